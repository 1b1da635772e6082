#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>

#include "archive/BitLoad.hpp"
#include "archive/LostPages.hpp"

namespace tessel::archive {

// FileMapping maps a whole file for reading.
//
// Ownership: unmaps in its destructor; the file itself is closed at once. Not
//   copyable; moving leaves an empty mapping.
// Threads: const members from any number of threads.
// Changes: a file that is replaced by renaming stays mapped as it was. Of one
//   that is cut, or that the disk no longer delivers, the lost bytes become
//   zeros, and isIntact() says so.
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

    // False if bytes that were read before this call may have been others than
    // those that the file had when it was mapped, because it was cut, or
    // written anew from its start to another end, or the disk failed. Bytes
    // that somebody writes in the middle of the file are not noticed.
    // Cost: two loads, of which one is from the file's last page.
    bool isIntact() const noexcept {
        // Keeps the compiler from moving what was read before behind this.
        std::atomic_signal_fence(std::memory_order_seq_cst);
        return lastBytes() == lastBytes_ && !lostPages_.any();
    }

    // Throws DamagedArchiveException if it is not intact.
    void requireIntact() const {
        if (!isIntact()) [[unlikely]]
            failChanged();
    }

    // Reads the whole file once. What the disk cannot deliver becomes zeros
    // now, and the mapping counts as intact until more is lost.
    void settle();

    // Takes the file's pages out of this process's memory. Touching them
    // brings them back, mostly from the system's page cache.
    void releasePages() const noexcept;

private:
    FileMapping() noexcept = default;

    [[noreturn]] void failChanged() const;

    // The end of a file is lost with whatever is cut off. Of the page that the
    // cut goes through, the system makes the rest zeros, and tells nobody. 0
    // for a file of less than eight bytes.
    std::uint64_t lastBytes() const noexcept {
        constexpr std::size_t width = sizeof(std::uint64_t);
        if (size_ < width) return 0;
        return loadLittle<std::uint64_t>(bytes().last(width).data());
    }

    void* start_ = nullptr;
    std::size_t size_ = 0;
    std::uint64_t lastBytes_ = 0;  // when the file was mapped
    LostPages lostPages_;
};

}  // namespace tessel::archive
