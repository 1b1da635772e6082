#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "coder/BitWriter.hpp"
#include "coder/HuffmanCode.hpp"

namespace tessel {

// Encodes texts: the codes of the characters one after the other, least
// significant bit first, as a bit block (sixpacks::boolVecToBytes).
//
// Ownership: borrows the code, which must outlive it and not change.
// Threads: any number of them.
class ComponentEncoder {
public:
    // Bytes that write may touch after the component.
    static constexpr std::size_t slack = BitWriter::slack;

    explicit ComponentEncoder(const HuffmanCode& code) noexcept : code_(code) {}

    // Length of the encoded text. Throws NoCodeForEmptyString or
    // CodeNotFoundException.
    std::size_t bytesFor(const std::u16string& text) const;

    // Writes the encoded text, whose length bytesFor gave and which must not
    // be 0. May write up to `slack` bytes more.
    void write(const std::u16string& text, std::uint8_t* to) const;

private:
    const HuffmanCode& code_;
};

}  // namespace tessel
