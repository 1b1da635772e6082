#pragma once

#include <atomic>
#include <stop_token>
#include <thread>

namespace tessel::console {

// Interrupts turns SIGINT, SIGTERM and SIGHUP into an end of the command.
//
// A command that has nothing to tidy up is ended at once, with the status 128
// and the signal's number. One that writes a file asks for a stop request
// instead (tidyUpFirst): it is told through token() and, where it waits for
// input, through wakeDescriptor(); the second signal ends it at once, too.
//
// SIGPIPE is ignored, so that writing fails with an error instead.
// endByClosedPipe() then ends the process as SIGPIPE would have. A SIGHUP that
// was ignored before, as nohup does, stays so.
//
// Threads: construct it on the main thread before any other thread starts,
//   since the signals are blocked in all threads but its own.
// Cost: one thread that sleeps.
class Interrupts {
public:
    Interrupts();
    Interrupts(const Interrupts&) = delete;
    Interrupts& operator=(const Interrupts&) = delete;
    ~Interrupts();

    // From now on the first signal only requests a stop.
    void tidyUpFirst() noexcept { tidiesUp_ = true; }

    std::stop_token token() const noexcept { return stop_.get_token(); }

    // Becomes readable, and stays so, when a stop is requested.
    int wakeDescriptor() const noexcept { return wake_; }

    // Throws CancelledException if a stop is requested.
    void throwIfStopped() const;

    // The exit status after the signal that requested the stop.
    int status() const noexcept { return 128 + signal_.load(); }

    // Ends the process as a closed pipe usually does: by SIGPIPE, or with the
    // status 141 where that signal was ignored from the start.
    [[noreturn]] void endByClosedPipe() const noexcept;

private:
    void listen() noexcept;

    std::stop_source stop_;
    int wake_ = -1;
    bool ignoredPipe_ = false;
    std::atomic<bool> tidiesUp_ = false;
    std::atomic<bool> ends_ = false;
    std::atomic<int> signal_ = 0;
    std::thread listener_;
};

}  // namespace tessel::console
