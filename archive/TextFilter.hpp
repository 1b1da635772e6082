#pragma once

#include <algorithm>
#include <cstddef>
#include <span>
#include <string_view>
#include <vector>

#include "archive/ByteSearch.hpp"

namespace tessel::archive {

// TextFilter tells which paths hold every one of some texts. A folder is
// searched once for all of its names. Each path is then searched only for the
// texts that its folder does not hold, from the first byte at the folder's end
// at which such a text could begin.
//
// Ownership: borrows the texts.
// Threads: one thread at a time; copies are independent.
class TextFilter {
public:
    explicit TextFilter(std::span<const std::string_view> texts);

    // The folder of the paths that follow.
    void enterFolder(std::string_view folder);

    // Whether all paths in the folder hold every text.
    bool takesWholeFolder() const noexcept { return missing_.empty(); }

    // Whether a path in the folder holds every text.
    bool takes(std::string_view path) const noexcept {
        return std::ranges::all_of(missing_, [&](const Missing& text) {
            return searches_[text.search].isIn(path.substr(text.start));
        });
    }

private:
    // A text that the folder does not hold, and where in a path it could
    // start if it reaches into the name.
    struct Missing {
        std::size_t search;  // place in searches_
        std::size_t start;
    };

    std::vector<ByteSearch> searches_;
    std::vector<Missing> missing_;
};

}  // namespace tessel::archive
