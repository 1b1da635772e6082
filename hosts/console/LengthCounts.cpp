#include "hosts/console/LengthCounts.hpp"

#include <algorithm>
#include <numeric>

namespace tessel::console {

std::uint64_t LengthCounts::paths() const noexcept {
    return std::accumulate(counts_.begin(), counts_.end(), std::uint64_t{0});
}

std::size_t LengthCounts::shortest() const noexcept {
    const auto first = std::find_if(counts_.begin(), counts_.end(),
                                    [](std::uint64_t n) { return n > 0; });
    return first == counts_.end()
               ? 0
               : static_cast<std::size_t>(first - counts_.begin());
}

std::size_t LengthCounts::longest() const noexcept {
    return counts_.empty() ? 0 : counts_.size() - 1;
}

std::size_t LengthCounts::quantile(unsigned percent) const noexcept {
    const std::uint64_t all = paths();
    std::uint64_t seen = 0;
    for (std::size_t length = 0; length < counts_.size(); ++length) {
        seen += counts_[length];
        if (seen > 0 && seen * 100 >= all * percent) return length;
    }
    return longest();
}

std::vector<LengthCounts::Bin> LengthCounts::bins(std::size_t maxBins) const {
    std::vector<Bin> bins;
    if (counts_.empty()) return bins;
    const std::size_t shown = quantile(99) + 1;
    const std::size_t width =
        std::max<std::size_t>(1, (shown + maxBins - 1) / maxBins);
    for (std::size_t begin = 0; begin < shown; begin += width)
        bins.push_back({begin, begin + width, 0});
    bins.back().end = std::max(bins.back().end, counts_.size());
    for (std::size_t length = 0; length < counts_.size(); ++length)
        bins[std::min(length / width, bins.size() - 1)].paths +=
            counts_[length];
    return bins;
}

}  // namespace tessel::console
