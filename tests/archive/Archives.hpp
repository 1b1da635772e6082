#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <random>
#include <span>
#include <string>
#include <utility>
#include <vector>

#include "archive/ArchiveReader.hpp"
#include "archive/ArchiveWriter.hpp"
#include "archive/Format.hpp"
#include "archive/NumberRange.hpp"

// Lists of paths and archives of them, for tests.
namespace archives {

using Paths = std::vector<std::string>;
using Bytes = std::vector<std::uint8_t>;

// The bytes of a list's archive. A list that comes again with the same options
// is not packed again: many tests share theirs.
Bytes archiveOf(const Paths& paths, const tessel::ArchiveOptions& options = {});

// Options for segments of so many paths, on one thread.
inline tessel::ArchiveOptions segmentsOf(std::uint64_t paths) {
    tessel::ArchiveOptions options;
    options.pathsPerSegment = paths;
    options.threads = 1;
    return options;
}

// A sorted list such as a system's files make: folders in folders, names with
// shared beginnings, and files beside folders.
inline Paths sortedPaths(std::size_t count) {
    std::mt19937 random(2718);
    const auto pick = [&](unsigned n) {
        return static_cast<unsigned>(random() % n);
    };
    constexpr const char* words[] = {"share", "lib",   "doc",    "python3",
                                     "man",   "icons", "locale", "include"};
    Paths paths;
    while (paths.size() < count) {
        std::string path = pick(9) == 0 ? "" : "usr/";
        for (unsigned depth = pick(5); depth > 0; --depth)
            path += std::string(words[pick(8)]) + std::to_string(pick(6)) + '/';
        path += words[pick(8)];
        path += '-' + std::to_string(pick(3000));
        if (pick(2) == 0) path += ".txt";
        paths.push_back(path);
    }
    std::sort(paths.begin(), paths.end());
    return paths;
}

// The numbers of the paths that start with the prefix.
inline std::vector<tessel::NumberRange> rangesBelow(const Paths& paths,
                                                    const std::string& prefix) {
    std::vector<tessel::NumberRange> ranges;
    for (std::uint64_t i = 0; i < paths.size(); ++i)
        if (paths[i].starts_with(prefix))
            tessel::archive::appendRange(ranges, {i, i + 1});
    return ranges;
}

inline Paths shuffled(Paths paths) {
    std::mt19937 random(3141);
    for (std::size_t i = paths.size(); i > 1; --i)
        std::swap(paths[i - 1], paths[random() % i]);
    return paths;
}

// Folders in no order, each with its names together, in no order either; the
// folders come again now and then.
inline Paths inFolderRuns(std::size_t count) {
    std::mt19937 random(1618);
    Paths paths;
    while (paths.size() < count) {
        const std::string folder =
            "home/" + std::to_string(random() % 1000) + "/x/";
        const std::size_t run = 1 + random() % 40;
        for (std::size_t i = 0; i < run && paths.size() < count; ++i)
            paths.push_back(folder + "file" + std::to_string(random() % 5000));
    }
    return paths;
}

// Each path in another folder than the one before, so that even a short list is
// rearranged.
inline Paths scatteredPaths(std::size_t count) {
    Paths paths;
    for (std::size_t i = 0; i < count; ++i)
        paths.push_back("usr/lib" + std::to_string(i * 7 % 5) + "/file" +
                        std::to_string(i * 11 % count) + ".txt");
    return paths;
}

// What is hard about paths, in one list.
inline Paths nastyPaths() {
    Paths paths = {"/",   "//",   "a", "a/", "a//", "a//b",          "a/b",
                   "./x", "../x", "a", "a",  "/a",  "\xFF\xFE/\x01", "a\nb",
                   "a/\n"};
    for (unsigned c = 1; c < 256; ++c) {
        paths.push_back(std::string(1, static_cast<char>(c)));
        paths.push_back("all/" + std::string(3, static_cast<char>(c)) + "x");
    }
    std::string deep;
    for (unsigned depth = 0; depth < 2000; ++depth) {
        deep += "d/";
        if (depth % 100 == 0) paths.push_back(deep + "leaf");
    }
    paths.push_back(std::string(70'000, 'n'));
    paths.push_back(std::string(70'000, 'n') + 'm');
    paths.push_back(std::string(60'000, 'f') + "/x");
    return paths;
}

// Where an archive's first segment is.
inline tessel::archive::SegmentEntry firstEntry(const Bytes& archive) {
    const auto header = tessel::archive::FileHeader::unpack(archive);
    return tessel::archive::SegmentEntry::unpack(
        std::span(archive).subspan(header.directoryOffset), 0);
}

// An archive in memory, open for reading its parts.
class OpenArchive {
public:
    explicit OpenArchive(const Paths& paths,
                         const tessel::ArchiveOptions& options = {})
        : reader_(tessel::archive::ArchiveBytes(archiveOf(paths, options))) {}

    const tessel::archive::ArchiveReader& reader() const { return reader_; }
    const tessel::archive::Segment& segment() const {
        return reader_.segment(0);
    }

private:
    tessel::archive::ArchiveReader reader_;
};

}  // namespace archives
