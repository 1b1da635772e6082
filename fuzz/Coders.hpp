#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "fuzz/Input.hpp"

namespace tessel::fuzz {

using Texts = std::vector<std::u16string>;

// The bytes of a coder's stored form.
inline std::vector<std::uint8_t> formOf(const HuffmanPathTree& coder,
                                        bool compress) {
    std::vector<std::uint8_t> form;
    coder.serialize(form, compress);
    return form;
}

// The texts of encoded components.
inline Texts decode(const HuffmanPathTree& coder,
                    const Components& components) {
    Texts texts;
    for (const Component& component : components)
        texts.push_back(coder.generatePathFrom(component));
    return texts;
}

// Builds a code from characters, each two bytes and a byte of frequency. A
// repeated character is left out.
inline void buildCode(HuffmanPathTree& coder, Input& input,
                      std::size_t characterCount) {
    std::u16string characters;
    std::vector<double> frequencies;
    while (characters.size() < characterCount && !input.empty()) {
        const auto character = static_cast<char16_t>(input.number());
        const double frequency = input.byte();
        if (characters.find(character) != std::u16string::npos) continue;
        characters.push_back(character);
        frequencies.push_back(frequency);
    }
    coder.deflateHuffman(frequencies.data(), characters);
}

}  // namespace tessel::fuzz
