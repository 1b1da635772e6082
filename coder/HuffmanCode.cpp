// The Huffman code: construction from frequencies, its compact form and back.

#include <algorithm>
#include <stdexcept>
#include <utility>

#include "coder/HuffmanPathTree.hpp"

namespace tessel {

namespace {

std::size_t at(std::int32_t position) {
    return static_cast<std::size_t>(position);
}

bool isPosition(std::int32_t position, std::size_t size) {
    return position >= 0 && at(position) < size;
}

void pushLeaf(HuffmanPathTree::HeapQueue& queue, double frequency,
              char16_t character) {
    HNode leaf;
    leaf.frequency = frequency;
    leaf.character = character;
    queue.push(leaf);
}

}  // namespace

HuffmanPathTree::HuffmanPathTree() : pathTree(std::make_unique<BPathTree>()) {}

HuffmanPathTree::~HuffmanPathTree() {
    joinAllGenThreads();
    clearThreadResources();
}

// ---- Construction ----

void HuffmanPathTree::requireNoCode() const {
    if (!nodes.empty()) throw std::logic_error("The coder has a code already.");
}

// Runs `build`, which makes `nodes`, and derives the code. If memory runs
// out, there is no code, as before, and it can be built again.
template <class Build>
void HuffmanPathTree::buildCode(Build build) {
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

void HuffmanPathTree::deflateHuffman(const double* characterFrequencies,
                                     const std::u16string& characters) {
    requireNoCode();
    if (!boolTree.empty())
        throw std::logic_error("The coder has loaded a shape already.");
    try {
        buildCode([&] {
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

void HuffmanPathTree::deflateHuffman(
    const std::unordered_map<char16_t, double>& characterFrequencies) {
    std::u16string characters;
    std::vector<double> values;
    for (const auto& [character, frequency] : characterFrequencies) {
        characters.push_back(character);
        values.push_back(frequency);
    }
    deflateHuffman(values.data(), characters);
}

void HuffmanPathTree::makeHeapAndTree(const double* characterFrequencies,
                                      const std::u16string& characters) {
    releaseContents(frequencies);
    frequencies.reserve(characters.size());
    HeapQueue queue;
    for (std::size_t i = 0; i < characters.size(); ++i)
        pushLeaf(queue, characterFrequencies[i], characters[i]);
    generateTree(queue);
}

void HuffmanPathTree::makeHeapAndTree(
    const std::unordered_map<char16_t, double>& characterFrequencies) {
    releaseContents(frequencies);
    frequencies.reserve(characterFrequencies.size());
    HeapQueue queue;
    for (const auto& [character, frequency] : characterFrequencies)
        pushLeaf(queue, frequency, character);
    generateTree(queue);
}

void HuffmanPathTree::generateTree(HeapQueue& queue) {
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

void HuffmanPathTree::traverse(Visitor visit) {
    if (!isPosition(rootIndex, nodes.size())) return;
    std::vector<HNode> pending{nodes[at(rootIndex)]};
    while (!pending.empty()) {
        HNode node = pending.back();
        pending.pop_back();
        const HNode seen = node;  // the visitor may change its copy
        visit(this, node);
        if (seen.right != -1) pending.push_back(nodes[at(seen.right)]);
        if (seen.left != -1) pending.push_back(nodes[at(seen.left)]);
    }
}

void HuffmanPathTree::generateCode() {
    parentOf.assign(nodes.size(), -1);
    traverse([](HuffmanPathTree* self, HNode& node) {
        if (node.left != -1) self->parentOf[at(node.left)] = node.index;
        if (node.right != -1) self->parentOf[at(node.right)] = node.index;
        if (node.isLeaf()) self->addCode(node);
    });
    decodeTable_.build(nodes, rootIndex);
}

void HuffmanPathTree::addCode(const HNode& leaf) {
    CodeTable::Entry entry;
    entry.leaf = leaf.index;
    for (std::int32_t child = leaf.index;;) {
        if (!isPosition(child, parentOf.size())) break;
        const std::int32_t parent = parentOf[at(child)];
        if (parent == -1) break;
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

std::vector<bool> HuffmanPathTree::codeOf(char16_t character) const {
    const CodeTable::Entry& entry = codes[character];
    if (!entry.exists()) throw CodeNotFoundException();
    std::vector<bool> bits;
    if (!entry.isLong) {
        for (unsigned i = 0; i < entry.length; ++i)
            bits.push_back(((entry.bits >> i) & 1U) != 0);
        return bits;
    }
    for (std::int32_t child = entry.leaf; parentOf[at(child)] != -1;) {
        const std::int32_t parent = parentOf[at(child)];
        bits.push_back(nodes[at(parent)].left != child);
        child = parent;
    }
    std::reverse(bits.begin(), bits.end());
    return bits;
}

std::vector<double> HuffmanPathTree::getFrequencies() const {
    return frequencies;
}

void HuffmanPathTree::setFrequencies(std::vector<double>& newFrequencies) {
    frequencies = std::exchange(newFrequencies, {});
}

void HuffmanPathTree::copyTree(const HuffmanPathTree& other) {
    if (&other != this) {
        boolTree = other.boolTree;
        treeString = other.treeString;
        duplicates = other.duplicates;
        partitionEnds = other.partitionEnds;
        partitionTracks = other.partitionTracks;
        maxPartitionTrackLength = other.maxPartitionTrackLength;
        maxDuplicateTrackLength = other.maxDuplicateTrackLength;
        maxCodeBytes = other.maxCodeBytes.load();
        maxDuplicatePathNumber = other.maxDuplicatePathNumber;
        nextPathNumber = other.nextPathNumber;
        pathCount = other.pathCount;
        frequencies = other.frequencies;
        rootIndex = other.rootIndex;
        nodes = other.nodes;
        codes = other.codes;
        parentOf = other.parentOf;
        decodeTable_ = other.decodeTable_;
        endsAscend_ = other.endsAscend_;
    }
    pathTree = std::make_unique<BPathTree>(*other.pathTree);
}

// ---- Compact form ----

void HuffmanPathTree::generateCompressedTree() {
    traverse([](HuffmanPathTree* self, HNode& node) {
        self->boolTree.push_back(node.isLeaf());
        if (!node.isLeaf()) return;
        self->treeString.push_back(node.character);
        self->frequencies.push_back(node.frequency);
    });
}

std::vector<bool> HuffmanPathTree::getBoolTree() const { return boolTree; }

std::u16string HuffmanPathTree::getTreeString() const { return treeString; }

void HuffmanPathTree::setTreeString(const std::u16string& newTreeString) {
    treeString = newTreeString;
}

std::size_t HuffmanPathTree::inflateFromBoolTree() {
    const auto leaves = static_cast<std::size_t>(
        std::count(boolTree.begin(), boolTree.end(), true));
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

void HuffmanPathTree::inflateFromCompressedTree() {
    decodeTable_.clear();
    rootIndex = 0;
    if (boolTree.empty() || boolTree.front()) return;
    std::vector<std::size_t> open{0};
    std::size_t handedOut = 0;
    while (!open.empty()) {
        const std::size_t top = open.back();
        if (boolTree[at(nodes[top].index)]) {
            open.pop_back();
            continue;
        }
        if (++handedOut >= nodes.size()) return;  // more folders than nodes
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

void HuffmanPathTree::inflate() {
    inflateFromBoolTree();
    inflateFromCompressedTree();
}

void HuffmanPathTree::inflateHuffman(const std::u16string& newTreeString) {
    requireNoCode();
    const auto leaves = static_cast<std::size_t>(
        std::count(boolTree.begin(), boolTree.end(), true));
    if (newTreeString.size() != leaves) throw DamagedFormException();
    buildCode([&] {
        setTreeString(newTreeString);
        inflate();
    });
}

}  // namespace tessel
