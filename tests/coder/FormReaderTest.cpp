// The payload of a stored form, read back. (HuffmanPathTreeFormTest and the
// hostile forms have the whole form.)

#include <gtest/gtest.h>

#include "coder/FormReader.hpp"
#include "coder/FormWriter.hpp"
#include "tests/support/Bytes.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::Bytes;
using tessel::BPathTree;
using tessel::DamagedFormException;
using tessel::FormReader;
using tessel::PathNumbering;
using tessel::PathTrack;

// A folder of two files, one partition; the second path is added again.
Bytes payload() {
    BPathTree tree;
    support::addBatch(tree, {"a"}, {"f", "g"});
    PathNumbering numbering;
    PathTrack track = {0};
    numbering.notePartition(track, false, 0, 2);
    PathTrack repeated = {0, 1};
    numbering.noteWholePath(repeated, true);
    Bytes out;
    tessel::FormWriter(tree, numbering, out).write({false, true, true});
    return out;
}

FormReader readBack(const Bytes& bytes, const PathNumbering& before = {}) {
    FormReader reader(before);
    tessel::sixpacks::ByteCursor cursor(bytes);
    reader.read(cursor);
    return reader;
}

TEST(FormReader, ReadsWhatWasWritten) {
    const FormReader reader = readBack(payload());
    EXPECT_EQ(reader.shape, (std::vector<bool>{false, true, true}));
    EXPECT_EQ(support::allPaths(*reader.tree),
              (std::vector<std::string>{"a/f", "a/g"}));
    EXPECT_EQ(reader.numbering.pathCount, 3U);
    EXPECT_EQ(reader.numbering.partitionEnds, (std::vector<std::uint64_t>{2}));
    EXPECT_EQ(reader.numbering.partitionTracks[0], PathTrack{0});
    EXPECT_EQ(reader.numbering.duplicates.at(3), (PathTrack{0, 1}));
    EXPECT_EQ(reader.numbering.maxDuplicatePathNumber, 3U);
    EXPECT_EQ(reader.numbering.maxCodeBytes, 1U);
}

TEST(FormReader, AppendsPartitionsAndReplacesDuplicates) {
    PathNumbering before;
    PathTrack track = {5};
    before.notePartition(track, false, 0, 4);
    before.duplicates[9] = {1};
    const FormReader reader = readBack(payload(), before);
    EXPECT_EQ(reader.numbering.partitionEnds,
              (std::vector<std::uint64_t>{4, 2}));
    EXPECT_EQ(reader.numbering.partitionTracks.size(), 2U);
    EXPECT_EQ(reader.numbering.duplicates.size(), 1U);
    // The ends fall now, and every number is still found.
    EXPECT_EQ(reader.numbering.partitionAtOrAfter(1, 1), 1U);
    EXPECT_EQ(reader.numbering.partitionAtOrAfter(0, 3), 0U);
}

TEST(FormReader, MaximaAreThoseOfTheSectionsThatWereRead) {
    PathNumbering before;
    before.maxCodeBytes = 100;
    before.maxPartitionTrackLength = 100;
    before.maxDuplicateTrackLength = 100;
    before.maxDuplicatePathNumber = 100;
    const FormReader reader = readBack(payload(), before);
    EXPECT_EQ(reader.numbering.maxCodeBytes, 1U);
    EXPECT_EQ(reader.numbering.maxPartitionTrackLength, 1U);
    EXPECT_EQ(reader.numbering.maxDuplicateTrackLength, 2U);
    EXPECT_EQ(reader.numbering.maxDuplicatePathNumber, 3U);
}

TEST(FormReader, AnUnknownMarkerEndsTheReading) {
    Bytes bytes = payload();
    const Bytes tail = {0, 0, 0, 3, 2, 0, 1};  // the duplicates
    const std::size_t markerAt = bytes.size() - tail.size() - 1;
    ASSERT_EQ(bytes[markerAt], 0U);
    bytes[markerAt] = 7;
    const FormReader reader = readBack(bytes);
    EXPECT_TRUE(reader.numbering.duplicates.empty());
    EXPECT_EQ(reader.numbering.partitionEnds.size(), 1U);
}

TEST(FormReader, ACutIsDamageUnlessItIsBetweenGroups) {
    const Bytes bytes = payload();
    const std::size_t duplicates = 8;
    const std::size_t partitions = 1 + 4 + 8 + 4;
    const std::size_t afterTree = bytes.size() - duplicates - partitions;
    for (std::size_t length = 0; length < bytes.size(); ++length) {
        const Bytes cut(bytes.begin(),
                        bytes.begin() + static_cast<std::ptrdiff_t>(length));
        const bool isWhole = length == afterTree ||
                             length == bytes.size() - duplicates ||
                             length == bytes.size() - duplicates + 4;
        if (isWhole)
            EXPECT_NO_THROW(readBack(cut)) << length;
        else
            EXPECT_THROW(readBack(cut), DamagedFormException) << length;
    }
}

// No shape; the codes; values whose lengths are bytes.
Bytes treeOf(const Bytes& codes, const Bytes& values, std::uint8_t count) {
    Bytes out(8);
    const Bytes parts[] = {
        {static_cast<std::uint8_t>(codes.size()), 0, 0, 0, 0, 0, 0, 0},
        codes,
        {count, 0, 0, 0, 0, 0, 0, 0, /*width*/ 0},
        values};
    for (const Bytes& part : parts)
        out.insert(out.end(), part.begin(), part.end());
    return out;
}

TEST(FormReader, AValueThatIsCutIsReportedBeforeANodeThatIsUnknown) {
    const Bytes unknown = {9};
    EXPECT_THROW(readBack(treeOf(unknown, {1, 'a', 1, 'b'}, 2)),
                 tessel::UnknownNodeTypeException);
    EXPECT_THROW(readBack(treeOf(unknown, {1, 'a', 2, 'b'}, 2)),
                 DamagedFormException);
}

}  // namespace
