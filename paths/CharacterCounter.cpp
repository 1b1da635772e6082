#include "paths/CharacterCounter.hpp"

#include "coder/HuffmanPathTree.hpp"
#include "paths/PathText.hpp"

namespace tessel::paths {

std::unique_ptr<HuffmanPathTree> coderFor(CharacterCounts counts) {
    for (char16_t unit = 0; counts.characters.size() == 1; ++unit) {
        if (counts.characters.front() == unit) continue;
        counts.characters.push_back(unit);
        counts.frequencies.push_back(0);
    }
    auto coder = std::make_unique<HuffmanPathTree>();
    coder->deflateHuffman(counts.frequencies.data(), counts.characters);
    return coder;
}

void CharacterCounter::addBytes(std::string_view bytes) {
    Page& firstPage = *pages_.front();
    forEachUnit(bytes, [&](char16_t unit) { add(firstPage, unit); });
}

CharacterCounts CharacterCounter::result() const {
    CharacterCounts all;
    for (std::size_t i = 0; i < pageCount; ++i) {
        if (pages_[i] == nullptr) continue;
        for (std::size_t k = 0; k < pageSize; ++k) {
            const std::uint64_t count = (*pages_[i])[k];
            if (count == 0) continue;
            all.characters.push_back(static_cast<char16_t>(i * pageSize + k));
            all.frequencies.push_back(static_cast<double>(count));
        }
    }
    return all;
}

}  // namespace tessel::paths
