#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "archive/PathArchive.hpp"
#include "hosts/console/ProgressBar.hpp"

namespace tessel::console {

// OrderedPaths hands out an archive's paths in byte order, repeats included.
//
// A list that is in this order is iterated. Any other is cut into runs of some
// megabytes of text; the numbers of each run are sorted by their paths, and
// the runs are merged, so that each path is read twice and memory stays at one
// number per path and some megabytes.
//
// Ownership: keeps the archive; borrows the bar.
class OrderedPaths {
public:
    OrderedPaths(PathArchive archive, ProgressBar& bar);

    // The next path, or nothing at the end. The view is valid until the next
    // call.
    std::optional<std::string_view> next();

private:
    // Numbers that are sorted by their paths, some of which are read ahead.
    class Run {
    public:
        Run(std::size_t begin, std::size_t end) : next_(begin), end_(end) {}

        // The smallest path that is left; valid until advance.
        std::string_view path() const noexcept;
        // Goes on to the next path. Returns false at the end.
        bool advance(const PathArchive& archive,
                     const std::vector<std::uint64_t>& order);

    private:
        void readAhead(const PathArchive& archive,
                       const std::vector<std::uint64_t>& order);

        std::size_t next_;  // in the order, not yet read
        std::size_t end_;
        std::string text_;
        std::vector<std::size_t> ends_;  // of the paths in text_
        std::size_t current_ = 0;        // index in ends_, plus 1
    };

    void sortRuns(ProgressBar& bar);
    std::uint64_t sortRun(std::uint64_t first);
    void startMerge();
    bool runIsAfter(std::size_t run, std::size_t other) const noexcept;
    std::optional<std::string_view> nextOfMerge();

    PathArchive archive_;
    std::optional<PathArchive::Iterator> sorted_;
    bool started_ = false;
    std::vector<std::uint64_t> order_;
    std::vector<Run> runs_;
    std::vector<std::size_t> heap_;  // of runs; the smallest path is at the top
};

}  // namespace tessel::console
