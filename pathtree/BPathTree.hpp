#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "pathtree/BNodePtr.hpp"
#include "pathtree/Component.hpp"
#include "pathtree/NodeStack.hpp"
#include "pathtree/PathTrack.hpp"
#include "pathtree/PathTreeErrors.hpp"
#include "pathtree/PathView.hpp"

namespace tessel {

class TreeInserter;

// BPathTree keeps paths as a trie whose edges are encoded components,
// compared by length and bytes, never decoded, ordered or interpreted.
//
// Invariants: root exists, has an empty value and belongs to no path;
//   children are only appended, so positions hold until deserialize; any
//   other node without children ends a path.
// Ownership: the tree owns root, a node its children. A copy shares nodes
//   with its source, so each sees the other's insertions; iteration state is
//   separate. Releasing a tree does not recurse.
// Threads: no locks. Use a tree and its copies from one thread at a time;
//   releasing them on different threads is safe.
// Cost: a file takes its encoded name and a byte in its folder's ChildBlock
//   (nine for a name of 253 bytes or more), and at most a quarter of a byte
//   for its position, a whole byte in a folder of more than 64 KiB; a folder
//   takes some 23 bytes, and 24 more if its block is on the heap. Finding a
//   child takes constant time on average.
class BPathTree {
public:
    // No position: what a search answers that finds nothing.
    static constexpr std::uint64_t allOnes = ~std::uint64_t{0};

    using BNode = tessel::BNode;

    BPathTree();
    // Shares all nodes with `other` and takes over its place in a pass.
    BPathTree(const BPathTree& other);
    BPathTree& operator=(const BPathTree&) = delete;
    virtual ~BPathTree();

    // ---- Insertion ----

    // If an insertion throws (std::bad_alloc, std::length_error), the tree,
    // its inputs and pathTrack are as they were; firstFileIndex, too.

    // Inspection. Position of the first of `nodes` that equals value, or
    // allOnes. Cost: linear; the insertions use a faster route to the same
    // answer.
    std::uint64_t findNode(const Component& value,
                           const ChildList& nodes) const;

    // Inspection. Position of the first of `nodes` that equals value. If
    // there is none, `existed` becomes false and a new last child takes over
    // the bytes, leaving value empty; otherwise `existed` becomes true and
    // value is untouched. Cost: linear.
    std::uint64_t addIfExistsAndFind(const ChildList& nodes, Component& value,
                                     bool& existed) const;

    // Adds one whole path and returns true when all of it was stored
    // already. Appends to pathTrack the positions of the part that was.
    // Components that become nodes are left empty; none may be used
    // afterwards. No components: false, and nothing changes.
    bool addPath(Components& components, PathTrack& pathTrack);

    // Adds files under a folder and returns true when the folder was stored
    // already. Appends the folder's positions to pathTrack. firstFileIndex
    // becomes the position of the first file if the folder was there, else
    // allOnes. File names are appended unseen, equal ones too. Without
    // folder components the files go under the root, with false and allOnes.
    // Components that become nodes are left empty.
    //
    // A file whose name later serves as a folder component under the same
    // parent becomes that folder's node and is no path any more.
    bool addPath(Components& folderComponents, Components& fileNames,
                 PathTrack& pathTrack, std::uint64_t& firstFileIndex);

    // The faster routes of those who know where a folder is.
    TreeInserter& inserter() noexcept { return *inserter_; }

    // Inspection. True when the node has no children.
    bool isLeaf(const BNodePtr& node) const noexcept;

    // ---- Iteration ----
    // A pass begins with reset and yields every leaf, depth first, siblings
    // in the order of insertion. Do not insert during a pass.

    // Starts a new pass. On a tree without paths it does nothing.
    // Releases the memory that speeds up insertion, and what the growth of
    // folders left unused: a walk over the tree if there was any.
    void reset();

    // True while the pass has a path left; false before the first reset.
    bool hasNextPath() const noexcept;

    // Calls visit(const PathView&) with the next path and moves on. Throws
    // NoMorePathException when none is left, with nothing changed.
    // If memory runs out, or visit throws, the pass stays before this path:
    // the call may be repeated. If visit itself changes the tree or the pass,
    // its views end there and the pass moves on by one more node.
    // Cost: the folders that are entered and left; no copy of the path.
    template <class Visit>
    void visitNextPath(Visit&& visit) {
        const ComponentView name = enterFolders();
        visit(PathView{currentPrefix, name, unchangedFolders_});
        leavePath();
    }

    // Inspection. Replaces `out` by the next path's components, folders first.
    // Throws as visitNextPath does. Cost: the depth of the tree and the bytes
    // of the path.
    void getNextPath(Components& out);

    // Inspection. Pushes the node's children, the first on top; the second
    // form onto pendingNodes.
    void pushAllChildren(const BNodePtr& node, NodeStack& stack) const;
    void pushAllChildren(const BNodePtr& node);

    // Inspection. True when node is the last child of the stack's top node, by
    // identity; the second form asks parentNodes. False for an empty stack.
    bool isNodeAtEndOfParent(const BNodePtr& node,
                             const NodeStack& parents) const noexcept;
    bool isNodeAtEndOfParent(const BNodePtr& node) const noexcept;

    // ---- Lookup ----
    // Positions that lead outside the tree throw std::out_of_range; the
    // outputs are then unchanged. TrackLookup answers without copies.

    // Inspection. Appends to `out` the components along the track. Throws
    // NoTreeToTraverseException on a tree without paths, otherwise
    // EmptyPathForTraverseException on an empty track.
    void traversePath(const PathTrack& pathTrack, Components& out) const;

    // Inspection. For each entry i of selectedPartitions (a position in
    // partitionTracks, 0-based) appends to folderPaths the batch's folder
    // components and to filePaths the names of the files at fileOffsets[i],
    // in that order: see TrackLookup. One list may be both outputs.
    void getPath(
        std::vector<Components>& folderPaths,
        std::vector<Components>& filePaths,
        const std::vector<std::uint64_t>& selectedPartitions,
        const std::vector<PathTrack>& partitionTracks,
        const std::vector<std::vector<std::uint64_t>>& fileOffsets) const;

    // ---- Stored form (the layout is in BPathTreeForm.cpp) ----

    // Inspection. Appends a code and the value of every node but the root, in
    // pre-order, and returns the largest number of children of any node.
    std::size_t serialize(std::vector<std::uint8_t>& structure,
                          Components& values) const;

    // Inspection. Replaces the tree by the one that the pair describes and
    // returns its number of leaves. Values that become nodes are left empty;
    // entries after a complete tree are ignored; two empty lists are the tree
    // without paths. The place in a pass is not reset.
    //
    // Input may be hostile. Throws UnknownNodeTypeException on a code above
    // 3 and DamagedFormException when an entry is missing; the tree is then
    // partly rebuilt.
    std::size_t deserialize(std::vector<std::uint8_t>& structure,
                            Components& values);

    // ---- Memory ----

    // Heap bytes of the nodes that root reaches, wherever a copy also uses
    // them, and of this tree's own state.
    struct MemoryUsage {
        std::size_t names = 0;       // the values' bytes
        std::size_t nodes = 0;       // all else in the slabs
        std::size_t childLists = 0;  // arrays of children
        std::size_t childIndex = 0;  // what speeds up insertion
        std::size_t iteration = 0;   // stacks and prefix
    };
    // Cost: a walk over the tree.
    MemoryUsage memoryUsage() const;

    // ---- State, public for inspection; change it through the operations ----
    //
    // Any handles may be put here, those of other trees among them: the pass
    // goes on with them. A root that is a file or no node is a tree without
    // paths; inserting under no node throws std::logic_error.

    BNodePtr root;
    NodeStack pendingNodes;    // still to visit in the pass; top is next
    NodeStack parentNodes;     // ancestors of the next node, root at bottom
    Components currentPrefix;  // values of the non-root nodes in parentNodes
    bool spareFlag = false;    // copied, otherwise unused

private:
    ComponentView enterFolders();
    void leavePath() noexcept;
    void closeFinishedFolders() noexcept;

    std::unique_ptr<TreeInserter> inserter_;
    std::size_t unchangedFolders_ = 0;  // see PathView
};

}  // namespace tessel
