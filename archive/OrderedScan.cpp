#include "archive/OrderedScan.hpp"

#include <algorithm>
#include <system_error>
#include <thread>
#include <utility>

#include "archive/ArchiveExceptions.hpp"

namespace tessel::archive {
namespace {

constexpr auto reportInterval = std::chrono::milliseconds(100);

// How far producers may run ahead of the consumer, in chunks per thread: far
// enough that one slow chunk does not stop the others, near enough that the
// results that wait stay few.
constexpr std::uint64_t slotsPerThread = 4;

unsigned threadsFor(std::uint64_t chunks, unsigned wanted) {
    if (wanted == 0) wanted = std::max(1U, std::thread::hardware_concurrency());
    return static_cast<unsigned>(std::clamp<std::uint64_t>(chunks, 1, wanted));
}

}  // namespace

OrderedScan::OrderedScan(std::uint64_t chunks, const ScanOptions& options)
    : options_(options),
      chunks_(chunks),
      threads_(threadsFor(chunks, options.threads)),
      lastReport_(std::chrono::steady_clock::now()),
      ready_(threads_ == 1 ? 1 : threads_ * slotsPerThread) {}

// ---- Producing ----

std::optional<std::uint64_t> OrderedScan::claim() {
    if (next_ == std::min(chunks_, consumed_ + slots())) return std::nullopt;
    return next_++;
}

void OrderedScan::finish(std::uint64_t chunk, std::exception_ptr failure) {
    const std::scoped_lock lock(mutex_);
    ready_[chunk % slots()] = {true, std::move(failure)};
    changed_.notify_all();
}

void OrderedScan::produceOne(std::uint64_t chunk, Produce produce) {
    std::exception_ptr failure;
    try {
        produce(chunk);
    } catch (...) {
        failure = std::current_exception();
    }
    finish(chunk, std::move(failure));
}

// One thread's life: produce until nothing is left or the scan is stopped.
void OrderedScan::work(Produce produce) {
    std::unique_lock lock(mutex_);
    while (!stopped_ && next_ < chunks_) {
        if (const auto chunk = claim()) {
            lock.unlock();
            produceOne(*chunk, produce);
            lock.lock();
        } else {
            changed_.wait(lock);
        }
    }
}

// ---- Consuming ----

// One step towards the wanted chunk: whether it is ready. Otherwise produces
// another chunk or, if there is none to claim, waits for a change.
bool OrderedScan::produceOrAwait(std::uint64_t wanted, Produce produce) {
    std::unique_lock lock(mutex_);
    Slot& slot = ready_[wanted % slots()];
    if (slot.done) {
        if (slot.failure) std::rethrow_exception(slot.failure);
        return true;
    }
    if (const auto chunk = claim()) {
        lock.unlock();
        produceOne(*chunk, produce);
    } else {
        changed_.wait(lock);
    }
    return false;
}

void OrderedScan::release(std::uint64_t chunk) {
    const std::scoped_lock lock(mutex_);
    ready_[chunk % slots()] = {};
    consumed_ = chunk + 1;
    changed_.notify_all();
}

void OrderedScan::stop() {
    const std::scoped_lock lock(mutex_);
    stopped_ = true;
    changed_.notify_all();
}

void OrderedScan::report(std::uint64_t done) {
    if (!options_.progress) return;
    const auto now = std::chrono::steady_clock::now();
    if (now - lastReport_ < reportInterval && done < chunks_) return;
    lastReport_ = now;
    options_.progress(done, chunks_);
}

void OrderedScan::consumeAll(Produce produce,
                             FunctionRef<bool(std::uint64_t)> consume) {
    for (std::uint64_t chunk = 0; chunk < chunks_; ++chunk) {
        do {
            if (options_.cancel.stop_requested()) throw CancelledException();
        } while (!produceOrAwait(chunk, produce));
        if (!consume(chunk)) return;
        release(chunk);
        report(chunk + 1);
    }
}

void OrderedScan::run(FunctionRef<void(std::uint64_t chunk)> produce,
                      FunctionRef<bool(std::uint64_t chunk)> consume) {
    // Destroyed in this order's reverse: first told to stop, then joined.
    std::vector<std::jthread> workers;
    struct Stopper {
        OrderedScan& scan;
        ~Stopper() { scan.stop(); }
    } const stopper{*this};

    workers.reserve(threads_ - 1);
    try {
        while (workers.size() + 1 < threads_)
            workers.emplace_back([this, produce] { work(produce); });
    } catch (const std::system_error&) {
        // Fewer threads do the same work.
    }
    consumeAll(produce, consume);
}

}  // namespace tessel::archive
