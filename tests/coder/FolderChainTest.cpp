// The way from a folder up to the root.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include "coder/FolderChain.hpp"
#include "pathtree/BPathTree.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::component;
using tessel::BPathTree;
using tessel::Components;
using tessel::FolderChain;
using tessel::FolderNode;

// Adds a folder of these names with a file and returns the folders on the way.
std::vector<const FolderNode*> addFolder(
    BPathTree& tree, const std::vector<std::string>& names) {
    Components folder = support::components(names);
    Components files = {component("file")};
    tessel::PathTrack track;
    std::uint64_t first = 0;
    tree.addPath(folder, files, track, first);
    track.resize(names.size());
    std::vector<const FolderNode*> folders;
    const FolderNode* at = tree.root->folder();
    for (const std::uint64_t position : track) {
        at = at->child(position).folder;
        folders.push_back(at);
    }
    return folders;
}

std::vector<const FolderNode*> foldersOf(const FolderChain& chain) {
    return {chain.folders().begin(), chain.folders().end()};
}

RC_GTEST_PROP(FolderChain, IsTheWayDownWhateverWasFoundBefore, ()) {
    BPathTree tree;
    const FolderNode& root = *tree.root->folder();
    std::vector<std::vector<const FolderNode*>> all;
    const auto steps = *rc::gen::container<std::vector<std::vector<unsigned>>>(
        rc::gen::container<std::vector<unsigned>>(rc::gen::inRange(0U, 3U)));
    for (const std::vector<unsigned>& step : steps) {
        std::vector<std::string> names;
        for (const unsigned seed : step)
            if (names.size() < FolderChain::maxDepth)
                names.push_back(support::numbered("d", seed));
        if (!names.empty()) all.push_back(addFolder(tree, names));
    }
    FolderChain chain;
    for (const auto& folders : all) {
        RC_ASSERT(chain.find(root, *folders.back()));
        RC_ASSERT(foldersOf(chain) == folders);
    }
    RC_ASSERT(chain.find(root, root));
    RC_ASSERT(chain.folders().empty());
}

TEST(FolderChain, EndsAtItsGreatestDepth) {
    BPathTree tree;
    const auto folders = addFolder(
        tree, std::vector<std::string>(FolderChain::maxDepth + 2, "d"));
    const FolderNode& root = *tree.root->folder();
    FolderChain chain;
    const std::size_t last = FolderChain::maxDepth - 1;
    ASSERT_TRUE(chain.find(root, *folders[last]));
    EXPECT_EQ(foldersOf(chain),
              std::vector<const FolderNode*>(
                  folders.begin(), folders.begin() + FolderChain::maxDepth));
    EXPECT_FALSE(chain.find(root, *folders[last + 1]));  // one more than before
    EXPECT_TRUE(chain.folders().empty());
    EXPECT_FALSE(chain.find(root, *folders[last + 2]));
    EXPECT_TRUE(chain.find(root, *folders[0]));
    EXPECT_EQ(chain.folders().size(), 1U);
}

TEST(FolderChain, DoesNotReachAnotherRoot) {
    BPathTree tree;
    const auto folders = addFolder(tree, {"a", "b"});
    const BPathTree other;
    FolderChain chain;
    EXPECT_FALSE(chain.find(*other.root->folder(), *folders.back()));
    EXPECT_TRUE(chain.folders().empty());
}

}  // namespace
