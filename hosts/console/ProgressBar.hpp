#pragma once

#include <chrono>
#include <cstdint>
#include <string>
#include <string_view>

namespace tessel::console {

// What a progress bar counts.
enum class ProgressUnit { Bytes, Paths, Steps };

// What the bar says at a moment.
struct ProgressState {
    std::string_view label;
    ProgressUnit unit = ProgressUnit::Paths;
    std::uint64_t done = 0;
    std::uint64_t total = 0;  // 0 if it is not known
    double seconds = 0;       // since the start
};

// One line of at most `columns` columns: label, bar and share (if the total is
// known), rate (except for steps) and time left.
std::string progressLine(const ProgressState& state, std::size_t columns);

// ProgressBar shows on standard error how far work is, and removes itself at
// the end. It appears only on a terminal, and only after half a second, so
// that short work does not flicker.
//
// Threads: one at a time, except wipe.
// Cost: one look at the clock per update; the line is drawn ten times per
//   second at most.
class ProgressBar {
public:
    enum class Visibility { Shown, Hidden };

    // Hidden in any case if standard error is no terminal.
    explicit ProgressBar(Visibility visibility);
    ProgressBar(const ProgressBar&) = delete;
    ProgressBar& operator=(const ProgressBar&) = delete;
    ~ProgressBar() { finish(); }

    // Starts to count anew. Time until the first drawing runs on.
    void begin(std::string label, ProgressUnit unit, std::uint64_t total);
    void update(std::uint64_t done);

    // The same, where the total becomes known only now.
    void update(std::uint64_t done, std::uint64_t total) {
        total_ = total;
        update(done);
    }

    // Removes the line.
    void finish() const noexcept;

    // Removes the line of whatever bar is shown, from any thread.
    static void wipe() noexcept;

private:
    using Clock = std::chrono::steady_clock;

    bool visible_;
    std::string label_;
    ProgressUnit unit_ = ProgressUnit::Paths;
    std::uint64_t total_ = 0;
    Clock::time_point start_;
    Clock::time_point nextDrawing_;
};

}  // namespace tessel::console
