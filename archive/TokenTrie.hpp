#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace tessel::archive {

// Finds all tokens that begin at a place of a text, one byte per step.
//
// A double-array trie (Aoe 1989) in the exclusive-or form: the child of a node
// for byte c is in slot base ^ c, if that slot is labelled c. Each base is
// used by one node only, so the label alone proves the parent.
//
// Invariants: slots 0 to 255 are never used, so base 0 has no children.
// Threads: reading from several threads is safe.
// Cost: a step is one load. 8 bytes per slot, of which some two thirds are
//   used. Building takes some 30 ns per byte of the tokens.
class TokenTrie {
public:
    static constexpr std::uint32_t noToken = 0xFFFFFFFF;

    TokenTrie() = default;
    // The tokens are distinct and not empty; their places are their numbers.
    explicit TokenTrie(const std::vector<std::string>& tokens);

    // Where a walk is: the base of a node.
    using Base = std::uint32_t;
    Base root() const noexcept { return root_; }

    // Moves on to the child for this byte; false if there is none. `token` is
    // then the token that ends there, or noToken.
    bool step(Base& base, std::uint8_t byte,
              std::uint32_t& token) const noexcept {
        const std::uint64_t slot = slots_[base ^ byte];
        if ((slot & labelMask) != byte) return false;
        base = static_cast<Base>(slot >> baseShift & baseMask);
        token = static_cast<std::uint32_t>(slot >> tokenShift);
        return true;
    }

private:
    // | token (32 bits) | base (23 bits) | label (9 bits) |
    static constexpr unsigned baseShift = 9;
    static constexpr unsigned tokenShift = 32;
    static constexpr std::uint64_t labelMask = 0x1FF;
    static constexpr std::uint64_t baseMask = 0x7FFFFF;
    static constexpr std::uint64_t unusedSlot = 0x100;  // a label of no byte

    class Builder;

    std::vector<std::uint64_t> slots_;
    Base root_ = 0;
};

}  // namespace tessel::archive
