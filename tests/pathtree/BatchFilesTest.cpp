// The files of one batch.

#include <gtest/gtest.h>

#include <stdexcept>

#include "pathtree/BPathTree.hpp"
#include "pathtree/BatchFiles.hpp"
#include "pathtree/TrackLookup.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addBatch;
using support::textOf;
using tessel::BatchFiles;
using tessel::BPathTree;
using tessel::PathTrack;
using tessel::TrackLookup;

TEST(BatchFiles, FilesOfAnOpenBatchAreAskedForOneByOne) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f"});
    addBatch(tree, {"a"}, {"g", "h"});
    const PathTrack track = {0, 1};
    BatchFiles files = TrackLookup(*tree.root)
                           .openBatch(track, [](tessel::ComponentView folder) {
                               EXPECT_EQ(textOf(folder), "a");
                           });
    EXPECT_EQ(textOf(files[2]), "h");
    EXPECT_EQ(textOf(files[1]), "g");
    EXPECT_THROW(files[3], std::out_of_range);
}

TEST(BatchFiles, TheRootsFilesCountFromItsFirstChild) {
    BPathTree tree;
    EXPECT_THROW(BatchFiles::ofRoot(tree.root->folder()), std::out_of_range);
    addBatch(tree, {}, {"f", "g"});
    BatchFiles files = BatchFiles::ofRoot(tree.root->folder());
    EXPECT_EQ(textOf(files[1]), "f");
    EXPECT_EQ(textOf(files[2]), "g");
    EXPECT_THROW(files[3], std::out_of_range);
    // Before the first one: the offset wraps to the largest position.
    EXPECT_THROW(files[0], std::out_of_range);
}

TEST(BatchFiles, AChildIsFoundByItsPositionOrNotAtAll) {
    BPathTree tree;
    addBatch(tree, {}, {"f", "g"});
    EXPECT_EQ(textOf(BatchFiles::childAt(tree.root->folder(), 1).value()), "g");
    EXPECT_THROW(BatchFiles::childAt(tree.root->folder(), 2),
                 std::out_of_range);
    EXPECT_THROW(BatchFiles::childAt(tree.root->folder(), ~std::uint64_t{0}),
                 std::out_of_range);
}

}  // namespace
