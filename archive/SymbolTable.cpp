#include "archive/SymbolTable.hpp"

#include <cstddef>

namespace tessel::archive {
namespace {

void require(bool holds) {
    if (!holds) throw DamagedFormException();
}

// Whether code words of these lengths use up all bit strings (Kraft's sum is
// 1), so that whatever bits come, they are some symbol's code.
bool isComplete(const std::vector<std::uint8_t>& lengths, unsigned maxBits) {
    std::uint64_t used = 0;
    for (const std::uint8_t length : lengths) {
        if (length > maxBits) return false;
        if (length > 0) used += std::uint64_t{1} << (maxBits - length);
    }
    return used == std::uint64_t{1} << maxBits;
}

}  // namespace

CodeLengths CodeLengths::unpack(sixpacks::ByteCursor& cursor,
                                unsigned symbolCount, unsigned maxBits) {
    const unsigned first = cursor.takeByte();
    const unsigned last = cursor.takeByte();
    if (first > last) return {};
    require(last < symbolCount);
    CodeLengths code;
    code.first = first;
    code.lengths.resize(last - first + 1);
    if (first == last) return code;
    const auto packed = cursor.take((last - first) / 2 + 1);
    for (std::size_t i = 0; i < code.lengths.size(); ++i)
        code.lengths[i] = packed[i / 2] >> (i % 2 * 4) & 15U;
    require(isComplete(code.lengths, maxBits));
    return code;
}

}  // namespace tessel::archive
