#pragma once

#include <condition_variable>
#include <exception>
#include <functional>
#include <mutex>
#include <string>
#include <string_view>
#include <thread>

namespace tessel::console {

// BackgroundWriter writes buffers one after another on a thread of its own,
// while its caller fills the next one.
//
// Threads: one caller at a time. The function that writes is called on the
//   other thread, never twice at the same time.
// Errors: what the function throws is thrown by the next call of a member, and
//   by all later ones. Nothing is written after it.
// Cost: one thread; a buffer is handed over without a copy.
class BackgroundWriter {
public:
    using Write = std::function<void(std::string_view)>;

    // Throws std::system_error if no thread can be started.
    explicit BackgroundWriter(Write write);
    BackgroundWriter(const BackgroundWriter&) = delete;
    BackgroundWriter& operator=(const BackgroundWriter&) = delete;
    // Waits for the buffer that is being written.
    ~BackgroundWriter();

    // Waits until the previous buffer is written, then starts to write this
    // one. Leaves the previous one, empty, in its place.
    void write(std::string& buffer);

    // Waits until all is written.
    void wait();

private:
    void run() noexcept;
    void writePending() noexcept;

    const Write write_;
    std::mutex mutex_;
    std::condition_variable changed_;
    // Guarded by mutex_. The thread alone touches pending_ while it is busy.
    std::string pending_;
    bool busy_ = false;
    bool ends_ = false;
    std::exception_ptr failure_;
    std::thread thread_;  // last: it uses all the others
};

}  // namespace tessel::console
