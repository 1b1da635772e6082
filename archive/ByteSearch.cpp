#include "archive/ByteSearch.hpp"

#include <algorithm>
#include <cstring>

namespace tessel::archive {
namespace {

// The bytes of paths, from the most frequent on, as counted in a million paths
// of a large archive of packages. All others are rarer.
constexpr std::string_view byFrequency =
    "/seratiolcnuhdpmg-._bxf1yvk20634w8Sj5zCMEATPDL9q7RIGFBONHVU";

// Smaller for more frequent bytes.
std::size_t rarityOf(char byte) noexcept {
    return std::min(byFrequency.find(byte), byFrequency.size());
}

}  // namespace

ByteSearch::ByteSearch(std::string_view text) noexcept
    : text_(text),
      rarest_(static_cast<std::size_t>(
          std::ranges::max_element(text, {}, rarityOf) - text.begin())) {}

bool ByteSearch::isIn(std::string_view hay) const noexcept {
    if (hay.size() < text_.size()) return false;
    const char* from = hay.data() + rarest_;
    const char* const end = from + (hay.size() - text_.size() + 1);
    const char byte = text_[rarest_];
    while (from != end) {
        const auto* const found = static_cast<const char*>(
            std::memchr(from, byte, static_cast<std::size_t>(end - from)));
        if (found == nullptr) return false;
        if (std::memcmp(found - rarest_, text_.data(), text_.size()) == 0)
            return true;
        from = found + 1;
    }
    return false;
}

}  // namespace tessel::archive
