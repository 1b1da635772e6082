#include "hosts/console/OrderedPaths.hpp"

#include <algorithm>
#include <numeric>
#include <span>
#include <utility>

namespace tessel::console {

namespace {

// Text per run. 4 to 64 MiB made no difference in time for seven million
// shuffled paths.
constexpr std::size_t runBytes = std::size_t{8} << 20;

// Paths that a run reads ahead: neighbours share a block of the archive.
constexpr std::size_t pathsAhead = 256;

// Text that a run reads ahead, so that long paths do not fill the memory. Of
// usual paths, pathsAhead have less.
constexpr std::size_t bytesAhead = std::size_t{64} << 10;

bool isInByteOrder(const PathArchive& archive, ProgressBar& bar) {
    std::string last;
    bool inOrder = true;
    archive.forEach([&](std::uint64_t number, std::string_view path) {
        if (number % 4096 == 0) bar.update(number);
        inOrder = last <= path;
        last.assign(path);
        return inOrder;
    });
    return inOrder;
}

}  // namespace

// ---- Run ----

std::string_view OrderedPaths::Run::path() const noexcept {
    const std::size_t begin = current_ == 1 ? 0 : ends_[current_ - 2];
    return std::string_view(text_).substr(begin, ends_[current_ - 1] - begin);
}

bool OrderedPaths::Run::advance(const PathArchive& archive,
                                const std::vector<std::uint64_t>& order) {
    if (current_ == ends_.size()) readAhead(archive, order);
    if (ends_.empty()) return false;
    ++current_;
    return true;
}

void OrderedPaths::Run::readAhead(const PathArchive& archive,
                                  const std::vector<std::uint64_t>& order) {
    text_.clear();
    ends_.clear();
    current_ = 0;
    const std::size_t count = std::min(pathsAhead, end_ - next_);
    archive.read(std::span(order).subspan(next_, count),
                 [&](std::uint64_t, std::string_view path) {
                     text_.append(path);
                     ends_.push_back(text_.size());
                     return text_.size() < bytesAhead;
                 });
    next_ += ends_.size();
}

// ---- OrderedPaths ----

OrderedPaths::OrderedPaths(PathArchive archive, ProgressBar& bar)
    : archive_(std::move(archive)) {
    bar.begin("reading", ProgressUnit::Paths, archive_.size());
    if (isInByteOrder(archive_, bar)) {
        sorted_.emplace(archive_.begin());
    } else {
        sortRuns(bar);
        startMerge();
    }
}

std::optional<std::string_view> OrderedPaths::next() {
    if (!sorted_) return nextOfMerge();
    if (started_ && *sorted_ != archive_.end()) ++*sorted_;
    started_ = true;
    if (*sorted_ == archive_.end()) return std::nullopt;
    return **sorted_;
}

void OrderedPaths::sortRuns(ProgressBar& bar) {
    bar.begin("sorting", ProgressUnit::Paths, archive_.size());
    order_.resize(archive_.size());
    std::iota(order_.begin(), order_.end(), std::uint64_t{0});
    for (std::uint64_t first = 0; first < archive_.size();) {
        const std::uint64_t end = sortRun(first);
        runs_.emplace_back(first, end);
        first = end;
        bar.update(first);
    }
}

// Sorts the numbers from `first` up to the end of a run, which is returned.
std::uint64_t OrderedPaths::sortRun(std::uint64_t first) {
    std::string text;
    std::vector<std::size_t> begins = {0};
    archive_.forEach(first, archive_.size(),
                     [&](std::uint64_t, std::string_view path) {
                         text.append(path);
                         begins.push_back(text.size());
                         return text.size() < runBytes;
                     });
    const auto pathOf = [&](std::uint64_t number) {
        const std::size_t i = number - first;
        return std::string_view(text).substr(begins[i],
                                             begins[i + 1] - begins[i]);
    };
    const std::uint64_t end = first + begins.size() - 1;
    const auto at = [&](std::uint64_t i) {
        return order_.begin() + static_cast<std::ptrdiff_t>(i);
    };
    std::sort(at(first), at(end), [&](std::uint64_t a, std::uint64_t b) {
        return pathOf(a) < pathOf(b);
    });
    return end;
}

void OrderedPaths::startMerge() {
    for (std::size_t i = 0; i < runs_.size(); ++i)
        if (runs_[i].advance(archive_, order_)) heap_.push_back(i);
    std::make_heap(
        heap_.begin(), heap_.end(),
        [this](std::size_t a, std::size_t b) { return runIsAfter(a, b); });
}

bool OrderedPaths::runIsAfter(std::size_t run,
                              std::size_t other) const noexcept {
    return runs_[run].path() > runs_[other].path();
}

std::optional<std::string_view> OrderedPaths::nextOfMerge() {
    const auto isAfter = [this](std::size_t a, std::size_t b) {
        return runIsAfter(a, b);
    };
    if (started_) {
        // The path handed out last was at the top.
        std::pop_heap(heap_.begin(), heap_.end(), isAfter);
        if (runs_[heap_.back()].advance(archive_, order_))
            std::push_heap(heap_.begin(), heap_.end(), isAfter);
        else
            heap_.pop_back();
    }
    started_ = !heap_.empty();
    if (heap_.empty()) return std::nullopt;
    return runs_[heap_.front()].path();
}

}  // namespace tessel::console
