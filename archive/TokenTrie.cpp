#include "archive/TokenTrie.hpp"

#include <algorithm>
#include <numeric>
#include <span>

namespace tessel::archive {

// Places the nodes from the root down. The tokens below a node are a range of
// the sorted tokens, so nothing but that range is kept per node.
class TokenTrie::Builder {
public:
    Builder(TokenTrie& trie, const std::vector<std::string>& tokens)
        : trie_(trie), tokens_(tokens), sorted_(tokens.size()) {
        std::iota(sorted_.begin(), sorted_.end(), 0U);
        std::ranges::sort(sorted_, [&](std::uint32_t a, std::uint32_t b) {
            return tokens[a] < tokens[b];
        });
        grow();
        growTo(2);
    }

    void build() {
        trie_.root_ = place({0, sorted_.size(), 0, 0});
        while (!nodes_.empty()) {
            const Node node = nodes_.back();
            nodes_.pop_back();
            const Base base = place(node);
            trie_.slots_[node.slot] |= std::uint64_t{base} << baseShift;
        }
    }

private:
    // A node whose children are not placed yet.
    struct Node {
        std::size_t begin;  // its tokens in sorted_
        std::size_t end;
        std::size_t depth;
        std::uint32_t slot;
    };

    static constexpr std::size_t pageSlots = 256;

    std::uint8_t byteOf(std::size_t sortedIndex, std::size_t depth) const {
        return static_cast<std::uint8_t>(tokens_[sorted_[sortedIndex]][depth]);
    }

    void grow() {
        trie_.slots_.resize(trie_.slots_.size() + pageSlots, emptySlot());
        baseUsed_.resize(trie_.slots_.size());
    }
    void growTo(std::size_t pages) {
        while (trie_.slots_.size() < pages * pageSlots) grow();
    }
    static constexpr std::uint64_t emptySlot() {
        return unusedSlot | std::uint64_t{noToken} << tokenShift;
    }
    bool isFree(std::size_t slot) const {
        return (trie_.slots_[slot] & labelMask) == unusedSlot;
    }

    Base place(Node node);
    Base findBase(std::span<const std::uint8_t> labels);
    bool fits(Base base, std::span<const std::uint8_t> labels) const;

    TokenTrie& trie_;
    const std::vector<std::string>& tokens_;
    std::vector<std::uint32_t> sorted_;
    std::vector<Node> nodes_;
    std::vector<bool> baseUsed_;
    // No slot before the first is free. Nodes with more than a few children
    // rarely fit before the second.
    std::size_t firstFree_ = pageSlots;
    std::size_t roomyFrom_ = pageSlots;
};

// Gives slots to the children of a node and returns its base; 0 if it has
// none.
TokenTrie::Base TokenTrie::Builder::place(Node node) {
    // The token that ends at the node itself sorts first.
    if (node.begin < node.end &&
        tokens_[sorted_[node.begin]].size() == node.depth) {
        std::uint64_t& slot = trie_.slots_[node.slot];
        slot = (slot & 0xFFFFFFFF) | std::uint64_t{sorted_[node.begin]}
                                         << tokenShift;
        ++node.begin;
    }
    std::vector<std::uint8_t> labels;
    std::vector<std::size_t> begins;
    for (std::size_t i = node.begin; i < node.end; ++i) {
        const std::uint8_t label = byteOf(i, node.depth);
        if (!labels.empty() && labels.back() == label) continue;
        labels.push_back(label);
        begins.push_back(i);
    }
    if (labels.empty()) return 0;
    begins.push_back(node.end);
    const Base base = findBase(labels);
    baseUsed_[base] = true;
    for (std::size_t i = 0; i < labels.size(); ++i) {
        const std::uint32_t slot = base ^ labels[i];
        trie_.slots_[slot] = (emptySlot() & ~labelMask) | labels[i];
        nodes_.push_back({begins[i], begins[i + 1], node.depth + 1, slot});
    }
    return base;
}

TokenTrie::Base TokenTrie::Builder::findBase(
    std::span<const std::uint8_t> labels) {
    // Few children go into gaps, many to the end, where gaps are wide. Gaps
    // that a long search found no use for are left behind.
    constexpr std::size_t longSearch = 64;
    const bool few = labels.size() <= 3;
    std::size_t& start = few ? firstFree_ : roomyFrom_;
    for (std::size_t slot = start;; ++slot) {
        if (slot == trie_.slots_.size()) grow();
        const Base base = static_cast<Base>(slot) ^ labels.front();
        if (!isFree(slot) || baseUsed_[base] || !fits(base, labels)) continue;
        if (slot > start + longSearch) start = few ? slot : slot - longSearch;
        return base;
    }
}

bool TokenTrie::Builder::fits(Base base,
                              std::span<const std::uint8_t> labels) const {
    return std::ranges::all_of(
        labels, [&](std::uint8_t label) { return isFree(base ^ label); });
}

TokenTrie::TokenTrie(const std::vector<std::string>& tokens) {
    Builder(*this, tokens).build();
}

}  // namespace tessel::archive
