#include <algorithm>
#include <utility>

#include "coder/CodeTable.hpp"
#include "coder/DecodeTable.hpp"

namespace tessel {

void CodeTable::insert(char16_t character, const Entry& entry) {
    std::uint32_t& start = pageStart_[character >> 8];
    if (start == 0) {
        const auto fresh = static_cast<std::uint32_t>(entries_.size());
        entries_.reserve(entries_.size() + pageEntries);
        entries_.resize(entries_.size() + pageEntries);
        start = fresh;
    }
    Entry& place = entries_[start + (character & 0xFFU)];
    if (place.exists()) return;
    place = entry;
    ++count_;
}

void CodeTable::clear() noexcept {
    std::fill(pageStart_.begin(), pageStart_.end(), 0U);
    entries_.resize(pageEntries);
    count_ = 0;
}

void DecodeTable::Step::append(char16_t character, unsigned bitCount) noexcept {
    const unsigned position = count();
    word_ |= std::uint64_t{character} << (position * characterBits);
    word_ += std::uint64_t{1} << fieldsAt;
    // From its own place on to that of all characters.
    for (unsigned i = position + 1; i <= mostCharacters; ++i) {
        const unsigned at = fieldsAt + i * fieldBits;
        word_ &= ~(fieldMask << at);
        word_ |= std::uint64_t{bitCount} << at;
    }
}

namespace {

constexpr std::size_t windows = std::size_t{1} << DecodeTable::windowBits;

// The character that a window begins with, and the bits of its code; none,
// and 0, if its code is longer than the window or leads off the tree.
struct FirstCharacter {
    char16_t character = 0;
    unsigned bits = 0;
};

std::vector<FirstCharacter> firstCharacters(const std::vector<HNode>& nodes,
                                            const HNode& root) {
    struct Pending {
        const HNode* node;
        std::size_t code;
        unsigned bits;
    };
    std::vector<FirstCharacter> firsts(windows);
    std::vector<Pending> pending{{&root, 0, 0}};
    while (!pending.empty()) {
        const Pending at = pending.back();
        pending.pop_back();
        if (at.node->isLeaf()) {
            const std::size_t step = std::size_t{1} << at.bits;
            for (std::size_t window = at.code; window < windows; window += step)
                firsts[window] = {at.node->character, at.bits};
            continue;
        }
        if (at.bits == DecodeTable::windowBits) continue;
        const auto descend = [&](std::int32_t child, std::size_t bit) {
            if (child < 0) return;
            pending.push_back({&nodes[static_cast<std::size_t>(child)],
                               at.code | bit << at.bits, at.bits + 1});
        };
        descend(at.node->left, 0);
        descend(at.node->right, 1);
    }
    return firsts;
}

}  // namespace

void DecodeTable::build(const std::vector<HNode>& nodes,
                        std::int32_t rootIndex) {
    clear();
    if (rootIndex < 0 || static_cast<std::size_t>(rootIndex) >= nodes.size())
        return;
    const HNode& root = nodes[static_cast<std::size_t>(rootIndex)];
    if (root.isLeaf()) return;
    const auto firsts = firstCharacters(nodes, root);
    std::vector<Step> built(windows);
    for (std::size_t window = 0; window < windows; ++window) {
        Step& step = built[window];
        // What is left of the window is filled up with zeros, which may look
        // like a character but must not reach beyond the window's end.
        FirstCharacter next = firsts[window];
        for (unsigned end = next.bits; next.bits != 0 && end <= windowBits;
             end += next.bits) {
            step.append(next.character, end);
            if (step.count() == mostCharacters) break;
            next = firsts[window >> end];
        }
    }
    steps_ = std::move(built);
}

}  // namespace tessel
