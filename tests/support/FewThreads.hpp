#pragma once

namespace support {

// For the lifetime of the object only `count` threads can be started: after
// that, pthread_create answers EAGAIN. A program that links this answers for
// the platform.
class FewThreads {
public:
    explicit FewThreads(int count);
    FewThreads(const FewThreads&) = delete;
    FewThreads& operator=(const FewThreads&) = delete;
    ~FewThreads();
};

}  // namespace support
