#pragma once

#include <cstddef>
#include <cstdint>

#include "pathtree/PackedComponent.hpp"

namespace tessel {

// A list of encoded components, one after the other in a buffer: a batch is
// handed to the path tree without an allocation per component or per folder.
//
// How each stands there is said in PackedComponent.hpp.
//
// Ownership: a view. The ComponentBuffers that its ComponentArena filled must
//   outlive it.
class ComponentList {
public:
    class Iterator {
    public:
        explicit Iterator(const std::uint8_t* position) noexcept
            : at_(position) {}
        ComponentView operator*() const noexcept {
            return packed::readComponent(at_);
        }
        // The component as it stands in the buffer.
        ComponentView packedBytes() const noexcept {
            return {at_, (**this).data() + (**this).size()};
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
        friend class ComponentList;

        const std::uint8_t* at_;
    };

    ComponentList() noexcept = default;

    std::size_t size() const noexcept { return count_; }
    bool empty() const noexcept { return count_ == 0; }
    Iterator begin() const noexcept { return Iterator(first_); }
    Iterator end() const noexcept { return Iterator(first_ + byteCount_); }

    // The first `count` components, which end at this position.
    ComponentList before(Iterator end, std::size_t count) const noexcept {
        return {first_, static_cast<std::size_t>(end.at_ - first_), count};
    }
    // All components but these, which before() gave.
    ComponentList after(const ComponentList& beginning) const noexcept {
        return {first_ + beginning.byteCount_,
                byteCount_ - beginning.byteCount_, count_ - beginning.count_};
    }

    // The whole list as it is in the buffer. Lists of equal components
    // have equal bytes, and no others have.
    ComponentView bytes() const noexcept { return {first_, byteCount_}; }

private:
    friend class ComponentArena;

    ComponentList(const std::uint8_t* start, std::size_t length,
                  std::size_t components) noexcept
        : first_(start), byteCount_(length), count_(components) {}

    const std::uint8_t* first_ = nullptr;
    std::size_t byteCount_ = 0;
    std::size_t count_ = 0;
};

}  // namespace tessel
