#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <span>
#include <stdexcept>
#include <vector>

#include "coder/FolderChain.hpp"
#include "coder/PathNumbering.hpp"
#include "pathtree/BPathTree.hpp"
#include "pathtree/TrackLookup.hpp"

namespace tessel {

// Fetches stored paths by number.
//
// Ownership: borrows the tree and the numbering, which nobody may change
//   meanwhile.
// Threads: any number of readers.
class PathRetrieval {
public:
    PathRetrieval(const BPathTree& tree,
                  const PathNumbering& numbering) noexcept
        : tree_(tree), numbering_(numbering) {}

    // A number of a request as getPath takes it: truncated; infinity, and what
    // 64 bits cannot hold, is above every number in use. Throws
    // std::out_of_range for NaN, for -1 and below.
    static std::uint64_t pathNumberOf(double value);

    // Visits paths by number, in ascending order, without copies and, where
    // the folders are known, without the heap. `numbers` is any random-access
    // range of unsigned integers. Per partition met, the visitor sees its
    // folder once, then the files asked for; usualFiles is how many they are at
    // most, unless numbers repeat or descend:
    //
    //   visitor.beginFolder(usualFiles);
    //   visitor.folder(ComponentView);  // each component, the root first
    //   visitor.file(ComponentView);    // each file, in the order of numbers
    //
    // The views are valid until paths are added or a pass begins. The visit
    // ends at the first number that is above the last partition's end. Pass
    // numbers in ascending order: a number smaller than its predecessor is
    // looked up in the predecessor's partition and may return another file
    // of that folder.
    //
    // Throws std::out_of_range for a number that leads outside the tree; the
    // paths before it have been visited then.
    // Cost: for each partition met a search in partitionEnds and the way from
    //   its folder up, or its track down.
    template <class Numbers, class Visitor>
    void visit(const Numbers& numbers, Visitor&& visitor) const;

    // See HuffmanPathTree::getPath.
    void getPath(std::vector<Components>& folderPaths,
                 std::vector<Components>& filePaths,
                 const std::vector<double>& numbers) const;

private:
    // Shows the folder of partition k to the visitor and returns its files.
    template <class Visitor>
    BatchFiles openPartition(std::size_t k, FolderChain& chain,
                             PathTrack& track, Visitor& visitor) const;

    void getByNumber(std::vector<Components>& folderPaths,
                     std::vector<Components>& filePaths,
                     const std::vector<double>& numbers) const;
    void getByTrack(std::vector<Components>& folderPaths,
                    const std::vector<double>& numbers) const;

    const BPathTree& tree_;
    const PathNumbering& numbering_;
};

// The numbers of a request as a range for visit, each converted when its turn
// comes: those after the last partition's end are ignored, whatever they are.
class PathNumbers {
public:
    class Iterator {
    public:
        explicit Iterator(const double* position) noexcept : at_(position) {}
        std::uint64_t operator*() const {
            return PathRetrieval::pathNumberOf(*at_);
        }
        Iterator& operator++() noexcept {
            ++at_;
            return *this;
        }
        friend std::ptrdiff_t operator-(Iterator a, Iterator b) noexcept {
            return a.at_ - b.at_;
        }
        friend bool operator==(Iterator a, Iterator b) noexcept = default;

    private:
        const double* at_;
    };

    explicit PathNumbers(std::span<const double> values) noexcept
        : values_(values) {}
    Iterator begin() const noexcept { return Iterator(values_.data()); }
    Iterator end() const noexcept {
        return Iterator(values_.data() + values_.size());
    }

private:
    std::span<const double> values_;
};

template <class Visitor>
BatchFiles PathRetrieval::openPartition(std::size_t k, FolderChain& chain,
                                        PathTrack& track,
                                        Visitor& visitor) const {
    const PathTracks& tracks = numbering_.partitionTracks;
    const FolderNode* const root = tree_.root->folder();
    const auto visitFolder = [&](ComponentView name) { visitor.folder(name); };
    const auto [folder, isEnd] = tracks.folders().find(k, root);
    if (folder == nullptr || !chain.find(*root, *folder)) {
        tracks.read(k, track);
        return TrackLookup(*tree_.root).openBatch(track, visitFolder);
    }
    for (const FolderNode* above : chain.folders()) visitFolder(above->value());
    if (isEnd) return {*folder, 0};
    return TrackLookup::openLast(folder, tracks.lastOf(k), visitFolder);
}

template <class Numbers, class Visitor>
void PathRetrieval::visit(const Numbers& numbers, Visitor&& visitor) const {
    const std::vector<std::uint64_t>& ends = numbering_.partitionEnds;
    FolderChain chain;
    PathTrack track;
    std::size_t k = 0;
    auto next = std::begin(numbers);
    const auto last = std::end(numbers);
    while (next != last) {
        std::uint64_t number = *next;
        k = numbering_.partitionAtOrAfter(k, number);
        if (k == ends.size()) return;
        if (k >= numbering_.partitionTracks.size())
            throw std::out_of_range("A partition has no track.");
        const auto left = static_cast<std::uint64_t>(last - next);
        visitor.beginFolder(
            static_cast<std::size_t>(std::min(left, ends[k] - number + 1)));
        BatchFiles files = openPartition(k, chain, track, visitor);
        const std::uint64_t base = k > 0 ? ends[k - 1] : 0;
        while (number <= ends[k]) {
            visitor.file(files[number - base]);
            if (++next == last) break;
            number = *next;
        }
    }
}

}  // namespace tessel
