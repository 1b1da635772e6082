#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "tests/support/Bytes.hpp"
#include "tests/support/ReferenceCode.hpp"

// A coder as plainly as it can be written: a tree of structs, a list of its
// leaves, a byte vector put together field by field.
namespace model {

using Path = std::vector<Bytes>;  // components, the file name last
using Texts = std::vector<std::u16string>;
using Track = std::vector<std::uint64_t>;

constexpr std::uint64_t noPosition = ~std::uint64_t{0};

struct Node {
    Bytes value;
    std::vector<std::shared_ptr<Node>> children;
};

// What a lookup answers; nothing when it must be refused as out of range.
struct Found {
    std::vector<Path> folders;
    std::vector<Path> files;
};

struct Tree {
    std::shared_ptr<Node> root = std::make_shared<Node>();

    bool addWhole(const Path& path, Track& track);
    bool addBatch(const Path& folder, const Path& files, Track& track,
                  std::uint64_t& firstFile);

    // Every path, in the order of iteration.
    std::vector<Path> paths() const;
    // The components along a track.
    std::optional<Path> follow(const Track& track) const;
    // Appends one partition's answer; false if it must be refused.
    bool lookUp(const Track& track, const std::vector<std::uint64_t>& offsets,
                Found& found) const;

    // Node codes and values in pre-order; returns the most children.
    std::uint64_t store(Bytes& codes, Path& values) const;
    std::uint64_t leafCount() const { return paths().size(); }
    Tree deepCopy() const;
};

// A stored form without compression. The duplicates' entries may follow
// `head` in any order.
struct Form {
    Bytes head;
    std::map<std::uint64_t, Bytes> entries;  // by path number
    unsigned numberBytes = 0;                // of a path number

    // Empty if the bytes are this form, else what differs.
    std::string differenceFrom(const Bytes& bytes) const;
    // One of the ways to write it.
    Bytes bytes() const;
};

struct Coder {
    Code code;
    Tree tree;
    std::map<std::uint64_t, Track> duplicates;
    std::vector<std::uint64_t> partitionEnds;
    std::vector<Track> partitionTracks;
    std::uint64_t maxPartitionTrackLength = 0;
    std::uint64_t maxDuplicateTrackLength = 0;
    std::uint64_t maxCodeBytes = 0;
    std::uint64_t maxDuplicatePathNumber = 0;
    std::uint64_t nextPathNumber = 0;
    std::uint64_t pathCount = 0;

    // A pass: the leaves as they were at the last reset.
    std::vector<Path> pass;
    std::size_t passed = 0;

    // Encodes, and counts the longest component.
    Encoded encodeText(const std::u16string& text);

    // A batch of folders; all or nothing.
    std::optional<Refusal> addBatches(const std::vector<Texts>& folders,
                                      const std::vector<Texts>& files);
    void addPartition(const Path& folder, const Path& files);
    void addWhole(const Path& path);

    void reset();
    bool hasNext() const;
    // Nothing when there is none left.
    std::optional<Path> next();

    // A merge of the numbers with the partition ends, step by step.
    std::optional<Found> getPath(const std::vector<double>& numbers) const;

    Form form() const;
    // This coder as it comes back from its stored form, with its code.
    Coder restored() const;
    // A copy that shares the tree's nodes.
    Coder copied() const { return *this; }
};

// The width code for values up to n, and the bytes that it stands for.
std::uint8_t widthCode(std::uint64_t n);
unsigned widthBytes(std::uint64_t n);

}  // namespace model
