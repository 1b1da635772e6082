#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <iterator>
#include <vector>

#include "pathtree/BNode.hpp"

namespace tessel {

// A list of encoded components in one buffer, for handing a batch to the
// path tree without an allocation for each component.
//
//   | length, 1 byte, or 0xFF and 8 bytes | the component's bytes | ...
//
// Cost: one to nine bytes a component beside its own.
class PackedComponents {
public:
    // Walks the list front to back; what it yields is valid until the list
    // changes.
    class Iterator {
    public:
        using iterator_category = std::input_iterator_tag;
        using value_type = ComponentView;
        using difference_type = std::ptrdiff_t;
        using pointer = void;
        using reference = ComponentView;

        explicit Iterator(const std::uint8_t* position) noexcept
            : at(position) {}
        ComponentView operator*() const noexcept {
            if (*at != longMark) return {at + 1, *at};
            return {at + 1 + sizeof(std::uint64_t), longLength()};
        }
        Iterator& operator++() noexcept {
            const ComponentView here = **this;
            at = here.data() + here.size();
            return *this;
        }
        friend bool operator==(Iterator a, Iterator b) noexcept {
            return a.at == b.at;
        }

    private:
        std::size_t longLength() const noexcept {
            std::uint64_t length = 0;
            std::memcpy(&length, at + 1, sizeof length);
            return static_cast<std::size_t>(length);
        }

        const std::uint8_t* at;
    };

    std::size_t size() const noexcept { return count; }
    bool empty() const noexcept { return count == 0; }
    Iterator begin() const noexcept { return Iterator(bytes.data()); }
    Iterator end() const noexcept {
        return Iterator(bytes.data() + bytes.size());
    }

    // Appends a component of `length` bytes, which the caller must write at
    // the address returned before it touches the list again. It may write up
    // to `slack` bytes more there, which do not become part of the list.
    std::uint8_t* extend(std::size_t length) {
        const bool isLong = length >= longMark;
        const std::size_t start = bytes.size();
        const std::size_t data =
            start + 1 + (isLong ? sizeof(std::uint64_t) : 0);
        bytes.reserve(grown(data + length + slack));
        bytes.resize(data + length);
        bytes[start] = isLong ? longMark : static_cast<std::uint8_t>(length);
        if (isLong) {
            const std::uint64_t stored = length;
            std::memcpy(&bytes[start + 1], &stored, sizeof stored);
        }
        ++count;
        return bytes.data() + data;
    }
    static constexpr std::size_t slack = 8;

    // Appends a copy of the component.
    void append(ComponentView component) {
        std::uint8_t* to = extend(component.size());
        if (!component.empty())
            std::memcpy(to, component.data(), component.size());
    }

    // Empties the list and keeps its memory.
    void clear() noexcept {
        bytes.clear();
        count = 0;
    }

private:
    static constexpr std::uint8_t longMark = 0xFF;

    // The capacity to ask for: doubled when `needed` does not fit.
    std::size_t grown(std::size_t needed) const noexcept {
        return needed <= bytes.capacity()
                   ? needed
                   : std::max(needed, 2 * bytes.capacity());
    }

    std::vector<std::uint8_t> bytes;
    std::size_t count = 0;
};

}  // namespace tessel
