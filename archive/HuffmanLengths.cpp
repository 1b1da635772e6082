#include "archive/HuffmanLengths.hpp"

#include <algorithm>
#include <cstddef>

namespace tessel::archive {

namespace {

struct Leaf {
    std::uint64_t count;
    std::uint32_t symbol;
};

// The depth of each leaf. Leaves are sorted by count, at least two.
std::vector<unsigned> depthsOf(const std::vector<Leaf>& leaves) {
    const std::size_t n = leaves.size();
    // Nodes 0 to n - 1 are leaves; inner nodes follow in the order of their
    // weights, so both queues are just positions.
    std::vector<std::uint64_t> weight(2 * n - 1);
    std::vector<std::size_t> parent(2 * n - 1);
    for (std::size_t i = 0; i < n; ++i) weight[i] = leaves[i].count;
    std::size_t leaf = 0;
    std::size_t inner = n;
    for (std::size_t node = n; node < 2 * n - 1; ++node) {
        for (int child = 0; child < 2; ++child) {
            const bool takeLeaf =
                leaf < n && (inner == node || weight[leaf] <= weight[inner]);
            const std::size_t taken = takeLeaf ? leaf++ : inner++;
            weight[node] += weight[taken];
            parent[taken] = node;
        }
    }
    std::vector<unsigned> depth(2 * n - 1);
    for (std::size_t node = 2 * n - 2; node-- > 0;)
        depth[node] = depth[parent[node]] + 1;
    depth.resize(n);
    return depth;
}

}  // namespace

std::vector<std::uint8_t> huffmanLengths(std::span<const std::uint64_t> counts,
                                         unsigned maxBits) {
    std::vector<std::uint8_t> lengths(counts.size());
    std::vector<Leaf> leaves;
    std::uint64_t total = 0;
    for (std::uint32_t s = 0; s < counts.size(); ++s) {
        if (counts[s] == 0) continue;
        leaves.push_back({counts[s], s});
        total += counts[s];
    }
    if (leaves.size() < 2) return lengths;
    const std::uint64_t raise =
        std::max<std::uint64_t>(1, total >> (maxBits + 2));
    while (true) {
        std::ranges::sort(leaves, [](const Leaf& a, const Leaf& b) {
            return a.count != b.count ? a.count < b.count : a.symbol < b.symbol;
        });
        const std::vector<unsigned> depths = depthsOf(leaves);
        if (std::ranges::max(depths) <= maxBits) {
            for (std::size_t i = 0; i < leaves.size(); ++i)
                lengths[leaves[i].symbol] =
                    static_cast<std::uint8_t>(depths[i]);
            return lengths;
        }
        for (Leaf& leaf : leaves) leaf.count += raise;
    }
}

std::vector<std::uint32_t> canonicalCodes(
    std::span<const std::uint8_t> lengths) {
    std::vector<std::uint32_t> firstOf(34);
    for (const std::uint8_t length : lengths)
        if (length > 0) ++firstOf[length + 1U];
    // firstOf[l + 1] counts the codes of length l; turn it into first codes.
    std::uint32_t code = 0;
    for (std::size_t l = 1; l < firstOf.size(); ++l)
        firstOf[l] = code = (code + firstOf[l]) << 1U;
    std::vector<std::uint32_t> codes(lengths.size());
    for (std::size_t s = 0; s < lengths.size(); ++s)
        if (lengths[s] > 0) codes[s] = firstOf[lengths[s]]++;
    return codes;
}

}  // namespace tessel::archive
