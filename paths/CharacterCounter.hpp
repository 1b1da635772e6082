#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace tessel {

class HuffmanPathTree;

}  // namespace tessel

namespace tessel::paths {

// How often each code unit occurs in some components.
struct CharacterCounts {
    std::u16string characters;        // ascending
    std::vector<double> frequencies;  // one for each of them
};

// A coder whose code is made for these characters. If there is only one, a
// second one that no path has lets there be a code. None, no code.
std::unique_ptr<HuffmanPathTree> coderFor(CharacterCounts counts);

// CharacterCounter counts code units.
//
// Cost: 2 KB, and as much again for each range of 256 units that occurs.
class CharacterCounter {
public:
    CharacterCounter() : pages_(pageCount) { page(0); }

    void add(char16_t unit) { ++page(unit / pageSize)[unit % pageSize]; }
    void add(std::u16string_view text);
    // Counts the units of the bytes' text.
    void addBytes(std::string_view bytes);

    CharacterCounts result() const;

private:
    static constexpr std::size_t pageSize = 256;
    static constexpr std::size_t pageCount = (std::size_t{1} << 16U) / pageSize;
    using Page = std::array<std::uint64_t, pageSize>;

    // The first page, where most units of most paths are, stays in a register
    // while a text is counted.
    void add(Page& firstPage, char16_t unit) {
        if (unit < pageSize)
            ++firstPage[unit];
        else
            add(unit);
    }

    Page& page(std::size_t i) {
        if (pages_[i] == nullptr) pages_[i] = std::make_unique<Page>();
        return *pages_[i];
    }

    std::vector<std::unique_ptr<Page>> pages_;
};

}  // namespace tessel::paths
