// The mutex that clang's analysis knows.

#include <gtest/gtest.h>

#include <thread>

#include "coder/ThreadSafety.hpp"

namespace {

// Whether another thread could lock it.
bool isFree(std::mutex& mutex) {
    bool locked = false;
    std::thread([&] {
        locked = mutex.try_lock();
        if (locked) mutex.unlock();
    }).join();
    return locked;
}

TEST(ThreadSafety, ALockHoldsTheMutexForItsLifetime) {
    tessel::Mutex mutex;
    EXPECT_TRUE(isFree(mutex));
    {
        const tessel::MutexLock lock(mutex);
        EXPECT_FALSE(isFree(mutex));
    }
    EXPECT_TRUE(isFree(mutex));
}

}  // namespace
