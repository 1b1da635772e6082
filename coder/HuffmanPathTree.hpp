#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <queue>
#include <string>
#include <thread>
#include <unordered_map>
#include <utility>
#include <vector>

#include "coder/AtomicMaximum.hpp"
#include "coder/CodeTable.hpp"
#include "coder/CoderErrors.hpp"
#include "coder/HNode.hpp"
#include "coder/PathTracks.hpp"
#include "packing/sixpacks.hpp"  // for the exceptions
#include "pathtree/BPathTree.hpp"
#include "pathtree/ComponentList.hpp"

namespace tessel {

struct Batch;
class HuffmanCode;
class PathNumbering;

// HuffmanPathTree keeps a very large list of file paths in compact form: a
// Huffman code over UTF-16 code units, and a path tree whose components are
// texts in that code. It knows no separators: a path is a list of component
// texts, the folders first and the file name last.
//
// It is the face of its parts, which do the work:
//
//   part           | does                                 | state
//   ---------------+--------------------------------------+----------------
//   HuffmanCode    | the code, its tables, compact form   | code()
//   BatchEncoder   | texts to components, on workers      | none: per call
//   BatchInserter  | components into the tree, numbered   | none: per call
//   BPathTree      | the stored paths                     | pathTree
//   PathNumbering  | numbers, partitions, repeated paths  | numbering()
//   PathRetrieval  | paths by number                      | none
//   PathIteration  | paths one after the other            | none
//
// Life: construct; build the code once (deflateHuffman from frequencies, or
//   deserialize and inflateHuffman from a stored form); add paths; iterate,
//   fetch and store any number of times.
// Path numbers: the n-th path added has number n, counted from 1. A batch of
//   f files under one folder adds f paths and is one partition.
// Invariants: pathTree is never null; those of the parts.
// Ownership: the coder owns all its members; the nodes of pathTree are
//   shared with copies made by copyTree.
// Threads: one thread at a time. generateCodeAsyncAndAddPaths starts workers
//   of its own and joins them before it returns.
// Cost: about two fifths of the bytes that the paths' text takes in UTF-8 on
//   real lists of files.
class HuffmanPathTree {
public:
    using HeapQueue = std::priority_queue<HNode, std::vector<HNode>,
                                          HNodeFrequencyComparator>;
    using Visitor = std::function<void(HuffmanPathTree*, HNode&)>;
    // Folder i as a list of component texts, or the names of the files in it.
    using FolderTexts = std::vector<std::vector<std::u16string>>;

    HuffmanPathTree();
    HuffmanPathTree(const HuffmanPathTree&) = delete;
    HuffmanPathTree& operator=(const HuffmanPathTree&) = delete;
    virtual ~HuffmanPathTree();

    // ---- The Huffman code ----

    // Builds the code from characters and their frequencies, of which there
    // must be at least as many. Bit for bit reproducible: it depends on
    // nothing but the two lists and their order. A repeated character makes
    // two leaves; the first in pre-order gives the code. With fewer than two
    // characters there is no code at all.
    //
    // Source of the construction: D. A. Huffman, "A Method for the
    // Construction of Minimum-Redundancy Codes", 1952, over a binary heap.
    // Throws std::logic_error, with nothing changed, if the coder has a code
    // or a loaded shape already, and std::invalid_argument if there are
    // characters but no frequencies (null).
    void deflateHuffman(const double* characterFrequencies,
                        const std::u16string& characters);
    // The same in the map's own order, so codes of characters that are
    // equally frequent can depend on how the map was filled.
    void deflateHuffman(
        const std::unordered_map<char16_t, double>& characterFrequencies);

    // First step of deflateHuffman: empties `frequencies` and builds `nodes`.
    void makeHeapAndTree(const double* characterFrequencies,
                         const std::u16string& characters);
    void makeHeapAndTree(
        const std::unordered_map<char16_t, double>& characterFrequencies);

    // Merges the queue's nodes into a tree and appends it to `nodes`, which
    // should be empty. With fewer than two nodes it only sets rootIndex: to
    // the one node's index, which is -1 for a leaf, or to -1. The queue is
    // consumed down to the root.
    void generateTree(HeapQueue& queue);

    // Inspection. Calls visit with a copy of every node of the tree, in
    // pre-order, left before right; visit may change the coder. Without a tree
    // it does nothing. Throws std::logic_error, before the first visit, if the
    // nodes were edited so that they are not those of one tree; generateCode
    // and generateCompressedTree throw the same.
    void traverse(Visitor visit);

    // Rebuilds parentOf and adds the code of every leaf to `codes`. Codes
    // already in the table are not replaced. Codes longer than 56 bits are
    // not stored: they are read from the current tree.
    void generateCode();

    // Adds to `codes` the code of a leaf of `nodes`, read from parentOf,
    // unless its character has one.
    void addCode(const HNode& leaf);

    // The code of a character, nearest the root first. Throws
    // CodeNotFoundException if it has none.
    std::vector<bool> codeOf(char16_t character) const;

    // The leaves' frequencies in pre-order, or what was set.
    std::vector<double> getFrequencies() const;
    // Takes over the list and leaves it empty. The code is not touched.
    void setFrequencies(std::vector<double>& newFrequencies);

    // Makes this coder a copy of another; all or nothing. Workers and their
    // buffers are not copied. The path trees share their nodes: a path added
    // through one is stored and iterated by both, but its number, its
    // partition and pathCount are known only to the coder that added it.
    // After adding to one of the two, numbers of the other still lead to the
    // same paths; add to both only if iteration order and counts do not
    // matter.
    void copyTree(const HuffmanPathTree& other);

    // ---- Compact form of the code's tree ----

    // Appends the shape of the tree to boolTree, its leaves' characters to
    // treeString and their frequencies to `frequencies`, in pre-order.
    void generateCompressedTree();

    std::vector<bool> getBoolTree() const;
    std::u16string getTreeString() const;
    void setTreeString(const std::u16string& newTreeString);

    // Appends to `nodes` one unlinked node for each bit of boolTree, giving
    // the leaves the characters of treeString. Returns the number of leaves.
    // Throws DamagedFormException, with nothing changed, if there are fewer
    // characters than leaves.
    std::size_t inflateFromBoolTree();
    // Links the nodes that inflateFromBoolTree made. Throws std::logic_error,
    // with nothing changed, if there are none or they are linked already.
    void inflateFromCompressedTree();
    // Both of the above. Throws std::logic_error, with nothing changed, if
    // the coder has a code already.
    void inflate();

    // Builds the code from boolTree, as deserialize left it, and the tree
    // string that belongs to it. Throws std::logic_error if the coder has a
    // code already and DamagedFormException if the shape has not as many
    // leaves as there are characters; nothing is changed then.
    //
    // A shape that is a single leaf gives its character an empty code: every
    // text of that character becomes the same empty component, from which no
    // text comes back.
    void inflateHuffman(const std::u16string& newTreeString);

    // ---- Encoding and adding ----

    // The encoded component of a text: its characters' codes as one bit
    // block. Throws NoCodeForEmptyString or CodeNotFoundException.
    // Raises maxCodeBytes. Safe on several threads.
    Component generateCodeFor(const std::u16string& text);

    // Adds a batch: files[i] are the names of the files under the folder
    // whose components are folders[i]. Encodes on as many threads as the
    // hardware runs and inserts on this one, in input order: the result does
    // not depend on the number of threads. Takes over both lists and leaves
    // them empty.
    //
    // A file whose name later serves as a folder under the same parent
    // becomes that folder's node: it is no longer iterated, and numbers of
    // its batch can point elsewhere. Keep such a path apart by splitting it
    // at another place. Files without a folder that are added after the
    // root's first children count from the first of those children: number
    // them through a folder, or add them first.
    //
    // Throws std::invalid_argument, with nothing changed, if the lists
    // differ in length or are one and the same. If texts cannot be encoded,
    // or a thread cannot be started, the failure of the lowest folder is
    // thrown after all workers have ended, and nothing is inserted; only
    // maxCodeBytes counts what was encoded. std::bad_alloc during insertion
    // leaves the folders before it added, and nothing of the others.
    // A refused batch's texts that were not yet encoded stay in asyncFolders
    // and asyncFiles, so that they can be mended; memoryUsage names them.
    void generateCodeAsyncAndAddPaths(FolderTexts& folders, FolderTexts& files);
    // The same as if the hardware ran `hardwareThreads` threads (0: two).
    void generateCodeAsyncAndAddPaths(FolderTexts& folders, FolderTexts& files,
                                      unsigned hardwareThreads);

    // The folders of each worker, first and last, when n of them meet that
    // many hardware threads (0: two). Takes 16 bytes for each of these.
    static std::vector<std::pair<std::uint64_t, std::uint64_t>> splitFolders(
        std::uint64_t n, unsigned hardwareThreads);

    // Encodes the folders first to last of asyncFolders and asyncFiles into
    // encodedFolders and encodedFiles. Throws what generateCodeFor throws, and
    // std::logic_error, with nothing encoded, if one of the other lists ends
    // before the last of these folders. Safe on several threads whose folders
    // differ.
    void generateCodeForPath(std::uint64_t first, std::uint64_t last);

    // Waits for genThreads and forgets them.
    void joinAllGenThreads();
    // Releases the workers' buffers.
    void clearThreadResources();

    // Inserts what generateCodeForPath encoded, in order, and clears the
    // workers' buffers. Throws std::logic_error, with nothing changed, if
    // encodedFolders and encodedFiles differ in length.
    void addPathToBTreeFromAsyncData();

    // Inserts one partition. What is stored is moved from; use neither list
    // afterwards.
    void addPathToBTree(Components& folderComponents, Components& fileNames);
    // Inserts one whole path. If it was stored already, its number is noted
    // in `duplicates`.
    void addPathToBTree(Components& components);

    // True when the path of this number repeated one that was stored.
    bool hasDuplicate(std::uint64_t pathNumber) const;

    // ---- Decoding ----

    // The text of an encoded component. Input may be hostile: throws
    // DamagedFormException if it is empty, its last byte is above 7, or its
    // bits lead off the tree. Bits after the last whole code are ignored. A
    // tree that is a single leaf gives one character for each bit.
    std::u16string generatePathFrom(const Component& bytes) const;
    // Appends the same text; if it throws, `text` is unchanged.
    void appendPathFrom(ComponentView bytes, std::u16string& text) const;

    // Inspection. If the node at `position` is a leaf, appends its character,
    // moves position to the root and returns true. Throws
    // DamagedFormException if there is no such node.
    bool appendToPathIfLeaf(std::int32_t& position, std::u16string& text) const;

    // ---- Iteration ----

    // True while a path is left in the pass that resetPathsToBTree began.
    bool hasNextPathFromBTree() const;

    // The next path's components. A stored path replaces what `components`
    // held; a repeated one, whose number is in `duplicates`, is appended to
    // it. Throws NoMorePathException when none is left; the path is counted
    // as handed out even then. If memory runs out, the pass stays before this
    // path. PathIteration answers without copies.
    void getNextPathFromBTree(Components& components);

    // Starts a new pass; also releases what workers left.
    void resetPathsToBTree();

    // ---- Retrieval by number ----

    // Fetches paths by number: appends one entry for each partition met, its
    // folder's components to folderPaths and the encoded names of the files
    // asked for to filePaths. Numbers are truncated. Pass them in ascending
    // order: a number smaller than its predecessor is looked up in the
    // predecessor's partition and may return another file of that folder. The
    // first number that is above the last partition's end is the last one
    // looked at. PathRetrieval answers without copies.
    //
    // In a coder that was loaded with tracks and no ends, numbers are those
    // of partitions, whose folders are appended to folderPaths alone.
    //
    // Throws std::out_of_range for NaN, for -1 and below and for a number
    // that leads outside the tree; the outputs are then unchanged.
    void getPath(std::vector<Components>& folderPaths,
                 std::vector<Components>& filePaths,
                 const std::vector<double>& partitions) const;

    // ---- Stored form (HuffmanPathTreeForm.cpp, beside its layout) ----

    // Appends the stored form; all or nothing. It holds all but the tree
    // string, the frequencies and the state of iteration. Throws
    // std::logic_error if boolTree is not the shape of one tree.
    // Cost: zlib's level 9 outweighs the rest.
    void serialize(std::vector<std::uint8_t>& out, bool compress) const;

    // Reads a stored form, which must be the whole of `in` and have been
    // written with the same flag. Meant for a fresh coder: partitions are
    // appended to those that it has. The code is not built; inflateHuffman
    // does that. Input may be hostile: throws DamagedFormException,
    // InvalidUintConversionException or UnknownNodeTypeException, and the
    // coder is then as it was.
    void deserialize(std::vector<std::uint8_t>& in, bool compress);

    // Inspection. The path tree's part of it: see BPathTree. The second one
    // first replaces pathTree by a new one and sets pathCount to its leaves.
    std::size_t serializePathTree(std::vector<std::uint8_t>& structure,
                                  Components& values) const;
    std::size_t deserializePathTree(std::vector<std::uint8_t>& structure,
                                    Components& values);

    // ---- Memory ----

    // Heap bytes by what they serve, allocator's overhead included. Nodes
    // that copies share are counted in each copy.
    struct MemoryUsage {
        std::size_t names = 0;            // the encoded components' bytes
        std::size_t nodes = 0;            // all else in the tree's slabs
        std::size_t childLists = 0;       // arrays of children
        std::size_t partitionTracks = 0;  // tracks and ends
        std::size_t duplicates = 0;
        std::size_t code = 0;   // tree, tables, shape, string, frequencies
        std::size_t batch = 0;  // what a refused batch has left
        std::size_t other = 0;  // the object, iteration, search memory

        std::size_t total() const noexcept {
            return names + nodes + childLists + partitionTracks + duplicates +
                   code + batch + other;
        }
    };
    // Cost: a walk over the path tree.
    MemoryUsage memoryUsage() const;

    // ---- State, public for inspection; change it through the operations ----
    //
    // Who sets it by hand gets answers that fit what was set, or exceptions:
    // every operation checks what it follows. After partitionEnds was changed,
    // call numbering().checkEnds(). A caller must keep three things:
    //
    // - encodedFolders and encodedFiles hold views into buffers of this coder,
    //   which clearThreadResources and every insertion of a batch release. Do
    //   not put views there that outlived their coder or their batch.
    // - Calls lock the two mutexes: do not call while you hold one.
    // - A thread in genThreads must end by itself; calls and the destructor
    //   join it.

    const HuffmanCode& code() const noexcept { return *code_; }
    const PathNumbering& numbering() const noexcept { return *numbering_; }
    PathNumbering& numbering() noexcept { return *numbering_; }

private:
    void insertBatch(Batch& batch);
    // Throws std::logic_error if pathTree was set to null.
    BPathTree& tree() const;

    std::unique_ptr<HuffmanCode> code_;
    std::unique_ptr<PathNumbering> numbering_;
    // What a refused batch left, or what was put there.
    std::unique_ptr<Batch> batch_;

public:
    // What each of these means is said in the part that has it.

    // ---- HuffmanCode ----
    std::vector<bool>& boolTree;
    std::u16string& treeString;
    std::vector<double>& frequencies;
    std::int32_t& rootIndex;
    std::vector<HNode>& nodes;
    CodeTable& codes;
    std::vector<std::int32_t>& parentOf;

    std::unique_ptr<BPathTree> pathTree;  // null: operations throw logic_error

    // ---- PathNumbering ----
    std::map<std::uint64_t, PathTrack>& duplicates;
    std::vector<std::uint64_t>& partitionEnds;
    PathTracks& partitionTracks;
    std::uint64_t& maxPartitionTrackLength;
    std::uint64_t& maxDuplicateTrackLength;
    AtomicMaximum& maxCodeBytes;
    std::uint64_t& maxDuplicatePathNumber;
    std::uint64_t& nextPathNumber;
    std::uint64_t& pathCount;

    // ---- Batch, and workers that a caller of its steps started ----
    std::vector<std::thread> genThreads;
    FolderTexts& asyncFolders;
    FolderTexts& asyncFiles;
    std::vector<ComponentList>& encodedFolders;
    std::vector<ComponentList>& encodedFiles;
    std::mutex& folderResultMutex;
    std::mutex& fileResultMutex;
};

}  // namespace tessel
