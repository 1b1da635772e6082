#include "tests/support/FailingCalls.hpp"

#include <dirent.h>
#include <dlfcn.h>
#include <fcntl.h>
#include <pthread.h>
#include <sys/file.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <atomic>
#include <cerrno>
#include <climits>
#include <cstdarg>
#include <cstdlib>
#include <sstream>
#include <string>
#include <string_view>

namespace {

struct Plan {
    std::string folder;
    std::string kind;
    long number = 0;
    int error = 0;
    std::string mark;
    std::atomic<long> calls = 0;

    Plan() {
        const char* const words = std::getenv("FAIL_CALL");
        if (words == nullptr) return;
        std::istringstream(words) >> kind >> number >> error;
        folder = std::getenv("FAIL_FOLDER");
        mark = std::getenv("FAIL_MARK");
    }
};

// Calls come before and after this file's own start and end, so it is made by
// the first and never ends.
Plan& plan() {
    static Plan* const instance = new Plan;
    return *instance;
}

// Whether this call is the one to fail. Sets errno then.
bool fails(std::string_view kind, std::string_view path) {
    Plan& now = plan();
    if (now.number == 0 || kind != now.kind || !path.starts_with(now.folder) ||
        ++now.calls != now.number)
        return false;
    if (!now.mark.empty())
        ::syscall(SYS_close, ::syscall(SYS_openat, AT_FDCWD, now.mark.c_str(),
                                       O_CREAT | O_WRONLY, 0600));
    errno = now.error;
    return true;
}

bool fails(std::string_view kind, int file) {
    if (plan().number == 0 || kind != plan().kind) return false;
    std::array<char, PATH_MAX> path{};
    const std::string link = "/proc/self/fd/" + std::to_string(file);
    const long length = ::syscall(SYS_readlinkat, AT_FDCWD, link.c_str(),
                                  path.data(), path.size());
    return length > 0 &&
           fails(kind, std::string_view(path.data(),
                                        static_cast<std::size_t>(length)));
}

template <class Function>
Function* real(const char* name) {
    return reinterpret_cast<Function*>(::dlsym(RTLD_NEXT, name));
}

bool isHalf() { return plan().error == 0; }

int openFile(const char* name, const char* path, int flags, mode_t mode) {
    if (fails("open", path)) return -1;
    return real<int(const char*, int, ...)>(name)(path, flags, mode);
}

mode_t modeOf(int flags, va_list rest) {
    return (flags & O_CREAT) != 0 ? va_arg(rest, mode_t) : 0;
}

}  // namespace

extern "C" {

void failCall(const char* folder, const char* kind, long number, int error) {
    Plan& now = plan();
    now.folder = folder;
    now.kind = kind;
    now.number = number;
    now.error = error;
    now.calls = 0;
}

int hasFailed() { return plan().number > 0 && plan().calls >= plan().number; }

int open(const char* path, int flags, ...) {
    va_list rest;
    va_start(rest, flags);
    const mode_t mode = modeOf(flags, rest);
    va_end(rest);
    return openFile("open", path, flags, mode);
}

int open64(const char* path, int flags, ...) {
    va_list rest;
    va_start(rest, flags);
    const mode_t mode = modeOf(flags, rest);
    va_end(rest);
    return openFile("open64", path, flags, mode);
}

int close(int file) {
    const bool isFailing = fails("close", file);
    const int error = errno;
    const int result = real<int(int)>("close")(file);
    if (!isFailing) return result;
    errno = error;
    return -1;
}

ssize_t read(int file, void* into, size_t bytes) {
    if (fails("read", file)) {
        if (!isHalf()) return -1;
        bytes = (bytes + 1) / 2;
    }
    return real<ssize_t(int, void*, size_t)>("read")(file, into, bytes);
}

ssize_t write(int file, const void* from, size_t bytes) {
    if (fails("write", file)) {
        if (!isHalf()) return -1;
        bytes = (bytes + 1) / 2;
    }
    return real<ssize_t(int, const void*, size_t)>("write")(file, from, bytes);
}

ssize_t pwrite(int file, const void* from, size_t bytes, off_t offset) {
    if (fails("pwrite", file)) {
        if (!isHalf()) return -1;
        bytes = (bytes + 1) / 2;
    }
    return real<ssize_t(int, const void*, size_t, off_t)>("pwrite")(
        file, from, bytes, offset);
}

int fsync(int file) {
    if (fails("fsync", file)) return -1;
    return real<int(int)>("fsync")(file);
}

int rename(const char* from, const char* to) noexcept {
    if (fails("rename", to)) return -1;
    return real<int(const char*, const char*)>("rename")(from, to);
}

void* mmap(void* at, size_t bytes, int protection, int flags, int file,
           off_t offset) noexcept {
    if (file >= 0 && fails("mmap", file)) return MAP_FAILED;
    return real<void*(void*, size_t, int, int, int, off_t)>("mmap")(
        at, bytes, protection, flags, file, offset);
}

int fstat(int file, struct stat* about) noexcept {
    if (fails("fstat", file)) return -1;
    return real<int(int, struct stat*)>("fstat")(file, about);
}

int stat(const char* path, struct stat* about) noexcept {
    if (fails("stat", path)) return -1;
    return real<int(const char*, struct stat*)>("stat")(path, about);
}

int lstat(const char* path, struct stat* about) noexcept {
    if (fails("lstat", path)) return -1;
    return real<int(const char*, struct stat*)>("lstat")(path, about);
}

int flock(int file, int operation) noexcept {
    if (fails("flock", file)) return -1;
    return real<int(int, int)>("flock")(file, operation);
}

int fchmod(int file, mode_t mode) noexcept {
    if (fails("fchmod", file)) return -1;
    return real<int(int, mode_t)>("fchmod")(file, mode);
}

int pthread_create(pthread_t* thread, const pthread_attr_t* attributes,
                   void* (*start)(void*), void* argument) noexcept {
    if (fails("pthread_create", plan().folder)) return plan().error;
    return real<int(pthread_t*, const pthread_attr_t*, void* (*)(void*),
                    void*)>("pthread_create")(thread, attributes, start,
                                              argument);
}

dirent* readdir(DIR* folder) {
    if (fails("readdir", ::dirfd(folder))) return nullptr;
    return real<dirent*(DIR*)>("readdir")(folder);
}
}
