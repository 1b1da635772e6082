#include "archive/Segment.hpp"

#include <algorithm>

#include "archive/ArchiveExceptions.hpp"
#include "packing/ByteCursor.hpp"

namespace tessel::archive {
namespace {

// Sections that every decoding needs.
constexpr std::size_t tableSections = 6;

constexpr std::uint64_t divideUp(std::uint64_t a, std::uint64_t b) noexcept {
    return (a + b - 1) / b;
}

// The sum of the first `count` of 16 bytes, eight at a time.
std::uint32_t sumOfFirst(const std::uint8_t* bytes, std::uint32_t count) {
    const auto keep = [](std::uint64_t word, std::uint32_t kept) {
        return kept >= 8 ? word : word & ((std::uint64_t{1} << (8 * kept)) - 1);
    };
    const std::uint64_t low = keep(loadLittle<std::uint64_t>(bytes), count);
    const std::uint64_t high =
        keep(loadLittle<std::uint64_t>(bytes + 8), count < 8 ? 0 : count - 8);
    constexpr std::uint64_t evenBytes = 0x00FF00FF00FF00FF;
    const std::uint64_t lanes = (low & evenBytes) + (low >> 8U & evenBytes) +
                                (high & evenBytes) + (high >> 8U & evenBytes);
    return static_cast<std::uint32_t>(lanes * 0x0001000100010001 >> 48U);
}

SegmentHead headOf(std::span<const std::uint8_t> segment,
                   const SegmentEntry& entry) {
    try {
        const SegmentHead head = SegmentHead::unpack(segment);
        if (head.paths == entry.paths && head.segmentBytes() == entry.bytes)
            return head;
    } catch (const DamagedFormException&) {
    }
    throw DamagedArchiveException(entry.offset, "A segment's head is damaged.");
}

}  // namespace

Segment::Segment(std::span<const std::uint8_t> bytes, const SegmentEntry& entry)
    : entry_(entry),
      head_(headOf(bytes, entry)),
      pieces_(bytes, head_, entry.offset),
      nameBlocks_(static_cast<std::uint32_t>(
          divideUp(head_.paths, head_.namesPerBlock))),
      folderBlocks_(static_cast<std::uint32_t>(
          divideUp(head_.folders, head_.foldersPerBlock))) {
    for (std::size_t i = 0; i < sectionCount; ++i)
        sectionOffsets_[i] = head_.offsetOf(static_cast<Section>(i));
    checkSizes();
    pieces_.require(0, sectionOffsets_[tableSections]);
}

Segment::~Segment() = default;

// ---- Checks ----

void Segment::fail(Section section, std::uint64_t offset,
                   const char* what) const {
    throw DamagedArchiveException(pieces_.inArchive(offsetOf(section) + offset),
                                  what);
}

// The sizes of the sections must be those that the counts ask for.
void Segment::checkSizes() const {
    const auto check = [this](Section section, bool holds) {
        if (!holds) fail(section, 0, "A section has a wrong size.");
    };
    const auto bytes = [this](Section section) { return bytesOf(section); };
    const bool rearranged = head_.order == ListOrder::Rearranged;
    const std::uint64_t numbers = divideUp(head_.paths * head_.numberBits(), 8);
    const std::uint64_t heads =
        head_.order == ListOrder::AsGiven
            ? 0
            : divideUp(folderBlocks_, head_.folderBlocksPerHead) + 1;

    check(Section::NameGroups,
          bytes(Section::NameGroups) ==
              nameGroupBytes * divideUp(nameBlocks_, blocksPerGroup));
    check(Section::FolderGroups,
          bytes(Section::FolderGroups) ==
              folderGroupBytes * divideUp(folderBlocks_, blocksPerGroup));
    check(Section::WideGroups,
          bytes(Section::WideGroups) % wideGroupBytes == 0);
    check(Section::Names, bytes(Section::Names) < wideFlag);
    check(Section::Folders, bytes(Section::Folders) < wideFlag);
    check(Section::FolderHeads,
          bytes(Section::FolderHeads) >= folderHeadBytes * heads);
    check(Section::Order, bytes(Section::Order) == (rearranged ? numbers : 0));
    check(Section::Index,
          bytes(Section::Index) == 0 || (head_.order != ListOrder::Sorted &&
                                         bytes(Section::Index) == numbers));
}

const SegmentTables& Segment::buildTables() const {
    const std::scoped_lock lock(buildingTables_);
    if (!ownTables_) {
        try {
            ownTables_ = std::make_unique<SegmentTables>(head_, pieces_.body());
        } catch (const DamagedArchiveException& damage) {
            throw DamagedArchiveException(pieces_.inArchive(damage.offset()),
                                          "A table of codes breaks the rules.");
        }
        tables_.store(ownTables_.get(), std::memory_order_release);
    }
    return *ownTables_;
}

// ---- Blocks ----

Segment::Block Segment::wideBlockAt(Section section, std::uint32_t start,
                                    std::uint32_t wideGroup,
                                    std::uint32_t inGroup) const {
    const std::uint64_t at = std::uint64_t{wideGroupBytes} * wideGroup;
    require(Section::WideGroups, at, wideGroupBytes);
    const std::uint8_t* const lengths = dataOf(Section::WideGroups) + at;
    std::uint64_t begin = start;
    for (std::uint32_t i = 0; i < inGroup; ++i)
        begin += loadLittle<std::uint32_t>(lengths + std::size_t{4} * i);
    const std::uint64_t end =
        begin + loadLittle<std::uint32_t>(lengths + std::size_t{4} * inGroup);
    require(section, begin, end - begin);
    return {static_cast<std::uint32_t>(begin), static_cast<std::uint32_t>(end)};
}

// group must be sound.
Segment::Block Segment::blockAt(Section section, const std::uint8_t* group,
                                const std::uint8_t* lengths,
                                std::uint32_t inGroup) const {
    const auto start = loadLittle<std::uint32_t>(group);
    if ((start & wideFlag) != 0) [[unlikely]]
        return wideBlockAt(section, start & ~wideFlag,
                           loadLittle<std::uint32_t>(lengths), inGroup);
    const std::uint32_t begin = start + sumOfFirst(lengths, inGroup);
    const std::uint32_t bytes = lengths[inGroup];
    require(section, begin, bytes);
    return {begin, begin + bytes};
}

Segment::NameBlock Segment::nameBlock(std::uint32_t block) const {
    const std::uint32_t inGroup = block % blocksPerGroup;
    const std::uint8_t* const group = nameGroup(block);
    requireGroup(Section::NameGroups, block, nameGroupBytes);
    const Block bytes = blockAt(Section::Names, group, group + 24, inGroup);
    const std::uint32_t seen =
        loadLittle<std::uint32_t>(group + 4) + sumOfFirst(group + 8, inGroup);
    if (seen > head_.folders)
        fail(Section::NameGroups,
             std::uint64_t{nameGroupBytes} * (block / blocksPerGroup),
             "A group has seen more folders than there are.");
    return {bytes, seen};
}

Segment::Block Segment::folderBlock(std::uint32_t block) const {
    const std::uint8_t* const group = folderGroup(block);
    requireGroup(Section::FolderGroups, block, folderGroupBytes);
    return blockAt(Section::Folders, group, group + 4, block % blocksPerGroup);
}

std::uint32_t Segment::seenBefore(std::uint32_t block) const {
    requireGroup(Section::NameGroups, block, nameGroupBytes);
    const std::uint8_t* const group = nameGroup(block);
    return loadLittle<std::uint32_t>(group + 4) +
           sumOfFirst(group + 8, block % blocksPerGroup);
}

std::uint32_t Segment::blockNaming(std::uint32_t folder, std::uint32_t first,
                                   std::uint32_t last) const {
    const auto seenBeforeGroup = [this](std::uint32_t group) {
        requireGroup(Section::NameGroups, group * blocksPerGroup,
                     nameGroupBytes);
        return loadLittle<std::uint32_t>(nameGroup(group * blocksPerGroup) + 4);
    };
    std::uint32_t group = first / blocksPerGroup;
    for (std::uint32_t end = last / blocksPerGroup; group < end;) {
        const std::uint32_t middle = group + (end - group + 1) / 2;
        if (seenBeforeGroup(middle) <= folder)
            group = middle;
        else
            end = middle - 1;
    }
    std::uint32_t seen = seenBeforeGroup(group);
    std::uint32_t block = group * blocksPerGroup;
    const std::uint8_t* const added = nameGroup(block) + 8;
    const std::uint32_t end = std::min<std::uint32_t>(
        last, block + static_cast<std::uint32_t>(blocksPerGroup) - 1);
    while (block < end && seen + added[block % blocksPerGroup] <= folder)
        seen += added[block++ % blocksPerGroup];
    return std::max(block, first);
}

// ---- Hints ----

void Segment::prefetchTwoLines(Section section,
                               std::uint64_t offset) const noexcept {
    const std::uint8_t* const line =
        dataOf(section) + std::min(offset, bytesOf(section));
    __builtin_prefetch(line);
    __builtin_prefetch(line + 64);
}

void Segment::prefetchFolderLines(std::uint32_t folder) const noexcept {
    if (folder >= head_.folders) return;
    const std::uint32_t block = folder / head_.foldersPerBlock;
    const std::uint8_t* const group = folderGroup(block);
    prefetchTwoLines(Section::Folders,
                     std::uint64_t{loadLittle<std::uint32_t>(group)} +
                         sumOfFirst(group + 4, block % blocksPerGroup));
}

// The folder that the block starts in is the most likely one.
void Segment::prefetchNames(std::uint32_t block) const noexcept {
    const std::uint8_t* const group = nameGroup(block);
    prefetchTwoLines(Section::Names,
                     std::uint64_t{loadLittle<std::uint32_t>(group)} +
                         sumOfFirst(group + 24, block % blocksPerGroup));
    const auto seen = loadLittle<std::uint32_t>(group + 4);
    if (seen < head_.folders)
        __builtin_prefetch(folderGroup(seen / head_.foldersPerBlock));
}

void Segment::prefetchFolder(std::uint32_t nameBlock) const noexcept {
    const std::uint8_t* const group = nameGroup(nameBlock);
    prefetchFolderLines(loadLittle<std::uint32_t>(group + 4) +
                        sumOfFirst(group + 8, nameBlock % blocksPerGroup) - 1);
}

void Segment::prefetchFolderBlocks(std::uint32_t block) const noexcept {
    constexpr std::uint64_t lines = 8;  // some 16 blocks
    const std::uint8_t* const group = folderGroup(block);
    const std::uint64_t begin =
        std::uint64_t{loadLittle<std::uint32_t>(group)} +
        sumOfFirst(group + 4, block % blocksPerGroup);
    for (std::uint64_t line = 0; line < lines; line += 2)
        prefetchTwoLines(Section::Folders, begin + 64 * line);
}

void Segment::prefetchNameGroups(std::uint32_t first,
                                 std::uint32_t last) const noexcept {
    constexpr std::uint32_t most = 8;
    for (std::uint32_t block = first, left = most; block <= last && left > 0;
         block += blocksPerGroup, --left)
        __builtin_prefetch(nameGroup(block));
}

void Segment::prefetchBlock(const NameBlock& block) const noexcept {
    prefetchTwoLines(Section::Names, block.begin);
    prefetchFolderLines(block.seen - 1);
}

}  // namespace tessel::archive
