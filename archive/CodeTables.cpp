#include "archive/CodeTables.hpp"

#include <algorithm>

namespace tessel::archive {

using sixpacks::ByteCursor;

// ---- LengthTable ----

void LengthTable::pack(std::vector<std::uint8_t>& out) const {
    out.push_back(static_cast<std::uint8_t>(first));
    out.push_back(static_cast<std::uint8_t>(last));
    if (first >= last) return;
    for (unsigned s = first; s <= last; s += 2) {
        const unsigned high = s < last ? lengths[s + 1] : 0U;
        out.push_back(static_cast<std::uint8_t>(lengths[s] | high << 4U));
    }
}

LengthTable LengthTable::unpack(ByteCursor& cursor, unsigned alphabet,
                                unsigned maxBits) {
    LengthTable table;
    table.first = cursor.takeByte();
    table.last = cursor.takeByte();
    if (table.empty()) return table;
    require(table.last < alphabet);
    if (table.single()) return table;
    const auto halves = cursor.take((table.last - table.first) / 2 + 1);
    std::uint32_t kraft = 0;  // in units of 2^-maxBits
    for (unsigned s = table.first; s <= table.last; ++s) {
        const unsigned i = s - table.first;
        const unsigned bits = halves[i / 2] >> (i % 2 * 4) & 15U;
        require(bits <= maxBits);
        table.lengths[s] = static_cast<std::uint8_t>(bits);
        if (bits > 0) kraft += 1U << (maxBits - bits);
    }
    require(kraft == 1U << maxBits);
    return table;
}

// ---- CountTable ----

CountTable CountTable::of(std::span<const std::uint8_t> lengths) {
    CountTable table;
    for (const std::uint8_t length : lengths) ++table.counts[length];
    table.counts[0] = 0;
    if (!lengths.empty()) table.maxLength = *std::ranges::max_element(lengths);
    return table;
}

void CountTable::pack(std::vector<std::uint8_t>& out) const {
    out.push_back(static_cast<std::uint8_t>(maxLength));
    for (unsigned bits = 1; bits <= maxLength; ++bits)
        packVarint(counts[bits], out);
}

CountTable CountTable::unpack(ByteCursor& cursor) {
    CountTable table;
    table.maxLength = cursor.takeByte();
    require(table.maxLength <= maxTokenCodeBits);
    if (table.maxLength == 0) return table;
    std::uint64_t kraft = 0;  // in units of 2^-maxTokenCodeBits
    for (unsigned bits = 1; bits <= table.maxLength; ++bits) {
        table.counts[bits] = unpackVarint(cursor);
        kraft += std::uint64_t{table.counts[bits]} << (maxTokenCodeBits - bits);
    }
    require(table.counts[table.maxLength] > 0 &&
            kraft == std::uint64_t{1} << maxTokenCodeBits);
    return table;
}

// ---- Varints ----

void packVarint(std::uint32_t value, std::vector<std::uint8_t>& out) {
    for (; value >= 0x80; value >>= 7U)
        out.push_back(static_cast<std::uint8_t>(value | 0x80U));
    out.push_back(static_cast<std::uint8_t>(value));
}

std::uint32_t unpackVarint(ByteCursor& cursor) {
    std::uint64_t value = 0;
    for (unsigned shift = 0; shift < 35; shift += 7) {
        const std::uint8_t byte = cursor.takeByte();
        value |= std::uint64_t{byte & 0x7FU} << shift;
        if (byte >= 0x80) continue;
        require(value <= UINT32_MAX);
        return static_cast<std::uint32_t>(value);
    }
    throw DamagedFormException();
}

}  // namespace tessel::archive
