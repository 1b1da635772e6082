// Lets a program's requests for memory fail: loaded before the C library
// (LD_PRELOAD), this counts what the program asks for from the start of main
// on, on all threads.
//
//   FAIL_MEMORY=7      the seventh request fails, and all after it
//   FAIL_MEMORY=7-7    the seventh request alone
//   FAIL_MARK=/file    is made when one did
//
// From glibc, which offers its own allocator under second names.

#include <dlfcn.h>
#include <fcntl.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <climits>
#include <cstddef>
#include <cstdlib>

extern "C" {
void* __libc_malloc(std::size_t bytes);
void* __libc_calloc(std::size_t count, std::size_t bytes);
void* __libc_realloc(void* memory, std::size_t bytes);
void* __libc_memalign(std::size_t alignment, std::size_t bytes);
}

namespace {

std::atomic<long> requests{LONG_MIN};  // none counts yet
long firstFailing = LONG_MAX;
long lastFailing = LONG_MAX;

int (*realMain)(int, char**, char**) = nullptr;

bool isRefused() {
    const long number = ++requests;
    if (number < firstFailing || number > lastFailing) return false;
    if (number == firstFailing)
        ::syscall(SYS_close,
                  ::syscall(SYS_openat, AT_FDCWD, std::getenv("FAIL_MARK"),
                            O_CREAT | O_WRONLY, 0600));
    errno = ENOMEM;
    return true;
}

int countingMain(int wordCount, char** words, char** environment) {
    if (const char* const plan = std::getenv("FAIL_MEMORY")) {
        char* end = nullptr;
        firstFailing = std::strtol(plan, &end, 10);
        if (*end == '-') lastFailing = std::strtol(end + 1, nullptr, 10);
        requests = 0;
    }
    const int status = realMain(wordCount, words, environment);
    requests = LONG_MIN;
    return status;
}

}  // namespace

extern "C" {

int __libc_start_main(int (*main)(int, char**, char**), int wordCount,
                      char** words, void (*init)(), void (*fini)(),
                      void (*loaderFini)(), void* stackEnd) {
    using Start = int (*)(int (*)(int, char**, char**), int, char**, void (*)(),
                          void (*)(), void (*)(), void*);
    realMain = main;
    return reinterpret_cast<Start>(::dlsym(RTLD_NEXT, "__libc_start_main"))(
        &countingMain, wordCount, words, init, fini, loaderFini, stackEnd);
}

void* malloc(std::size_t bytes) noexcept {
    return isRefused() ? nullptr : __libc_malloc(bytes);
}

void* calloc(std::size_t count, std::size_t bytes) noexcept {
    return isRefused() ? nullptr : __libc_calloc(count, bytes);
}

void* realloc(void* memory, std::size_t bytes) noexcept {
    return isRefused() ? nullptr : __libc_realloc(memory, bytes);
}

void* memalign(std::size_t alignment, std::size_t bytes) noexcept {
    return isRefused() ? nullptr : __libc_memalign(alignment, bytes);
}

void* aligned_alloc(std::size_t alignment, std::size_t bytes) noexcept {
    return memalign(alignment, bytes);
}

int posix_memalign(void** memory, std::size_t alignment,
                   std::size_t bytes) noexcept {
    void* const made = memalign(alignment, bytes);
    if (made == nullptr) return ENOMEM;
    *memory = made;
    return 0;
}
}
