#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <iterator>
#include <memory>
#include <utility>
#include <vector>

#include "pathtree/BNode.hpp"

namespace tessel {

// A list of encoded components, one behind the other in a buffer: a batch is
// handed to the path tree without an allocation for each component, nor for
// each folder.
//
//   | length, 1 byte, or 0xFF and 8 bytes | the component's bytes | ...
//
// Ownership: a view. The ComponentBuffers that its ComponentPacker filled
//   must outlive it.
class PackedComponents {
public:
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
            std::uint64_t length = 0;
            std::memcpy(&length, at + 1, sizeof length);
            return {at + 1 + sizeof length, static_cast<std::size_t>(length)};
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
        const std::uint8_t* at;
    };

    PackedComponents() noexcept = default;

    std::size_t size() const noexcept { return count; }
    bool empty() const noexcept { return count == 0; }
    Iterator begin() const noexcept { return Iterator(first); }
    Iterator end() const noexcept { return Iterator(first + byteCount); }

    // The whole list as it stands in the buffer. Lists of equal components
    // have equal bytes, and no others have.
    ComponentView bytes() const noexcept { return {first, byteCount}; }

private:
    friend class ComponentPacker;

    static constexpr std::uint8_t longMark = 0xFF;

    PackedComponents(const std::uint8_t* start, std::size_t length,
                     std::size_t components) noexcept
        : first(start), byteCount(length), count(components) {}

    const std::uint8_t* first = nullptr;
    std::size_t byteCount = 0;
    std::size_t count = 0;
};

// The memory that lists of components stand in.
using ComponentBuffers = std::vector<std::unique_ptr<std::uint8_t[]>>;

// Writes lists of components one after the other.
//
// Ownership: owns the buffers until takeBuffers hands them over.
// Threads: each thread has a packer of its own.
// Cost: one to nine bytes a component beside its own; an allocation for each
//   64 KiB, fewer bytes at first.
class ComponentPacker {
public:
    // Bytes that a caller of extend may write behind the component.
    static constexpr std::size_t slack = 8;

    // Appends a component of `length` bytes to the list at hand. The caller
    // must write it at the address returned before it uses the packer again,
    // and may write up to `slack` bytes more.
    std::uint8_t* extend(std::size_t length) {
        const bool isLong = length >= PackedComponents::longMark;
        const std::size_t mark = 1 + (isLong ? sizeof(std::uint64_t) : 0);
        if (mark + length + slack > capacity - used)
            moveOn(mark + length + slack);
        std::uint8_t* at = buffers.back().get() + used;
        *at = isLong ? PackedComponents::longMark
                     : static_cast<std::uint8_t>(length);
        if (isLong) {
            const std::uint64_t stored = length;
            std::memcpy(at + 1, &stored, sizeof stored);
        }
        used += mark + length;
        ++count;
        return at + mark;
    }

    // Appends a copy of the component to the list at hand.
    void append(ComponentView component) {
        std::uint8_t* to = extend(component.size());
        if (!component.empty())
            std::memcpy(to, component.data(), component.size());
    }

    // Ends the list at hand, returns it and begins another one.
    PackedComponents finish() noexcept {
        PackedComponents list;
        if (count > 0)
            list = {buffers.back().get() + start, used - start, count};
        start = used;
        count = 0;
        return list;
    }

    // Hands over all buffers; the lists stay valid. The packer is then as
    // new.
    ComponentBuffers takeBuffers() noexcept {
        capacity = start = used = count = 0;
        return std::exchange(buffers, {});
    }

private:
    static constexpr std::size_t firstBuffer = std::size_t{1} << 10;
    static constexpr std::size_t usualBuffer = std::size_t{64} << 10;

    // Takes a new buffer with room for the list at hand and `more` bytes.
    void moveOn(std::size_t more) {
        const std::size_t begun = used - start;
        const std::size_t usual =
            std::clamp(2 * capacity, firstBuffer, usualBuffer);
        const std::size_t size = std::max(usual, begun + begun / 2 + more);
        auto next = std::make_unique_for_overwrite<std::uint8_t[]>(size);
        if (begun > 0)
            std::memcpy(next.get(), buffers.back().get() + start, begun);
        if (begun > 0 && start == 0)  // nothing else stands in the old one
            buffers.back() = std::move(next);
        else
            buffers.push_back(std::move(next));
        capacity = size;
        start = 0;
        used = begun;
    }

    ComponentBuffers buffers;
    std::size_t capacity = 0;  // of the last buffer
    std::size_t start = 0;     // of the list at hand
    std::size_t used = 0;
    std::size_t count = 0;  // components of the list at hand
};

}  // namespace tessel
