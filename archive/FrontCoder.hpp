#pragma once

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <string_view>
#include <vector>

#include "archive/Contexts.hpp"
#include "archive/Format.hpp"
#include "archive/ListArranger.hpp"
#include "archive/SegmentList.hpp"
#include "archive/Workers.hpp"

namespace tessel::archive {

// What is left of a name or folder after its shared prefix: to be cut into
// tokens. The final zero byte belongs to it.
struct Piece {
    const char* text;
    std::uint32_t length;
    // The context of its first token: a TokenContext, or firstTokenContext.
    std::uint8_t context;
    bool folder;
};
// The context of the token after a shared prefix, in names.
inline constexpr std::uint8_t firstTokenContext = tokenContextCount;

// How a name refers to its predecessor.
struct NameCode {
    std::uint32_t prefix;    // bytes shared with it
    std::uint8_t operation;  // see Format.hpp
    std::uint8_t replaced;   // context of the next byte, if prefix > 0
};

// How often each symbol of the codes around the tokens is used.
struct FrontCounts {
    using Row = std::array<std::uint64_t, 256>;
    std::array<Row, operationCodeCount> operations{};
    std::array<Row, replacedContextCount> replaced{};
    std::uint64_t pieceBytes = 0;

    FrontCounts& operator+=(const FrontCounts& other);
};

// A segment's list in stored order, front-coded.
//
// Invariants: block i holds the names from i * namesPerBlock on; nothing in a
//   block refers to the one before, except that the current folder carries on.
// Ownership: borrows the list, which must stay as it is.
// Threads: reading from several threads is safe.
// Cost: 20 bytes per path. Front coding runs on all workers, in chunks whose
//   limits do not depend on their number.
class FrontCoder {
public:
    static constexpr std::size_t namesPerBlock = 16;
    static constexpr std::size_t foldersPerBlock = 8;
    // Names or folders per step of parallel work: whole groups of blocks.
    static constexpr std::size_t chunkItems =
        64 * blocksPerGroup * namesPerBlock;

    FrontCoder(const SegmentList& list, Arrangement arrangement,
               Workers& workers);

    const Arrangement& arrangement() const noexcept { return arrangement_; }
    std::size_t names() const noexcept { return arrangement_.names.size(); }
    std::size_t folders() const noexcept { return folderPrefixes_.size(); }

    const NameRef& nameRef(std::size_t place) const noexcept {
        return arrangement_.names[place];
    }
    const NameCode& nameCode(std::size_t place) const noexcept {
        return codes_[place];
    }
    std::uint32_t folderPrefix(std::size_t number) const noexcept {
        return folderPrefixes_[number];
    }
    std::string_view folder(std::size_t number) const noexcept {
        return list_.folders()[arrangement_.listFolder(
            static_cast<std::uint32_t>(number))];
    }
    // Folders named before the names of this chunk.
    std::uint32_t seenBeforeChunk(std::size_t chunk) const noexcept {
        return seenBeforeChunk_[chunk];
    }

    // A name that is a prefix of its predecessor has nothing left.
    bool hasPiece(std::size_t place) const noexcept {
        return codes_[place].prefix == 0 ||
               codes_[place].prefix < nameRef(place).length;
    }
    // REQUIRES: hasPiece(place).
    Piece namePiece(std::size_t place) const noexcept;
    Piece folderPiece(std::size_t number) const noexcept;
    // The byte after the shared prefix; 0 if the name ends there.
    std::uint8_t byteAfterPrefix(std::size_t place) const noexcept {
        return static_cast<std::uint8_t>(
            list_.text()[nameRef(place).start + codes_[place].prefix]);
    }

    const FrontCounts& counts() const noexcept { return counts_; }
    std::uint32_t maxNameBytes() const noexcept { return maxNameBytes_; }
    std::uint32_t maxFolderBytes() const noexcept { return maxFolderBytes_; }

    // Chunks of this many items.
    static constexpr std::size_t chunksOf(std::size_t items) noexcept {
        return (items + chunkItems - 1) / chunkItems;
    }

private:
    void findSeenFolders();
    void codeNames(std::size_t chunk, FrontCounts& counts);
    NameCode codeOf(std::size_t place, std::uint32_t seen) const;
    NameCode sharedPrefix(std::size_t place) const;
    void codeFolders(std::size_t chunk, FrontCounts& counts);
    void findLongest();

    const SegmentList& list_;
    Arrangement arrangement_;
    std::vector<NameCode> codes_;
    std::vector<std::uint32_t> folderPrefixes_;
    std::vector<std::uint32_t> seenBeforeChunk_;
    FrontCounts counts_;
    std::uint32_t maxNameBytes_ = 0;
    std::uint32_t maxFolderBytes_ = 0;
};

// The symbol of a prefix length among those of the folder prefix code.
constexpr unsigned prefixSymbol(std::uint32_t prefix) noexcept {
    return prefix <= maxShortPrefix ? prefix : operationLongPrefix;
}

// The symbol of the jump code for this distance, which is at least 1.
constexpr unsigned jumpSymbol(std::uint32_t distance) noexcept {
    return static_cast<unsigned>(std::bit_width(distance)) - 1;
}

}  // namespace tessel::archive
