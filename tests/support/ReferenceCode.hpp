#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "tests/support/Bytes.hpp"

namespace model {

using support::Bytes;

struct CodeNode {
    double frequency = 0;
    char16_t character = 0;
    int index = -1;
    int left = -1;
    int right = -1;

    bool isLeaf() const { return left == -1 && right == -1; }
};

// A Huffman code, built step by step from characters and their frequencies.
struct Code {
    std::vector<CodeNode> nodes;
    int root = 0;
    std::vector<bool> shape;          // in pre-order, true: a leaf
    std::u16string leaves;            // their characters, in pre-order
    std::vector<double> frequencies;  // likewise
    std::map<char16_t, std::vector<bool>> codes;
};

Code buildCode(const std::u16string& characters,
               const std::vector<double>& frequencies);

// Bits to a bit block.
Bytes packBits(const std::vector<bool>& bits);

enum class Refusal { emptyText, unknownCharacter };

struct Encoded {
    Bytes bytes;
    std::optional<Refusal> refusal;
};
Encoded encode(const Code& code, const std::u16string& text);

// Walks the tree bit by bit. No answer: the bytes are no encoded text.
std::optional<std::u16string> decode(const std::vector<CodeNode>& nodes,
                                     int root, const Bytes& bytes);

}  // namespace model
