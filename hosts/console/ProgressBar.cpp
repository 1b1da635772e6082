#include "hosts/console/ProgressBar.hpp"

#include <fmt/format.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <utility>

#include "hosts/console/Quantities.hpp"
#include "hosts/console/Terminal.hpp"

namespace tessel::console {

namespace {

using namespace std::chrono_literals;

constexpr auto quietTime = 500ms;
constexpr auto drawingInterval = 100ms;
constexpr std::size_t maxBarWidth = 40;

// Whether a line is on the terminal. Relaxed suffices: whoever wipes a line
// too much or too few does no harm.
// NOLINTNEXTLINE(cppcoreguidelines-avoid-non-const-global-variables)
std::atomic<bool> lineIsShown = false;

void writeToTerminal(std::string_view text) noexcept {
    // What cannot be shown is not missed.
    static_cast<void>(::write(STDERR_FILENO, text.data(), text.size()) < 0);
}

std::string rateText(const ProgressState& state) {
    const double rate =
        static_cast<double>(state.done) / std::max(state.seconds, 1e-3);
    switch (state.unit) {
        case ProgressUnit::Bytes:
            return fmt::format("  {}/s", bytesText(rate));
        case ProgressUnit::Paths:
            return fmt::format("  {} paths/s", countText(rate));
        default:
            return {};
    }
}

std::string timeLeftText(const ProgressState& state) {
    if (state.done == 0) return {};
    const double share =
        static_cast<double>(state.done) / static_cast<double>(state.total);
    return fmt::format("  {} left",
                       durationText(state.seconds * (1 - share) / share));
}

std::string bar(double share, std::size_t width) {
    const auto filled =
        static_cast<std::size_t>(share * static_cast<double>(width));
    std::string text(filled, '=');
    if (filled < width) text.push_back('>');
    text.resize(width, ' ');
    return "[" + text + "]";
}

std::string knownTotalLine(const ProgressState& state, std::size_t columns) {
    const double share = std::min(1.0, static_cast<double>(state.done) /
                                           static_cast<double>(state.total));
    const std::string tail =
        fmt::format(" {:3.0f} %{}{}", share * 100, rateText(state),
                    share < 1 ? timeLeftText(state) : "");
    const std::size_t fixed = state.label.size() + tail.size() + 3;
    if (columns < fixed + 5)
        return fmt::format("{}{}", state.label, tail).substr(0, columns);
    return fmt::format("{} {}{}", state.label,
                       bar(share, std::min(columns - fixed, maxBarWidth)),
                       tail);
}

}  // namespace

std::string progressLine(const ProgressState& state, std::size_t columns) {
    if (state.total > 0) return knownTotalLine(state, columns);
    const auto done = static_cast<double>(state.done);
    return fmt::format("{}  {}{}", state.label,
                       state.unit == ProgressUnit::Bytes ? bytesText(done)
                                                         : countText(done),
                       rateText(state))
        .substr(0, columns);
}

ProgressBar::ProgressBar(Visibility visibility)
    : visible_(visibility == Visibility::Shown && isTerminal(STDERR_FILENO)),
      start_(Clock::now()),
      nextDrawing_(start_ + quietTime) {}

void ProgressBar::begin(std::string label, ProgressUnit unit,
                        std::uint64_t total) {
    label_ = std::move(label);
    unit_ = unit;
    total_ = total;
    start_ = Clock::now();
}

void ProgressBar::update(std::uint64_t done) {
    if (!visible_) return;
    const auto now = Clock::now();
    if (now < nextDrawing_) return;
    nextDrawing_ = now + drawingInterval;
    const std::chrono::duration<double> seconds = now - start_;
    // The last column stays free: some terminals wrap when it is written.
    const std::string line =
        progressLine({label_, unit_, done, total_, seconds.count()},
                     columnsOf(STDERR_FILENO) - 1);
    lineIsShown.store(true, std::memory_order_relaxed);
    writeToTerminal("\r" + line + "\x1b[K");
}

void ProgressBar::finish() const noexcept {
    if (visible_) wipe();
}

void ProgressBar::wipe() noexcept {
    if (lineIsShown.exchange(false, std::memory_order_relaxed))
        writeToTerminal("\r\x1b[K");
}

}  // namespace tessel::console
