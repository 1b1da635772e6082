#pragma once

#include <cstddef>
#include <cstdint>
#include <exception>
#include <vector>

#include "pathtree/BNode.hpp"
#include "pathtree/ChildFinder.hpp"
#include "pathtree/NodePool.hpp"
#include "pathtree/NodeStack.hpp"
#include "pathtree/PackedComponents.hpp"
#include "pathtree/PathTracks.hpp"

namespace tessel {

// Iteration was asked for a path and has none left.
class NoMorePathException : public std::exception {
public:
    const char* what() const noexcept override;
};

// A track was to be followed in a tree without paths.
class NoTreeToTraverseException : public std::exception {
public:
    const char* what() const noexcept override;
};

// An empty track was to be followed.
class EmptyPathForTraverseException : public std::exception {
public:
    const char* what() const noexcept override;
};

// A node code of the stored form is none of the four.
class UnknownNodeTypeException : public std::exception {
public:
    const char* what() const noexcept override;
};

// An encoded component, and a list of them: a folder's components, a batch
// of file names, or a whole path with the file name last.
using Component = std::vector<std::uint8_t>;
using Components = std::vector<Component>;

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
// Cost: a file takes its encoded name, 5 to 8 bytes, and 8 bytes in its
//   folder's child list; a folder takes 8 bytes more, and about 20 for the
//   list if it has more than one child. Finding a child takes constant time
//   on average.
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

    // Position of the first of `nodes` that equals value, or allOnes.
    // Cost: linear; the insertions use a faster route to the same answer.
    std::uint64_t findNode(const Component& value,
                           const ChildList& nodes) const;

    // Position of the first of `nodes` that equals value. If there is none,
    // `existed` becomes false and a new last child takes over the bytes,
    // leaving value empty; otherwise `existed` becomes true and value is
    // untouched. Cost: linear.
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
    //
    // If it throws (std::bad_alloc, std::length_error), no file is added; a
    // new folder may be left without files.
    bool addPath(Components& folderComponents, Components& fileNames,
                 PathTrack& pathTrack, std::uint64_t& firstFileIndex);

    // The two halves of it, from packed lists, which are only read. The
    // first finds or makes the folder; the second, to be called with a
    // folder of this tree, returns the position that the first file takes.
    BNode& addFolder(const PackedComponents& folderComponents,
                     PathTrack& pathTrack, bool& existed);
    std::uint64_t addFiles(BNode& folder, const PackedComponents& fileNames);

    // True when the node has no children.
    bool isLeaf(const BNodePtr& node) const noexcept;

    // ---- Iteration ----
    // A pass begins with reset and yields every leaf, depth first, siblings
    // in the order of insertion. Do not insert during a pass.

    // Starts a new pass. On a tree without paths it does nothing.
    // Releases the memory that speeds up insertion.
    void reset();

    // True while the pass has a path left; false before the first reset.
    bool hasNextPath() const noexcept;

    // Replaces `out` by the next path's components, folders first. Throws
    // NoMorePathException when none is left, with nothing changed.
    // Cost: the depth of the tree and the bytes of the path.
    void getNextPath(Components& out);

    // Pushes the node's children, the first on top; the second form onto
    // pendingNodes.
    void pushAllChildren(const BNodePtr& node, NodeStack& stack) const;
    void pushAllChildren(const BNodePtr& node);

    // True when node is the last child of the stack's top node, by identity;
    // the second form asks parentNodes. False for an empty stack.
    bool isNodeAtEndOfParent(const BNodePtr& node,
                             const NodeStack& parents) const noexcept;
    bool isNodeAtEndOfParent(const BNodePtr& node) const noexcept;

    // ---- Lookup ----
    // Positions that lead outside the tree throw std::out_of_range. Whatever
    // is thrown, the outputs are unchanged.

    // Appends to `out` the components along the track. Throws
    // NoTreeToTraverseException on a tree without paths, otherwise
    // EmptyPathForTraverseException on an empty track.
    void traversePath(const PathTrack& pathTrack, Components& out) const;

    // Fetches files by batch. For each entry i of selectedPartitions (a
    // position in partitionTracks, 0-based) appends to folderPaths the
    // batch's folder components and to filePaths the names of the files at
    // fileOffsets[i] (1-based within the batch), in that order.
    //
    // A track that ends at a leaf is that of a batch which joined an
    // existing folder, and the leaf its first file. So a batch that made its
    // folder and brought no file is answered as if the folder were a file.
    void getPath(
        std::vector<Components>& folderPaths,
        std::vector<Components>& filePaths,
        const std::vector<std::uint64_t>& selectedPartitions,
        const std::vector<PathTrack>& partitionTracks,
        const std::vector<std::vector<std::uint64_t>>& fileOffsets) const;

    // The same for one batch: appends to folder and files. If it throws, part
    // of them may be appended.
    void getBatch(Components& folder, Components& files, const PathTrack& track,
                  const std::vector<std::uint64_t>& offsets) const;

    // ---- Stored form (defined beside its layout, in packing/) ----

    // Appends a code and the value of every node but the root, in pre-order,
    // and returns the largest number of children of any node.
    std::size_t serialize(std::vector<std::uint8_t>& structure,
                          Components& values) const;

    // Replaces the tree by the one that the pair describes and returns its
    // number of leaves. Values that become nodes are left empty; entries
    // after a complete tree are ignored; two empty lists are the tree
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
        std::size_t finder = 0;      // what speeds up insertion
        std::size_t iteration = 0;   // stacks and prefix
    };
    // Cost: a walk over the tree.
    MemoryUsage memoryUsage() const;

    // Releases the memory that speeds up insertion, if it holds no more than
    // `most` children. It comes back by itself when it is needed.
    void releaseFinder(std::size_t most = ~std::size_t{0}) noexcept;

    // ---- State, public for inspection; change it through the operations ----

    BNodePtr root;
    NodeStack pendingNodes;    // still to visit in the pass; top is next
    NodeStack parentNodes;     // ancestors of the next node, root at bottom
    Components currentPrefix;  // values of the non-root nodes in parentNodes
    bool spareFlag = false;    // copied, otherwise unused

private:
    friend class TreeBuilder;

    ChildFinder::Found findOrAppend(BNode& parent, ComponentView value,
                                    NodePool::Kind kind, bool& existed) const;
    template <class Folder>
    BNode& findOrAddFolder(Folder& components, PathTrack& pathTrack,
                           bool& existed);
    template <class Files>
    std::uint64_t appendFiles(BNode& folder, Files& fileNames);
    void closeFinishedFolders();

    // Helpers of insertion, which is const for addIfExistsAndFind: the tree
    // is in the nodes, not in them.
    mutable NodePool pool_;
    mutable ChildFinder finder_;
};

}  // namespace tessel
