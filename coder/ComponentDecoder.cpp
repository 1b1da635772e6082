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
    // validBits of them are the component's, as far as it has so many.
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

// Decoded characters on their way to a text, which appending one by one
// would check for room each time.
class TextBuffer {
public:
    explicit TextBuffer(std::u16string& text) noexcept : text_(text) {}

    void put(DecodeTable::Entry entry) noexcept {
        entry.writeTo(next_);
        next_ += entry.count();
    }
    void takeBack(unsigned count) noexcept { next_ -= count; }

    void flush() {
        text_.append(units_.data(),
                     static_cast<std::size_t>(next_ - units_.data()));
        next_ = units_.data();
    }
    // Leaves room for a window.
    void flushIfFull() {
        if (next_ >= units_.data() + units_.size() - maxUnitsPerWindow) flush();
    }

private:
    // A character takes at least a bit, and an entry is written whole.
    static constexpr std::size_t maxUnitsPerWindow =
        bitsPerWindow + DecodeTable::Entry::writtenUnits;

    std::u16string& text_;
    // Not cleared: a unit is written before it is read.
    std::array<char16_t, 4 * maxUnitsPerWindow> units_;
    char16_t* next_ = units_.data();
};

// Decodes from position `bit` as far as the table leads.
class TableDecoder {
public:
    TableDecoder(const DecodeTable& table, ComponentView bytes, std::size_t bit,
                 TextBuffer& text) noexcept
        : table_(table), reader_(bytes), bit_(bit), text_(text) {}

    std::size_t bit() const noexcept { return bit_; }

    // As long as all entries of a window lie before the end. Returns false
    // at bits that the table does not know. An unknown entry takes no bits,
    // so all that follow it in the window are unknown, too.
    bool decodeWindows(std::size_t end) {
        while (end - bit_ >= bitsPerWindow) {
            std::uint64_t window = reader_.from(bit_);
            for (unsigned k = 0; k < entriesPerWindow; ++k) take(window);
            if (entry_.count() == 0) return false;
            text_.flushIfFull();
        }
        return true;
    }

    // The bits that are left, which one window holds. The last entry may
    // extend past the end: then only the characters that end in time stay.
    void decodeRest(std::size_t end) {
        if (bit_ >= end) return;
        std::uint64_t window = reader_.from(bit_);
        do take(window);
        while (bit_ < end && entry_.count() > 0);
        if (bit_ <= end) return;
        bit_ -= entry_.bitLength();
        const unsigned fitting = entry_.charactersWithin(end - bit_);
        if (fitting > 0) bit_ += entry_.bitLengthOf(fitting);
        text_.takeBack(entry_.count() - fitting);
    }

private:
    void take(std::uint64_t& window) noexcept {
        entry_ = table_[window];
        text_.put(entry_);
        bit_ += entry_.bitLength();
        window >>= entry_.bitLength();
    }

    const DecodeTable& table_;
    BitReader reader_;
    std::size_t bit_;
    TextBuffer& text_;
    DecodeTable::Entry entry_;  // the last one taken
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
    TextBuffer buffer(text);
    TableDecoder decoder(code_.decodeTable(), bytes, bit, buffer);
    if (decoder.decodeWindows(end)) decoder.decodeRest(end);
    buffer.flush();
    return decoder.bit();
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
