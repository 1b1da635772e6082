// Paths out of the coder: texts of components, iteration, lookup by number.

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstring>
#include <iterator>
#include <limits>
#include <stdexcept>

#include "coder/HuffmanPathTree.hpp"

namespace tessel {

namespace {

constexpr std::size_t bitsPerByte = 8;

// Bytes of a bit block that hold no data: the count of the last bits.
constexpr std::size_t trailerBytes = 1;

// Number of bits in an encoded component, which is checked.
std::size_t bitsIn(ComponentView bytes) {
    if (bytes.empty() || bytes.back() >= bitsPerByte)
        throw DamagedFormException();
    if (bytes.size() == trailerBytes) return 0;
    return bitsPerByte * (bytes.size() - trailerBytes - 1) + bytes.back();
}

bool bitAt(ComponentView bytes, std::size_t bit) {
    return ((bytes[bit / bitsPerByte] >> (bit % bitsPerByte)) & 1U) != 0;
}

// At least 25 bits from position `bit` on, least significant first; what
// lies behind the end reads as 0.
std::uint64_t windowAt(ComponentView bytes, std::size_t bit) {
    static_assert(std::endian::native == std::endian::little);
    std::uint32_t window = 0;
    const std::size_t first = bit / bitsPerByte;
    const std::size_t left = bytes.size() - first;
    if (left >= sizeof window)
        std::memcpy(&window, bytes.data() + first, sizeof window);
    else
        std::memcpy(&window, bytes.data() + first, left);
    return window >> (bit % bitsPerByte);
}

// A path number as it stands among the numbers of a request. Infinity and
// whatever 64 bits cannot hold is above every number in use.
std::uint64_t pathNumberOf(double value) {
    if (std::isnan(value) || value < 1)
        throw std::out_of_range("A path number is below 1 or not a number.");
    constexpr double beyondAll = 18446744073709551616.0;  // 2 to the 64th
    return value >= beyondAll ? std::numeric_limits<std::uint64_t>::max()
                              : static_cast<std::uint64_t>(value);
}

}  // namespace

// ---- Decoding ----

bool HuffmanPathTree::appendToPathIfLeaf(std::int32_t& position,
                                         std::u16string& text) const {
    if (position < 0 || static_cast<std::size_t>(position) >= nodes.size())
        throw DamagedFormException();
    const HNode& node = nodes[static_cast<std::size_t>(position)];
    if (!node.isLeaf()) return false;
    text.push_back(node.character);
    position = rootIndex;
    return true;
}

// The reference walk: decodes one character, one bit a step, from the bits
// `bit` to `end` - 1, of which there is at least one. Returns where the next
// character begins; `end`, with nothing appended, if no leaf is reached.
std::size_t HuffmanPathTree::walkToLeaf(ComponentView bytes, std::size_t bit,
                                        std::size_t end,
                                        std::u16string& text) const {
    std::int32_t position = rootIndex;
    // If the root is a leaf, a bit leads nowhere else: it is one character.
    if (appendToPathIfLeaf(position, text)) return bit + 1;
    while (bit < end) {
        const HNode& node = nodes[static_cast<std::size_t>(position)];
        position = bitAt(bytes, bit++) ? node.right : node.left;
        if (appendToPathIfLeaf(position, text)) break;
    }
    return bit;
}

void HuffmanPathTree::appendPathFrom(ComponentView bytes,
                                     std::u16string& text) const {
    const std::size_t end = bitsIn(bytes);
    const std::size_t before = text.size();
    try {
        for (std::size_t bit = 0; bit < end;) {
            if (!decodeTable.empty()) {
                const DecodeTable::Step& step =
                    decodeTable[windowAt(bytes, bit)];
                if (step.count > 0 && step.bits <= end - bit) {
                    text.append(step.characters.data(), step.count);
                    bit += step.bits;
                    continue;
                }
            }
            bit = walkToLeaf(bytes, bit, end, text);
        }
    } catch (...) {
        text.resize(before);
        throw;
    }
}

std::u16string HuffmanPathTree::generatePathFrom(const Component& bytes) const {
    std::u16string text;
    appendPathFrom(bytes, text);
    return text;
}

// ---- Iteration ----

bool HuffmanPathTree::hasNextPathFromBTree() const {
    return hasDuplicate(nextPathNumber + 1) || pathTree->hasNextPath();
}

void HuffmanPathTree::getNextPathFromBTree(Components& components) {
    ++nextPathNumber;
    const auto repeated = duplicates.find(nextPathNumber);
    if (repeated != duplicates.end())
        pathTree->traversePath(repeated->second, components);
    else
        pathTree->getNextPath(components);
}

void HuffmanPathTree::resetPathsToBTree() {
    pathTree->reset();
    nextPathNumber = 0;
    joinAllGenThreads();
    clearThreadResources();
}

// ---- Lookup by number ----

void HuffmanPathTree::getPath(std::vector<Components>& folderPaths,
                              std::vector<Components>& filePaths,
                              const std::vector<double>& partitions) const {
    if (partitionEnds.empty()) {
        getPathByTrack(folderPaths, partitions);
        return;
    }
    std::vector<std::uint64_t> selectedPartitions;
    std::vector<std::vector<std::uint64_t>> fileOffsets;
    std::size_t k = 0;
    for (std::size_t i = 0; i < partitions.size();) {
        std::uint64_t number = pathNumberOf(partitions[i]);
        k = partitionAtOrAfter(k, number);
        if (k == partitionEnds.size()) break;
        const std::uint64_t base = k > 0 ? partitionEnds[k - 1] : 0;
        std::vector<std::uint64_t>& offsets = fileOffsets.emplace_back();
        selectedPartitions.push_back(k);
        while (number <= partitionEnds[k]) {
            if (number <= base)
                throw std::out_of_range("A path number is out of order.");
            offsets.push_back(number - base);
            if (++i == partitions.size()) break;
            number = pathNumberOf(partitions[i]);
        }
    }
    pathTree->getPath(folderPaths, filePaths, selectedPartitions,
                      partitionTracks, fileOffsets);
}

// The first partition from k on whose end is not below the number; the
// number of partitions if there is none.
std::size_t HuffmanPathTree::partitionAtOrAfter(std::size_t k,
                                                std::uint64_t number) const {
    const auto from = partitionEnds.begin() + static_cast<std::ptrdiff_t>(k);
    const auto found =
        endsAscend ? std::lower_bound(from, partitionEnds.end(), number)
                   : std::find_if(from, partitionEnds.end(),
                                  [number](auto end) { return end >= number; });
    return static_cast<std::size_t>(found - partitionEnds.begin());
}

void HuffmanPathTree::getPathByTrack(
    std::vector<Components>& folderPaths,
    const std::vector<double>& partitions) const {
    if (partitionTracks.empty()) return;
    std::vector<Components> found;
    for (const double value : partitions) {
        const double position = value - 1;
        if (!(position > -1) ||
            position >= static_cast<double>(partitionTracks.size()))
            throw std::out_of_range("There is no partition of this number.");
        pathTree->traversePath(
            partitionTracks[static_cast<std::size_t>(position)],
            found.emplace_back());
    }
    folderPaths.reserve(folderPaths.size() + found.size());
    std::move(found.begin(), found.end(), std::back_inserter(folderPaths));
}

}  // namespace tessel
