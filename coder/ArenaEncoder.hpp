#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "coder/ComponentEncoder.hpp"
#include "pathtree/ComponentArena.hpp"

namespace tessel {

// Encodes texts into arenas, as ComponentEncoder does, but a short text in one
// pass and four characters at a time.
//
// Ownership: borrows the code, which must outlive it and not change.
// Threads: any number of them, each with an arena of its own.
// Cost: 2 KB, filled when it is made: make one for many texts.
class ArenaEncoder {
public:
    explicit ArenaEncoder(const HuffmanCode& code) noexcept;

    // Appends the encoded text to the arena's current list and returns its
    // length. Throws NoCodeForEmptyString, CodeNotFoundException or
    // std::bad_alloc; nothing is appended then.
    std::size_t append(const std::u16string& text, ComponentArena& arena) const;

    // Does the same to a text of bytes if it is short, all of it is ASCII and
    // each character has a code, none of them long. Otherwise appends nothing
    // and returns 0.
    std::size_t appendAscii(std::string_view text, ComponentArena& arena) const;

private:
    // A code for one step: its length in the low byte, its bits above. A
    // length of noStep stands for no code or a long one.
    using PackedCode = std::uint64_t;

    static PackedCode packed(const CodeTable::Entry& entry) noexcept;
    PackedCode codeOf(char byte) const noexcept;
    PackedCode codeOf(char16_t unit) const noexcept;
    template <class Unit>
    std::size_t appendShort(std::basic_string_view<Unit> text,
                            ComponentArena& arena) const;

    const CodeTable& codes_;
    ComponentEncoder encoder_;
    std::array<PackedCode, 256> ascii_{};  // the upper half has no codes
};

}  // namespace tessel
