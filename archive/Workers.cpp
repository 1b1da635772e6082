#include "archive/Workers.hpp"

#include <algorithm>
#include <new>
#include <system_error>
#include <utility>

namespace tessel::archive {

Workers::Workers(unsigned threads, std::stop_token cancel)
    : cancel_(std::move(cancel)) {
    if (threads == 0)
        threads = std::max(1U, std::thread::hardware_concurrency());
    // A thread that cannot be started, for want of memory too, is done
    // without: those that did start do its work.
    try {
        threads_.reserve(threads - 1);
        for (unsigned worker = 1; worker < threads; ++worker)
            threads_.emplace_back([this, worker] { serve(worker); });
    } catch (const std::system_error&) {
    } catch (const std::bad_alloc&) {
    }
}

Workers::~Workers() {
    {
        const std::lock_guard lock(mutex_);
        ending_ = true;
    }
    wake_.notify_all();
    for (std::thread& thread : threads_) thread.join();
}

void Workers::run(std::size_t steps, const Step& step) {
    {
        const std::lock_guard lock(mutex_);
        step_ = &step;
        steps_ = steps;
        failure_ = nullptr;
        next_.store(0, std::memory_order_relaxed);
        busy_ = threads_.size();
        ++loop_;
    }
    wake_.notify_all();
    doSteps(0);
    std::unique_lock lock(mutex_);
    idle_.wait(lock, [this] { return busy_ == 0; });
    if (failure_) std::rethrow_exception(std::exchange(failure_, nullptr));
    throwIfCancelled();
}

void Workers::throwIfCancelled() const {
    if (cancel_.stop_requested()) throw CancelledException();
}

void Workers::serve(unsigned worker) {
    std::size_t done = 0;
    std::unique_lock lock(mutex_);
    while (true) {
        wake_.wait(lock, [&] { return ending_ || loop_ != done; });
        if (ending_) return;
        done = loop_;
        lock.unlock();
        doSteps(worker);
        lock.lock();
        if (--busy_ == 0) idle_.notify_one();
    }
}

// What the loop's steps read was published by the mutex; so is what they
// wrote, when the worker reports itself idle.
void Workers::doSteps(unsigned worker) noexcept {
    while (!cancel_.stop_requested()) {
        const std::size_t index = next_.fetch_add(1, std::memory_order_relaxed);
        if (index >= steps_) return;
        try {
            (*step_)(index, worker);
        } catch (...) {
            const std::lock_guard lock(mutex_);
            if (!failure_) failure_ = std::current_exception();
            next_.store(steps_, std::memory_order_relaxed);
        }
    }
}

}  // namespace tessel::archive
