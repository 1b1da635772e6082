#pragma once

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <memory>
#include <ranges>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "packing/ByteCursor.hpp"
#include "packing/FunctionRef.hpp"

namespace tessel {

class HuffmanPathTree;

// A range whose elements can be read as std::string_view.
template <class Range>
concept PathRange = std::ranges::input_range<Range> &&
    std::convertible_to<std::ranges::range_reference_t<Range>,
                        std::string_view>;

// A saved store was written by a newer version of this library. what() names
// both versions.
class UnsupportedStoreVersionException : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// PathStore keeps a very large list of paths in two fifths to half of the
// memory that their text takes.
//
//     auto store = tessel::PathStore::from(lines);
//     std::string path = store[1'000'000];
//     for (std::string_view each : store) std::cout << each << '\n';
//     store.saveFile("paths.store");
//
// A path is any bytes but none: NUL, newline and bytes that are no text come
// back as they were added. Numbers count from 0 in the order of addition.
// Repeated paths keep a number each. Paths cannot be removed or changed.
//
// Invariants: paths read by number are those that were added, in that order,
//   whatever failed in between. A store that was moved from is empty and can
//   be used again.
// Ownership: owns all that it keeps; nothing that was passed in is referred
//   to afterwards.
// Threads: any number of threads may read one store at the same time.
//   forEachInTreeOrder, append and assignment need it for themselves.
// Cost: about 27 bytes per path of 72 bytes on real lists; bench/README.md
//   has the figures. Reading neighbours together is several times as fast as
//   reading one path after the other in random order.
class PathStore {
public:
    class Iterator;
    // Takes a path's number and its bytes, which live until it returns.
    using Visitor = FunctionRef<void(std::size_t, std::string_view)>;

    PathStore() noexcept;
    PathStore(PathStore&& other) noexcept;
    PathStore& operator=(PathStore&& other) noexcept;
    ~PathStore();

    // ---- Adding ----

    // A store of these paths. See append.
    template <PathRange Paths>
    static PathStore from(Paths&& paths);

    // Adds the paths of a range, in order. The range is read twice if it is a
    // forward range, otherwise once, and kept as text until it has been added.
    //
    // Throws std::invalid_argument, whose message names the position in the
    // range, if a path is empty; std::bad_alloc; and what the range throws.
    // Whatever is thrown, the store keeps the paths that it had.
    //
    // Cost: proportional to the paths added, on as many threads as the
    // hardware runs and can be started. If a path has a character that no path
    // before had, all paths are encoded anew, once per call, and for that time
    // the store takes twice its memory. So append many paths per call, not one
    // per call.
    template <PathRange Paths>
    void append(Paths&& paths);
    void append(std::string_view path);

    // ---- Reading ----

    std::size_t size() const noexcept { return size_; }
    bool empty() const noexcept { return size_ == 0; }

    // Path i. Throws std::out_of_range unless i is below size(). Here and
    // below, DamagedFormException is thrown if the store was loaded from bytes
    // that no store wrote, and path i cannot be told from them.
    std::string operator[](std::size_t i) const;

    // Replaces `text` by path i. Throws as operator[], with `text` unchanged.
    // Cost: allocates nothing if the capacity of `text` suffices.
    void read(std::size_t i, std::string& text) const;

    // Calls visit with the paths first to last - 1. Throws std::out_of_range,
    // before the first call, unless first <= last <= size().
    // Cost: each folder is decoded once per run of its files.
    void read(std::size_t first, std::size_t last, Visitor visit) const;

    // Calls visit with the paths of these numbers, in the order given. Throws
    // std::out_of_range, before the first call, if one is not below size().
    // Cost: least if the numbers ascend.
    void read(std::span<const std::size_t> numbers, Visitor visit) const;

    // All paths, in the order of addition. A view that an iterator gives lives
    // until that iterator is advanced or destroyed. Appending to the store
    // does not invalidate iterators, but assigning to it does.
    Iterator begin() const;
    std::default_sentinel_t end() const noexcept { return {}; }

    // Calls visit with every path, a folder's files together, wherever they
    // were added. The view lives until visit returns. Not for a call from
    // inside visit. Begins by giving back memory that appending left unused,
    // so no other thread may read the store meanwhile.
    // Cost: per path less than any other way, and independent of the order of
    // addition.
    void forEachInTreeOrder(FunctionRef<void(std::string_view)> visit) const;

    // ---- Saving ----

    // The store as bytes; docs/format.md describes them. Cost: mostly that of
    // zlib's level 9.
    std::vector<std::uint8_t> save() const;

    // The store that these bytes hold. They may come from anywhere: throws
    // DamagedFormException if they are not a whole saved store, and
    // UnsupportedStoreVersionException if a newer version wrote them. Memory
    // is bounded by what the bytes themselves account for, see docs/format.md.
    static PathStore load(std::span<const std::uint8_t> bytes);

    // The same with a file. A file of that name is replaced once the new one
    // is safely on disk, so that there is always a whole one; a pipe or a
    // device is written to. Throw std::system_error, whose message has the
    // file's name, besides what save and load throw.
    void saveFile(const std::string& file) const;
    static PathStore loadFile(const std::string& file);

    // ---- Inspection ----

    // Heap bytes by what they serve, the allocator's own included.
    struct MemoryUsage {
        std::size_t names = 0;     // encoded names of folders and files
        std::size_t tree = 0;      // what holds the names together
        std::size_t numbers = 0;   // where each number's path is
        std::size_t encoding = 0;  // the code and its tables
        std::size_t other = 0;

        std::size_t total() const noexcept {
            return names + tree + numbers + encoding + other;
        }
    };
    // Cost: a walk over all paths.
    MemoryUsage memoryUsage() const;

    // What keeps the paths, for programs that need more than this interface.
    // It holds a path's folders with the '/' after each, then its file's name;
    // its numbers count from 1. Valid until append or assignment.
    const HuffmanPathTree& coder() const;

private:
    class Contents;
    class Survey;
    using Sink = FunctionRef<void(std::string_view)>;
    // Gives the sink every path, in order. May be called twice.
    using Source = FunctionRef<void(Sink)>;

    void appendFrom(Source source);
    void appendOnce(Source source);
    void addInPlace(Source source);
    void recode(Survey& survey, Source source);
    void restoreSoundness() noexcept;
    void withSoundCoder(FunctionRef<void(HuffmanPathTree&)> use) const;

    std::unique_ptr<Contents> contents_;  // null: an empty store
    std::size_t size_ = 0;
};

// Reads a store from its first path to its last.
class PathStore::Iterator {
public:
    using iterator_concept = std::input_iterator_tag;
    using value_type = std::string_view;
    using difference_type = std::ptrdiff_t;

    explicit Iterator(const PathStore& store);
    Iterator(Iterator&& other) noexcept;
    Iterator& operator=(Iterator&& other) noexcept;
    ~Iterator();

    std::string_view operator*() const;
    Iterator& operator++();
    void operator++(int) { ++*this; }
    friend bool operator==(const Iterator& iterator,
                           std::default_sentinel_t) noexcept {
        return iterator.atEnd();
    }

private:
    class Window;
    bool atEnd() const noexcept;
    std::unique_ptr<Window> window_;
};

template <PathRange Paths>
void PathStore::append(Paths&& paths) {
    const auto source = [&](Sink sink) {
        for (auto&& path : paths) sink(std::string_view(path));
    };
    if constexpr (std::ranges::forward_range<Paths>)
        appendFrom(source);
    else
        appendOnce(source);
}

template <PathRange Paths>
PathStore PathStore::from(Paths&& paths) {
    PathStore store;
    store.append(std::forward<Paths>(paths));
    return store;
}

}  // namespace tessel
