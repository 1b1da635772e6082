#pragma once

#include <cstddef>
#include <utility>
#include <vector>

// The library's behaviour written a second time, plainly, for the tests to
// compare with. Nothing in this namespace calls the library.
namespace model {

// A binary heap with every step written out: which of two equal elements
// comes out first is decided here and nowhere else. The smallest frequency is
// on top. Item needs a member `frequency`.
template <class Item>
class ReferenceHeap {
public:
    std::size_t size() const { return items_.size(); }
    const Item& top() const { return items_.front(); }

    void push(const Item& item) {
        items_.push_back(item);
        raise(items_.size() - 1, item);
    }

    // Removes the top: the hole that it leaves sinks to the bottom, preferring
    // the right child, and takes in the last element, which rises from there.
    void pop() {
        const std::size_t length = items_.size() - 1;
        if (length > 0) {
            const Item last = items_.back();
            raise(sinkHole(length), last);
        }
        items_.pop_back();
    }

private:
    static bool above(const Item& a, const Item& b) {
        return a.frequency > b.frequency;
    }

    // Puts the item in the hole, or higher up. An equal parent stays above.
    void raise(std::size_t hole, const Item& item) {
        while (hole > 0) {
            const std::size_t parent = (hole - 1) / 2;
            if (!above(items_[parent], item)) break;
            items_[hole] = items_[parent];
            hole = parent;
        }
        items_[hole] = item;
    }

    // Sinks a hole from position 0 among the first `length` elements and
    // returns where it ends.
    std::size_t sinkHole(std::size_t length) {
        std::size_t hole = 0;
        std::size_t child = 0;
        while (child < (length - 1) / 2) {
            child = 2 * (child + 1);
            if (above(items_[child], items_[child - 1])) --child;
            items_[hole] = items_[child];
            hole = child;
        }
        if (length % 2 == 0 && child == (length - 2) / 2) {
            child = 2 * child + 1;
            items_[hole] = items_[child];
            hole = child;
        }
        return hole;
    }

    std::vector<Item> items_;
};

}  // namespace model
