#pragma once

#include <cstddef>
#include <iterator>
#include <type_traits>
#include <utility>

namespace tessel::paths {

// IndexedRange is what a function returns for each index of [first, last), as
// a range that can be read again and again. (The library's own views do not
// compile with every compiler that this project supports.)
//
// Ownership: keeps the function. Its iterators refer to the range.
template <class Function>
class IndexedRange {
public:
    class Iterator {
    public:
        using iterator_concept = std::forward_iterator_tag;
        using iterator_category = std::input_iterator_tag;
        using value_type =
            std::remove_cvref_t<std::invoke_result_t<Function, std::size_t>>;
        using reference = std::invoke_result_t<Function, std::size_t>;
        using pointer = void;
        using difference_type = std::ptrdiff_t;

        Iterator() = default;
        Iterator(const Function& function, std::size_t index)
            : function_(&function), index_(index) {}

        reference operator*() const { return (*function_)(index_); }
        Iterator& operator++() {
            ++index_;
            return *this;
        }
        Iterator operator++(int) {
            Iterator before = *this;
            ++index_;
            return before;
        }
        friend bool operator==(const Iterator& a, const Iterator& b) {
            return a.index_ == b.index_;
        }
        friend std::ptrdiff_t operator-(const Iterator& a, const Iterator& b) {
            return static_cast<std::ptrdiff_t>(a.index_ - b.index_);
        }

    private:
        const Function* function_ = nullptr;
        std::size_t index_ = 0;
    };

    IndexedRange(std::size_t first, std::size_t last, Function function)
        : function_(std::move(function)), first_(first), last_(last) {}

    Iterator begin() const { return {function_, first_}; }
    Iterator end() const { return {function_, last_}; }

private:
    Function function_;
    std::size_t first_;
    std::size_t last_;
};

}  // namespace tessel::paths
