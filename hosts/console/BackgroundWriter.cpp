#include "hosts/console/BackgroundWriter.hpp"

#include <utility>

namespace tessel::console {

BackgroundWriter::BackgroundWriter(Write write)
    : write_(std::move(write)), thread_([this] { run(); }) {}

BackgroundWriter::~BackgroundWriter() {
    {
        const std::lock_guard lock(mutex_);
        ends_ = true;
    }
    changed_.notify_all();
    thread_.join();
}

void BackgroundWriter::write(std::string& buffer) {
    wait();
    {
        const std::lock_guard lock(mutex_);
        pending_.clear();
        pending_.swap(buffer);
        busy_ = true;
    }
    changed_.notify_all();
}

void BackgroundWriter::wait() {
    std::unique_lock lock(mutex_);
    changed_.wait(lock, [this] { return !busy_; });
    if (failure_) std::rethrow_exception(failure_);
}

void BackgroundWriter::run() noexcept {
    std::unique_lock lock(mutex_);
    for (;;) {
        changed_.wait(lock, [this] { return busy_ || ends_; });
        if (!busy_) return;
        lock.unlock();
        writePending();
        lock.lock();
        busy_ = false;
        changed_.notify_all();
    }
}

// The caller reads failure_ only after busy_ has become false under the lock.
void BackgroundWriter::writePending() noexcept {
    try {
        write_(pending_);
    } catch (...) {
        failure_ = std::current_exception();
    }
}

}  // namespace tessel::console
