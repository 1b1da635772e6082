#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "archive/BitWriter.hpp"
#include "archive/Contexts.hpp"
#include "archive/FrontCoder.hpp"
#include "archive/SymbolCode.hpp"
#include "archive/TokenCoder.hpp"
#include "archive/TokenUses.hpp"

namespace tessel::archive {

// The codes around the tokens.
struct FrontCodes {
    explicit FrontCodes(const FrontCounts& counts);

    std::array<SymbolCode, operationCodeCount> operations;
    std::array<SymbolCode, replacedContextCount> replaced;
};

// Consecutive blocks and what the groups say about each.
struct Blocks {
    std::vector<std::uint8_t> bytes;
    std::vector<std::uint32_t> lengths;    // [block], in bytes
    std::vector<std::uint8_t> newFolders;  // [block]; of name blocks only
};

// Writes the blocks of one chunk.
//
// Ownership: borrows everything it is given.
// Threads: one writer per chunk, any number at once.
class BlockWriter {
public:
    BlockWriter(const FrontCoder& list, const FrontCodes& codes,
                const TokenCoder& tokens)
        : list_(list), codes_(codes), tokens_(tokens) {}

    // `steps` are those of the chunk's pieces, one after the other.
    Blocks writeNames(std::size_t chunk, const std::vector<TokenRef>& steps);
    Blocks writeFolders(std::size_t chunk, const std::vector<TokenRef>& steps);

private:
    void putName(std::size_t place);
    void putOperation(std::size_t place);
    void putLongPrefix(std::uint32_t prefix);
    void putPiece();
    void endBlock();

    const FrontCoder& list_;
    const FrontCodes& codes_;
    const TokenCoder& tokens_;

    BitWriter bits_;
    Blocks blocks_;
    std::size_t blockStart_ = 0;
    const TokenRef* step_ = nullptr;
    std::uint32_t seen_ = 0;
    unsigned previous_ = operationNextFolder;
};

}  // namespace tessel::archive
