#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <exception>
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

#include "coder/CodeTable.hpp"
#include "coder/DecodeTable.hpp"
#include "coder/FolderMemo.hpp"
#include "coder/HNode.hpp"
#include "packing/sixpacks.hpp"
#include "pathtree/BPathTree.hpp"

namespace tessel {

// An empty text was to be encoded.
class NoCodeForEmptyString : public std::exception {
public:
    const char* what() const noexcept override;
};

// A text to be encoded holds a character that has no code.
class CodeNotFoundException : public std::exception {
public:
    const char* what() const noexcept override;
};

// HuffmanPathTree keeps a very large list of file paths in compact form: a
// Huffman code over UTF-16 code units, and a path tree whose components are
// texts in that code. It knows no separators: a path is a list of component
// texts, the folders first and the file name last.
//
// Life: construct; build the code once (deflateHuffman from frequencies, or
//   deserialize and inflateHuffman from a stored form); add paths; iterate,
//   fetch and store any number of times.
// Path numbers: the n-th path added has number n, counted from 1. A batch of
//   f files under one folder adds f paths and is one partition.
// Invariants: pathTree is never null. With a code, nodes[rootIndex] is the
//   root, each node's index is its position, and `codes` has every leaf's
//   character. partitionEnds and partitionTracks have one entry a partition
//   (a loaded form may hold tracks without ends).
// Ownership: the coder owns all its members; the nodes of pathTree are
//   shared with copies made by copyTree.
// Threads: one thread at a time. generateCodeAsyncAndAddPaths starts workers
//   of its own and joins them before it returns.
// Cost: about half the bytes that the paths' text takes in UTF-8 on real
//   lists of files.
class HuffmanPathTree {
public:
    using HeapQueue = std::priority_queue<HNode, std::vector<HNode>,
                                          HNodeFrequencyComparator>;
    using Visitor = std::function<void(HuffmanPathTree*, HNode&)>;
    using FolderTexts = std::vector<std::vector<std::u16string>>;
    using FirstAndLast = std::pair<std::uint64_t, std::uint64_t>;

    HuffmanPathTree();
    HuffmanPathTree(const HuffmanPathTree&) = delete;
    HuffmanPathTree& operator=(const HuffmanPathTree&) = delete;
    virtual ~HuffmanPathTree();

    // ---- The Huffman code ----

    // Builds the code from characters and their frequencies, of which there
    // must be at least as many. Bit for bit reproducible: it depends on
    // nothing but the two lists and their order. A repeated character makes
    // two leaves, of which the first in pre-order gives the code. With fewer
    // than two characters there is no code at all.
    //
    // Source of the construction: D. A. Huffman, "A Method for the
    // Construction of Minimum-Redundancy Codes", 1952, over a binary heap.
    // Throws std::logic_error, with nothing changed, if the coder has a code
    // or a loaded shape already.
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

    // Calls visit with a copy of every node of the tree, in pre-order, left
    // before right. Without a tree it does nothing.
    void traverse(Visitor visit);

    // Rebuilds parentOf and adds the code of every leaf to `codes`. A
    // character that has a code keeps it, except that codes of over 56 bits
    // are always those of the present tree.
    void generateCode();

    // Adds to `codes` the code of a leaf of `nodes`, read off parentOf,
    // unless its character has one.
    void addCode(const HNode& leaf);

    // The code of a character, nearest the root first. Throws
    // CodeNotFoundException if it has none.
    std::vector<bool> codeOf(char16_t character) const;

    // The leaves' frequencies in pre-order, or what was set.
    std::vector<double> getFrequencies() const;
    // Takes over the list and leaves it empty. The code is not touched.
    void setFrequencies(std::vector<double>& newFrequencies);

    // Makes this coder a copy of another. Workers and their buffers are not
    // copied. The path trees share their nodes: a path added through one is
    // stored and iterated by both, but its number, its partition and
    // pathCount are known only to the coder that added it. After adding to
    // one of the two, numbers of the other still lead to the same paths;
    // add to both only if iteration order and counts do not matter.
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
    // Links the nodes that inflateFromBoolTree made.
    void inflateFromCompressedTree();
    // Both of the above.
    void inflate();

    // Builds the code from boolTree, as deserialize left it, and the tree
    // string that belongs to it. Throws std::logic_error if the coder has a
    // code already and DamagedFormException if the shape has not as many
    // leaves as there are characters; nothing is changed then.
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
    // at another place.
    //
    // Throws std::invalid_argument, with nothing changed, if the lists
    // differ in length or are one and the same. If texts cannot be encoded, or
    // a thread cannot be started, the failure of the lowest folder is thrown
    // after all workers have ended, and nothing is inserted. std::bad_alloc
    // during insertion leaves the folders before it added.
    void generateCodeAsyncAndAddPaths(FolderTexts& folders, FolderTexts& files);
    // The same as if the hardware ran `hardwareThreads` threads (0: two).
    void generateCodeAsyncAndAddPaths(FolderTexts& folders, FolderTexts& files,
                                      unsigned hardwareThreads);

    // The folders that each worker begins with, first and last, when n of
    // them meet that many hardware threads (0: two).
    static std::vector<FirstAndLast> splitFolders(std::uint64_t n,
                                                  unsigned hardwareThreads);

    // Encodes the folders first to last of asyncFolders and asyncFiles into
    // encodedFolders and encodedFiles, which must be as long. Throws what
    // generateCodeFor throws. Safe on several threads whose folders differ.
    void generateCodeForPath(std::uint64_t first, std::uint64_t last);

    // Encodes all of asyncFolders and asyncFiles, which must be equally long,
    // on as many workers as splitFolders gives ranges, and releases the texts
    // on the way. A worker whose range is done helps with the others'. A
    // single folder needs no worker and keeps its texts. Throws what
    // generateCodeAsyncAndAddPaths throws; what was encoded stays.
    void encodeOnWorkers(unsigned hardwareThreads);

    // Waits for the workers and forgets them.
    void joinAllGenThreads();
    // Releases the workers' buffers.
    void clearThreadResources();

    // Inserts what the workers encoded, in order, and clears their buffers.
    void addPathToBTreeFromAsyncData();

    // Inserts one partition. What is stored is moved from; use neither list
    // afterwards.
    void addPathToBTree(Components& folderComponents, Components& fileNames);
    // Inserts one whole path. If it was stored already, its number is noted
    // in `duplicates`.
    void addPathToBTree(Components& components);

    // True when the path of this number repeated one that was stored.
    bool hasDuplicate(std::uint64_t pathNumber) const;

    // ---- Decoding and retrieval ----

    // The text of an encoded component. Input may be hostile: throws
    // DamagedFormException if it is empty, its last byte is above 7, or its
    // bits lead off the tree. Bits after the last whole code are ignored. A
    // tree that is a single leaf gives one character for each bit.
    std::u16string generatePathFrom(const Component& bytes) const;
    // Appends the same text; if it throws, `text` is unchanged.
    void appendPathFrom(ComponentView bytes, std::u16string& text) const;

    // If the node at `position` is a leaf, appends its character, moves
    // position to the root and returns true. Throws DamagedFormException if
    // there is no such node.
    bool appendToPathIfLeaf(std::int32_t& position, std::u16string& text) const;

    // True while a path is left in the pass that resetPathsToBTree began.
    bool hasNextPathFromBTree() const;

    // The next path's components. A stored path replaces what `components`
    // held; a repeated one, whose number is in `duplicates`, is appended to
    // it. Throws NoMorePathException when none is left; the path is counted
    // as handed out even then.
    void getNextPathFromBTree(Components& components);

    // Starts a new pass; also ends and clears whatever workers left behind.
    void resetPathsToBTree();

    // Fetches paths by number, in ascending order, one entry for each
    // partition met: its folder's components are appended to folderPaths and
    // the encoded names of the files asked for to filePaths. Numbers are
    // truncated; those beyond the last partition end the collection. Numbers
    // out of order are answered in the order given as long as none is beyond
    // the partition at hand: one before it counts back from its first file,
    // which gives the folder's earlier children.
    //
    // In a coder that was loaded with tracks and no ends, numbers are those
    // of partitions, whose folders are appended to folderPaths alone.
    //
    // Throws std::out_of_range for NaN, for -1 and below and for a number
    // that leads outside the tree; the outputs are then unchanged.
    // Cost: for each partition met a search in partitionEnds and its track.
    void getPath(std::vector<Components>& folderPaths,
                 std::vector<Components>& filePaths,
                 const std::vector<double>& partitions) const;

    // ---- Stored form (defined beside its layout, in packing/) ----

    // Appends the stored form. It holds all but the tree string, the
    // frequencies and the state of iteration. Throws std::logic_error, with
    // nothing appended, if boolTree is not the shape of one tree.
    // Cost: zlib's level 9 outweighs the rest.
    void serialize(std::vector<std::uint8_t>& out, bool compress) const;

    // Reads a stored form, which must be the whole of `in` and have been
    // written with the same flag. Meant for a fresh coder: partitions are
    // appended to those that it has. The code is not built; inflateHuffman
    // does that. Input may be hostile: throws DamagedFormException,
    // InvalidUintConversionException or UnknownNodeTypeException, and the
    // coder is then as it was.
    void deserialize(std::vector<std::uint8_t>& in, bool compress);

    // The path tree's part of it: see BPathTree. The second one first
    // replaces pathTree by a new one and sets pathCount to its leaves.
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
        std::size_t other = 0;  // the object, iteration, search memory

        std::size_t total() const noexcept {
            return names + nodes + childLists + partitionTracks + duplicates +
                   code + other;
        }
    };
    // Cost: a walk over the path tree.
    MemoryUsage memoryUsage() const;

    // ---- State, public for inspection; change it through the operations ----

    std::vector<bool> boolTree;  // shape in pre-order; true: a leaf
    std::u16string treeString;   // the leaves' characters in pre-order
    std::unique_ptr<BPathTree> pathTree;
    // Path number of a repeated whole path -> track of the stored one.
    // Ordered: no numbers that a stored form may bring make it slow, and the
    // same content is always written as the same bytes.
    std::map<std::uint64_t, PathTrack> duplicates;
    std::vector<std::uint64_t> partitionEnds;  // pathCount after partition k
    // The folder's track, and the position of the batch's first file if the
    // folder was there before.
    PathTracks partitionTracks;
    std::uint64_t maxPartitionTrackLength = 0;
    std::uint64_t maxDuplicateTrackLength = 0;
    std::atomic<std::uint64_t> maxCodeBytes = 0;  // of components so far
    std::uint64_t maxDuplicatePathNumber = 0;
    std::uint64_t nextPathNumber = 0;  // handed out since the last reset
    std::uint64_t pathCount = 0;
    std::vector<double> frequencies;  // of the leaves, in pre-order
    std::int32_t rootIndex = 0;
    std::vector<HNode> nodes;
    CodeTable codes;
    std::vector<std::int32_t> parentOf;  // by position in nodes; -1: none

    // Workers. An entry of these lists is that of the worker which took it;
    // `codes`, which they share, nobody changes.
    std::vector<std::thread> genThreads;
    FolderTexts asyncFolders;  // released under releaseMutex
    FolderTexts asyncFiles;    // released under releaseMutex
    std::vector<PackedComponents> encodedFolders;  // under folderResultMutex
    std::vector<PackedComponents> encodedFiles;    // under fileResultMutex
    std::vector<ComponentBuffers> encodedBuffers;  // under folderResultMutex
    std::mutex folderResultMutex;
    std::mutex fileResultMutex;

private:
    class WorkerRange;
    struct Worker;
    struct LoadedForm;

    void requireNoCode() const;
    template <class Build>
    void buildCode(Build build);

    std::size_t encodedBytes(const std::u16string& text) const;
    void encodeTo(const std::u16string& text, std::uint8_t* to) const;
    PackedComponents encodeAll(const std::vector<std::u16string>& texts,
                               Worker& worker) const;
    void encodeFolders(std::uint64_t first, std::uint64_t last, Worker& worker);
    void work(std::vector<WorkerRange>& ranges, std::size_t own,
              Worker& worker) noexcept;
    void releaseEncoded(Worker& worker) noexcept;
    void collect(const std::vector<Worker>& workers);
    void raiseMaxCodeBytes(std::uint64_t length) noexcept;
    void reserveBuffers(Worker& worker);
    void keepBuffers(Worker& worker) noexcept;
    void insertEncoded(std::size_t i, std::uint32_t hash, FolderMemo& memo,
                       PathTrack& track);
    void reserveForPartition(std::size_t trackLength);
    void notePartition(PathTrack& track, bool existed,
                       std::uint64_t firstFileIndex, std::size_t fileCount);

    std::size_t stepThrough(ComponentView bytes, std::size_t bit,
                            std::size_t end, std::u16string& text) const;
    std::size_t walkToLeaf(ComponentView bytes, std::size_t bit,
                           std::size_t end, std::u16string& text) const;
    std::size_t partitionAtOrAfter(std::size_t k, std::uint64_t number) const;
    void packPartitions(std::size_t mostChildren,
                        std::vector<std::uint8_t>& out) const;
    void packDuplicates(std::size_t mostChildren,
                        std::vector<std::uint8_t>& out) const;
    void getPathByNumber(std::vector<Components>& folderPaths,
                         std::vector<Components>& filePaths,
                         const std::vector<double>& partitions) const;
    void getPathByTrack(std::vector<Components>& folderPaths,
                        const std::vector<double>& partitions) const;

    std::mutex releaseMutex_;  // held by the worker that releases texts
    DecodeTable decodeTable_;  // derived from nodes; empty: walk the tree
    bool endsAscend_ = true;   // partitionEnds can be searched
};

}  // namespace tessel
