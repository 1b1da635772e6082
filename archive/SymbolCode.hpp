#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <vector>

#include "archive/BitWriter.hpp"
#include "archive/CodeTables.hpp"

namespace tessel::archive {

// A canonical Huffman code for the symbols of a fixed alphabet of at most
// 256: the writer's side of a LengthTable.
class SymbolCode {
public:
    SymbolCode() = default;
    // A code for the symbols with a count above 0, none longer than maxBits.
    SymbolCode(std::span<const std::uint64_t> counts, unsigned maxBits);

    // The symbol must have had a count.
    void put(BitWriter& out, unsigned symbol) const {
        out.put(codes_[symbol], table_.lengths[symbol]);
    }

    const LengthTable& table() const noexcept { return table_; }

private:
    LengthTable table_;
    std::array<std::uint16_t, 256> codes_{};
};

}  // namespace tessel::archive
