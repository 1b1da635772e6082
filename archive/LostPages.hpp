#pragma once

#include <atomic>
#include <cstddef>
#include <memory>

namespace tessel::archive {

// LostPages keeps a process alive when it touches mapped pages that its file no
// longer has: somebody cut the file, or the disk failed. The system raises
// SIGBUS then. Here the lost page becomes a page of zeros, and the object of
// its range remembers that.
//
// The first object sets a handler of SIGBUS for the whole process. Everything
// that does not concern a range of an object goes on to the handler that was
// set before, or ends the process as if there were none. A handler that the
// program sets later comes first; this one works if that one passes on.
//
// Ownership: does not own the pages. Destroy it before they are unmapped.
//   Movable; a moved-from object has no range.
// Threads: any() from any number of threads.
// Cost: reading costs nothing; each lost page costs a signal and a mapping,
//   some microseconds.
class LostPages {
public:
    LostPages() noexcept = default;
    // Watches a range that is mapped for reading. `start` is the start of a
    // page. Throws std::bad_alloc.
    LostPages(const void* start, std::size_t bytes);

    // Whether a page of the range was lost since construction. Once it was,
    // the answer stays.
    bool any() const noexcept {
        // The mark is set before the page of zeros appears, by a system call
        // that all processors see; so it needs no order of its own.
        return range_ != nullptr && isMarked(*range_);
    }

    struct Range;

private:
    struct Release {
        void operator()(Range* range) const noexcept;
    };

    static bool isMarked(const Range& range) noexcept;

    std::unique_ptr<Range, Release> range_;
};

// A watched range. It is kept for reuse and never freed, since the handler may
// look at it at any time.
struct LostPages::Range {
    std::atomic<unsigned> changes = 0;  // odd while start and bytes change
    std::atomic<std::size_t> start = 0;
    std::atomic<std::size_t> bytes = 0;  // 0: free for the next object
    std::atomic<bool> lost = false;
    Range* next = nullptr;
};

inline bool LostPages::isMarked(const Range& range) noexcept {
    return range.lost.load(std::memory_order_relaxed);
}

}  // namespace tessel::archive
