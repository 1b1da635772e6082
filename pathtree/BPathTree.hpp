#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "pathtree/BNodePtr.hpp"
#include "pathtree/BatchFiles.hpp"
#include "pathtree/ChildIndex.hpp"
#include "pathtree/ComponentList.hpp"
#include "pathtree/NodePool.hpp"
#include "pathtree/NodeStack.hpp"
#include "pathtree/PathTreeErrors.hpp"
#include "pathtree/PathView.hpp"

namespace tessel {

// A path track: child positions from the root of the path tree down.
using PathTrack = std::vector<std::uint64_t>;

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
// Cost: a file takes its encoded name, 5 to 8 bytes (13 to 16 for a name of
//   63 bytes or more, see NodePool), and 8 to 10 bytes in its folder's child
//   list; a folder takes 8 bytes more, and about 20 for the list if it has
//   more than one child. Finding a child takes constant time on average.
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

    // A folder that took files: its node, whether it was stored already (the
    // root, for a folder without components, never counts as stored) and the
    // position of the first of the files.
    struct AddedBatch {
        BNode& folder;
        bool existed;
        std::uint64_t firstFile;
    };

    // The same from packed lists, which are only read.
    AddedBatch addBatch(const ComponentList& folderComponents,
                        const ComponentList& fileNames, PathTrack& pathTrack);

    // Appends files to a folder of this tree that was found before; returns
    // the position of the first.
    std::uint64_t addFiles(BNode& folder, const ComponentList& fileNames);

    // Inspection. True when the node has no children.
    bool isLeaf(const BNodePtr& node) const noexcept;

    // ---- Iteration ----
    // A pass begins with reset and yields every leaf, depth first, siblings
    // in the order of insertion. Do not insert during a pass.

    // Starts a new pass. On a tree without paths it does nothing.
    // Releases the memory that speeds up insertion.
    void reset();

    // True while the pass has a path left; false before the first reset.
    bool hasNextPath() const noexcept;

    // Calls visit(const PathView&) with the next path and moves on. Throws
    // NoMorePathException when none is left, with nothing changed.
    // If memory runs out, or visit throws, the pass stays before this path:
    // the call may be repeated.
    // Cost: the folders that are entered and left; no copy of the path.
    template <class Visit>
    void visitNextPath(Visit&& visit) {
        const ComponentView name = enterFolders().value();
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
    // Positions that lead outside the tree throw std::out_of_range. Views are
    // valid as long as the tree. When something is thrown, components may
    // have been visited already; output lists are unchanged.

    // Calls visit(ComponentView) with each component along the track. Throws
    // NoTreeToTraverseException on a tree without paths, otherwise
    // EmptyPathForTraverseException on an empty track.
    template <class Visit>
    void visitTrack(std::span<const std::uint64_t> track, Visit&& visit) const;

    // Calls visitFolder(ComponentView) with each folder component of the
    // batch to which the track belongs, then returns its files.
    //
    // The track ends at | the folder is   | the first file's position is
    // ------------------+-----------------+------------------------------
    // a node with files | that node       | 0: the batch made the folder
    // a leaf            | the leaf's      | the leaf's: the batch joined an
    //                   | parent          | existing folder
    //
    // So a batch that made its folder and brought no file is answered as if
    // the folder were a file.
    template <class VisitFolder>
    BatchFiles openBatch(std::span<const std::uint64_t> track,
                         VisitFolder&& visitFolder) const;

    // The same, and then visitFile(ComponentView) with the files at these
    // offsets (1-based within the batch), in the order given.
    template <class VisitFolder, class VisitFile>
    void visitBatch(std::span<const std::uint64_t> track,
                    std::span<const std::uint64_t> offsets,
                    VisitFolder&& visitFolder, VisitFile&& visitFile) const;

    // Inspection. Appends to `out` the components along the track. Throws as
    // visitTrack does.
    void traversePath(const PathTrack& pathTrack, Components& out) const;

    // Inspection. For each entry i of selectedPartitions (a position in
    // partitionTracks, 0-based) appends to folderPaths the batch's folder
    // components and to filePaths the names of the files at fileOffsets[i],
    // in that order: see openBatch. One list may be both outputs.
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

    // Releases the memory that speeds up insertion, if it holds no more than
    // `maxChildren` children. It comes back by itself when it is needed.
    void releaseChildIndex(std::size_t maxChildren = ~std::size_t{0}) noexcept;

    // ---- State, public for inspection; change it through the operations ----

    BNodePtr root;
    NodeStack pendingNodes;    // still to visit in the pass; top is next
    NodeStack parentNodes;     // ancestors of the next node, root at bottom
    Components currentPrefix;  // values of the non-root nodes in parentNodes
    bool spareFlag = false;    // copied, otherwise unused

private:
    friend class TreeBuilder;

    BatchFiles filesOfRoot() const;
    static const BNode& childAt(const BNode& node, std::uint64_t position) {
        return BatchFiles::childAt(node, position);
    }

    template <class Folder, class Files>
    AddedBatch insertBatch(Folder& components, Files& fileNames,
                           PathTrack& pathTrack);
    template <class Files>
    std::uint64_t appendFiles(BNode& folder, const Files& fileNames);
    const BNode& enterFolders();
    void leavePath() noexcept;
    void closeFinishedFolders() noexcept;

    // Mutable for addIfExistsAndFind, which is const: the tree's content is
    // its nodes; these only help to make and to find them.
    mutable NodePool pool_;
    mutable ChildIndex childIndex_;

    std::size_t unchangedFolders_ = 0;  // see PathView
};

template <class Visit>
void BPathTree::visitTrack(std::span<const std::uint64_t> track,
                           Visit&& visit) const {
    if (root->isLeaf()) throw NoTreeToTraverseException();
    if (track.empty()) throw EmptyPathForTraverseException();
    const BNode* node = root.get();
    for (const std::uint64_t position : track) {
        node = &childAt(*node, position);
        visit(node->value());
    }
}

template <class VisitFolder>
BatchFiles BPathTree::openBatch(std::span<const std::uint64_t> track,
                                VisitFolder&& visitFolder) const {
    if (track.empty()) return filesOfRoot();
    const BNode* folder = root.get();
    for (const std::uint64_t position : track.first(track.size() - 1)) {
        folder = &childAt(*folder, position);
        visitFolder(folder->value());
    }
    const BNode& end = childAt(*folder, track.back());
    if (end.isLeaf()) return {*folder, track.back()};
    visitFolder(end.value());
    return {end, 0};
}

template <class VisitFolder, class VisitFile>
void BPathTree::visitBatch(std::span<const std::uint64_t> track,
                           std::span<const std::uint64_t> offsets,
                           VisitFolder&& visitFolder,
                           VisitFile&& visitFile) const {
    const BatchFiles files = openBatch(track, visitFolder);
    for (const std::uint64_t offset : offsets) visitFile(files[offset]);
}

}  // namespace tessel
