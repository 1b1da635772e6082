#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>

namespace tessel::archive {

// FileMapping maps a whole file for reading.
//
// Ownership: unmaps in its destructor; the file itself is closed at once. Not
//   copyable; moving leaves an empty mapping.
// Threads: const members from any number of threads.
// Limit: the mapping does not notice if the file is changed or cut. Touching
//   what was cut off raises SIGBUS.
class FileMapping {
public:
    // Throws std::system_error, which names the file, if the file cannot be
    // opened or mapped or is not a regular file.
    explicit FileMapping(const std::string& file);
    ~FileMapping();

    FileMapping(FileMapping&& other) noexcept;
    FileMapping& operator=(FileMapping&& other) noexcept;
    FileMapping(const FileMapping&) = delete;
    FileMapping& operator=(const FileMapping&) = delete;

    // The file's bytes; none for an empty file.
    std::span<const std::uint8_t> bytes() const noexcept {
        return {static_cast<const std::uint8_t*>(start_), size_};
    }

    // Takes the file's pages out of this process's memory. Touching them
    // brings them back, mostly from the system's page cache.
    void releasePages() const noexcept;

private:
    void* start_ = nullptr;
    std::size_t size_ = 0;
};

}  // namespace tessel::archive
