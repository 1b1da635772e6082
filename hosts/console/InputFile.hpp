#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "hosts/console/Interrupts.hpp"

namespace tessel::console {

// InputFile reads a file, or standard input for the name "-".
//
// Ownership: opens and closes the file; standard input stays open. Keeps a
//   pointer to the interrupts, which must outlive it.
// Errors: std::system_error that names the file; CancelledException if a stop
//   is requested while it waits for input.
class InputFile {
public:
    InputFile(const std::string& file, const Interrupts& interrupts);
    InputFile(const InputFile&) = delete;
    InputFile& operator=(const InputFile&) = delete;
    ~InputFile();

    // What errors call it.
    const std::string& name() const noexcept { return name_; }

    // Whether it is a file that can be mapped.
    bool isRegular() const noexcept { return regular_; }

    // Bytes of a regular file; 0 if nobody knows.
    std::uint64_t size() const noexcept { return size_; }

    // Reads at most this many bytes, at least one unless the input is at its
    // end.
    std::size_t read(char* into, std::size_t mostBytes);

    // Everything up to the end.
    std::vector<std::uint8_t> readAll();

private:
    void waitForInput() const;
    [[noreturn]] void fail() const;

    const Interrupts* interrupts_;
    std::string name_;
    int descriptor_;
    bool regular_ = false;
    std::uint64_t size_ = 0;
};

}  // namespace tessel::console
