#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <stop_token>
#include <variant>
#include <vector>

#include "hosts/python/KeyedPermutation.hpp"

namespace tessel::python {

// View says which of an archive's paths a list has, and in which order: it
// maps the list's indices to the archive's numbers. It starts as all of them
// and is narrowed or reordered step by step; a step maps indices to those of
// the step before.
//
// Invariants: every index below size() has a number below domain(). Slices
//   that follow each other are one step.
// Ownership: copies share selections.
// Threads: immutable.
// Cost: a mapping takes a few nanoseconds per step, see KeyedPermutation.
class View {
public:
    // Indices i of the step before: first + i * step.
    struct Slice {
        std::uint64_t first = 0;
        std::int64_t step = 1;
    };
    using Selection = std::shared_ptr<const std::vector<std::uint64_t>>;

    struct Step {
        std::variant<Slice, KeyedPermutation, Selection> map;
        std::uint64_t size = 0;  // indices that it maps
    };

    // All numbers below `domain`.
    explicit View(std::uint64_t domain) : domain_(domain), size_(domain) {}

    // `count` indices from `first` on; all of them must be below size().
    View sliced(std::uint64_t first, std::int64_t step,
                std::uint64_t count) const;
    View shuffled(std::uint64_t seed) const;
    // These indices, in this order. Throws std::out_of_range.
    View selected(Selection indices) const;

    std::uint64_t size() const noexcept { return size_; }
    std::uint64_t domain() const noexcept { return domain_; }
    bool isWhole() const noexcept { return steps_.empty(); }
    const std::vector<Step>& steps() const noexcept { return steps_; }

    // The number at an index below size().
    std::uint64_t operator[](std::uint64_t index) const;

    // The number of index 0, if each further index has the next number.
    std::optional<std::uint64_t> start() const noexcept;

    // Replaces indices, all below size(), by their numbers.
    void toNumbers(std::span<std::uint64_t> indices) const;

    // The indices, ascending, that have one of these numbers.
    //
    // numbers  ascending, none twice
    // stop     a request ends the call soon; its answer then means nothing
    std::vector<std::uint64_t> indicesOf(
        std::vector<std::uint64_t> numbers,
        const std::stop_token& stop = {}) const;

    // Bytes on the heap, shared selections included.
    std::size_t heapBytes() const noexcept;

private:
    View with(Step step) const;

    std::uint64_t domain_;
    std::uint64_t size_;
    std::vector<Step> steps_;
};

}  // namespace tessel::python
