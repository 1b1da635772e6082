#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <stop_token>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "hosts/python/StoredList.hpp"
#include "hosts/python/View.hpp"
#include "packing/FunctionRef.hpp"

namespace tessel::python {

// PathSequence is a list of paths by index: those of a stored archive that a
// view shows.
//
// Ownership: shares archive and selections with its copies.
// Threads: immutable; const members from any number of threads, with or
//   without the interpreter's lock.
// Errors: reading throws DamagedListException.
class PathSequence {
public:
    using Visitor = FunctionRef<void(std::string_view path)>;

    explicit PathSequence(const StoredList::Pointer& stored)
        : PathSequence(stored, View(stored->archive().size())) {}
    PathSequence(StoredList::Pointer stored, View view)
        : stored_(std::move(stored)), view_(std::move(view)) {}

    std::uint64_t size() const noexcept { return view_.size(); }
    const StoredList::Pointer& stored() const noexcept { return stored_; }
    const PathArchive& archive() const noexcept { return stored_->archive(); }
    const View& view() const noexcept { return view_; }

    // The path at an index below size().
    std::string operator[](std::uint64_t index) const;

    // Shows the paths at the indices from first up to, but without, last,
    // which must be at most size().
    void read(std::uint64_t first, std::uint64_t last, Visitor visitor) const;

    // Shows the paths at these indices, all below size(), in this order.
    void read(std::vector<std::uint64_t> indices, Visitor visitor) const;

    // All indices of a path, ascending. Searches its folder.
    std::vector<std::uint64_t> indicesOf(std::string_view path) const;

    // Whether the path is in the list.
    bool contains(std::string_view path) const;

    // Ends a call that read this many paths: after a large one, the pages of a
    // large file are taken out of this process's memory, so that worker
    // processes that wait take none for them.
    void endReading(std::uint64_t paths) const noexcept;

private:
    std::vector<std::uint64_t> numbersOf(std::string_view path) const;

    StoredList::Pointer stored_;
    View view_;
};

// Whether two lists have the same paths in the same order. Gives up soon after
// a request to stop; the answer then means nothing.
bool areEqual(const PathSequence& left, const PathSequence& right,
              const std::stop_token& stop);

}  // namespace tessel::python
