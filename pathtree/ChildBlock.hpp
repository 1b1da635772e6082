#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "pathtree/PackedComponent.hpp"

namespace tessel {

class FolderNode;

// One child of a folder: a file, which is nothing but its name, or a folder.
struct Child {
    ComponentView name;            // of a file
    FolderNode* folder = nullptr;  // or the folder

    ComponentView value() const noexcept;  // in FolderNode.hpp
};

// Children that are to be appended to a folder: packed entries, as in a
// ChildBlock without padding. Each folder among them owns a share of its node,
// which the folder takes over if the children are appended.
struct ChildBatch {
    ComponentView entries;
    std::uint64_t count = 0;
    bool hasFolders = false;
    bool hasFiles = true;
};

// ChildBlock is a folder's children in one buffer, in the order of insertion.
//
//   | flags, 1 | count | used | capacity | entries, used | free | samples |
//              |   1, 2 or 8 bytes each  |<---------- capacity ----------->|
//
//   entry of        | bytes
//   ----------------+-------------------------------------------------------
//   a file          | see PackedComponent.hpp
//   a folder        | 255; the address of its FolderNode, 8 bytes
//   a folder that   | 253; the address, 8 bytes; the rest of the file's
//   was a file      | entry, unused: the name is in the FolderNode
//
//   flags     | says
//   ----------+-------------------------------------------------------------
//   width     | two bits: numbers have 2^width bytes, 1 for blocks of up to
//             | 255 bytes, 2 for up to 64 KiB, 8 beyond
//   padded    | entries have at least 9 bytes, so that a file of any length
//             | can become a folder in place
//   folders   | there is a folder among the children
//   files     | there is, or was, a file among them: else all entries have the
//             | same size, and positions need no samples
//
// Sample j is where the entry 8 * j begins, counted from the first entry;
// samples are written from the end to the front, sample 0 is left out. So a
// child is found by its position in at most 8 steps.
//
// Ownership: a view of the memory, which a FolderNode owns. Null is a folder
//   without children.
class ChildBlock {
public:
    static constexpr std::size_t folderEntryBytes = 1 + sizeof(FolderNode*);
    static constexpr std::uint64_t maxChildren = 0xFFFFFFFF;

    explicit ChildBlock(std::uint8_t* memory) noexcept : memory_(memory) {}

    std::uint8_t* memory() const noexcept { return memory_; }
    std::uint64_t count() const noexcept { return number(0); }
    std::uint64_t usedBytes() const noexcept { return number(1); }
    bool isPadded() const noexcept { return hasFlag(padded); }
    bool hasFolders() const noexcept { return hasFlag(folders); }
    bool hasFiles() const noexcept { return hasFlag(files); }
    std::uint8_t* entries() const noexcept {
        return memory_ == nullptr ? nullptr
                                  : memory_ + headerBytes(numberBytes());
    }
    // Where the entry of a child begins, counted from the first entry. The
    // position must be below count().
    std::uint64_t offsetOf(std::uint64_t position) const noexcept;

    // ---- One entry ----

    static Child read(const std::uint8_t* entry) noexcept {
        if (*entry == packed::folderMark || *entry == packed::promotedMark)
            return {{}, folderAt(entry)};
        return {packed::readComponent(entry), nullptr};
    }
    // Bytes that the entry takes.
    static std::size_t sizeOf(const std::uint8_t* entry,
                              bool isPadded) noexcept {
        if (*entry <= packed::maxShortLength)
            return fileBytes(*entry, isPadded);
        if (*entry == packed::folderMark) return folderEntryBytes;
        return sizeOfRare(entry);
    }
    // Bytes of an entry for a file whose name has this length.
    static constexpr std::size_t fileBytes(std::size_t length,
                                           bool isPadded) noexcept {
        const std::size_t bytes = packed::headerBytes(length) + length;
        return isPadded ? std::max(bytes, folderEntryBytes) : bytes;
    }
    static FolderNode* folderAt(const std::uint8_t* entry) noexcept {
        FolderNode* folder = nullptr;
        std::memcpy(&folder, entry + 1, sizeof folder);
        return folder;
    }
    static void setFolderAt(std::uint8_t* entry, FolderNode* folder) noexcept {
        std::memcpy(entry + 1, &folder, sizeof folder);
    }
    static void writeFolder(std::uint8_t* entry, FolderNode* folder) noexcept {
        *entry = packed::folderMark;
        setFolderAt(entry, folder);
    }

    // ---- Change ----

    // Bytes of a block that holds these children and has no room for more.
    static std::size_t exactBytes(const ChildBatch& batch) noexcept;
    // Writes such a block; the memory must have room for it.
    static void write(std::uint8_t* memory, const ChildBatch& batch) noexcept;

    // Bytes that the batch takes among these entries.
    std::uint64_t bytesFor(const ChildBatch& batch) const noexcept;
    bool hasRoomFor(std::uint64_t moreChildren,
                    std::uint64_t moreBytes) const noexcept;
    // Appends children, for which there must be room.
    void append(const ChildBatch& batch) noexcept;

    // A copy on the heap that has room for more children, and an eighth of the
    // old size beyond that if there are children. Throws std::bad_alloc.
    std::uint8_t* grownCopy(std::uint64_t moreChildren,
                            std::uint64_t moreBytes) const;
    // The same for a block that is on the heap: it is changed in place or
    // freed. Throws std::bad_alloc, with nothing changed.
    std::uint8_t* grow(std::uint64_t moreChildren, std::uint64_t moreBytes);
    // Gives back, in a block on the heap, what is neither used nor needed.
    std::uint8_t* shrink() noexcept;
    // A copy on the heap whose entries are padded. Throws std::bad_alloc.
    std::uint8_t* paddedCopy() const;
    // Bytes that shrink() gives back.
    std::uint64_t slackBytes() const noexcept;

    // Makes the file at this position a folder. Its entry must have at least
    // folderEntryBytes.
    void promote(std::uint64_t position, FolderNode* folder) noexcept;

    // ---- Release: a walk whose place is kept in the block itself ----

    // Makes ready for nextDeadFolder. The block holds no children any more.
    void beginRelease() noexcept;
    // The entry of the next folder, or null after the last.
    std::uint8_t* nextDeadFolder() noexcept;
    // The entry that nextDeadFolder returned last.
    std::uint8_t* currentDeadFolder() const noexcept;

private:
    // Flags, a byte of the block.
    static constexpr std::uint8_t width = 3;
    static constexpr std::uint8_t padded = 4;
    static constexpr std::uint8_t folders = 8;
    static constexpr std::uint8_t files = 16;

    static constexpr std::uint64_t childrenPerSample = 8;

    // What a block is for: its size follows.
    struct Plan {
        std::uint64_t count;
        std::uint64_t used;
        std::uint64_t capacity = 0;
        std::uint8_t flags;

        // Of this many children, in this many bytes, and `slack` bytes beyond.
        Plan(std::uint64_t children, std::uint64_t bytes, std::uint64_t slack,
             std::uint8_t kind) noexcept;
        std::size_t numberBytes() const noexcept { return bytesOf(flags); }
        std::uint64_t totalBytes() const noexcept {
            return headerBytes(numberBytes()) + capacity;
        }
    };

    // Bytes of a number, as the flags say.
    static constexpr std::size_t bytesOf(std::uint8_t flags) noexcept {
        return std::size_t{1} << (flags & width);
    }
    static constexpr std::uint64_t maxNumber(std::size_t numberBytes) noexcept {
        return ~std::uint64_t{0} >> (64 - 8 * numberBytes);
    }
    static constexpr std::size_t headerBytes(std::size_t numberBytes) noexcept {
        return 1 + 3 * numberBytes;
    }
    // Bytes of the samples of this many children.
    static constexpr std::uint64_t sampleBytes(
        std::uint64_t children, std::size_t numberBytes) noexcept {
        return children == 0 ? 0
                             : (children - 1) / childrenPerSample * numberBytes;
    }
    static std::size_t sizeOfRare(const std::uint8_t* entry) noexcept;

    bool hasFlag(std::uint8_t flag) const noexcept {
        return memory_ != nullptr && (*memory_ & flag) != 0;
    }
    std::size_t numberBytes() const noexcept {
        return memory_ == nullptr ? 1 : bytesOf(*memory_);
    }
    std::uint64_t capacity() const noexcept { return number(2); }

    // Number i of the header.
    std::uint64_t number(std::size_t i) const noexcept {
        return memory_ == nullptr ? 0 : numberAt(headerNumber(i));
    }
    void setNumber(std::size_t i, std::uint64_t value) noexcept {
        setNumberAt(headerNumber(i), value);
    }
    std::uint8_t* headerNumber(std::size_t i) const noexcept {
        return memory_ + 1 + i * numberBytes();
    }
    std::uint64_t numberAt(const std::uint8_t* at) const noexcept {
        switch (numberBytes()) {
            case sizeof(std::uint8_t):
                return *at;
            case sizeof(std::uint16_t):
                return readAs<std::uint16_t>(at);
            default:
                return readAs<std::uint64_t>(at);
        }
    }
    template <class Number>
    static std::uint64_t readAs(const std::uint8_t* at) noexcept {
        Number value = 0;
        std::memcpy(&value, at, sizeof value);
        return value;
    }
    void setNumberAt(std::uint8_t* at, std::uint64_t value) noexcept;

    std::uint8_t* sampleAt(std::uint64_t j) const noexcept {
        return entries() + capacity() - j * numberBytes();
    }
    std::uint64_t sample(std::uint64_t j) const noexcept {
        return numberAt(sampleAt(j));
    }

    static ChildBlock begin(std::uint8_t* memory, const Plan& plan) noexcept;
    static ChildBlock allocate(const Plan& plan);
    Plan planToGrow(std::uint64_t moreChildren,
                    std::uint64_t moreBytes) const noexcept;
    void setCapacity(std::uint64_t bytes) noexcept;
    static std::uint64_t paddedBytes(const ChildBatch& batch) noexcept;
    void setAppended(std::uint64_t bytes, const ChildBatch& batch) noexcept;
    ChildBatch all() const noexcept {
        return {{entries(), static_cast<std::size_t>(usedBytes())},
                count(),
                hasFolders(),
                hasFiles()};
    }

    std::uint8_t* memory_;
};

// Reads the children of a block one after the other.
//
// Ownership: borrows the block, which must not change meanwhile.
class ChildReader {
public:
    // Begins at a position, which must be at most block.count().
    explicit ChildReader(ChildBlock block, std::uint64_t position = 0) noexcept
        : at_(block.entries() + (position < block.count()
                                     ? block.offsetOf(position)
                                     : block.usedBytes())),
          left_(block.count() - position),
          isPadded_(block.isPadded()) {}

    bool atEnd() const noexcept { return left_ == 0; }
    // The next child, of which there must be one.
    Child next() noexcept {
        const Child child = ChildBlock::read(at_);
        at_ += ChildBlock::sizeOf(at_, isPadded_);
        --left_;
        return child;
    }

private:
    const std::uint8_t* at_;
    std::uint64_t left_;
    bool isPadded_;
};

}  // namespace tessel
