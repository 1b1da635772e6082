#include "archive/SortedSearch.hpp"

#include <algorithm>

namespace tessel::archive {
namespace {

// The greatest number in [first, last] for which `holds`. It is known to hold
// for first; the numbers above it for which it does not are all at the end.
template <class Predicate>
std::uint32_t lastThat(std::uint32_t first, std::uint32_t last,
                       Predicate holds) {
    while (first < last) {
        const std::uint32_t middle = first + (last - first + 1) / 2;
        if (holds(middle))
            first = middle;
        else
            last = middle - 1;
    }
    return first;
}

}  // namespace

SortedSearch::SortedSearch(const Segment& segment)
    : segment_(segment),
      heads_(segment),
      paths_(segment),
      buffer_(segment.head().maxFolderBytes + FolderDecoder::slack),
      folders_(segment, buffer_.data()) {}

// ---- Folders ----

// The block between first and last in which the folder is first named.
std::uint32_t SortedSearch::blockOfFirst(std::uint32_t folder,
                                         std::uint32_t first,
                                         std::uint32_t last) const {
    return lastThat(first, std::max(first, last), [&](std::uint32_t block) {
        return segment_.seenBefore(block) <= folder;
    });
}

std::string_view SortedSearch::firstNameOf(const Candidate& candidate) {
    const std::uint32_t block = blockOfFirst(
        candidate.number, candidate.firstBlock, candidate.lastBlock);
    const std::uint64_t start =
        std::uint64_t{block} * segment_.head().namesPerBlock;
    const std::uint64_t end = std::min<std::uint64_t>(
        start + segment_.head().namesPerBlock, segment_.size());
    for (std::uint64_t place = start; place < end; ++place) {
        paths_.seek(place);
        if (paths_.foldersSeen() > candidate.number) return paths_.name();
    }
    segment_.fail(Section::NameGroups, 0,
                  "A block does not name the folders that it should.");
}

// Whether the candidate's first path is less than the target.
bool SortedSearch::startsBefore(const Target& target,
                                const Candidate& candidate) {
    const std::string_view folder = candidate.folder;
    const std::size_t shared = std::min(folder.size(), target.path.size());
    const int order =
        folder.substr(0, shared).compare(target.path.substr(0, shared));
    if (order != 0) return order < 0;
    if (folder.size() >= target.path.size()) return false;
    const std::string_view rest = target.path.substr(folder.size());
    if (target.aim == Aim::Equal && rest.find('/') == std::string_view::npos)
        return true;
    return firstNameOf(candidate) < rest;
}

// ---- The way down ----

std::uint32_t SortedSearch::lastHeadBefore(const Target& target) {
    return lastThat(0, heads_.size() - 1, [&](std::uint32_t head) {
        return startsBefore(target,
                            {heads_.folder(head), heads_.number(head),
                             heads_.nameBlock(head), heads_.nameBlock(head)});
    });
}

std::uint32_t SortedSearch::lastFolderBefore(const Target& target,
                                             std::uint32_t head) {
    const SegmentHead& sizes = segment_.head();
    const auto isBefore = [&](std::uint32_t folder) {
        return startsBefore(
            target, {folders_.at(folder), folder, heads_.nameBlock(head),
                     heads_.nameBlock(head + 1)});
    };
    const std::uint32_t firstBlock = heads_.folderBlock(head);
    const std::uint32_t block = lastThat(
        firstBlock,
        std::min<std::uint32_t>(firstBlock + sizes.folderBlocksPerHead,
                                segment_.folderBlocks()) -
            1,
        [&](std::uint32_t b) { return isBefore(b * sizes.foldersPerBlock); });
    std::uint32_t folder = block * sizes.foldersPerBlock;
    const std::uint32_t end =
        std::min<std::uint32_t>(folder + sizes.foldersPerBlock, sizes.folders);
    while (folder + 1 < end && isBefore(folder + 1)) ++folder;
    return folder;
}

std::uint32_t SortedSearch::lastBlockBefore(const Target& target,
                                            std::uint32_t head,
                                            std::uint32_t folder) {
    const std::uint32_t firstBlock = heads_.nameBlock(head);
    const std::uint32_t lastBlock = heads_.nameBlock(head + 1);
    const std::uint32_t first = blockOfFirst(folder, firstBlock, lastBlock);
    const std::uint32_t last = blockOfFirst(folder + 1, first, lastBlock);
    return lastThat(first, last, [&](std::uint32_t block) {
        return paths_.at(std::uint64_t{block} * segment_.head().namesPerBlock) <
               target.path;
    });
}

// The first place from the block's start on whose path is not less.
std::uint64_t SortedSearch::scanBlock(std::string_view path,
                                      std::uint32_t block) {
    const std::uint32_t perBlock = segment_.head().namesPerBlock;
    std::uint64_t place = std::uint64_t{block} * perBlock;
    const std::uint64_t end =
        std::min<std::uint64_t>(place + perBlock, segment_.size());
    while (place < end && paths_.at(place) < path) ++place;
    return place;
}

std::uint64_t SortedSearch::search(const Target& target) {
    const std::uint32_t head = lastHeadBefore(target);
    const std::uint32_t folder = lastFolderBefore(target, head);
    return scanBlock(target.path, lastBlockBefore(target, head, folder));
}

std::uint64_t SortedSearch::lowerBound(std::string_view path) {
    return search({path, Aim::LowerBound});
}

std::uint64_t SortedSearch::find(std::string_view path) {
    const std::uint64_t place = search({path, Aim::Equal});
    if (place == segment_.size() || paths_.at(place) != path)
        return segment_.size();
    return place;
}

}  // namespace tessel::archive
