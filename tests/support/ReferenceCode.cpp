#include "tests/support/ReferenceCode.hpp"

#include "tests/support/ReferenceHeap.hpp"

namespace model {

namespace {

std::size_t at(int position) { return static_cast<std::size_t>(position); }

void mergeAll(ReferenceHeap<CodeNode>& heap, Code& code) {
    if (heap.size() < 2) {
        code.root = -1;
        return;
    }
    const auto take = [&] {
        CodeNode node = heap.top();
        heap.pop();
        if (node.index == -1) {
            node.index = static_cast<int>(code.nodes.size());
            code.nodes.push_back(node);
        }
        return node;
    };
    while (heap.size() > 1) {
        const CodeNode first = take();
        const CodeNode second = take();
        CodeNode parent;
        parent.frequency = first.frequency + second.frequency;
        parent.index = static_cast<int>(code.nodes.size());
        parent.left = first.index;
        parent.right = second.index;
        code.nodes.push_back(parent);
        heap.push(parent);
    }
    code.root = heap.top().index;
}

struct Visit {
    int node;
    std::vector<bool> bits;
};

void walkTree(Code& code) {
    std::vector<Visit> pending;
    if (code.root != -1) pending.push_back({code.root, {}});
    while (!pending.empty()) {
        const Visit visit = pending.back();
        pending.pop_back();
        const CodeNode& node = code.nodes[at(visit.node)];
        code.shape.push_back(node.isLeaf());
        if (node.isLeaf()) {
            code.leaves.push_back(node.character);
            code.frequencies.push_back(node.frequency);
            code.codes.emplace(node.character, visit.bits);
            continue;
        }
        Visit right{node.right, visit.bits};
        right.bits.push_back(true);
        pending.push_back(right);
        Visit left{node.left, visit.bits};
        left.bits.push_back(false);
        pending.push_back(left);
    }
}

}  // namespace

Code buildCode(const std::u16string& characters,
               const std::vector<double>& frequencies) {
    Code code;
    ReferenceHeap<CodeNode> heap;
    for (std::size_t i = 0; i < characters.size(); ++i) {
        CodeNode leaf;
        leaf.frequency = frequencies[i];
        leaf.character = characters[i];
        heap.push(leaf);
    }
    mergeAll(heap, code);
    walkTree(code);
    return code;
}

Bytes packBits(const std::vector<bool>& bits) {
    if (bits.empty()) return {};
    Bytes bytes(bits.size() / 8 + 1, 0);
    for (std::size_t i = 0; i < bits.size(); ++i)
        if (bits[i])
            bytes[i / 8] =
                static_cast<std::uint8_t>(bytes[i / 8] | (1U << (i % 8)));
    bytes.push_back(static_cast<std::uint8_t>(bits.size() % 8));
    return bytes;
}

Encoded encode(const Code& code, const std::u16string& text) {
    if (text.empty()) return {{}, Refusal::emptyText};
    std::vector<bool> bits;
    for (const char16_t character : text) {
        const auto found = code.codes.find(character);
        if (found == code.codes.end()) return {{}, Refusal::unknownCharacter};
        bits.insert(bits.end(), found->second.begin(), found->second.end());
    }
    return {packBits(bits), {}};
}

std::optional<std::u16string> decode(const std::vector<CodeNode>& nodes,
                                     int root, const Bytes& bytes) {
    if (bytes.empty() || bytes.back() > 7) return {};
    if (bytes.size() == 1) return std::u16string();
    const std::size_t bits = 8 * (bytes.size() - 2) + bytes.back();
    if (bits == 0) return std::u16string();
    const auto exists = [&](int position) {
        return position >= 0 && at(position) < nodes.size();
    };
    if (!exists(root)) return {};
    // Of a tree that is one leaf every bit is a character.
    if (nodes[at(root)].isLeaf())
        return std::u16string(bits, nodes[at(root)].character);
    std::u16string text;
    int position = root;
    for (std::size_t i = 0; i < bits; ++i) {
        const bool bit = ((bytes[i / 8] >> (i % 8)) & 1U) != 0;
        const CodeNode& node = nodes[at(position)];
        position = bit ? node.right : node.left;
        if (!exists(position)) return {};
        if (!nodes[at(position)].isLeaf()) continue;
        text.push_back(nodes[at(position)].character);
        position = root;
    }
    return text;
}

}  // namespace model
