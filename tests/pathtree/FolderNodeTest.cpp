// The node of a folder: its name, the place of its children, its release.

#include <gtest/gtest.h>

#include <array>
#include <limits>
#include <stdexcept>

#include "pathtree/BNodePtr.hpp"
#include "pathtree/NodePool.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::childTexts;
using support::component;
using support::components;
using tessel::BNodePtr;
using tessel::ChildBatch;
using tessel::ChildBlock;
using tessel::Component;
using tessel::ComponentArena;
using tessel::Components;
using tessel::FolderNode;
using tessel::NodePool;
using Texts = std::vector<std::string>;

Component valueOf(std::size_t length) {
    Component value(length);
    for (std::size_t i = 0; i < length; ++i)
        value[i] = static_cast<std::uint8_t>(i * 7 + length);
    return value;
}

// Files as a batch, valid as long as the arena.
ChildBatch filesOf(ComponentArena& arena, const Components& names) {
    const auto list = support::packedBy(arena, names);
    return {list.bytes(), list.size(), false};
}

// A folder as the only child of a batch, which takes over its share.
class OneFolder {
public:
    explicit OneFolder(FolderNode* folder) {
        ChildBlock::writeFolder(entry_.data(), folder);
    }
    ChildBatch batch() const { return {entry_, 1, true}; }

private:
    std::array<std::uint8_t, ChildBlock::folderEntryBytes> entry_{};
};

// On both sides of each border: 62 and 63, 1024 and 1025.
constexpr std::size_t lengths[] = {0,    1,    61,   62,    63,    64,   255,
                                   1023, 1024, 1025, 16000, 16384, 70000};

TEST(FolderNode, KeepsANameOfAnyLengthWithAnyChildren) {
    NodePool pool;
    ComponentArena arena;
    for (const std::size_t length : lengths)
        for (const std::size_t files : {0U, 1U, 3U, 40U, 5000U}) {
            Components names;
            for (std::size_t i = 0; i < files; ++i)
                names.push_back(valueOf(i % 30));
            const BNodePtr node = BNodePtr::adopt(
                pool.make(valueOf(length), filesOf(arena, names)));
            FolderNode& folder = *node->folder();
            EXPECT_TRUE(tessel::sameComponent(folder.value(), valueOf(length)));
            ASSERT_EQ(folder.children().count(), files);
            for (std::size_t i = 0; i < files; ++i)
                ASSERT_TRUE(
                    tessel::sameComponent(folder.child(i).value(), names[i]));
            EXPECT_EQ(folder.ownValueBytes() > 0, length > 1024);
            EXPECT_EQ(folder.ownChildBytes() > 0, files >= 40);
            folder.append(filesOf(arena, {valueOf(9)}));
            ASSERT_EQ(folder.children().count(), files + 1);
            EXPECT_TRUE(tessel::sameComponent(folder.value(), valueOf(length)));
            EXPECT_EQ(folder.child(files).value().size(), 9U);
        }
}

TEST(FolderNode, FirstChildrenAreExactAndLaterOnesHaveAnEighthMore) {
    NodePool pool;
    ComponentArena arena;
    const ChildBatch thousand =
        filesOf(arena, Components(1000, component("123456789")));
    const BNodePtr node = BNodePtr::adopt(pool.make({}, thousand));
    FolderNode& folder = *node->folder();
    const std::size_t exact = 7 + 1000 * 10 + 124 * 2;
    EXPECT_GE(folder.ownChildBytes(), exact);
    EXPECT_LE(folder.ownChildBytes(), exact + 32);
    folder.append(filesOf(arena, components({"x"})));
    EXPECT_GE(folder.ownChildBytes(), exact + 1250);
    EXPECT_LE(folder.ownChildBytes(), exact + 1250 + 40);
    folder.trim();
    EXPECT_LE(folder.ownChildBytes(), exact + 2 + 32);
    EXPECT_EQ(support::textOf(folder.child(1000).value()), "x");
    EXPECT_EQ(support::textOf(folder.child(999).value()), "123456789");
}

TEST(FolderNode, TooManyChildrenAreRefusedBeforeMemoryIsTaken) {
    NodePool pool;
    ComponentArena arena;
    const BNodePtr node =
        BNodePtr::adopt(pool.make({}, filesOf(arena, components({"a"}))));
    const ChildBatch tooMany{
        {}, std::numeric_limits<std::uint32_t>::max(), false};
    EXPECT_THROW(node->folder()->append(tooMany), std::length_error);
    EXPECT_EQ(childTexts(*node), Texts{"a"});
}

// Names around the entry of a folder, which has nine bytes.
TEST(FolderNode, AFileOfAnyLengthBecomesAFolder) {
    NodePool pool;
    ComponentArena arena;
    for (const std::size_t length : {0U, 1U, 7U, 8U, 9U, 252U, 253U, 300U}) {
        Components names;
        for (std::size_t i = 0; i < 40; ++i) names.push_back(valueOf(length));
        const BNodePtr node =
            BNodePtr::adopt(pool.make({}, filesOf(arena, names)));
        FolderNode& folder = *node->folder();
        for (const std::size_t position : {20U, 0U, 39U}) {
            folder.reservePromotion(position);
            folder.promote(
                position,
                pool.make(valueOf(length),
                          filesOf(arena, components({"inside", "it"}))));
        }
        folder.append(filesOf(arena, components({"last", ""})));
        ASSERT_EQ(folder.children().count(), 42U);
        for (std::size_t i = 0; i < 40; ++i) {
            const tessel::Child child = folder.child(i);
            EXPECT_TRUE(tessel::sameComponent(child.value(), valueOf(length)));
            EXPECT_EQ(child.folder != nullptr, i == 0 || i == 20 || i == 39);
        }
        EXPECT_EQ(support::textOf(folder.child(40).value()), "last");
        EXPECT_EQ(support::textOf(folder.child(41).value()), "");
    }
}

TEST(FolderNode, IsReleasedWithEveryKindOfChild) {
    NodePool pool;
    ComponentArena arena;
    BNodePtr held;
    {
        const BNodePtr root = BNodePtr::adopt(pool.make({}, {}));
        for (std::size_t files = 0; files < 60; files += 7) {
            const Components names(files, valueOf(300));
            FolderNode* const inner =
                pool.make(valueOf(2000), filesOf(arena, names));
            FolderNode* const middle =
                pool.make(valueOf(5), OneFolder(inner).batch());
            middle->append(filesOf(arena, {valueOf(3)}));
            root->folder()->append(OneFolder(middle).batch());
        }
        held = BNodePtr(root->children()[3]);
    }
    EXPECT_EQ(held->value().size(), 5U);
    ASSERT_EQ(held->children().size(), 2U);
    EXPECT_EQ(held->children()[0].children().size(), 21U);
    EXPECT_EQ(held->children()[0].children()[20].value().size(), 300U);
}

// ---- The way up ----

TEST(FolderNode, AFolderKnowsWhatItIsIn) {
    NodePool pool;
    ComponentArena arena;
    const BNodePtr root = BNodePtr::adopt(pool.make({}, {}));
    EXPECT_EQ(root->folder()->parent(), nullptr);

    FolderNode* const inner = pool.make(valueOf(3), {});
    FolderNode* const made = pool.make(valueOf(4), OneFolder(inner).batch());
    EXPECT_EQ(inner->parent(), made);
    EXPECT_EQ(made->parent(), nullptr);

    root->folder()->append(OneFolder(made).batch());
    EXPECT_EQ(made->parent(), root->folder());

    root->folder()->append(filesOf(arena, {valueOf(9), valueOf(20)}));
    root->folder()->reservePromotion(2);
    FolderNode* const promoted = pool.make(valueOf(20), {});
    root->folder()->promote(2, promoted);
    EXPECT_EQ(promoted->parent(), root->folder());
}

// Files and folders in turn: each folder is found among them.
TEST(FolderNode, FoldersAmongFilesKnowWhatTheyAreIn) {
    NodePool pool;
    std::vector<std::uint8_t> entries;
    std::vector<FolderNode*> folders;
    for (std::size_t i = 0; i < 40; ++i) {
        folders.push_back(pool.make(valueOf(i), {}));
        entries.resize(entries.size() + ChildBlock::folderEntryBytes);
        ChildBlock::writeFolder(
            entries.data() + entries.size() - ChildBlock::folderEntryBytes,
            folders.back());
        entries.push_back(static_cast<std::uint8_t>(i));
        entries.insert(entries.end(), i, 7);
    }
    const BNodePtr root =
        BNodePtr::adopt(pool.make({}, {entries, 80, true, true}));
    for (const FolderNode* folder : folders)
        EXPECT_EQ(folder->parent(), root->folder());
}

}  // namespace
