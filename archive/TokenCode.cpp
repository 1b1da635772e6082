#include "archive/TokenCode.hpp"

#include <algorithm>

#include "packing/ByteCursor.hpp"

namespace tessel::archive {
namespace {

constexpr std::size_t maxEntries = std::size_t{1} << 24;

}  // namespace

void TokenList::validate() const {
    require(entries.size() % tokenEntryBytes == 0 &&
            entries.size() / tokenEntryBytes < maxEntries &&
            text.size() <= maxTokenTextBytes &&
            std::ranges::find(text, 0) == text.end());
    for (std::uint32_t i = 0; i < size(); ++i) {
        const TokenEntry checked = entry(i);
        require(checked.offset + checked.length <= text.size());
    }
}

// Codes count up within a length; each further length doubles them first.
CodePlaces::CodePlaces(const CountTable& counts) noexcept {
    lastCode_.fill(~std::uint32_t{0});  // no code is longer than the longest
    std::uint64_t code = 0;
    std::uint32_t place = 0;
    for (unsigned bits = 1; bits <= counts.maxLength; ++bits) {
        const std::uint32_t count = counts.counts[bits];
        code <<= 1U;
        placeOffset_[bits] = place - static_cast<std::uint32_t>(code);
        code += count;
        place += count;
        if (shortest_ == 0 && count > 0) shortest_ = bits;
        if (shortest_ > 0)
            lastCode_[bits] =
                static_cast<std::uint32_t>((code << (32 - bits)) - 1);
    }
}

}  // namespace tessel::archive
