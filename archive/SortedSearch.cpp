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

std::string_view SortedSearch::firstNameOf(const Candidate& candidate) {
    const std::uint32_t block = segment_.blockNaming(
        candidate.number, heads_.nameBlock(candidate.firstHead),
        heads_.nameBlock(candidate.lastHead));
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

// Unknown if the folder is one of those that the target is in.
SortedSearch::Order SortedSearch::compare(const Target& target,
                                          const Candidate& candidate) {
    const std::string_view folder = candidate.folder;
    const int order = folder.compare(target.path.substr(0, folder.size()));
    if (order != 0) return order < 0 ? Order::Before : Order::NotBefore;
    if (folder.size() == target.nameStart) {
        ownFolder_ = candidate.number;
        if (target.aim == Aim::Equal) return Order::Before;
    }
    return folder.size() == target.path.size() ? Order::NotBefore
                                               : Order::Unknown;
}

// Whether the candidate's first path is less than the target.
bool SortedSearch::startsBefore(const Target& target,
                                const Candidate& candidate) {
    const Order order = compare(target, candidate);
    if (order != Order::Unknown) return order == Order::Before;
    return firstNameOf(candidate) < target.path.substr(candidate.folder.size());
}

// ---- The way down ----

std::uint32_t SortedSearch::lastHeadBefore(const Target& target) {
    return lastThat(0, heads_.size() - 1, [&](std::uint32_t head) {
        return startsBefore(
            target, {heads_.folder(head), heads_.number(head), head, head});
    });
}

// The last folder of a block whose first path is less than the target; at
// least `folder`, the block's first one.
//
// If a folder's first path is less, so are those of all folders before it. For
// a folder that the target is in, at any depth, the folder's text does not
// decide: the name of its first path has to be read, which is slow. So that is
// done only for folders after which no other folder has decided.
std::uint32_t SortedSearch::lastOfBlockBefore(const Target& target,
                                              std::uint32_t head,
                                              std::uint32_t folder) {
    const std::uint32_t perBlock = segment_.head().foldersPerBlock;
    const std::uint32_t end =
        std::min(folder + perBlock, segment_.head().folders);
    const auto candidate = [&](std::uint32_t number) {
        return Candidate{folders_.at(number), number, head, head + 1};
    };
    std::uint32_t next = folder + 1;
    for (; next < end; ++next) {
        const Order order = compare(target, candidate(next));
        if (order == Order::NotBefore) break;
        if (order == Order::Before) folder = next;
    }
    while (folder + 1 < next && startsBefore(target, candidate(folder + 1)))
        ++folder;
    return folder;
}

std::uint32_t SortedSearch::lastFolderBefore(const Target& target,
                                             std::uint32_t head) {
    const SegmentHead& sizes = segment_.head();
    const std::uint32_t firstBlock = heads_.folderBlock(head);
    segment_.prefetchFolderBlocks(firstBlock);
    const std::uint32_t block =
        lastThat(firstBlock,
                 std::min<std::uint32_t>(firstBlock + sizes.folderBlocksPerHead,
                                         segment_.folderBlocks()) -
                     1,
                 [&](std::uint32_t b) {
                     const std::uint32_t folder = b * sizes.foldersPerBlock;
                     return startsBefore(
                         target, {folders_.at(folder), folder, head, head + 1});
                 });
    return lastOfBlockBefore(target, head, block * sizes.foldersPerBlock);
}

// Whether the block's first path is less than the target. Names suffice in the
// target's own folder.
bool SortedSearch::blockStartsBefore(const Target& target,
                                     std::uint32_t block) {
    paths_.seek(std::uint64_t{block} * segment_.head().namesPerBlock);
    if (paths_.folderNumber() == ownFolder_)
        return paths_.name() < target.name();
    return paths_.path() < target.path;
}

std::uint32_t SortedSearch::lastBlockBefore(const Target& target,
                                            std::uint32_t head,
                                            std::uint32_t folder) {
    const std::uint32_t firstBlock = heads_.nameBlock(head);
    const std::uint32_t lastBlock =
        std::max(firstBlock, heads_.nameBlock(head + 1));
    const std::uint32_t first =
        segment_.blockNaming(folder, firstBlock, lastBlock);
    const std::uint32_t last =
        segment_.blockNaming(folder + 1, first, lastBlock);
    return lastThat(first, last, [&](std::uint32_t block) {
        return blockStartsBefore(target, block);
    });
}

// The last block whose first path is less than the target, or the first block
// if there is none. The target's place is in it or at the start of the next.
std::uint32_t SortedSearch::search(const Target& target) {
    ownFolder_ = unknown;
    const std::uint32_t head = lastHeadBefore(target);
    segment_.prefetchNameGroups(heads_.nameBlock(head),
                                heads_.nameBlock(head + 1));
    return lastBlockBefore(target, head, lastFolderBefore(target, head));
}

std::uint64_t SortedSearch::lowerBound(std::string_view path) {
    const std::uint32_t perBlock = segment_.head().namesPerBlock;
    std::uint64_t place =
        std::uint64_t{search({path, Aim::LowerBound})} * perBlock;
    const std::uint64_t end =
        std::min<std::uint64_t>(place + perBlock, segment_.size());
    while (place < end && paths_.at(place) < path) ++place;
    return place;
}

bool SortedSearch::isInOwnFolder(const Target& target) {
    return ownFolder_ == unknown ? paths_.folder() == target.folder()
                                 : paths_.folderNumber() == ownFolder_;
}

// Compares names first: they are there, folders would have to be decoded.
std::uint64_t SortedSearch::find(std::string_view path) {
    const Target target(path, Aim::Equal);
    const std::string_view name = target.name();
    const std::uint32_t perBlock = segment_.head().namesPerBlock;
    std::uint64_t place = std::uint64_t{search(target)} * perBlock;
    // With the first path of the next block.
    const std::uint64_t end =
        std::min<std::uint64_t>(place + perBlock + 1, segment_.size());
    for (; place < end; ++place) {
        paths_.seek(place);
        if (paths_.name() == name && isInOwnFolder(target)) return place;
    }
    return segment_.size();
}

}  // namespace tessel::archive
