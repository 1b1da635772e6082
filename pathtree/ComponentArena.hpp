#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <utility>
#include <vector>

#include "pathtree/ComponentList.hpp"

namespace tessel {

// The memory that lists of components are in.
using ComponentBuffers = std::vector<std::unique_ptr<std::uint8_t[]>>;

// Writes lists of components one after the other, each list whole in one
// buffer.
//
// Ownership: owns the buffers until takeBuffers hands them over.
// Threads: each thread has an arena of its own.
// Cost: one or nine bytes per component beside its own; one allocation per
//   64 KiB, for fewer bytes at first.
class ComponentArena {
public:
    // Bytes that a caller of extend may write after the component.
    static constexpr std::size_t slack = 8;

    // Appends a component of `length` bytes to the current list. The caller
    // must write it at the address returned before it uses the arena again,
    // and may write up to `slack` bytes more.
    std::uint8_t* extend(std::size_t length) {
        const std::size_t header = packed::headerBytes(length);
        if (header + length + slack > capacity_ - used_)
            moveOn(header + length + slack);
        std::uint8_t* at = buffers_.back().get() + used_;
        used_ += header + length;
        ++count_;
        return packed::writeHeader(at, length);
    }

    // Makes room for a component of up to `most` bytes and returns the place to
    // write it, with `slack` bytes more. It is appended when its length is
    // committed, before the arena is used otherwise; or it is dropped.
    std::uint8_t* reserve(std::size_t most) {
        const std::size_t room = packed::headerBytes(most) + most + slack;
        if (room > capacity_ - used_) moveOn(room);
        return buffers_.back().get() + used_ + packed::headerBytes(0);
    }

    void commit(std::size_t length) noexcept {
        std::uint8_t* const at = buffers_.back().get() + used_;
        const std::size_t header = packed::headerBytes(length);
        if (header != packed::headerBytes(0))
            std::memmove(at + header, at + packed::headerBytes(0), length);
        packed::writeHeader(at, length);
        used_ += header + length;
        ++count_;
    }

    // Appends a copy of the component to the current list.
    void append(ComponentView component) {
        std::uint8_t* to = extend(component.size());
        if (!component.empty())
            std::memcpy(to, component.data(), component.size());
    }

    // Ends the current list, returns it and begins another one.
    ComponentList finish() noexcept {
        ComponentList list;
        if (count_ > 0)
            list = {buffers_.back().get() + start_, used_ - start_, count_};
        start_ = used_;
        count_ = 0;
        return list;
    }

    // Hands over all buffers; the lists stay valid. The arena is then as
    // new.
    ComponentBuffers takeBuffers() noexcept {
        capacity_ = start_ = used_ = count_ = 0;
        return std::exchange(buffers_, {});
    }

private:
    static constexpr std::size_t firstBuffer = std::size_t{1} << 10;
    static constexpr std::size_t usualBuffer = std::size_t{64} << 10;

    // Takes a new buffer with room for the current list and `more` bytes.
    void moveOn(std::size_t more) {
        const std::size_t begun = used_ - start_;
        const std::size_t usual =
            std::clamp(2 * capacity_, firstBuffer, usualBuffer);
        const std::size_t size = std::max(usual, begun + begun / 2 + more);
        auto next = std::make_unique_for_overwrite<std::uint8_t[]>(size);
        if (begun > 0)
            std::memcpy(next.get(), buffers_.back().get() + start_, begun);
        if (begun > 0 && start_ == 0)  // nothing else is in the old one
            buffers_.back() = std::move(next);
        else
            buffers_.push_back(std::move(next));
        capacity_ = size;
        start_ = 0;
        used_ = begun;
    }

    ComponentBuffers buffers_;
    std::size_t capacity_ = 0;  // of the last buffer
    std::size_t start_ = 0;     // of the current list
    std::size_t used_ = 0;
    std::size_t count_ = 0;  // components of the current list
};

}  // namespace tessel
