#pragma once

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <span>

#include "archive/BitLoad.hpp"
#include "archive/Format.hpp"
#include "archive/PieceVerifier.hpp"
#include "archive/SegmentTables.hpp"

namespace tessel::archive {

// Segment gives access to the parts of one segment: it finds blocks and makes
// sure that their bytes are sound before anyone reads them. It decodes
// nothing but its tables.
//
// Ownership: borrows the segment's bytes.
// Threads: const members from any number of threads.
// Cost: one bit per piece; the tables are derived when they are first asked
//   for.
class Segment {
public:
    // Bytes of a block within its section, all of them sound.
    struct Block {
        std::uint32_t begin = 0;
        std::uint32_t end = 0;
    };
    struct NameBlock : Block {
        std::uint32_t seen = 0;  // folders named before the block
    };

    // Verifies head, checksums of all levels and the sections that every
    // decoding needs.
    //
    // bytes  of the segment, as many as the entry says
    //
    // Throws DamagedArchiveException, whose offset counts from the start of
    // the archive.
    Segment(std::span<const std::uint8_t> bytes, const SegmentEntry& entry);
    ~Segment();
    Segment(const Segment&) = delete;
    Segment& operator=(const Segment&) = delete;

    const SegmentHead& head() const noexcept { return head_; }
    const SegmentEntry& entry() const noexcept { return entry_; }
    const PieceVerifier& pieces() const noexcept { return pieces_; }
    std::uint64_t size() const noexcept { return head_.paths; }
    std::uint32_t nameBlocks() const noexcept { return nameBlocks_; }
    std::uint32_t folderBlocks() const noexcept { return folderBlocks_; }

    // Throws DamagedArchiveException, every time, if they break the rules.
    const SegmentTables& tables() const {
        // Acquire: what the thread that built the tables wrote is seen.
        const auto* const tables = tables_.load(std::memory_order_acquire);
        return tables != nullptr ? *tables : buildTables();
    }

    // ---- Sections ----

    // The bytes of a section, sound or not.
    const std::uint8_t* dataOf(Section section) const noexcept {
        return pieces_.body().data() + offsetOf(section);
    }
    std::uint64_t bytesOf(Section section) const noexcept {
        return head_.bytesOf(section);
    }
    std::uint64_t offsetOf(Section section) const noexcept {
        return sectionOffsets_[static_cast<std::size_t>(section)];
    }

    // Makes sure that a stretch of a section is within it and sound.
    void require(Section section, std::uint64_t begin,
                 std::uint64_t bytes) const {
        if (begin > bytesOf(section) || bytes > bytesOf(section) - begin)
            [[unlikely]]
            fail(section, begin, "A place is outside its section.");
        pieces_.require(offsetOf(section) + begin,
                        offsetOf(section) + begin + bytes);
    }

    // Throws DamagedArchiveException for a byte of a section.
    [[noreturn]] void fail(Section section, std::uint64_t offset,
                           const char* what) const;

    // ---- Blocks ----

    // Throw DamagedArchiveException. `block` must be below nameBlocks() or
    // folderBlocks().
    NameBlock nameBlock(std::uint32_t block) const;
    Block folderBlock(std::uint32_t block) const;

    // Folders named before a name block, without a look at the block.
    std::uint32_t seenBefore(std::uint32_t block) const;

    // The name block from first to last in which a folder is first named, if
    // there is one. Looks at the groups, not at the blocks.
    std::uint32_t blockNaming(std::uint32_t folder, std::uint32_t first,
                              std::uint32_t last) const;

    // ---- Hints ----

    // Ask the processor for what will be read soon, in this order, some paths
    // apart: each reads what the one before has fetched. They check nothing,
    // change nothing and may be left out.
    void prefetchNameGroup(std::uint32_t block) const noexcept {
        __builtin_prefetch(nameGroup(block));
    }
    void prefetchNames(std::uint32_t block) const noexcept;
    void prefetchFolder(std::uint32_t nameBlock) const noexcept;

    // The same for a block that is already found.
    void prefetchBlock(const NameBlock& block) const noexcept;

    // The bytes from the start of a folder block on, for a search in it and
    // those that follow.
    void prefetchFolderBlocks(std::uint32_t block) const noexcept;
    void prefetchNameGroups(std::uint32_t first,
                            std::uint32_t last) const noexcept;

private:
    // The group of a block, sound or not.
    const std::uint8_t* nameGroup(std::uint32_t block) const noexcept {
        return dataOf(Section::NameGroups) +
               std::size_t{nameGroupBytes} * (block / blocksPerGroup);
    }
    const std::uint8_t* folderGroup(std::uint32_t block) const noexcept {
        return dataOf(Section::FolderGroups) +
               std::size_t{folderGroupBytes} * (block / blocksPerGroup);
    }
    void requireGroup(Section section, std::uint32_t block,
                      std::size_t groupBytes) const {
        require(section, groupBytes * (block / blocksPerGroup), groupBytes);
    }

    Block blockAt(Section section, const std::uint8_t* group,
                  const std::uint8_t* lengths, std::uint32_t inGroup) const;
    Block wideBlockAt(Section section, std::uint32_t start,
                      std::uint32_t wideGroup, std::uint32_t inGroup) const;
    void prefetchTwoLines(Section section, std::uint64_t offset) const noexcept;
    void prefetchFolderLines(std::uint32_t folder) const noexcept;
    const SegmentTables& buildTables() const;
    void checkSizes() const;

    SegmentEntry entry_;
    SegmentHead head_;
    PieceVerifier pieces_;
    std::array<std::uint64_t, sectionCount> sectionOffsets_{};
    std::uint32_t nameBlocks_ = 0;
    std::uint32_t folderBlocks_ = 0;

    mutable std::mutex buildingTables_;
    mutable std::unique_ptr<const SegmentTables> ownTables_;  // guarded by it
    mutable std::atomic<const SegmentTables*> tables_ = nullptr;
};

}  // namespace tessel::archive
