#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "archive/FolderDecoder.hpp"
#include "archive/FolderHeads.hpp"
#include "archive/PathBuffer.hpp"
#include "archive/PathCursor.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// SortedSearch finds places in a segment whose stored order is that of the
// paths' bytes.
//
// Folders are numbered as they are first named, so their first paths ascend
// with their numbers. That gives a way down by binary search: from the folder
// heads to a block of folders to a folder, then from the name blocks between
// this folder's first path and the next folder's to one block.
//
// Ownership: borrows the segment.
// Threads: one thread at a time.
class SortedSearch {
public:
    // The segment must be sorted or rearranged.
    explicit SortedSearch(const Segment& segment);

    // The place of the first path that is not less than this one; the
    // segment's size if all are less. Throws DamagedArchiveException.
    std::uint64_t lowerBound(std::string_view path);

    // The place of the first path equal to this one; the segment's size if
    // there is none. Throws DamagedArchiveException. Faster than lowerBound.
    std::uint64_t find(std::string_view path);

private:
    // What is looked for, and how a folder is compared with it.
    enum class Aim {
        LowerBound,
        // Only the place of a path that is there matters. So the path's own
        // folder starts before it, without a look at its first name.
        Equal
    };
    struct Target {
        Target(std::string_view wanted, Aim how) noexcept
            : path(wanted), nameStart(wanted.rfind('/') + 1), aim(how) {}

        std::string_view folder() const noexcept {
            return path.substr(0, nameStart);
        }
        std::string_view name() const noexcept {
            return path.substr(nameStart);
        }

        std::string_view path;
        std::size_t nameStart;  // 0 without '/'
        Aim aim;
    };
    // A folder, and the heads between whose first paths its own first path
    // must be.
    struct Candidate {
        std::string_view folder;
        std::uint32_t number;
        std::uint32_t firstHead;
        std::uint32_t lastHead;
    };
    // What a folder's text says of the order of its first path and the target.
    enum class Order { Before, NotBefore, Unknown };

    static constexpr std::uint64_t unknown = ~std::uint64_t{0};

    Order compare(const Target& target, const Candidate& candidate);
    bool startsBefore(const Target& target, const Candidate& candidate);
    std::string_view firstNameOf(const Candidate& candidate);

    std::uint32_t lastHeadBefore(const Target& target);
    std::uint32_t lastFolderBefore(const Target& target, std::uint32_t head);
    std::uint32_t lastOfBlockBefore(const Target& target, std::uint32_t head,
                                    std::uint32_t folder);
    bool blockStartsBefore(const Target& target, std::uint32_t block);
    std::uint32_t lastBlockBefore(const Target& target, std::uint32_t head,
                                  std::uint32_t folder);
    std::uint32_t search(const Target& target);
    bool isInOwnFolder(const Target& target);

    const Segment& segment_;
    FolderHeads heads_;
    PathCursor paths_;
    PathBuffer buffer_;
    FolderDecoder folders_;
    std::uint64_t ownFolder_ = unknown;  // of the target, once it came by
};

}  // namespace tessel::archive
