#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace tessel::console {

// OutputBuffer collects what is written to a descriptor and writes it in large
// pieces.
//
// Ownership: borrows the descriptor.
// Threads: one at a time.
// Errors: every member that writes throws ClosedPipeException if the reader is
//   gone, and std::system_error, which names the output, if the system
//   refuses. SIGPIPE must be ignored. The destructor writes nothing: call
//   flush.
class OutputBuffer {
public:
    // name  what errors call the output, such as "standard output"
    OutputBuffer(int descriptor, std::string name);

    int descriptor() const noexcept { return descriptor_; }

    void write(std::string_view bytes) {
        if (bytes.size() > capacity - buffer_.size()) return writeLarge(bytes);
        buffer_.append(bytes);
    }
    void put(char byte) { write({&byte, 1}); }

    void flush();

private:
    // Four times a pipe's usual size. 64 KiB to 1 MiB made no difference when
    // listing to a file, a pipe and /dev/null.
    static constexpr std::size_t capacity = std::size_t{256} << 10;

    void writeLarge(std::string_view bytes);
    void widenPipe();
    void writeAll(std::string_view bytes);

    int descriptor_;
    std::string name_;
    std::string buffer_;
    bool isPipeWide_ = false;
};

}  // namespace tessel::console
