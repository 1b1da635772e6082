// Packed children beside a plain vector: batches, folders, files that become
// folders, growth over all borders of numbers, and trees that share them.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <array>
#include <map>
#include <set>

#include "pathtree/BNodePtr.hpp"
#include "pathtree/BPathTree.hpp"
#include "pathtree/NodePool.hpp"
#include "tests/support/Trees.hpp"

namespace {

using tessel::BNodePtr;
using tessel::BPathTree;
using tessel::Child;
using tessel::ChildBlock;
using tessel::ChildReader;
using tessel::Component;
using tessel::ComponentArena;
using tessel::Components;
using tessel::FolderNode;
using tessel::NodePool;

// ---- One folder ----

struct PlainChild {
    Component name;
    BNodePtr folder;
};

Component nameOf(unsigned seed) {
    static constexpr std::array<std::size_t, 12> lengths = {
        0, 1, 3, 7, 8, 9, 12, 30, 252, 253, 254, 1000};
    return Component(lengths[seed % lengths.size()],
                     static_cast<std::uint8_t>(seed / lengths.size()));
}

bool sameChild(const Child& child, const PlainChild& plain) {
    return tessel::sameComponent(child.value(), plain.name) &&
           child.folder == (plain.folder ? plain.folder->folder() : nullptr);
}

void compare(const FolderNode& folder, const std::vector<PlainChild>& plain) {
    const ChildBlock block = folder.children();
    RC_ASSERT(block.count() == plain.size());
    ChildReader reader(block);
    for (std::size_t i = 0; i < plain.size(); ++i) {
        RC_ASSERT(sameChild(reader.next(), plain[i]));
        RC_ASSERT(sameChild(folder.child(i), plain[i]));
    }
    RC_ASSERT(reader.atEnd());
    RC_ASSERT(ChildReader(block, plain.size()).atEnd());
}

// A folder and its plain twin, changed by the same steps.
class Pair {
public:
    void appendFiles(unsigned count, unsigned seed) {
        ComponentArena arena;
        for (unsigned i = 0; i < count; ++i) {
            plain_.push_back({nameOf(seed + i * 7), {}});
            arena.append(plain_.back().name);
        }
        const auto list = arena.finish();
        node_->folder()->append({list.bytes(), list.size(), false});
    }
    void appendFolder(unsigned seed) {
        plain_.push_back({nameOf(seed), {}});
        FolderNode* const made = makeFolder(plain_.back());
        std::array<std::uint8_t, ChildBlock::folderEntryBytes> entry{};
        ChildBlock::writeFolder(entry.data(), made);
        node_->folder()->append({entry, 1, true, seed % 3 == 0});
    }
    void promote(unsigned seed) {
        if (plain_.empty()) return;
        const std::size_t position = seed % plain_.size();
        if (plain_[position].folder) return;
        node_->folder()->reservePromotion(position);
        node_->folder()->promote(position, makeFolder(plain_[position]));
    }
    void trim() {
        node_->folder()->trim();
        if (node_->folder()->ownChildBytes() > 0)
            RC_ASSERT(node_->folder()->children().slackBytes() == 0U);
    }
    void check() const { compare(*node_->folder(), plain_); }

private:
    // Held by its parent and by its plain twin.
    FolderNode* makeFolder(PlainChild& plain) {
        static constexpr std::array<std::uint8_t, 2> file = {1, 9};
        FolderNode* const made = pool_.make(plain.name, {file, 1, false});
        plain.folder = BNodePtr(tessel::BNode(*made));
        return made;
    }

    NodePool pool_;
    BNodePtr node_ = BNodePtr::adopt(pool_.make({}, {}));
    std::vector<PlainChild> plain_;
};

RC_GTEST_PROP(ChildBlock, EqualsAVector, ()) {
    Pair pair;
    const auto steps = *rc::gen::container<std::vector<unsigned>>(
        rc::gen::arbitrary<unsigned>());
    for (const unsigned step : steps) {
        const unsigned seed = step / 8;
        switch (step % 8) {
            case 0:
            case 1:
                pair.appendFiles(seed % 40, seed);
                break;
            case 2:
                pair.appendFiles(seed % 100 == 0 ? 3000 : 1, seed);
                break;
            case 3:
            case 4:
                pair.appendFolder(seed);
                break;
            case 5:
                pair.trim();
                break;
            default:
                pair.promote(seed);
        }
        pair.check();
    }
}

// The block's numbers have one byte at first, then two: one step at a time
// over the borders, of bytes and of children.
void growOver(std::size_t border) {
    for (const std::size_t length : {0U, 20U, 252U}) {
        NodePool pool;
        const BNodePtr node = BNodePtr::adopt(pool.make({}, {}));
        FolderNode& folder = *node->folder();
        ComponentArena arena;
        const std::size_t perBlock = border / (1 + length);
        const std::size_t distance = perBlock / 100 + 40;
        const std::size_t first = perBlock - std::min(perBlock, distance);
        for (std::size_t i = 0; i < first; ++i)
            arena.append(Component(length, static_cast<std::uint8_t>(i)));
        auto list = arena.finish();
        folder.append({list.bytes(), list.size(), false});
        for (std::size_t i = first; i < perBlock + 100; ++i) {
            arena.append(Component(length, static_cast<std::uint8_t>(i)));
            list = arena.finish();
            folder.append({list.bytes(), 1, false});
            ASSERT_EQ(folder.children().count(), i + 1);
            ASSERT_EQ(folder.child(i).value().size(), length);
        }
        for (std::size_t i = 0; i < perBlock + 100; ++i)
            ASSERT_TRUE(tessel::sameComponent(
                folder.child(i).value(),
                Component(length, static_cast<std::uint8_t>(i))));
    }
}

TEST(ChildBlock, GrowsOverTheBorderOfOneByte) { growOver(255); }
TEST(ChildBlock, GrowsOverTheBorderOfTwoBytes) { growOver(65535); }

// Children whose block is full, with every number of bytes around a border: as
// they were made, with one more, given back, and with a folder among them.
void expectEachSize(std::size_t shortest, std::size_t longest) {
    for (std::size_t length = shortest; length <= longest; ++length) {
        NodePool pool;
        std::vector<Component> names;
        for (std::uint8_t i = 0; i < 20; ++i) names.push_back({i});
        names.insert(names.begin() + 9, Component(length, 99));
        ComponentArena arena;
        for (const Component& name : names) arena.append(name);
        auto list = arena.finish();
        const BNodePtr node =
            BNodePtr::adopt(pool.make({}, {list.bytes(), list.size(), false}));
        FolderNode& folder = *node->folder();
        const auto expectNames = [&] {
            ASSERT_EQ(folder.children().count(), names.size());
            ChildReader reader(folder.children());
            for (std::size_t i = 0; i < names.size(); ++i) {
                ASSERT_TRUE(
                    tessel::sameComponent(folder.child(i).value(), names[i]))
                    << length;
                ASSERT_TRUE(
                    tessel::sameComponent(reader.next().value(), names[i]));
            }
        };
        expectNames();
        arena.append(names.emplace_back(Component{77}));
        list = arena.finish();
        folder.append({list.bytes(), list.size(), false});
        expectNames();
        folder.trim();
        expectNames();
        folder.reservePromotion(3);
        folder.promote(3, pool.make(names[3], {list.bytes(), 1, false}));
        expectNames();
    }
}

TEST(ChildBlock, HasEachSizeAroundTheBorderOfOneByte) {
    expectEachSize(1, 300);
}
TEST(ChildBlock, HasEachSizeAroundTheBorderOfTwoBytes) {
    expectEachSize(65'200, 65'540);
}

// ---- A tree and its copy, beside plain lists of children ----

// Children as a plain tree has them: in order, never removed.
struct PlainNode {
    Component name;
    std::vector<PlainNode> children;

    // The first child of this name, made if there is none.
    PlainNode& enter(const Component& wanted) {
        for (PlainNode& child : children)
            if (child.name == wanted) return child;
        return children.emplace_back(PlainNode{wanted, {}});
    }
};

void compare(const tessel::BNode& node, const PlainNode& plain) {
    RC_ASSERT(tessel::sameComponent(node.value(), plain.name));
    const tessel::ChildList children = node.children();
    RC_ASSERT(children.size() == plain.children.size());
    for (std::size_t i = 0; i < plain.children.size(); ++i)
        compare(children[i], plain.children[i]);
}

RC_GTEST_PROP(ChildBlock, TreesThatShareFoldersEqualAPlainTree, ()) {
    auto tree = std::make_unique<BPathTree>();
    auto copy = std::make_unique<BPathTree>(*tree);
    PlainNode plain;
    const auto steps = *rc::gen::container<std::vector<std::vector<unsigned>>>(
        rc::gen::container<std::vector<unsigned>>(rc::gen::inRange(0U, 60U)));
    for (const std::vector<unsigned>& step : steps) {
        BPathTree& used = step.size() % 2 == 0 ? *tree : *copy;
        Components path;
        for (const unsigned seed : step) path.push_back(nameOf(seed));
        if (path.size() > 6) path.resize(6);
        PlainNode* place = &plain;
        tessel::PathTrack track;
        if (step.size() % 3 == 0) {
            for (const Component& name : path) place = &place->enter(name);
            used.addPath(path, track);
        } else {
            Components files;
            for (unsigned i = 0; i < step.size() * 3; ++i)
                files.push_back(nameOf(step[0] + i));
            for (const Component& name : path) place = &place->enter(name);
            for (const Component& name : files)
                place->children.push_back(PlainNode{name, {}});
            std::uint64_t first = 0;
            used.addPath(path, files, track, first);
        }
        if (step.size() % 5 == 0) used.reset();
    }
    compare(*tree->root, plain);
    tree.reset();
    compare(*copy->root, plain);
}

}  // namespace
