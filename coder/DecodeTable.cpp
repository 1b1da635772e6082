#include "coder/DecodeTable.hpp"

#include <utility>

#include "pathtree/containers.hpp"

namespace tessel {

void DecodeTable::Entry::append(char16_t character,
                                unsigned bitCount) noexcept {
    const unsigned position = count();
    word_ |= std::uint64_t{character} << (position * characterBits);
    word_ += std::uint64_t{1} << fieldsAt;
    // Its own end, and that of all characters that are not there.
    for (unsigned i = position + 1; i <= maxCharacters; ++i) {
        const unsigned at = fieldsAt + i * fieldBits;
        word_ &= ~(fieldMask << at);
        word_ |= std::uint64_t{bitCount} << at;
    }
}

void DecodeTable::clear() noexcept { releaseContents(entries_); }

namespace {

constexpr std::size_t windows = std::size_t{1} << DecodeTable::windowBits;

// The character that a window begins with and the length of its code; length
// 0 if the code is longer than the window or leads off the tree.
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
            if (child < 0 || static_cast<std::size_t>(child) >= nodes.size())
                return;
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
    std::vector<Entry> built(windows);
    for (std::size_t window = 0; window < windows; ++window) {
        Entry& entry = built[window];
        // The rest of a window is filled up with zeros. They may look like a
        // character, so none is taken that ends after the window.
        FirstCharacter next = firsts[window];
        for (unsigned end = next.bits; next.bits != 0 && end <= windowBits;
             end += next.bits) {
            entry.append(next.character, end);
            if (entry.count() == maxCharacters) break;
            next = firsts[window >> end];
        }
    }
    entries_ = std::move(built);
}

}  // namespace tessel
