#pragma once

#include <atomic>
#include <cstdint>

namespace tessel {

// The largest of the values that raise() has been given.
//
// Threads: raise from any number of them at once.
class AtomicMaximum {
public:
    AtomicMaximum() noexcept = default;
    AtomicMaximum(const AtomicMaximum& other) noexcept : value_(other) {}
    AtomicMaximum& operator=(const AtomicMaximum& other) noexcept {
        return *this = std::uint64_t{other};
    }
    AtomicMaximum& operator=(std::uint64_t value) noexcept {
        value_.store(value, std::memory_order_relaxed);
        return *this;
    }
    ~AtomicMaximum() = default;

    // Implicit, because it reads as the number that it is.
    // NOLINTNEXTLINE(google-explicit-constructor)
    operator std::uint64_t() const noexcept {
        return value_.load(std::memory_order_relaxed);
    }

    // Relaxed: the value says nothing about any other memory, and whoever
    // wants the final one has joined the threads that raise it.
    void raise(std::uint64_t value) noexcept {
        std::uint64_t known = *this;
        while (value > known && !value_.compare_exchange_weak(
                                    known, value, std::memory_order_relaxed)) {
        }
    }

private:
    std::atomic<std::uint64_t> value_ = 0;
};

}  // namespace tessel
