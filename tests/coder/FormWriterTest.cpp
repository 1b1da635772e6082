// The payload of a stored form, byte by byte. (HuffmanPathTreeFormTest has the
// whole form.)

#include <gtest/gtest.h>

#include "coder/FormWriter.hpp"
#include "tests/support/Bytes.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::Bytes;
using tessel::BPathTree;
using tessel::FormWriter;
using tessel::PathNumbering;
using tessel::PathTrack;

TEST(FormWriter, OfNothingWritesThreeEmptyGroups) {
    const BPathTree tree;
    const PathNumbering numbering;
    Bytes out = {7};
    FormWriter(tree, numbering, out).write({});
    Bytes expected(1 + 3 * 8 + 1, 0);
    expected[0] = 7;  // what was there stays
    EXPECT_EQ(out, expected);
}

TEST(FormWriter, WritesShapeTreePartitionsAndDuplicatesInTurn) {
    BPathTree tree;
    support::addBatch(tree, {"a"}, {"f"});
    PathNumbering numbering;
    PathTrack track = {0};
    numbering.notePartition(track, false, 0, 1);
    PathTrack repeated = {0, 0};
    numbering.noteWholePath(repeated, true);
    Bytes out;
    FormWriter(tree, numbering, out).write({true});
    EXPECT_EQ(out, (Bytes{
                       2, 0,   0, 0,   0, 0, 0, 0,  // shape: bytes
                       1, 1,                        // one bit, which is set
                       2, 0,   0, 0,   0, 0, 0, 0,  // node codes
                       1, 0,                        // the folder, its file
                       2, 0,   0, 0,   0, 0, 0, 0,  // values
                       0,                           // their lengths in a byte
                       1, 'a', 1, 'f',              //
                       1,                           // partitions
                       0, 0,   1, 1,                // one end: 1
                       1, 0,   0, 0,   0, 0, 0, 0,  // tracks
                       0, 0,   1, 0,                // one position: 0
                       0,                           // duplicates
                       0, 0,   0,                   // widths
                       2, 2,   0, 0,                // number 2: at 0, 0
                   }));
}

TEST(FormWriter, AValueLongerThanTheMaximumThatIsKeptStaysWhole) {
    BPathTree tree;
    support::addBatch(tree, {}, {std::string(300, 'x')});
    const PathNumbering numbering;  // knows of no component
    Bytes out;
    FormWriter(tree, numbering, out).write({});
    const std::size_t widthAt = 8 + 8 + 1 + 8;
    ASSERT_EQ(out.size(), widthAt + 1 + 2 + 300);
    EXPECT_EQ(out[widthAt], 1U);
    EXPECT_EQ(out[widthAt + 1] + out[widthAt + 2] * 256U, 300U);
}

}  // namespace
