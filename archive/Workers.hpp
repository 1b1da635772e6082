#pragma once

#include <atomic>
#include <condition_variable>
#include <cstddef>
#include <exception>
#include <functional>
#include <mutex>
#include <stop_token>
#include <thread>
#include <vector>

#include "archive/ArchiveExceptions.hpp"

namespace tessel::archive {

// A few threads that share out the steps of one loop at a time.
//
// Invariants: the calling thread is worker 0 and does its share, so one
//   worker means no thread at all. If there is no system resource or memory for
//   a thread, the others do its work.
// Threads: `run` is called from one thread at a time. The destructor waits for
//   the threads, which are idle between loops.
// Cost: waking the others takes some 20 microseconds per loop.
class Workers {
public:
    using Step = std::function<void(std::size_t index, unsigned worker)>;

    // 0 threads: as many as the machine has cores.
    Workers(unsigned threads, std::stop_token cancel);
    ~Workers();
    Workers(const Workers&) = delete;
    Workers& operator=(const Workers&) = delete;

    // Workers that may call a step; `worker` is below this.
    unsigned count() const noexcept {
        return static_cast<unsigned>(threads_.size()) + 1;
    }

    // Calls step(index, worker) once for each index below `steps`, in any
    // order and on any worker, and returns when all are done. The steps'
    // effects are visible to the caller afterwards.
    // Throws what a step threw (further steps are left out then), and
    // CancelledException if the stop token says so between two steps.
    void run(std::size_t steps, const Step& step);

    // Throws CancelledException if the stop token says so.
    void throwIfCancelled() const;

private:
    void serve(unsigned worker);
    void doSteps(unsigned worker) noexcept;

    std::stop_token cancel_;
    std::mutex mutex_;
    std::condition_variable wake_;
    std::condition_variable idle_;
    const Step* step_ = nullptr;        // guarded by mutex_ while it changes
    std::size_t steps_ = 0;             // the same
    std::size_t loop_ = 0;              // guarded by mutex_
    std::size_t busy_ = 0;              // guarded by mutex_
    bool ending_ = false;               // guarded by mutex_
    std::exception_ptr failure_;        // guarded by mutex_
    std::atomic<std::size_t> next_{0};  // relaxed: only hands out numbers
    std::vector<std::thread> threads_;
};

}  // namespace tessel::archive
