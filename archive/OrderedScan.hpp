#pragma once

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <exception>
#include <mutex>
#include <optional>
#include <vector>

#include "archive/ScanOptions.hpp"
#include "packing/FunctionRef.hpp"

namespace tessel::archive {

// OrderedScan divides work into chunks, produces them on several threads and
// consumes them on the calling thread in ascending order, so that the outcome
// does not depend on the number of threads.
//
// Chunk c belongs to slot c mod slots(): the caller keeps one result per slot.
// A slot is written by produce, then read by consume, and never by both at a
// time.
//
// Threads: run() is called once, by the thread that made the object. It
//   returns or throws only after all its threads have ended.
// Cost: one lock per chunk and side; make a chunk worth 100 microseconds.
class OrderedScan {
public:
    OrderedScan(std::uint64_t chunks, const ScanOptions& options);

    std::uint64_t slots() const noexcept { return ready_.size(); }

    // Calls produce(chunk) once per chunk, on any thread, and consume(chunk)
    // on this one until it returns false. What produce throws for a chunk is
    // thrown here when it is that chunk's turn. Throws CancelledException.
    // If no further thread can be started, those that run do all the work.
    void run(FunctionRef<void(std::uint64_t chunk)> produce,
             FunctionRef<bool(std::uint64_t chunk)> consume);

private:
    using Produce = FunctionRef<void(std::uint64_t)>;

    struct Slot {
        bool done = false;
        std::exception_ptr failure;
    };

    std::optional<std::uint64_t> claim();  // the lock must be held
    void finish(std::uint64_t chunk, std::exception_ptr failure);
    void produceOne(std::uint64_t chunk, Produce produce);
    void work(Produce produce);
    bool produceOrAwait(std::uint64_t wanted, Produce produce);
    void release(std::uint64_t chunk);
    void stop();
    void consumeAll(Produce produce, FunctionRef<bool(std::uint64_t)> consume);
    void report(std::uint64_t done);

    const ScanOptions& options_;
    const std::uint64_t chunks_;
    const unsigned threads_;
    std::chrono::steady_clock::time_point lastReport_;

    std::mutex mutex_;
    std::condition_variable changed_;
    std::vector<Slot> ready_;     // guarded by mutex_, but not its size
    std::uint64_t next_ = 0;      // guarded by mutex_: first chunk unclaimed
    std::uint64_t consumed_ = 0;  // guarded by mutex_: chunks consumed
    bool stopped_ = false;        // guarded by mutex_
};

}  // namespace tessel::archive
