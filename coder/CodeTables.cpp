#include "coder/CodeTable.hpp"
#include "coder/DecodeTable.hpp"

namespace tessel {

void CodeTable::insert(char16_t character, const Entry& entry) {
    std::uint32_t& start = pageStart[character >> 8];
    if (start == 0) {
        const auto fresh = static_cast<std::uint32_t>(entries.size());
        entries.reserve(entries.size() + pageEntries);
        entries.resize(entries.size() + pageEntries);
        start = fresh;
    }
    Entry& place = entries[start + (character & 0xFFU)];
    if (place.exists()) return;
    place = entry;
    ++count;
}

void DecodeTable::Step::append(char16_t character, unsigned bitCount) noexcept {
    const unsigned position = count();
    word |= std::uint64_t{character} << (position * characterBits);
    word += std::uint64_t{1} << fieldsAt;
    // From its own place on to that of all characters.
    for (unsigned i = position + 1; i <= mostCharacters; ++i) {
        const unsigned at = fieldsAt + i * fieldBits;
        word &= ~(((std::uint64_t{1} << fieldBits) - 1) << at);
        word |= std::uint64_t{bitCount} << at;
    }
}

void DecodeTable::build(const std::vector<HNode>& nodes,
                        std::int32_t rootIndex) {
    clear();
    if (rootIndex < 0 || static_cast<std::size_t>(rootIndex) >= nodes.size())
        return;
    const HNode& root = nodes[static_cast<std::size_t>(rootIndex)];
    if (root.isLeaf()) return;
    std::vector<Step> built(std::size_t{1} << windowBits);
    for (std::size_t window = 0; window < built.size(); ++window) {
        Step& step = built[window];
        const HNode* node = &root;
        for (unsigned bit = 0; bit < windowBits; ++bit) {
            const std::int32_t next =
                ((window >> bit) & 1U) != 0 ? node->right : node->left;
            if (next < 0) break;
            node = &nodes[static_cast<std::size_t>(next)];
            if (!node->isLeaf()) continue;
            step.append(node->character, bit + 1);
            if (step.count() == mostCharacters) break;
            node = &root;
        }
    }
    steps = std::move(built);
}

}  // namespace tessel
