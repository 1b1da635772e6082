// The coder's own account of its memory beside the allocator's.

#include <gtest/gtest.h>
#include <malloc.h>

#include <cmath>

#include "tests/support/Coders.hpp"

namespace {

using support::CoderPtr;
using support::Texts;
using tessel::HuffmanPathTree;

std::size_t allocatedBytes() {
    const struct mallinfo2 info = mallinfo2();
    return info.uordblks + info.hblkhd;
}

const std::u16string characters = u"/abcdefghijklmnopqrstuvwxyz0123456789._-";

std::u16string nameOf(std::size_t number, std::size_t length) {
    std::u16string name;
    while (name.size() < length) {
        number = number * 6364136223846793005U + 1442695040888963407U;
        name += characters[1 + (number >> 33) % (characters.size() - 1)];
    }
    return name;
}

// About a hundred thousand paths in the given number of folders.
void fill(HuffmanPathTree& coder, std::size_t folders) {
    const std::size_t filesEach = 100000 / folders;
    constexpr std::size_t foldersABatch = 500;
    for (std::size_t i = 0; i < folders;) {
        std::vector<Texts> batchFolders;
        std::vector<Texts> batchFiles;
        for (; batchFolders.size() < foldersABatch && i < folders; ++i) {
            batchFolders.push_back({u"/", nameOf(i / 100, 6), nameOf(i, 9)});
            Texts& names = batchFiles.emplace_back();
            for (std::size_t k = 0; k < filesEach; ++k)
                names.push_back(nameOf(i * 1000 + k, 8 + k % 17));
        }
        support::addBatches(coder, std::move(batchFolders),
                            std::move(batchFiles));
    }
}

CoderPtr filledCoder(std::size_t folders) {
    std::vector<double> frequencies;
    for (std::size_t i = 0; i < characters.size(); ++i)
        frequencies.push_back(static_cast<double>(1 + i % 9));
    CoderPtr coder = support::coderWith(characters, frequencies);
    fill(*coder, folders);
    return coder;
}

// What is in use beyond `before` must be what the coder says, to 5 %.
void compareAccount(const HuffmanPathTree& coder, std::size_t before) {
    const auto actual = static_cast<double>(allocatedBytes() - before);
    const auto claimed = static_cast<double>(coder.memoryUsage().total());
    EXPECT_NEAR(claimed / actual, 1, 0.05)
        << claimed << " claimed, " << actual << " in use";
}

class MemoryUsage : public ::testing::TestWithParam<std::size_t> {
protected:
    // What the allocator keeps aside of freed pieces counts as in use; after
    // one coder has come and gone, it is the same before and after.
    void SetUp() override { filledCoder(GetParam()).reset(); }
};

TEST_P(MemoryUsage, OfAFilledCoderIsTheAllocators) {
    const std::size_t before = allocatedBytes();
    const CoderPtr coder = filledCoder(GetParam());
    compareAccount(*coder, before);
}

TEST_P(MemoryUsage, OfARestoredCoderIsTheAllocators) {
    const CoderPtr source = filledCoder(GetParam());
    const support::Bytes form = support::formOf(*source, true);
    support::restoredFrom(form, true, *source).reset();
    const std::size_t before = allocatedBytes();
    const CoderPtr coder = support::restoredFrom(form, true, *source);
    compareAccount(*coder, before);
}

TEST_P(MemoryUsage, OfACoderWithDuplicatesIsTheAllocators) {
    const std::size_t before = allocatedBytes();
    const CoderPtr coder = filledCoder(GetParam());
    for (std::size_t i = 0; i < 20000; ++i)
        support::addWhole(*coder, {u"/", nameOf(i % 2000, 7)});
    compareAccount(*coder, before);
    EXPECT_GT(coder->memoryUsage().duplicates, 18000U * 8);
}

// Paths that were stored and then extended: files became folders.
TEST_P(MemoryUsage, OfACoderWithLateFoldersIsTheAllocators) {
    const std::size_t before = allocatedBytes();
    const CoderPtr coder = filledCoder(GetParam());
    for (std::size_t i = 0; i < 20000; ++i) {
        const Texts path = {u"/", u"late", nameOf(i, 7)};
        support::addWhole(*coder, path);
        support::addWhole(*coder, {path[0], path[1], path[2], u"file"});
    }
    compareAccount(*coder, before);
}

TEST_P(MemoryUsage, NamesAreTheBytesOfTheComponents) {
    const CoderPtr coder = filledCoder(GetParam());
    std::size_t bytes = 0;
    for (const auto& value : support::storedTree(*coder->pathTree).second)
        bytes += value.size();
    EXPECT_EQ(coder->memoryUsage().names, bytes);
}

INSTANTIATE_TEST_SUITE_P(Folders, MemoryUsage,
                         ::testing::Values(1, 100, 5000, 50000));

TEST(MemoryUsageParts, TheTotalIsTheirSum) {
    HuffmanPathTree::MemoryUsage usage;
    usage.names = 1;
    usage.nodes = 20;
    usage.childLists = 300;
    usage.partitionTracks = 4000;
    usage.duplicates = 50000;
    usage.code = 600000;
    usage.other = 7000000;
    EXPECT_EQ(usage.total(), 7654321U);
}

// The blocks of children, beside their names, of a tree whose folder has so
// many files, at the end of a chain of folders.
std::size_t listBytes(std::size_t files) {
    tessel::BPathTree tree;
    tessel::Components folder = {{1}, {2}, {3}};
    tessel::Components names;
    for (std::size_t i = 0; i < files; ++i)
        names.push_back({9, static_cast<std::uint8_t>(i)});
    tessel::PathTrack track;
    std::uint64_t first = 0;
    tree.addPath(folder, names, track, first);
    return tree.memoryUsage().childLists;
}

TEST(MemoryUsageParts, SmallFoldersNeedNoBlockOfTheirOwn) {
    const std::size_t ofTheRoot = listBytes(0);
    EXPECT_LE(ofTheRoot, 32U);
    EXPECT_EQ(listBytes(1), ofTheRoot);
    EXPECT_EQ(listBytes(60), ofTheRoot);
    EXPECT_GT(listBytes(61), ofTheRoot);
    EXPECT_GE(listBytes(200), ofTheRoot + 200);
    EXPECT_LE(listBytes(200), ofTheRoot + 200 + 48 + 7 + 24);
}

TEST(MemoryUsageParts, AFreshCoderTakesLittle) {
    const HuffmanPathTree coder;
    const HuffmanPathTree::MemoryUsage usage = coder.memoryUsage();
    EXPECT_EQ(usage.names, 0U);
    EXPECT_EQ(usage.childLists, 0U);
    EXPECT_EQ(usage.duplicates, 0U);
    EXPECT_GE(usage.total(), sizeof(HuffmanPathTree));
    EXPECT_LT(usage.total(), 16000U);
}

}  // namespace
