// Decoding of hostile bytes with a code of hostile frequencies: a text or
// DamagedFormException, and a text that was decoded can be encoded again.
//
// Input: a byte with the number of characters, the characters with their
// frequencies, then the bytes to decode.
#include <cstdint>
#include <string>
#include <vector>

#include "fuzz/Coders.hpp"

namespace tessel::fuzz {
namespace {

// The bits of a component that decoded without an exception.
std::vector<bool> bitsOf(const Component& component) {
    std::vector<bool> bits;
    sixpacks::bytesToBoolVec(component, bits);
    return bits;
}

void checkText(HuffmanPathTree& coder, const Component& bytes,
               const std::u16string& text) {
    if (text.empty()) return;
    const Component encoded = coder.generateCodeFor(text);
    require(coder.generatePathFrom(encoded) == text, "decode undoes encode");

    const std::vector<bool> before = bitsOf(bytes);
    const std::vector<bool> after = bitsOf(encoded);
    require(after.size() <= before.size(), "encoding adds no bits");
    for (std::size_t i = 0; i < after.size(); ++i)
        require(before[i] == after[i], "encode undoes decode");
}

// The same text by the bit-by-bit walk over the tree.
std::u16string walk(const HuffmanPathTree& coder, const Component& bytes) {
    std::u16string text;
    std::int32_t position = coder.rootIndex;
    for (const bool bit : bitsOf(bytes)) {
        while (coder.appendToPathIfLeaf(position, text)) continue;
        const HNode& node = coder.nodes[static_cast<std::size_t>(position)];
        position = bit ? node.right : node.left;
    }
    coder.appendToPathIfLeaf(position, text);
    return text;
}

void decodeAndEncode(Input input) {
    HuffmanPathTree coder;
    const std::size_t characterCount = input.byte();
    buildCode(coder, input, characterCount);
    const Component bytes = input.remainder();
    std::u16string text;
    try {
        text = coder.generatePathFrom(bytes);
    } catch (const DamagedFormException&) {
        require(bytes.empty() || bytes.back() > 7 || coder.codes.size() == 0,
                "a full tree decodes any bit block");
        return;
    }
    checkText(coder, bytes, text);
    if (coder.codes.size() > 0)
        require(walk(coder, bytes) == text, "tables decode as the tree does");
}

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::decodeAndEncode({data, size});
    return 0;
}
