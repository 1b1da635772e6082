#include "paths/CharacterCounter.hpp"

#include <cstring>

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

// Four units at a time: one comparison tells that all of them are on the first
// page. That takes one instruction in fifty off a build from ASCII names.
void CharacterCounter::add(std::u16string_view text) {
    constexpr std::size_t unitsPerWord = 4;
    constexpr std::uint64_t beyondFirstPage = 0xFF00FF00FF00FF00;
    static_assert(pageSize == 0x100);
    std::uint64_t* const firstPage = pages_.front()->data();
    const char16_t* at = text.data();
    const char16_t* const end = at + text.size();
    for (; end - at >= std::ptrdiff_t{unitsPerWord}; at += unitsPerWord) {
        std::uint64_t word = 0;
        std::memcpy(&word, at, sizeof word);
        if ((word & beyondFirstPage) != 0) break;
        ++firstPage[at[0]];
        ++firstPage[at[1]];
        ++firstPage[at[2]];
        ++firstPage[at[3]];
    }
    for (; at != end; ++at) add(*pages_.front(), *at);
}

// Eight bytes at a time, as long as all of them are ASCII.
void CharacterCounter::addBytes(std::string_view bytes) {
    constexpr std::uint64_t beyondAscii = 0x8080808080808080;
    Page& firstPage = *pages_.front();
    std::uint64_t word = 0;
    for (; bytes.size() >= sizeof word; bytes.remove_prefix(sizeof word)) {
        std::memcpy(&word, bytes.data(), sizeof word);
        if ((word & beyondAscii) != 0) break;
        for (std::size_t i = 0; i < sizeof word; ++i)
            ++firstPage[static_cast<unsigned char>(bytes[i])];
    }
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
