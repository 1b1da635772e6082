#include "archive/SymbolCode.hpp"

#include <algorithm>
#include <cstddef>

#include "archive/HuffmanLengths.hpp"

namespace tessel::archive {

SymbolCode::SymbolCode(std::span<const std::uint64_t> counts,
                       unsigned maxBits) {
    const std::vector<std::uint8_t> lengths = huffmanLengths(counts, maxBits);
    const std::vector<std::uint32_t> codes = canonicalCodes(lengths);
    for (std::size_t s = 0; s < counts.size(); ++s) {
        if (counts[s] == 0) continue;
        if (table_.empty()) table_.first = static_cast<unsigned>(s);
        table_.last = static_cast<unsigned>(s);
        table_.lengths[s] = lengths[s];
        codes_[s] = static_cast<std::uint16_t>(codes[s]);
    }
}

}  // namespace tessel::archive
