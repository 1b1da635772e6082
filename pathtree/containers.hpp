#pragma once

#include <cstddef>
#include <vector>

namespace tessel {

// Makes room for `more` elements, growing by an eighth instead of doubling,
// so that a long-lived list leaves little unused.
template <class T>
void reserveGently(std::vector<T>& list, std::size_t more) {
    const std::size_t needed = list.size() + more;
    if (needed > list.capacity()) list.reserve(needed + needed / 8);
}

// Empties a container and gives back its memory, which clear() and the
// assignment of {} would keep.
template <class Container>
void releaseContents(Container& container) noexcept {
    Container().swap(container);
}

}  // namespace tessel
