#include "tests/support/FewThreads.hpp"

#include <dlfcn.h>
#include <pthread.h>

#include <atomic>
#include <cerrno>

namespace {

constexpr int anyNumber = 1 << 30;

// Threads that may still be started.
std::atomic<int> threadsLeft{anyNumber};

using CreateThread = int (*)(pthread_t*, const pthread_attr_t*,
                             void* (*)(void*), void*);

}  // namespace

// Sanitizers bring their own, under this name.
extern "C" __attribute__((weak)) int __interceptor_pthread_create(
    pthread_t* thread, const pthread_attr_t* attributes, void* (*start)(void*),
    void* argument);

extern "C" int pthread_create(pthread_t* thread,
                              const pthread_attr_t* attributes,
                              void* (*start)(void*), void* argument) {
    if (threadsLeft.fetch_sub(1) <= 0) return EAGAIN;
    static const CreateThread real = __interceptor_pthread_create != nullptr
                                         ? &__interceptor_pthread_create
                                         : reinterpret_cast<CreateThread>(dlsym(
                                               RTLD_NEXT, "pthread_create"));
    return real(thread, attributes, start, argument);
}

namespace support {

FewThreads::FewThreads(int count) { threadsLeft = count; }
FewThreads::~FewThreads() { threadsLeft = anyNumber; }

}  // namespace support
