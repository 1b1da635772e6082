#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace tessel::console {

// Counts how many paths have which length.
class LengthCounts {
public:
    // Paths of lengths from begin up to, but without, end.
    struct Bin {
        std::size_t begin = 0;
        std::size_t end = 0;
        std::uint64_t paths = 0;

        friend bool operator==(const Bin&, const Bin&) = default;
    };

    void add(std::size_t length) {
        if (length >= counts_.size()) counts_.resize(length + 1);
        ++counts_[length];
    }

    std::uint64_t paths() const noexcept;

    // Shortest, longest and middle length; 0 if there is no path. Of an even
    // number of paths the median is the lower of the two in the middle.
    std::size_t shortest() const noexcept;
    std::size_t longest() const noexcept;
    std::size_t median() const noexcept { return quantile(50); }

    // The smallest length that this many per cent of the paths do not exceed.
    std::size_t quantile(unsigned percent) const noexcept;

    // At most `maxBins` bins of equal width from 0 on. The last one holds
    // everything beyond the length that 99 per cent do not exceed, so that a
    // few long paths do not flatten the picture.
    std::vector<Bin> bins(std::size_t maxBins) const;

private:
    std::vector<std::uint64_t> counts_;  // by length
};

}  // namespace tessel::console
