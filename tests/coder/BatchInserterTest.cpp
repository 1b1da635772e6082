// Encoded folders and files into the tree, and their numbers.

#include <gtest/gtest.h>

#include <random>

#include "tests/support/Coders.hpp"

namespace {

using support::CoderPtr;
using support::fourLetterCoder;
using support::Texts;
using tessel::Components;
using tessel::PathTrack;
using Ends = std::vector<std::uint64_t>;

TEST(BatchInserter, ANewFoldersTrackHasOnePositionPerComponent) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a", u"b"}, {u"c", u"d"});
    ASSERT_EQ(coder->partitionTracks.size(), 1U);
    EXPECT_EQ(coder->partitionTracks[0], (PathTrack{0, 0}));
    EXPECT_EQ(coder->maxPartitionTrackLength, 0U);
    EXPECT_EQ(coder->partitionEnds, (Ends{2}));
    EXPECT_EQ(coder->pathCount, 2U);
}

TEST(BatchInserter, ANewFolderLeavesTheLongestPartitionTrackAsItWas) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a", u"b"}, {u"c"});
    support::addBatch(*coder, {u"a", u"b"}, {u"d"});
    ASSERT_EQ(coder->maxPartitionTrackLength, 3U);
    support::addBatch(*coder, {u"d"}, {u"a"});
    EXPECT_EQ(coder->partitionTracks[2], (PathTrack{1}));
    EXPECT_EQ(coder->maxPartitionTrackLength, 3U);
    support::addBatch(*coder, {u"c", u"a", u"b", u"d"}, {u"a"});
    EXPECT_EQ(coder->partitionTracks[3], (PathTrack{2, 0, 0, 0}));
    EXPECT_EQ(coder->maxPartitionTrackLength, 3U);
}

TEST(BatchInserter, AStoredFoldersTrackEndsWithTheFirstNewFile) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a", u"b"}, {u"c", u"d"});
    support::addBatch(*coder, {u"a", u"b"}, {u"cc", u"dd", u"c"});
    ASSERT_EQ(coder->partitionTracks.size(), 2U);
    EXPECT_EQ(coder->partitionTracks[1], (PathTrack{0, 0, 2}));
    EXPECT_EQ(coder->maxPartitionTrackLength, 3U);
    EXPECT_EQ(coder->partitionEnds, (Ends{2, 5}));
    EXPECT_EQ(coder->pathCount, 5U);
}

TEST(BatchInserter, ASecondBatchAppendsAfterTheFirst) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatches(*coder, {{u"a"}, {u"b"}}, {{u"a"}, {u"b", u"c"}});
    support::addBatches(*coder, {{u"c"}, {u"d"}}, {{u"a"}, {u"b", u"c"}});
    EXPECT_EQ(coder->partitionEnds, (Ends{1, 3, 4, 6}));
    EXPECT_EQ(coder->pathCount, 6U);
}

// A batch of its own finds every folder from the root down.
TEST(BatchInserter, FoldersOfOneBatchGetWhatTheyWouldGetInBatchesOfTheirOwn) {
    std::mt19937 numbers(20230610);
    const auto below = [&](std::size_t bound) { return numbers() % bound; };
    for (std::size_t round = 0; round < 30; ++round) {
        const CoderPtr together = fourLetterCoder();
        const CoderPtr apart = fourLetterCoder();
        std::vector<Texts> folders;
        std::vector<Texts> files;
        Texts folder;
        for (std::size_t i = 0; i < 60; ++i) {
            folder.resize(below(folder.size() + 1));
            for (std::size_t more = below(4); more > 0; --more)
                folder.emplace_back(1, static_cast<char16_t>(u'a' + below(4)));
            Texts names;
            for (std::size_t more = below(3); more > 0; --more)
                names.emplace_back(1, static_cast<char16_t>(u'a' + below(4)));
            folders.push_back(folder);
            files.push_back(names);
            support::addBatch(*apart, folder, names);
        }
        support::addBatches(*together, folders, files);
        ASSERT_EQ(support::tracksOf(*together), support::tracksOf(*apart));
        ASSERT_EQ(support::formOf(*together, false),
                  support::formOf(*apart, false));
        ASSERT_EQ(support::brokenInvariant(*together), "");
    }
}

TEST(BatchInserter, AFolderWithoutFilesIsAPartitionOfNoPaths) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatches(*coder, {{u"a"}, {u"b"}}, {{}, {u"c"}});
    EXPECT_EQ(coder->partitionEnds, (Ends{0, 1}));
    EXPECT_EQ(coder->pathCount, 1U);
    EXPECT_EQ(support::iterated(*coder),
              (std::vector<Texts>{{u"a"}, {u"b", u"c"}}));
}

TEST(BatchInserter, FilesWithoutAFolderGoUnderTheRoot) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {}, {u"a", u"b"});
    EXPECT_EQ(coder->partitionTracks[0], PathTrack{});
    EXPECT_EQ(support::iterated(*coder), (std::vector<Texts>{{u"a"}, {u"b"}}));
    const auto answer = support::found(*coder, {2});
    ASSERT_TRUE(answer);
    EXPECT_EQ(answer->folders, (std::vector<Components>{{}}));
    EXPECT_EQ(support::decodedBy(*coder, answer->files[0]), Texts{u"b"});
}

// ---- A file that becomes a folder ----

TEST(BatchInserter, AFileWhoseNameServesAsAFolderIsNoPathAnyMore) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a"}, {u"b", u"c"});
    support::addBatch(*coder, {u"a", u"b"}, {u"d"});
    EXPECT_EQ(coder->pathCount, 3U);
    EXPECT_EQ(coder->partitionTracks[1], (PathTrack{0, 0, 0}));
    EXPECT_EQ(support::iterated(*coder),
              (std::vector<Texts>{{u"a", u"b", u"d"}, {u"a", u"c"}}));
}

TEST(BatchInserter, NumbersOfABatchWhoseFirstFileBecameAFolderPointElsewhere) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a"}, {u"b"});
    support::addBatch(*coder, {u"a"}, {u"c", u"d"});
    support::addBatch(*coder, {u"a", u"c"}, {u"aa"});
    // The second batch's track now ends at the folder c.
    const auto answer = support::found(*coder, {2});
    ASSERT_TRUE(answer);
    EXPECT_EQ(support::decodedBy(*coder, answer->folders[0]),
              (Texts{u"a", u"c"}));
    EXPECT_EQ(support::decodedBy(*coder, answer->files[0]), Texts{u"aa"});
    // Where its second file was sought there is nothing.
    EXPECT_FALSE(support::found(*coder, {3}));
    // The third batch joined a stored folder and is found.
    const auto third = support::found(*coder, {4});
    ASSERT_TRUE(third);
    EXPECT_EQ(support::decodedBy(*coder, third->files[0]), Texts{u"aa"});
}

TEST(BatchInserter, APathThatIsAlsoAFolderSplitElsewhereStaysApart) {
    const CoderPtr coder = fourLetterCoder();
    // c/a is a file and a folder: the file is split one level higher.
    support::addBatches(*coder, {{u"b"}, {u"b", u"c", u"a"}, {u"b", u"c"}},
                        {{u"cda"}, {u"d"}, {u"b"}});
    EXPECT_EQ(
        support::iterated(*coder),
        (std::vector<Texts>{
            {u"b", u"cda"}, {u"b", u"c", u"a", u"d"}, {u"b", u"c", u"b"}}));
    const auto answer = support::found(*coder, {1, 2, 3});
    ASSERT_TRUE(answer);
    EXPECT_EQ(support::decodedBy(*coder, answer->files[0]), Texts{u"cda"});
}

}  // namespace
