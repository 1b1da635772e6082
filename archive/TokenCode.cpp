#include "archive/TokenCode.hpp"

namespace tessel::archive {
namespace {

constexpr std::size_t maxEntries = std::size_t{1} << 24;

void require(bool holds) {
    if (!holds) throw DamagedFormException();
}

std::uint32_t takeVarint(sixpacks::ByteCursor& cursor) {
    std::uint64_t value = 0;
    for (unsigned shift = 0; shift < 35; shift += 7) {
        const std::uint8_t byte = cursor.takeByte();
        value |= std::uint64_t{byte & 0x7FU} << shift;
        if (byte < 0x80) {
            require(value >> 32U == 0);
            return static_cast<std::uint32_t>(value);
        }
    }
    throw DamagedFormException();
}

}  // namespace

void TokenList::validate() const {
    require(entries.size() % tokenEntryBytes == 0 &&
            entries.size() / tokenEntryBytes < maxEntries &&
            text.size() <= maxTokenTextBytes);
    for (std::uint32_t i = 0; i < size(); ++i) {
        const TokenEntry checked = entry(i);
        require(checked.offset + checked.length <= text.size());
    }
}

// Codes count up through the lengths; each length doubles the code first.
CodeCounts CodeCounts::unpack(sixpacks::ByteCursor& cursor) {
    CodeCounts counts;
    counts.longest = cursor.takeByte();
    require(counts.longest <= maxTokenCodeBits);
    if (counts.longest == 0) {
        counts.size = 1;
        counts.lastCode[0] = ~std::uint32_t{0};
        return counts;
    }
    std::uint64_t code = 0;
    for (unsigned bits = 1; bits <= counts.longest; ++bits) {
        const std::uint32_t count = takeVarint(cursor);
        code <<= 1U;
        counts.placeOffset[bits] =
            counts.size - static_cast<std::uint32_t>(code);
        code += count;
        require(code <= std::uint64_t{1} << bits);
        if (count > 0 && counts.shortest == 0) counts.shortest = bits;
        if (counts.shortest > 0)
            counts.lastCode[bits] =
                static_cast<std::uint32_t>((code << (32 - bits)) - 1);
        counts.size += count;
        require(bits < counts.longest || count > 0);
    }
    require(code == std::uint64_t{1} << counts.longest);
    return counts;
}

}  // namespace tessel::archive
