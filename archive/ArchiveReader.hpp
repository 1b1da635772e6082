#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "archive/ArchiveBytes.hpp"
#include "archive/PackedNumbers.hpp"
#include "archive/PathVisitor.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// ArchiveReader opens an archive and reads paths by their numbers: the part of
// PathArchive that its other parts build on.
//
// Ownership: keeps the archive's bytes and its segments. Not movable, because
//   the segments point into it.
// Threads: const members from any number of threads.
// Cost: opening verifies the directory, and of each segment head, checksums
//   and tables.
class ArchiveReader {
public:
    // Throws DamagedArchiveException and UnsupportedArchiveVersionException.
    explicit ArchiveReader(ArchiveBytes bytes);

    std::uint64_t size() const noexcept { return size_; }
    std::uint32_t version() const noexcept { return version_; }
    std::uint64_t bytes() const noexcept { return bytes_.bytes().size(); }
    // The archive as it is stored, sound or not. Valid as long as this object.
    std::span<const std::uint8_t> data() const noexcept {
        return bytes_.bytes();
    }
    // Throws DamagedArchiveException if what was read so far may not be what
    // the file held. Call it after reading, before anyone uses what was read;
    // `read` does that itself.
    void requireIntact() const { bytes_.requireIntact(); }
    void releasePages() const noexcept { bytes_.releasePages(); }

    std::size_t segmentCount() const noexcept { return segments_.size(); }
    const Segment& segment(std::size_t index) const noexcept {
        return *segments_[index];
    }
    // The segment of a number below size().
    std::size_t segmentOf(std::uint64_t number) const noexcept;

    // The path with this number, which must be below size(), instead of what
    // `into` holds. Throws DamagedArchiveException.
    void read(std::uint64_t number, std::string& into) const;

    // Shows the paths of these numbers, all below size(), in the order asked.
    // False if the visitor ended the visit.
    bool read(std::span<const std::uint64_t> numbers,
              PathVisitor visitor) const;

    // The same for the numbers from first up to, but without, last.
    bool read(std::uint64_t first, std::uint64_t last,
              PathVisitor visitor) const;

private:
    bool readStored(const Segment& segment, std::uint64_t first,
                    std::uint64_t last, PathVisitor visitor) const;

    ArchiveBytes bytes_;
    std::uint32_t version_ = 0;
    std::uint64_t size_ = 0;
    std::vector<std::unique_ptr<const Segment>> segments_;
};

// Whether paths have their numbers as places.
inline bool isInPlace(const Segment& segment) noexcept {
    return segment.head().order != ListOrder::Rearranged;
}

// The place in the stored order of the segment's path with this number,
// counted from the segment's first. Throws DamagedArchiveException.
inline std::uint64_t placeOf(const Segment& segment, std::uint64_t number) {
    if (isInPlace(segment)) return number;
    return PackedNumbers(segment, Section::Order).at(number);
}

}  // namespace tessel::archive
