// Neighbouring paths read as one text on all cores, beside a loop over them.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/ArchiveWriter.hpp"
#include "archive/PathArchive.hpp"
#include "hosts/console/ListReader.hpp"

namespace {

using tessel::ArchiveWriter;
using tessel::NumberRange;
using tessel::PathArchive;
using tessel::console::ListReader;
using tessel::console::Numbering;
using tessel::console::Separator;

using Bytes = std::vector<std::uint8_t>;

Bytes packed(const std::vector<std::string>& paths) {
    Bytes bytes;
    ArchiveWriter writer(bytes);
    writer.addAll(paths);
    writer.finish();
    return bytes;
}

struct Read {
    std::string text;
    std::uint64_t paths = 0;
};

void readInto(Read& read, const PathArchive& archive, const NumberRange& range,
              Separator separator, Numbering numbering = Numbering::None) {
    ListReader(archive, separator, numbering)
        .read(range, [&](std::string_view text, std::uint64_t paths) {
            read.text.append(text);
            read.paths += paths;
        });
}

void expectAll(const std::vector<std::string>& paths, const NumberRange& range,
               Separator separator, Numbering numbering = Numbering::None) {
    std::string expected;
    for (std::uint64_t i = range.begin; i < range.end; ++i) {
        if (numbering == Numbering::Numbers)
            expected.append(std::to_string(i)).push_back('\t');
        expected.append(paths[i]).push_back(static_cast<char>(separator));
    }
    Read read;
    readInto(read, PathArchive::own(packed(paths)), range, separator,
             numbering);
    EXPECT_EQ(read.paths, range.end - range.begin);
    EXPECT_TRUE(read.text == expected);
}

std::vector<std::string> numbered(std::size_t count) {
    std::vector<std::string> paths;
    for (std::size_t i = 0; i < count; ++i)
        paths.push_back("folder" + std::to_string(i * 7919 % 100) + "/name" +
                        std::to_string(i));
    return paths;
}

TEST(ListReader, ReadsRangesOfEveryLength) {
    const auto paths = numbered(70000);
    for (const std::uint64_t end : {0U, 1U, 4095U, 4096U, 4097U, 70000U})
        expectAll(paths, {0, end}, Separator::Newline);
    expectAll(paths, {5, 5}, Separator::Newline);
    expectAll(paths, {4095, 40001}, Separator::Nul);
    expectAll(paths, {4095, 40001}, Separator::Newline, Numbering::Numbers);
}

// So that the rest of a chunk is read path by path.
TEST(ListReader, ReadsLongPaths) {
    std::vector<std::string> paths = numbered(20000);
    for (std::size_t i = 100; i < 200; ++i)
        paths[i] = std::string(100'000, 'a') + '/' + std::to_string(i);
    expectAll(paths, {0, paths.size()}, Separator::Newline);
    expectAll(paths, {0, paths.size()}, Separator::Newline, Numbering::Numbers);
}

// Nothing is lost that a loop over the paths shows. In a list that is not
// stored in its order, more may come: the loop reads further ahead.
void expectPathsBeforeDamage(const std::vector<std::string>& paths) {
    Bytes bytes = packed(paths);
    bytes[bytes.size() / 2] ^= 1U;
    const PathArchive archive = PathArchive::own(std::move(bytes));
    Read expected;
    const auto loop = [&](std::uint64_t, std::string_view path) {
        expected.text.append(path).push_back('\n');
        ++expected.paths;
    };
    EXPECT_THROW(archive.forEach(loop), tessel::DamagedArchiveException);
    Read read;
    EXPECT_THROW(readInto(read, archive, {0, paths.size()}, Separator::Newline),
                 tessel::DamagedArchiveException);
    EXPECT_GT(expected.paths, 0U);
    EXPECT_GE(read.paths, expected.paths);
    EXPECT_TRUE(read.text.starts_with(expected.text));
    std::string start;
    for (std::uint64_t i = 0; i < read.paths; ++i)
        start.append(paths[i]).push_back('\n');
    EXPECT_TRUE(read.text == start);
}

TEST(ListReader, ShowsAllPathsBeforeDamage) {
    std::vector<std::string> paths = numbered(60000);
    expectPathsBeforeDamage(paths);
    std::ranges::sort(paths);
    expectPathsBeforeDamage(paths);
}

}  // namespace
