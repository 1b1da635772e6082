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
            : at_(position) {}
        ComponentView operator*() const noexcept {
            if (*at_ != longMark) return {at_ + 1, *at_};
            std::uint64_t length = 0;
            std::memcpy(&length, at_ + 1, sizeof length);
            return {at_ + 1 + sizeof length, static_cast<std::size_t>(length)};
        }
        Iterator& operator++() noexcept {
            const ComponentView here = **this;
            at_ = here.data() + here.size();
            return *this;
        }
        friend bool operator==(Iterator a, Iterator b) noexcept {
            return a.at_ == b.at_;
        }

    private:
        const std::uint8_t* at_;
    };

    PackedComponents() noexcept = default;

    std::size_t size() const noexcept { return count_; }
    bool empty() const noexcept { return count_ == 0; }
    Iterator begin() const noexcept { return Iterator(first_); }
    Iterator end() const noexcept { return Iterator(first_ + byteCount_); }

    // The whole list as it stands in the buffer. Lists of equal components
    // have equal bytes, and no others have.
    ComponentView bytes() const noexcept { return {first_, byteCount_}; }

private:
    friend class ComponentPacker;

    static constexpr std::uint8_t longMark = 0xFF;

    PackedComponents(const std::uint8_t* start, std::size_t length,
                     std::size_t components) noexcept
        : first_(start), byteCount_(length), count_(components) {}

    const std::uint8_t* first_ = nullptr;
    std::size_t byteCount_ = 0;
    std::size_t count_ = 0;
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
        if (mark + length + slack > capacity_ - used_)
            moveOn(mark + length + slack);
        std::uint8_t* at = buffers_.back().get() + used_;
        *at = isLong ? PackedComponents::longMark
                     : static_cast<std::uint8_t>(length);
        if (isLong) {
            const std::uint64_t stored = length;
            std::memcpy(at + 1, &stored, sizeof stored);
        }
        used_ += mark + length;
        ++count_;
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
        if (count_ > 0)
            list = {buffers_.back().get() + start_, used_ - start_, count_};
        start_ = used_;
        count_ = 0;
        return list;
    }

    // Hands over all buffers; the lists stay valid. The packer is then as
    // new.
    ComponentBuffers takeBuffers() noexcept {
        capacity_ = start_ = used_ = count_ = 0;
        return std::exchange(buffers_, {});
    }

private:
    static constexpr std::size_t firstBuffer = std::size_t{1} << 10;
    static constexpr std::size_t usualBuffer = std::size_t{64} << 10;

    // Takes a new buffer with room for the list at hand and `more` bytes.
    void moveOn(std::size_t more) {
        const std::size_t begun = used_ - start_;
        const std::size_t usual =
            std::clamp(2 * capacity_, firstBuffer, usualBuffer);
        const std::size_t size = std::max(usual, begun + begun / 2 + more);
        auto next = std::make_unique_for_overwrite<std::uint8_t[]>(size);
        if (begun > 0)
            std::memcpy(next.get(), buffers_.back().get() + start_, begun);
        if (begun > 0 && start_ == 0)  // nothing else stands in the old one
            buffers_.back() = std::move(next);
        else
            buffers_.push_back(std::move(next));
        capacity_ = size;
        start_ = 0;
        used_ = begun;
    }

    ComponentBuffers buffers_;
    std::size_t capacity_ = 0;  // of the last buffer
    std::size_t start_ = 0;     // of the list at hand
    std::size_t used_ = 0;
    std::size_t count_ = 0;  // components of the list at hand
};

}  // namespace tessel
