#include "coder/HuffmanCode.hpp"

#include <algorithm>
#include <limits>
#include <stdexcept>

#include "coder/CoderErrors.hpp"
#include "packing/ByteCursor.hpp"
#include "pathtree/containers.hpp"

namespace tessel {

namespace {

std::size_t at(std::int32_t position) {
    return static_cast<std::size_t>(position);
}

void requireFrequencies(const double* frequencies, std::size_t count) {
    if (count > 0 && frequencies == nullptr)
        throw std::invalid_argument("Characters need frequencies.");
}

[[noreturn]] void refuseNodes() {
    throw std::logic_error("The coder's nodes are not those of one tree.");
}

std::size_t leavesIn(const std::vector<bool>& shape) {
    return static_cast<std::size_t>(
        std::count(shape.begin(), shape.end(), true));
}

}  // namespace

// ---- Construction ----

void HuffmanCode::requireNoCode() const {
    if (!nodes.empty()) throw std::logic_error("The coder has a code already.");
}

// Runs `build`, which makes `nodes`, and fills the tables. If memory runs
// out, there is no code, as before, and it can be built again.
template <class Build>
void HuffmanCode::buildOrClear(Build build) {
    try {
        build();
        generateCode();
    } catch (...) {
        decodeTable_.clear();
        releaseContents(nodes);
        releaseContents(parentOf);
        codes.clear();
        rootIndex = 0;
        throw;
    }
}

void HuffmanCode::build(const double* characterFrequencies,
                        const std::u16string& characters) {
    requireNoCode();
    if (!boolTree.empty())
        throw std::logic_error("The coder has loaded a shape already.");
    requireFrequencies(characterFrequencies, characters.size());
    try {
        buildOrClear([&] {
            makeHeapAndTree(characterFrequencies, characters);
            generateCompressedTree();
        });
    } catch (...) {
        boolTree.clear();
        treeString.clear();
        frequencies.clear();
        throw;
    }
}

void HuffmanCode::makeHeapAndTree(const double* characterFrequencies,
                                  const std::u16string& characters) {
    const std::size_t count = characters.size();
    requireFrequencies(characterFrequencies, count);
    releaseContents(frequencies);
    frequencies.reserve(count);
    HeapQueue queue;
    for (std::size_t i = 0; i < count; ++i) {
        HNode leaf;
        leaf.frequency = characterFrequencies[i];
        leaf.character = characters[i];
        queue.push(leaf);
    }
    generateTree(queue);
}

void HuffmanCode::generateTree(HeapQueue& queue) {
    decodeTable_.clear();
    if (queue.size() < 2) {
        rootIndex = queue.empty() ? -1 : queue.top().index;
        return;
    }
    std::int32_t next = 0;
    const auto takeSmallest = [&] {
        HNode node = queue.top();
        queue.pop();
        if (node.index == -1) {
            node.index = next++;
            nodes.push_back(node);
        }
        return node;
    };
    nodes.reserve(nodes.size() + 2 * queue.size() - 1);
    while (queue.size() > 1) {
        const HNode smallest = takeSmallest();
        const HNode second = takeSmallest();
        HNode parent;
        parent.frequency = smallest.frequency + second.frequency;
        parent.index = next++;
        parent.left = smallest.index;
        parent.right = second.index;
        nodes.push_back(parent);
        queue.push(parent);
    }
    rootIndex = queue.top().index;
}

void HuffmanCode::generateCompressedTree() {
    traverse([this](const HNode& node) {
        boolTree.push_back(node.isLeaf());
        if (!node.isLeaf()) return;
        treeString.push_back(node.character);
        frequencies.push_back(node.frequency);
    });
}

void HuffmanCode::generateCode() {
    parentOf.assign(nodes.size(), -1);
    traverse([this](const HNode& node) {
        if (node.left != -1) parentOf[at(node.left)] = node.index;
        if (node.right != -1) parentOf[at(node.right)] = node.index;
        if (node.isLeaf()) addCode(node);
    });
    decodeTable_.build(nodes, rootIndex);
}

// -1 also for a position that is none.
std::int32_t HuffmanCode::parentOfNode(std::int32_t child) const noexcept {
    if (child < 0 || at(child) >= parentOf.size()) return -1;
    const std::int32_t parent = parentOf[at(child)];
    return isPosition(parent) ? parent : -1;
}

void HuffmanCode::addCode(const HNode& leaf) {
    CodeTable::Entry entry;
    entry.leaf = leaf.index;
    std::int32_t child = leaf.index;
    for (std::int32_t parent = parentOfNode(child); parent != -1;
         parent = parentOfNode(child)) {
        if (entry.length == CodeTable::longestInline) {
            entry = {0, leaf.index, 0, true};
            break;
        }
        const bool bit = nodes[at(parent)].left != child;
        entry.bits = (entry.bits << 1) | (bit ? 1U : 0U);
        ++entry.length;
        child = parent;
    }
    codes.insert(leaf.character, entry);
}

// ---- From the compact form ----

void HuffmanCode::restore(const std::u16string& characters) {
    requireNoCode();
    if (characters.size() != leavesIn(boolTree)) throw DamagedFormException();
    buildOrClear([&] {
        treeString = characters;
        inflate();
    });
}

std::size_t HuffmanCode::inflateFromBoolTree() {
    const std::size_t leaves = leavesIn(boolTree);
    if (leaves > treeString.size()) throw DamagedFormException();
    decodeTable_.clear();
    nodes.reserve(nodes.size() + boolTree.size());
    std::size_t character = 0;
    for (std::size_t k = 0; k < boolTree.size(); ++k) {
        HNode node;
        node.index = static_cast<std::int32_t>(k);
        if (boolTree[k]) node.character = treeString[character++];
        nodes.push_back(node);
    }
    return leaves;
}

void HuffmanCode::inflateFromCompressedTree() {
    const bool hasLinks = !boolTree.empty() && !boolTree.front();
    const auto isUnlinked = [this](const HNode& node) {
        return node.isLeaf() && node.index >= 0 &&
               at(node.index) < boolTree.size();
    };
    if (hasLinks &&
        (nodes.empty() || !std::all_of(nodes.begin(), nodes.end(), isUnlinked)))
        throw std::logic_error("The coder has no unlinked nodes of its shape.");
    decodeTable_.clear();
    rootIndex = 0;
    if (!hasLinks) return;
    std::vector<std::size_t> open{0};
    std::size_t handedOut = 0;
    while (!open.empty()) {
        const std::size_t top = open.back();
        if (boolTree[at(nodes[top].index)]) {
            open.pop_back();
            continue;
        }
        // A shape with more inner nodes than nodes to link: some stay without
        // children.
        if (++handedOut >= nodes.size()) return;
        const auto child = static_cast<std::int32_t>(handedOut);
        if (nodes[top].left == -1) {
            nodes[top].left = child;
        } else {
            nodes[top].right = child;
            open.pop_back();
        }
        open.push_back(handedOut);
    }
}

void HuffmanCode::inflate() {
    requireNoCode();
    inflateFromBoolTree();
    inflateFromCompressedTree();
}

// ---- Questions ----

// Iterative: a tree may be as deep as it has leaves.
std::vector<HNode> HuffmanCode::inPreOrder() const {
    std::vector<HNode> order;
    std::vector<std::int32_t> pending;
    if (isPosition(rootIndex)) pending.push_back(rootIndex);
    while (!pending.empty()) {
        const std::int32_t position = pending.back();
        pending.pop_back();
        if (!isPosition(position) || order.size() == nodes.size())
            refuseNodes();
        const HNode& node = nodes[at(position)];
        order.push_back(node);
        if (node.right != -1) pending.push_back(node.right);
        if (node.left != -1) pending.push_back(node.left);
    }
    return order;
}

std::vector<bool> HuffmanCode::codeOf(char16_t character) const {
    const CodeTable::Entry& entry = codes[character];
    if (!entry.exists()) throw CodeNotFoundException();
    std::vector<bool> bits;
    if (!entry.isLong) {
        for (unsigned i = 0; i < entry.length; ++i)
            bits.push_back(((entry.bits >> i) & 1U) != 0);
        return bits;
    }
    std::int32_t child = entry.leaf;
    for (std::int32_t parent = parentOfNode(child); parent != -1;
         parent = parentOfNode(child)) {
        if (bits.size() == nodes.size()) refuseNodes();
        bits.push_back(nodes[at(parent)].left != child);
        child = parent;
    }
    std::reverse(bits.begin(), bits.end());
    return bits;
}

bool HuffmanCode::isShape(const std::vector<bool>& bits) {
    if (bits.empty()) return true;
    if (bits.size() > std::numeric_limits<std::int32_t>::max()) return false;
    std::size_t awaited = 1;
    for (const bool isLeaf : bits) {
        if (awaited == 0) return false;
        if (isLeaf)
            --awaited;
        else
            ++awaited;
    }
    return awaited == 0;
}

std::size_t HuffmanCode::memoryBytes() const noexcept {
    return boolTree.capacity() / 8 + treeString.capacity() * sizeof(char16_t) +
           frequencies.capacity() * sizeof(double) +
           nodes.capacity() * sizeof(HNode) +
           parentOf.capacity() * sizeof(std::int32_t) + codes.memoryBytes() +
           decodeTable_.memoryBytes();
}

}  // namespace tessel
