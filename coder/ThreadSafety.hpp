#pragma once

#include <mutex>

// Marks that clang's thread-safety analysis (-Wthread-safety) checks; other
// compilers see nothing. A member marked QZTESSEL_GUARDED_BY(lock) may only
// be touched by a thread that holds the lock, a function marked
// QZTESSEL_REQUIRES(lock) only be called by one.
#if defined(__clang__)
#define QZTESSEL_THREAD_SAFETY(mark) __attribute__((mark))
#else
#define QZTESSEL_THREAD_SAFETY(mark)
#endif
#define QZTESSEL_GUARDED_BY(lock) QZTESSEL_THREAD_SAFETY(guarded_by(lock))
#define QZTESSEL_REQUIRES(lock) \
    QZTESSEL_THREAD_SAFETY(requires_capability(lock))
#define QZTESSEL_NO_THREAD_SAFETY \
    QZTESSEL_THREAD_SAFETY(no_thread_safety_analysis)

namespace tessel {

// A standard mutex that the analysis knows.
class QZTESSEL_THREAD_SAFETY(capability("mutex")) Mutex : public std::mutex {
public:
    void lock() QZTESSEL_THREAD_SAFETY(acquire_capability()) {
        std::mutex::lock();
    }
    bool try_lock() QZTESSEL_THREAD_SAFETY(try_acquire_capability(true)) {
        return std::mutex::try_lock();
    }
    void unlock() QZTESSEL_THREAD_SAFETY(release_capability()) {
        std::mutex::unlock();
    }
};

// Holds a Mutex for its own lifetime.
class QZTESSEL_THREAD_SAFETY(scoped_lockable) MutexLock {
public:
    explicit MutexLock(Mutex& mutex)
        QZTESSEL_THREAD_SAFETY(acquire_capability(mutex))
        : mutex_(mutex) {
        mutex_.lock();
    }
    ~MutexLock() QZTESSEL_THREAD_SAFETY(release_capability()) {
        mutex_.unlock();
    }
    MutexLock(const MutexLock&) = delete;
    MutexLock& operator=(const MutexLock&) = delete;

private:
    Mutex& mutex_;
};

}  // namespace tessel
