#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <numeric>
#include <random>
#include <stdexcept>
#include <system_error>

#include "archive/ArchiveReader.hpp"
#include "archive/ArchiveWriter.hpp"
#include "archive/Format.hpp"
#include "tests/support/Sizes.hpp"

namespace tessel {
namespace {

namespace fs = std::filesystem;
using support::shareOf;
using Bytes = std::vector<std::uint8_t>;
using Paths = std::vector<std::string>;

// ---- Lists ----

Bytes written(const Paths& paths, const ArchiveOptions& options = {}) {
    Bytes bytes;
    ArchiveWriter writer(bytes, options);
    writer.addAll(paths);
    EXPECT_EQ(writer.size(), paths.size());
    const std::uint64_t size = writer.finish();
    EXPECT_EQ(size, bytes.size());
    return bytes;
}

Paths readBack(const Bytes& bytes) {
    const archive::ArchiveReader reader{
        archive::ArchiveBytes(std::span(bytes))};
    Paths paths;
    reader.read(0, reader.size(), [&](std::uint64_t number, auto path) {
        EXPECT_EQ(number, paths.size());
        paths.emplace_back(path);
    });
    return paths;
}

archive::SegmentHead headOf(const Bytes& bytes) {
    return archive::SegmentHead::unpack(
        std::span(bytes).subspan(archive::fileHeaderBytes));
}

// A list like that of a file system: folders in folders, similar names.
Paths treeList(std::size_t count) {
    Paths paths;
    for (std::size_t i = 0; paths.size() < count; ++i)
        for (std::size_t j = 0; j < 1 + i % 7; ++j)
            paths.push_back("usr/share/doc/package-" + std::to_string(i / 3) +
                            (i % 3 == 0 ? "/" : "/examples/") + "file" +
                            std::to_string(100 + i * j % 50) +
                            (j % 2 == 0 ? ".html" : ".txt"));
    paths.resize(count);
    return paths;
}

Paths sorted(Paths paths) {
    std::ranges::sort(paths);
    return paths;
}

Paths shuffled(Paths paths) {
    std::mt19937 random(17);
    std::ranges::shuffle(paths, random);
    return paths;
}

// Random bytes but NUL, slashes among them.
Paths randomList(std::size_t count, std::uint32_t seed) {
    std::mt19937 random(seed);
    Paths paths(count);
    for (std::string& path : paths) {
        path.resize(1 + random() % 40);
        for (char& c : path)
            c = random() % 5 == 0 ? '/' : static_cast<char>(1 + random() % 255);
    }
    return paths;
}

void expectRoundTrip(const Paths& paths, const ArchiveOptions& options = {}) {
    const Paths back = readBack(written(paths, options));
    ASSERT_EQ(back.size(), paths.size());
    for (std::size_t i = 0; i < paths.size(); ++i)
        ASSERT_EQ(back[i], paths[i]) << i;
}

// ---- Round trips ----

TEST(ArchiveWriterTest, AnEmptyListIsHeaderOnly) {
    EXPECT_EQ(written({}).size(), archive::fileHeaderBytes);
    EXPECT_TRUE(readBack(written({})).empty());
}

TEST(ArchiveWriterTest, KeepsSmallAwkwardLists) {
    for (const Paths& paths :
         {Paths{"a"}, Paths{"/"}, Paths{"//"}, Paths{"a/"}, Paths{"/a"},
          Paths{"a", "a", "a"}, Paths{"a/", "a//", "a//b", "a"},
          Paths{"\x01", "\xFF", "\xFF/\x01", "\n", "\r\n/\t"},
          Paths{"abc", "ab", "a", "abcd", "b"},
          Paths{"/etc/passwd", "/etc/group", "/", "/etc/"}})
        expectRoundTrip(paths);
}

TEST(ArchiveWriterTest, KeepsEveryByte) {
    Paths paths;
    for (int c = 1; c < 256; ++c) {
        paths.emplace_back(1, static_cast<char>(c));
        paths.push_back("shared prefix " + paths.back());
        paths.push_back("folder " + std::string(1, static_cast<char>(c)) +
                        "/x");
    }
    expectRoundTrip(paths);
}

TEST(ArchiveWriterTest, KeepsLists) {
    const Paths tree = treeList(5000);
    expectRoundTrip(tree);
    expectRoundTrip(sorted(tree));
    expectRoundTrip(shuffled(tree));
    Paths reversed = sorted(tree);
    std::ranges::reverse(reversed);
    expectRoundTrip(reversed);
}

TEST(ArchiveWriterTest, KeepsRandomBytes) {
    for (std::uint32_t seed = 0; seed < 20; ++seed) {
        SCOPED_TRACE(seed);
        expectRoundTrip(randomList(seed * seed * 3, seed));
        expectRoundTrip(sorted(randomList(500, seed)));
    }
}

TEST(ArchiveWriterTest, KeepsRepeats) {
    expectRoundTrip(Paths(100'000, "the/same/path.txt"));
    expectRoundTrip(Paths(1000, std::string(300, 'x')));
}

TEST(ArchiveWriterTest, KeepsLongNamesAndFolders) {
    const std::string name(archive::maxComponentBytes, 'n');
    const std::string folder =
        std::string(archive::maxComponentBytes - 1, 'f') + "/";
    std::string similar = name;
    similar.back() = 'x';
    expectRoundTrip({"short", name, similar, name, folder, folder + name,
                     folder + "a", "short"});
}

TEST(ArchiveWriterTest, KeepsDeepFolders) {
    Paths paths;
    std::string folder;
    for (int depth = 0; depth < 500; ++depth) {
        folder += "level" + std::to_string(depth) + "/";
        paths.push_back(folder + "file");
    }
    expectRoundTrip(paths);
    std::ranges::reverse(paths);
    expectRoundTrip(paths);
}

TEST(ArchiveWriterTest, AllLevelsKeepTheList) {
    const Paths tree = treeList(20'000);
    ArchiveOptions options;
    std::vector<std::size_t> sizes;
    for (const auto level :
         {ArchiveLevel::Fast, ArchiveLevel::Normal, ArchiveLevel::Best}) {
        options.level = level;
        expectRoundTrip(tree, options);
        sizes.push_back(written(tree, options).size());
    }
    EXPECT_LE(sizes[1], sizes[0]);
    EXPECT_LE(sizes[2], sizes[1] + sizes[1] / 100);
}

TEST(ArchiveWriterTest, ChoosesTheOrder) {
    const Paths tree = treeList(3000);
    EXPECT_EQ(headOf(written(sorted(tree))).order, archive::ListOrder::Sorted);
    EXPECT_EQ(headOf(written(tree)).order, archive::ListOrder::AsGiven);
    EXPECT_EQ(headOf(written(shuffled(tree))).order,
              archive::ListOrder::Rearranged);
}

TEST(ArchiveWriterTest, OnlyUnsortedListsGetAnIndex) {
    const Paths tree = treeList(3000);
    ArchiveOptions options;
    options.index = ArchiveIndex::WhereNeeded;
    const auto indexBytes = [&](const Paths& paths) {
        return headOf(written(paths, options)).bytesOf(archive::Section::Index);
    };
    EXPECT_EQ(indexBytes(sorted(tree)), 0U);
    EXPECT_EQ(indexBytes(tree), 3000U * 12 / 8);
    EXPECT_EQ(indexBytes(shuffled(tree)), 3000U * 12 / 8);
    EXPECT_EQ(headOf(written(shuffled(tree))).bytesOf(archive::Section::Index),
              0U);
}

// ---- Segments ----

TEST(ArchiveWriterTest, SegmentsAreCutByPathsAndByText) {
    const Paths tree = treeList(shareOf(1000));
    ArchiveOptions options;
    options.pathsPerSegment = 64;
    expectRoundTrip(tree, options);
    EXPECT_EQ(headOf(written(tree, options)).paths, 64U);
    options = {};
    options.textPerSegment = 500;
    expectRoundTrip(tree, options);
    EXPECT_LE(headOf(written(tree, options)).textBytes, 500U);
    options.textPerSegment = 1;
    expectRoundTrip(treeList(10), options);
}

TEST(ArchiveWriterTest, AppendKeepsTheBytesOfOldSegments) {
    const Paths tree = treeList(900);
    Bytes bytes;
    std::size_t added = 0;
    for (const std::size_t slice : {0U, 1U, 299U, 0U, 600U}) {
        const Bytes before = bytes;
        ArchiveWriter writer = before.empty() ? ArchiveWriter(bytes)
                                              : ArchiveWriter::append(bytes);
        EXPECT_EQ(writer.size(), added);
        for (std::size_t i = 0; i < slice; ++i) writer.add(tree[added + i]);
        EXPECT_EQ(bytes, before);
        writer.finish();
        added += slice;
        EXPECT_EQ(readBack(bytes),
                  Paths(tree.begin(),
                        tree.begin() + static_cast<std::ptrdiff_t>(added)));
        if (before.size() > archive::fileHeaderBytes) {
            const auto kept = static_cast<std::ptrdiff_t>(
                archive::FileHeader::unpack(before).directoryOffset);
            EXPECT_TRUE(std::equal(before.begin() + archive::fileHeaderBytes,
                                   before.begin() + kept,
                                   bytes.begin() + archive::fileHeaderBytes));
        }
    }
    EXPECT_EQ(added, tree.size());
    ArchiveWriter::repack(bytes);
    EXPECT_EQ(bytes, written(tree));
}

TEST(ArchiveWriterTest, AppendRefusesWhatIsNoArchive) {
    Bytes bytes = written(treeList(10));
    bytes.pop_back();
    EXPECT_THROW(ArchiveWriter::append(bytes), DamagedArchiveException);
    Bytes nothing;
    EXPECT_THROW(ArchiveWriter::append(nothing), DamagedArchiveException);
}

// ---- Threads ----

TEST(ArchiveWriterTest, BytesDoNotDependOnThreads) {
    for (const Paths& paths :
         {treeList(shareOf(70'000)), shuffled(treeList(shareOf(70'000))),
          randomList(shareOf(30'000), 1)})
        for (const auto level :
             {ArchiveLevel::Fast, ArchiveLevel::Normal, ArchiveLevel::Best}) {
            ArchiveOptions options;
            options.level = level;
            options.threads = 1;
            const Bytes one = written(paths, options);
            for (const unsigned threads : {2U, 3U, 7U}) {
                options.threads = threads;
                EXPECT_EQ(written(paths, options), one) << threads;
            }
        }
}

// ---- Errors ----

// The message that adding the path gives.
std::string refusal(ArchiveWriter& writer, const std::string& path) {
    try {
        writer.add(path);
    } catch (const std::logic_error& error) {
        return error.what();
    }
    return "";
}

TEST(ArchiveWriterTest, BadPathsAreNamedAndLeftOut) {
    Bytes bytes;
    ArchiveWriter writer(bytes);
    writer.add("good");
    EXPECT_EQ(refusal(writer, ""), "path 1 is empty");
    EXPECT_EQ(refusal(writer, std::string("a\0b", 3)), "path 1 holds a NUL");
    const std::string tooLong(archive::maxComponentBytes + 1, 'x');
    EXPECT_EQ(refusal(writer, tooLong),
              "the name of path 1 is longer than 1 MiB");
    EXPECT_EQ(refusal(writer, tooLong + "/"),
              "the folder of path 1 is longer than 1 MiB");
    writer.add("fine");
    writer.finish();
    EXPECT_EQ(readBack(bytes), (Paths{"good", "fine"}));
}

TEST(ArchiveWriterTest, AFinishedWriterTakesNothing) {
    Bytes bytes;
    ArchiveWriter writer(bytes);
    writer.finish();
    EXPECT_THROW(writer.add("late"), std::logic_error);
    EXPECT_THROW(writer.finish(), std::logic_error);
}

TEST(ArchiveWriterTest, AWriterThatWasMovedFromTakesNothing) {
    Bytes bytes;
    ArchiveWriter writer(bytes);
    writer.add("a");
    ArchiveWriter moved = std::move(writer);
    // NOLINTBEGIN(bugprone-use-after-move): what is tested
    EXPECT_THROW(writer.add("b"), std::logic_error);
    EXPECT_THROW(writer.finish(), std::logic_error);
    EXPECT_EQ(writer.size(), 0U);
    // NOLINTEND(bugprone-use-after-move)
    moved.finish();
    EXPECT_EQ(readBack(bytes), Paths{"a"});
}

TEST(ArchiveWriterTest, AWriterTakesThePlaceOfAnUnfinishedOne) {
    Bytes first;
    Bytes second;
    ArchiveWriter writer(first);
    writer.add("lost");
    writer = ArchiveWriter(second);
    writer.add("kept");
    writer.finish();
    EXPECT_TRUE(first.empty());
    EXPECT_EQ(readBack(second), Paths{"kept"});
}

TEST(ArchiveWriterTest, CancellingLeavesTheOldBytes) {
    Bytes bytes = {1, 2, 3};
    std::stop_source source;
    ArchiveOptions options;
    options.cancel = source.get_token();
    int reports = 0;
    options.progress = [&](const ArchiveProgress&) {
        if (++reports == 2) source.request_stop();
    };
    ArchiveWriter writer(bytes, options);
    writer.addAll(treeList(1000));
    EXPECT_THROW(writer.finish(), CancelledException);
    EXPECT_EQ(reports, 2);
    EXPECT_EQ(bytes, (Bytes{1, 2, 3}));
    EXPECT_THROW(writer.finish(), std::logic_error);
}

TEST(ArchiveWriterTest, ProgressRunsUpwards) {
    ArchiveOptions options;
    options.pathsPerSegment = 400;
    std::vector<double> shares;
    std::uint64_t written = 0;
    options.progress = [&](const ArchiveProgress& progress) {
        const double share =
            static_cast<double>(progress.pathsWritten) +
            (progress.pathsWritten < progress.pathsAdded ? progress.share : 0);
        shares.push_back(share);
        written = progress.pathsWritten;
    };
    Bytes bytes;
    ArchiveWriter writer(bytes, options);
    writer.addAll(treeList(1000));
    writer.finish();
    EXPECT_TRUE(std::ranges::is_sorted(shares));
    EXPECT_GT(shares.size(), 15U);
    EXPECT_EQ(written, 1000U);
}

TEST(ArchiveWriterTest, WhatTheCallbackThrowsReachesTheCaller) {
    ArchiveOptions options;
    options.progress = [](const ArchiveProgress&) {
        throw std::runtime_error("enough");
    };
    Bytes bytes = {9};
    ArchiveWriter writer(bytes, options);
    writer.add("a");
    EXPECT_THROW(writer.finish(), std::runtime_error);
    EXPECT_EQ(bytes, Bytes{9});
}

// ---- Files ----

class ArchiveWriterFileTest : public testing::Test {
protected:
    ArchiveWriterFileTest()
        : folder_(
              fs::path(testing::TempDir()) /
              testing::UnitTest::GetInstance()->current_test_info()->name()) {
        fs::remove_all(folder_);
        fs::create_directory(folder_);
    }
    ~ArchiveWriterFileTest() override { fs::remove_all(folder_); }

    std::string file() const { return (folder_ / "list").string(); }
    Bytes contents() const {
        std::ifstream in(file(), std::ios::binary);
        return Bytes(std::istreambuf_iterator<char>(in), {});
    }
    std::size_t filesInFolder() const {
        return static_cast<std::size_t>(
            std::distance(fs::directory_iterator(folder_), {}));
    }

    fs::path folder_;
};

TEST_F(ArchiveWriterFileTest, WritesAppendsAndRepacksTheSameBytes) {
    const Paths tree = treeList(500);
    ArchiveWriter writer(file());
    for (std::size_t i = 0; i < 200; ++i) writer.add(tree[i]);
    writer.finish();
    ArchiveWriter more = ArchiveWriter::append(file());
    for (std::size_t i = 200; i < 500; ++i) more.add(tree[i]);
    more.finish();
    EXPECT_EQ(readBack(contents()), tree);
    ArchiveWriter::repack(file());
    EXPECT_EQ(contents(), written(tree));
    EXPECT_EQ(filesInFolder(), 1U);
}

TEST_F(ArchiveWriterFileTest, AnUnfinishedWriterLeavesNoTrace) {
    {
        ArchiveWriter writer(file());
        writer.add("a");
        EXPECT_FALSE(fs::exists(file()));
    }
    EXPECT_EQ(filesInFolder(), 0U);
}

TEST_F(ArchiveWriterFileTest, ACancelledRepackKeepsTheOldFile) {
    ArchiveWriter writer(file());
    writer.addAll(treeList(100));
    writer.finish();
    const Bytes before = contents();
    std::stop_source source;
    source.request_stop();
    ArchiveOptions options;
    options.cancel = source.get_token();
    EXPECT_THROW(ArchiveWriter::repack(file(), options), CancelledException);
    EXPECT_EQ(contents(), before);
    EXPECT_EQ(filesInFolder(), 1U);
}

TEST_F(ArchiveWriterFileTest, AppendToNoFileNamesIt) {
    try {
        ArchiveWriter::append(file());
        FAIL();
    } catch (const std::system_error& error) {
        EXPECT_EQ(error.code(), std::errc::no_such_file_or_directory);
        EXPECT_NE(std::string(error.what()).find(file()), std::string::npos);
    }
}

}  // namespace
}  // namespace tessel
