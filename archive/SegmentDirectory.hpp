#pragma once

#include <cstdint>
#include <span>
#include <vector>

#include "archive/Format.hpp"

namespace tessel::archive {

// The segments of a file while it is written, and what an old file says of
// its own.
class SegmentDirectory {
public:
    // Where the next segment goes.
    std::uint64_t end() const noexcept;
    std::uint64_t paths() const noexcept;

    // Adds a segment that starts at end().
    void add(std::uint64_t bytes, std::uint64_t paths);

    // Appends the directory and returns the file's header.
    FileHeader pack(std::vector<std::uint8_t>& out) const;

    // The directory of a whole file. Throws DamagedArchiveException unless
    // header and directory are sound and describe these bytes, and
    // UnsupportedArchiveVersionException. The segments are not looked at.
    static SegmentDirectory unpack(std::span<const std::uint8_t> file);

    std::uint32_t version() const noexcept { return version_; }
    const std::vector<SegmentEntry>& entries() const noexcept {
        return entries_;
    }

private:
    bool isNext(const SegmentEntry& entry) const noexcept;

    std::uint32_t version_ = formatVersion;
    std::vector<SegmentEntry> entries_;
};

}  // namespace tessel::archive
