#include "hosts/python/View.hpp"

#include <algorithm>
#include <stdexcept>
#include <string>
#include <utility>

namespace tessel::python {

namespace {

// Unsigned, so that a wrapped product still ends where it should.
std::uint64_t mapped(const View::Slice& slice, std::uint64_t index) noexcept {
    return slice.first + index * static_cast<std::uint64_t>(slice.step);
}

std::uint64_t mapped(const KeyedPermutation& order,
                     std::uint64_t index) noexcept {
    return order[index];
}

std::uint64_t mapped(const View::Selection& selection,
                     std::uint64_t index) noexcept {
    return (*selection)[index];
}

std::uint64_t mappedBy(const View::Step& step, std::uint64_t index) {
    return std::visit([&](const auto& map) { return mapped(map, index); },
                      step.map);
}

using Numbers = std::vector<std::uint64_t>;

// ---- The other way ----

// The indices, ascending, that a step maps to one of the numbers; any numbers
// after a request to stop.

// Whether a slice has this number, and at which index.
std::optional<std::uint64_t> indexIn(const View::Slice& slice,
                                     std::uint64_t size,
                                     std::uint64_t number) noexcept {
    const bool descends = slice.step < 0;
    const std::uint64_t stride = descends
                                     ? -static_cast<std::uint64_t>(slice.step)
                                     : static_cast<std::uint64_t>(slice.step);
    if (descends ? number > slice.first : number < slice.first) return {};
    const std::uint64_t distance =
        descends ? slice.first - number : number - slice.first;
    if (distance % stride != 0 || distance / stride >= size) return {};
    return distance / stride;
}

Numbers unmapped(const View::Slice& slice, std::uint64_t size,
                 const Numbers& numbers, const std::stop_token&) {
    Numbers indices;
    for (const std::uint64_t number : numbers)
        if (const auto index = indexIn(slice, size, number))
            indices.push_back(*index);
    if (slice.step < 0) std::ranges::reverse(indices);
    return indices;
}

Numbers unmapped(const KeyedPermutation& order, std::uint64_t, Numbers numbers,
                 const std::stop_token& stop) {
    for (std::uint64_t& number : numbers) {
        if (stop.stop_requested()) return {};
        number = order.indexOf(number);
    }
    std::ranges::sort(numbers);
    return numbers;
}

Numbers unmapped(const View::Selection& selection, std::uint64_t,
                 const Numbers& numbers, const std::stop_token& stop) {
    Numbers indices;
    for (std::uint64_t i = 0; i < selection->size(); ++i) {
        if (stop.stop_requested()) return {};
        if (std::ranges::binary_search(numbers, (*selection)[i]))
            indices.push_back(i);
    }
    return indices;
}

}  // namespace

// ---- Steps ----

View View::with(Step step) const {
    View view = *this;
    view.size_ = step.size;
    view.steps_.push_back(std::move(step));
    return view;
}

View View::sliced(std::uint64_t first, std::int64_t step,
                  std::uint64_t count) const {
    if (count <= 1) step = 1;  // so that no product of steps overflows
    if (count == 0) first = 0;
    if (first == 0 && step == 1 && count == size_) return *this;
    const auto* before =
        steps_.empty() ? nullptr : std::get_if<Slice>(&steps_.back().map);
    if (before == nullptr) return with({Slice{first, step}, count});
    const Slice both{mapped(*before, first),
                     count <= 1 ? 1 : before->step * step};
    View view = *this;
    view.steps_.pop_back();
    return view.with({both, count});
}

View View::shuffled(std::uint64_t seed) const {
    return with({KeyedPermutation(size_, seed), size_});
}

View View::selected(Selection indices) const {
    for (std::size_t i = 0; i < indices->size(); ++i)
        if ((*indices)[i] >= size_)
            throw std::out_of_range("index " + std::to_string((*indices)[i]) +
                                    " at position " + std::to_string(i) +
                                    " is out of range for " +
                                    std::to_string(size_) + " paths");
    const std::uint64_t count = indices->size();
    return with({std::move(indices), count});
}

// ---- Mapping ----

std::uint64_t View::operator[](std::uint64_t index) const {
    for (auto step = steps_.rbegin(); step != steps_.rend(); ++step)
        index = mappedBy(*step, index);
    return index;
}

std::optional<std::uint64_t> View::start() const noexcept {
    if (steps_.empty()) return 0;
    const auto* slice = std::get_if<Slice>(&steps_.front().map);
    if (steps_.size() > 1 || slice == nullptr || slice->step != 1) return {};
    return slice->first;
}

void View::toNumbers(std::span<std::uint64_t> indices) const {
    for (std::uint64_t& index : indices) index = (*this)[index];
}

std::vector<std::uint64_t> View::indicesOf(Numbers numbers,
                                           const std::stop_token& stop) const {
    for (const Step& step : steps_)
        numbers = std::visit(
            [&](const auto& map) {
                return unmapped(map, step.size, numbers, stop);
            },
            step.map);
    return numbers;
}

std::size_t View::heapBytes() const noexcept {
    std::size_t bytes = steps_.capacity() * sizeof(Step);
    for (const Step& step : steps_)
        if (const auto* selection = std::get_if<Selection>(&step.map))
            bytes += (*selection)->capacity() * sizeof(std::uint64_t);
    return bytes;
}

}  // namespace tessel::python
