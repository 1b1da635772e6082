#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

// The layout of an archive, as docs/archive-format.md describes it: what the
// writer and the reader must agree on. Numbers here are stored in files or
// decide how stored bits are read. Never change one without a new version.
namespace tessel::archive {

// Throws DamagedFormException unless this holds of the bytes being read.
void require(bool holds);

// ---- File ----

inline constexpr std::array<std::uint8_t, 8> fileMagic = {
    0x89, 'T', 'S', 'L', '\r', '\n', 0x1A, '\n'};
inline constexpr std::uint32_t formatVersion = 1;
inline constexpr std::size_t fileHeaderBytes = 64;
inline constexpr std::size_t segmentEntryBytes = 40;

// The first 64 bytes of every archive. All versions keep this layout and its
// checksum, so that a reader can name a version that it does not know.
struct FileHeader {
    std::uint32_t version = formatVersion;
    std::uint64_t fileBytes = 0;
    std::uint64_t paths = 0;
    std::uint64_t segments = 0;
    std::uint64_t directoryOffset = 0;

    // Appends fileHeaderBytes bytes, the checksum included.
    void pack(std::vector<std::uint8_t>& out) const;

    // Throws DamagedFormException if magic or checksum do not match, or if a
    // header of this version contradicts itself. Of a newer version, only
    // `version` is meaningful.
    static FileHeader unpack(std::span<const std::uint8_t> file);
};

// One entry of the segment directory, which ends the file.
struct SegmentEntry {
    std::uint64_t offset = 0;
    std::uint64_t bytes = 0;
    std::uint64_t firstNumber = 0;
    std::uint64_t paths = 0;

    // Appends segmentEntryBytes bytes, the checksum included. `index` is the
    // entry's place in the directory.
    void pack(std::vector<std::uint8_t>& out, std::uint64_t index) const;

    // Throws DamagedFormException if the checksum does not match.
    static SegmentEntry unpack(std::span<const std::uint8_t> bytes,
                               std::uint64_t index);
};

// ---- Segment ----

inline constexpr std::array<std::uint8_t, 4> segmentTag = {'T', 'S', 'E', 'G'};
inline constexpr std::size_t segmentHeadBytes = 256;
// Zero bytes that end each body, so that a reader may load whole words.
inline constexpr std::size_t bodyGuardBytes = 32;

inline constexpr std::uint64_t maxPathsPerSegment = 8'000'000;
// With this much text, names and folders stay below 2 GiB each, because no
// code spends more than three bytes per byte of text.
inline constexpr std::uint64_t maxTextPerSegment = std::uint64_t{1} << 29;
// The longest name, and the longest folder with its final '/'.
inline constexpr std::size_t maxComponentBytes = std::size_t{1} << 20;

// In what order the blocks hold the paths. Stored as one byte.
enum class ListOrder : std::uint8_t {
    Sorted = 0,      // as given, and no path is less than its predecessor
    AsGiven = 1,     // as given
    Rearranged = 2,  // sorted; section Order has the place of each number
};

// The parts of a segment's body, in their order. Never renumber.
enum class Section : std::uint8_t {
    TokenCodes = 0,
    FirstTokenCodes = 1,
    ReplacedCodes = 2,
    OperationCodes = 3,
    TokenEntries = 4,
    TokenText = 5,
    FolderHeads = 6,
    NameGroups = 7,
    FolderGroups = 8,
    WideGroups = 9,
    Names = 10,
    Folders = 11,
    Order = 12,
    Index = 13,
};
inline constexpr std::size_t sectionCount = 16;  // two are not used yet

// The fixed part at the start of each segment.
struct SegmentHead {
    ListOrder order = ListOrder::Sorted;
    std::uint8_t namesPerBlock = 16;
    std::uint8_t foldersPerBlock = 8;
    std::uint8_t folderBlocksPerHead = 16;
    std::uint8_t pieceShift = 12;
    std::uint32_t folders = 0;
    std::uint64_t paths = 0;
    std::uint64_t textBytes = 0;
    std::uint32_t maxNameBytes = 0;
    std::uint32_t maxFolderBytes = 0;
    std::array<std::uint64_t, sectionCount> sectionBytes{};
    // The only checksum of the highest level; see SumTree.
    std::uint64_t topSum = 0;

    std::size_t bytesOf(Section section) const noexcept {
        return sectionBytes[static_cast<std::size_t>(section)];
    }
    // Bits of one number in the sections Order and Index: at least 1.
    unsigned numberBits() const noexcept;
    // Where a section starts, counted from the start of the body.
    std::uint64_t offsetOf(Section section) const noexcept;
    std::uint64_t bodyBytes() const noexcept;
    // Bytes between head and body: the stored levels of checksums.
    std::uint64_t sumTreeBytes() const noexcept;
    std::uint64_t segmentBytes() const noexcept {
        return segmentHeadBytes + sumTreeBytes() + bodyBytes();
    }

    // Appends segmentHeadBytes bytes, the checksum included.
    void pack(std::vector<std::uint8_t>& out) const;

    // Throws DamagedFormException if tag or checksum do not match, or if a
    // field has a value that no writer stores. The sizes of the sections are
    // in bounds afterwards: their sum cannot wrap and equals the stored size
    // of the segment. Whether that fits the file is the caller's question.
    static SegmentHead unpack(std::span<const std::uint8_t> segment);
};

// ---- Blocks ----

inline constexpr std::size_t blocksPerGroup = 16;
// | offset, bit 31: wide | folders before | 16 new folders | 16 lengths |
inline constexpr std::size_t nameGroupBytes = 40;
// | offset, bit 31: wide | 16 lengths |
inline constexpr std::size_t folderGroupBytes = 20;
// | 16 lengths of 4 bytes |
inline constexpr std::size_t wideGroupBytes = 64;
inline constexpr std::uint32_t wideFlag = std::uint32_t{1} << 31;
inline constexpr std::size_t maxNarrowLength = 255;

// ---- Folder heads ----

// | offset in the text | block of the folder's first name |
inline constexpr std::size_t folderHeadBytes = 8;

// ---- Operations ----

// What a name does with its predecessor, before it is mapped to a symbol:
// 0 to 124 share that many bytes with it.
inline constexpr unsigned maxShortPrefix = 124;
inline constexpr unsigned operationLongPrefix = 125;
inline constexpr unsigned operationNextFolder = 126;
inline constexpr unsigned operationJump = 127;
inline constexpr unsigned operationCount = 128;

// ---- Codes ----

inline constexpr unsigned maxTokenCodeBits = 24;
inline constexpr unsigned maxReplacedCodeBits = 8;
inline constexpr unsigned maxOperationCodeBits = 10;
// Symbols of the jump code: the bit lengths of a distance, less one.
inline constexpr unsigned jumpSymbols = 32;

// ---- Token entries ----

// Three bytes: offset into the token text (18 bits, high), length without the
// terminator (5 bits), "ends the piece" (1 bit, low).
struct TokenEntry {
    std::uint32_t offset = 0;
    std::uint32_t length = 0;
    bool ends = false;

    std::uint32_t packed() const noexcept {
        return offset << 6U | length << 1U | (ends ? 1U : 0U);
    }
    static TokenEntry fromPacked(std::uint32_t bits) noexcept {
        return {bits >> 6U & 0x3FFFFU, bits >> 1U & 31U, (bits & 1U) != 0};
    }
};
inline constexpr std::size_t tokenEntryBytes = 3;
inline constexpr std::size_t maxTokenBytes = 31;
inline constexpr std::size_t maxTokenTextBytes = std::size_t{1} << 18;

// ---- Little-endian fields ----

inline constexpr std::uint64_t aligned8(std::uint64_t bytes) noexcept {
    return (bytes + 7) & ~std::uint64_t{7};
}
void packUint32(std::uint32_t value, std::vector<std::uint8_t>& out);
void packUint64(std::uint64_t value, std::vector<std::uint8_t>& out);

}  // namespace tessel::archive
