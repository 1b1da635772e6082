#pragma once

#include <array>
#include <cstddef>
#include <vector>

namespace tessel::embedded {

// SmallArray is a fixed number of value-initialized elements, in the object
// itself for as many as most calls have, otherwise on the heap.
//
// Ownership: owns its elements; does not move.
template <class Element, std::size_t inlineCount>
class SmallArray {
public:
    explicit SmallArray(std::size_t count) : count_(count) {
        if (count > inlineCount) many_.resize(count);
    }
    SmallArray(const SmallArray&) = delete;
    SmallArray& operator=(const SmallArray&) = delete;
    ~SmallArray() = default;

    std::size_t size() const noexcept { return count_; }
    Element* data() noexcept {
        return count_ > inlineCount ? many_.data() : few_.data();
    }
    const Element* data() const noexcept {
        return count_ > inlineCount ? many_.data() : few_.data();
    }
    Element& operator[](std::size_t i) noexcept { return data()[i]; }
    const Element& operator[](std::size_t i) const noexcept {
        return data()[i];
    }

private:
    std::size_t count_;
    std::array<Element, inlineCount> few_{};
    std::vector<Element> many_;
};

}  // namespace tessel::embedded
