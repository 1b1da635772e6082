#include "coder/ComponentDecoder.hpp"

#include <algorithm>
#include <array>
#include <bit>
#include <cstring>

#include "packing/ByteCursor.hpp"

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

    // The bits from position `bit` on, least significant first. At least
    // validBits of them are the component's, as far as it has that many.
    static constexpr unsigned validBits = 57;
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

constexpr unsigned entriesPerWindow =
    BitReader::validBits / DecodeTable::windowBits;
constexpr std::size_t bitsPerWindow =
    std::size_t{entriesPerWindow} * DecodeTable::windowBits;

// Holds decoded characters on their way to a text, which appending one by one
// would check for room each time.
class TextBuffer {
public:
    // The units are not cleared: each is written before it is read.
    // NOLINTNEXTLINE(cppcoreguidelines-pro-type-member-init)
    explicit TextBuffer(std::u16string& text) noexcept : text_(text) {}

    char16_t* begin() noexcept { return units_.data(); }

    // True when a whole window might not fit after `end` any more.
    bool isFull(const char16_t* end) const noexcept {
        return end >= units_.data() + units_.size() - maxUnitsPerWindow;
    }

    // Appends what is before `end` to the text.
    void flush(const char16_t* end) {
        text_.append(units_.data(),
                     static_cast<std::size_t>(end - units_.data()));
    }

private:
    // A character takes at least a bit, and an entry is written whole.
    static constexpr std::size_t maxUnitsPerWindow =
        bitsPerWindow + DecodeTable::Entry::writtenUnits;

    std::u16string& text_;
    std::array<char16_t, 4 * maxUnitsPerWindow> units_;
};

// Where decoding is. Kept in registers: an entry that is written may not be
// taken for a change of it, so it must not be a member of anything that the
// buffer can reach.
struct DecodePosition {
    std::size_t bit = 0;
    char16_t* out = nullptr;
    DecodeTable::Entry last;  // the last entry taken

    void take(const DecodeTable& table, std::uint64_t& window) noexcept {
        last = table[window];
        last.writeTo(out);
        out += last.count();
        bit += last.bitLength();
        window >>= last.bitLength();
    }

    // Keeps of the last entry, which extends past the end, the characters
    // that end in time.
    void fitLast(std::size_t end) noexcept {
        bit -= last.bitLength();
        out -= last.count();
        const unsigned fitting = last.charactersWithin(end - bit);
        if (fitting > 0) bit += last.bitLengthOf(fitting);
        out += fitting;
    }
};

}  // namespace

void ComponentDecoder::appendText(ComponentView bytes,
                                  std::u16string& text) const {
    const std::size_t end = bitsIn(bytes);
    const std::size_t before = text.size();
    try {
        for (std::size_t bit = 0; bit < end;) {
            bit = decodeByTable(bytes, bit, end, text);
            if (bit < end) bit = walkToLeaf(bytes, bit, end, text);
        }
    } catch (...) {
        text.resize(before);
        throw;
    }
}

// Returns where the table knows no further, or `end`.
std::size_t ComponentDecoder::decodeByTable(ComponentView bytes,
                                            std::size_t bit, std::size_t end,
                                            std::u16string& text) const {
    if (code_.decodeTable().empty()) return bit;
    const DecodeTable& table = code_.decodeTable();
    const BitReader reader(bytes);
    TextBuffer buffer(text);
    DecodePosition at{bit, buffer.begin(), {}};
    // As long as all entries of a window lie before the end. An entry that
    // knows nothing takes no bits, so those after it know nothing either.
    while (end - at.bit >= bitsPerWindow) {
        std::uint64_t window = reader.from(at.bit);
        for (unsigned k = 0; k < entriesPerWindow; ++k) at.take(table, window);
        if (at.last.count() == 0) {
            buffer.flush(at.out);
            return at.bit;
        }
        if (buffer.isFull(at.out)) {
            buffer.flush(at.out);
            at.out = buffer.begin();
        }
    }
    // One window holds the bits that are left.
    if (at.bit < end) {
        std::uint64_t window = reader.from(at.bit);
        do at.take(table, window);
        while (at.bit < end && at.last.count() > 0);
        if (at.bit > end) at.fitLast(end);
    }
    buffer.flush(at.out);
    return at.bit;
}

bool ComponentDecoder::appendIfLeaf(std::int32_t& position,
                                    std::u16string& text) const {
    const std::vector<HNode>& nodes = code_.nodes;
    if (position < 0 || static_cast<std::size_t>(position) >= nodes.size())
        throw DamagedFormException();
    const HNode& node = nodes[static_cast<std::size_t>(position)];
    if (!node.isLeaf()) return false;
    text.push_back(node.character);
    position = code_.rootIndex;
    return true;
}

// Decodes one character, one bit at a time, from the bits `bit` to `end` - 1,
// of which there is at least one. Returns where the next character begins;
// `end`, with nothing appended, if no leaf is reached.
std::size_t ComponentDecoder::walkToLeaf(ComponentView bytes, std::size_t bit,
                                         std::size_t end,
                                         std::u16string& text) const {
    std::int32_t position = code_.rootIndex;
    // If the root is a leaf, a bit leads nowhere else: it is one character.
    if (appendIfLeaf(position, text)) return bit + 1;
    while (bit < end) {
        const HNode& node = code_.nodes[static_cast<std::size_t>(position)];
        position = bitAt(bytes, bit++) ? node.right : node.left;
        if (appendIfLeaf(position, text)) break;
    }
    return bit;
}

}  // namespace tessel
