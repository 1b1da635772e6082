#pragma once

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <new>
#include <span>
#include <utility>
#include <vector>

#include "binding/HostInterface.hpp"
#include "hosts/embedded/BlockPool.hpp"

namespace tessel::embedded {

// The classes of values. An object's exact class is its instances' business.
enum class ValueClass : std::uint8_t {
    Double,
    Char,
    Uint8,
    Logical,
    Cell,
    Struct,
    Object
};

using Dimensions = std::vector<std::size_t>;

// The product of the dimensions, 1 without any. Throws std::length_error if it
// does not fit.
std::size_t elementCount(const Dimensions& dimensions);

// Shape holds an array's dimensions: two of them inside itself, any other
// number in a list on the heap.
class Shape {
public:
    Shape(std::size_t rows, std::size_t columns)
        : count_(product(rows, columns)), rows_(rows), columns_(columns) {}
    // Both throw std::length_error if the number of elements does not fit.
    explicit Shape(const Dimensions& dimensions);
    Shape(const Shape& other);
    Shape(Shape&&) noexcept = default;
    Shape& operator=(const Shape&) = delete;
    Shape& operator=(Shape&&) noexcept = default;
    ~Shape() = default;

    std::size_t count() const noexcept { return count_; }
    Dimensions dimensions() const;

    friend bool operator==(const Shape& a, const Shape& b) noexcept;

private:
    static std::size_t product(std::size_t a, std::size_t b) {
        std::size_t result = 0;
        if (__builtin_mul_overflow(a, b, &result)) refuse();
        return result;
    }
    [[noreturn]] static void refuse();
    friend std::size_t elementCount(const Dimensions& dimensions);

    std::size_t count_;
    std::size_t rows_;
    std::size_t columns_;
    std::unique_ptr<const Dimensions> others_;  // null for two dimensions
};

// Array is one array on the heap, as a plug-in sees it and as values share it:
// a header with the number of references, followed by the elements (see
// InlineArray) or by a container of them (see ContainerArray).
//
// Ownership: who makes an array has its first reference; each holder gives its
//   reference back with drop(), and the last one deletes the array. No
//   operation recurses, so that depth costs no stack.
// Invariants: an array with more than one reference is not changed. Arrays of
//   the classes Cell and Struct are those that Value makes.
// Threads: references may be counted on several threads at once; everything
//   else as a standard container. A plug-in's array has one reference, so a
//   usual array is made and deleted without an atomic read-modify-write.
class Array : public HostArray {
public:
    Array(const Array&) = delete;
    Array& operator=(const Array&) = delete;
    // For drop() alone.
    virtual ~Array() = default;

    ValueClass valueClass() const noexcept { return valueClass_; }
    const Shape& shape() const noexcept { return shape_; }
    std::size_t numel() const noexcept { return shape_.count(); }

    // Another array of equal content with one reference. Elements that are
    // arrays themselves are shared.
    virtual Array* clone() const = 0;
    // Whether elements are equal; both must have one class and shape.
    virtual bool hasElementsOf(const Array& other) const = 0;

    // Relaxed: a new reference is made from one that the caller holds, so the
    // array cannot go meanwhile, and nothing is read through the count.
    void addReference() const noexcept {
        references_.fetch_add(1, std::memory_order_relaxed);
    }

    // Acquire: what other holders did before they dropped their references
    // comes before what the last holder does with the array.
    bool isUnique() const noexcept {
        return references_.load(std::memory_order_acquire) == 1;
    }

    // Gives one reference back. Acquire-release: every holder's last use comes
    // before the deletion by the last of them.
    void drop() const noexcept {
        if (losesReference()) bury();
    }

protected:
    Array(ValueClass valueClass, Shape shape) noexcept
        : valueClass_(valueClass), shape_(std::move(shape)) {}

private:
    // Gives one reference back. True if it was the last one.
    bool losesReference() const noexcept {
        return isUnique() ||
               references_.fetch_sub(1, std::memory_order_acq_rel) == 1;
    }

    // Destroys an array without references, and what it alone refers to.
    // Cells and structs may be nested as deep as there is memory: they are
    // taken apart first, level by level (Value.cpp).
    void bury() const noexcept {
        if (valueClass_ == ValueClass::Cell ||
            valueClass_ == ValueClass::Struct)
            buryNested();
        else
            destroy();
    }
    void buryNested() const noexcept;
    void bury(Array*& waiting) noexcept;

    // Destroys the array and releases its block.
    virtual void destroy() const noexcept = 0;

    mutable std::atomic<std::uint32_t> references_ = 1;
    ValueClass valueClass_;
    Shape shape_;
};

// InlineArray keeps its elements in the same block, after its header: one heap
// block per array. Its class of values is one whose elements are never complex.
template <class Element>
class InlineArray final : public Array {
public:
    // Copies of these elements, or as many value-initialized ones as the shape
    // asks for. Throws std::bad_alloc, also for more than can be addressed.
    static InlineArray* make(ValueClass valueClass, Shape shape,
                             std::span<const Element> elements) {
        void* const block = allocate(elements.size());
        return new (block) InlineArray(valueClass, std::move(shape), elements);
    }
    static InlineArray* make(ValueClass valueClass, Shape shape) {
        void* const block = allocate(shape.count());
        return new (block) InlineArray(valueClass, std::move(shape));
    }

    InlineArray(const InlineArray&) = delete;
    InlineArray& operator=(const InlineArray&) = delete;
    ~InlineArray() override { std::destroy_n(data(), numel()); }

    std::span<const Element> elements() const noexcept {
        return {data(), numel()};
    }
    std::span<Element> elements() noexcept { return {data(), numel()}; }

    Array* clone() const override {
        return make(valueClass(), shape(), elements());
    }
    bool hasElementsOf(const Array& other) const override {
        return std::ranges::equal(
            elements(), static_cast<const InlineArray&>(other).elements());
    }

private:
    static_assert(alignof(Element) <= alignof(Array));

    InlineArray(ValueClass valueClass, Shape shape,
                std::span<const Element> elements) noexcept
        : Array(valueClass, std::move(shape)) {
        std::uninitialized_copy(elements.begin(), elements.end(), data());
    }
    InlineArray(ValueClass valueClass, Shape shape) noexcept
        : Array(valueClass, std::move(shape)) {
        std::uninitialized_value_construct_n(data(), numel());
    }
    void destroy() const noexcept override {
        auto* const block = const_cast<InlineArray*>(this);
        const std::size_t size = sizeFor(numel());
        block->~InlineArray();
        BlockPool::release(block, size);
    }

    static std::size_t sizeFor(std::size_t count) noexcept {
        return sizeof(InlineArray) + count * sizeof(Element);
    }

    // A process addresses at most 2^47 bytes.
    static void* allocate(std::size_t count) {
        constexpr std::size_t maxBytes = std::size_t{1} << 47U;
        if (count > (maxBytes - sizeof(InlineArray)) / sizeof(Element))
            throw std::bad_array_new_length();
        return BlockPool::allocate(sizeFor(count));
    }

    Element* data() noexcept { return reinterpret_cast<Element*>(this + 1); }
    const Element* data() const noexcept {
        return reinterpret_cast<const Element*>(this + 1);
    }
};

// ContainerArray keeps its elements in a container: numbers, fields, instances.
template <class Content>
class ContainerArray final : public Array {
public:
    ContainerArray(ValueClass valueClass, Shape shape, Content elements)
        : Array(valueClass, std::move(shape)), content(std::move(elements)) {}

    Array* clone() const override {
        return new ContainerArray(valueClass(), shape(), content);
    }
    bool hasElementsOf(const Array& other) const override {
        return content == static_cast<const ContainerArray&>(other).content;
    }

    Content content;

private:
    void destroy() const noexcept override { delete this; }
};

}  // namespace tessel::embedded
