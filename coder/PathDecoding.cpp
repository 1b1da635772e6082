// Paths out of the coder: texts of components, iteration, lookup by number.

#include <algorithm>
#include <array>
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

// Reads the bits of a component up to 64 at a time.
class BitReader {
public:
    explicit BitReader(ComponentView component) noexcept : bytes_(component) {
        if (bytes_.size() < sizeof whole_) whole_ = shortComponent();
    }

    // The bits from position `bit` on, least significant first, of which at
    // least sureBits are given as far as the component has them.
    static constexpr unsigned sureBits = 57;
    std::uint64_t from(std::size_t bit) const noexcept {
        if (bytes_.size() < sizeof whole_) return whole_ >> bit;
        const std::size_t base =
            std::min(bit / bitsPerByte, bytes_.size() - sizeof whole_);
        return load<std::uint64_t>(base) >> (bit - base * bitsPerByte);
    }

private:
    template <class Integer>
    Integer load(std::size_t at) const noexcept {
        static_assert(std::endian::native == std::endian::little);
        Integer value = 0;
        std::memcpy(&value, bytes_.data() + at, sizeof value);
        return value;
    }

    // All bytes of a component of one to seven, from reads that overlap.
    std::uint64_t shortComponent() const noexcept {
        const std::size_t size = bytes_.size();
        const auto placed = [](std::uint64_t value, std::size_t at) {
            return value << (at * bitsPerByte);
        };
        if (size >= sizeof(std::uint32_t)) {
            const std::size_t rest = size - sizeof(std::uint32_t);
            return load<std::uint32_t>(0) |
                   placed(load<std::uint32_t>(rest), rest);
        }
        return bytes_[0] | placed(bytes_[size / 2], size / 2) |
               placed(bytes_[size - 1], size - 1);
    }

    ComponentView bytes_;
    std::uint64_t whole_ = 0;  // of a component shorter than this
};

// A path number as it stands among the numbers of a request. Infinity and
// whatever 64 bits cannot hold is above every number in use.
std::uint64_t pathNumberOf(double value) {
    if (std::isnan(value) || value <= -1)
        throw std::out_of_range("A path number is negative or not a number.");
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
            bit = stepThrough(bytes, bit, end, text);
            if (bit < end) bit = walkToLeaf(bytes, bit, end, text);
        }
    } catch (...) {
        text.resize(before);
        throw;
    }
}

// Decodes as far as the table leads, several characters a step. Returns
// where the table knows no further, or `end`.
std::size_t HuffmanPathTree::stepThrough(ComponentView bytes, std::size_t bit,
                                         std::size_t end,
                                         std::u16string& text) const {
    if (decodeTable_.empty()) return bit;
    constexpr unsigned stepsAWindow =
        BitReader::sureBits / DecodeTable::windowBits;
    constexpr std::size_t bitsAWindow =
        std::size_t{stepsAWindow} * DecodeTable::windowBits;
    // A character takes at least a bit, and a step is written whole.
    constexpr std::size_t mostAWindow =
        bitsAWindow + DecodeTable::Step::writtenCharacters;
    // Not cleared: it is written before it is read, and this is the hot path.
    // NOLINTNEXTLINE(cppcoreguidelines-pro-type-member-init)
    std::array<char16_t, 4 * mostAWindow> decoded;
    char16_t* const flushAt = decoded.data() + decoded.size() - mostAWindow;
    char16_t* out = decoded.data();
    const auto flush = [&] {
        text.append(decoded.data(),
                    static_cast<std::size_t>(out - decoded.data()));
        out = decoded.data();
    };
    const BitReader reader(bytes);
    DecodeTable::Step step;
    const auto take = [&](std::uint64_t& window) {
        step = decodeTable_[window];
        step.writeTo(out);
        out += step.count();
        bit += step.bits();
        window >>= step.bits();
    };
    // As long as all steps of a window lie before the end. A step that knows
    // nothing takes no bits, so all that follow it know nothing either.
    while (end - bit >= bitsAWindow) {
        std::uint64_t window = reader.from(bit);
        for (unsigned k = 0; k < stepsAWindow; ++k) take(window);
        if (step.count() == 0) {
            flush();
            return bit;
        }
        if (out >= flushAt) flush();
    }
    // One window holds the bits that are left. The last step may take more
    // than these: it is taken back and then as far as it fits.
    if (bit < end) {
        std::uint64_t window = reader.from(bit);
        do take(window);
        while (bit < end && step.count() > 0);
        if (bit > end) {
            bit -= step.bits();
            out -= step.count();
            const unsigned fitting = step.countWithin(end - bit);
            if (fitting > 0) bit += step.bitsOf(fitting);
            out += fitting;
        }
    }
    flush();
    return bit;
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
    const std::size_t foldersBefore = folderPaths.size();
    const std::size_t filesBefore = filePaths.size();
    try {
        getPathByNumber(folderPaths, filePaths, partitions);
    } catch (...) {
        folderPaths.resize(foldersBefore);
        filePaths.resize(filesBefore);
        throw;
    }
}

// Merges the numbers with the ends of the partitions, both ascending.
void HuffmanPathTree::getPathByNumber(
    std::vector<Components>& folderPaths, std::vector<Components>& filePaths,
    const std::vector<double>& partitions) const {
    std::vector<std::uint64_t> offsets;
    PathTrack track;
    std::size_t k = 0;
    for (std::size_t i = 0; i < partitions.size();) {
        std::uint64_t number = pathNumberOf(partitions[i]);
        k = partitionAtOrAfter(k, number);
        if (k == partitionEnds.size()) return;
        const std::uint64_t base = k > 0 ? partitionEnds[k - 1] : 0;
        offsets.clear();
        while (number <= partitionEnds[k]) {
            offsets.push_back(number - base);
            if (++i == partitions.size()) break;
            number = pathNumberOf(partitions[i]);
        }
        if (k >= partitionTracks.size())
            throw std::out_of_range("A partition has no track.");
        partitionTracks.get(k, track);
        Components folder;
        Components files;
        pathTree->getBatch(folder, files, track, offsets);
        folderPaths.push_back(std::move(folder));
        filePaths.push_back(std::move(files));
    }
}

// The first partition from k on whose end is not below the number; the
// number of partitions if there is none.
std::size_t HuffmanPathTree::partitionAtOrAfter(std::size_t k,
                                                std::uint64_t number) const {
    const auto begin = partitionEnds.begin();
    const auto at = [begin](std::size_t i) {
        return begin + static_cast<std::ptrdiff_t>(i);
    };
    const auto holds = [number](std::uint64_t end) { return end >= number; };
    if (!endsAscend_)
        return static_cast<std::size_t>(
            std::find_if(at(k), partitionEnds.end(), holds) - begin);
    // Strides that double, then a search within the last: a request for
    // neighbours stays near, one for a far number takes few steps.
    std::size_t stride = 1;
    while (stride < partitionEnds.size() - k && !holds(*at(k + stride - 1))) {
        k += stride;
        stride *= 2;
    }
    const std::size_t last = std::min(k + stride, partitionEnds.size());
    return static_cast<std::size_t>(std::lower_bound(at(k), at(last), number) -
                                    begin);
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
