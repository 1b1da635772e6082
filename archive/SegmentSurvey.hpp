#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

#include "archive/ArchiveReports.hpp"
#include "archive/Format.hpp"

namespace tessel::archive {

// SegmentSurvey finds the segments of an archive whose header or directory may
// be damaged.
//
// Where a directory entry is sound, it is trusted. Elsewhere, a segment starts
// where the previous one ends, and its own head tells its size. If that is
// damaged, too, the directory's next sound entry goes on; without one, no
// later segment has a known number.
//
// Ownership: borrows the archive's bytes.
class SegmentSurvey {
public:
    // Throws UnsupportedArchiveVersionException.
    explicit SegmentSurvey(std::span<const std::uint8_t> archive);

    // Segments with known numbers, in ascending order. A segment may reach
    // beyond the archive's end.
    const std::vector<SegmentEntry>& segments() const noexcept {
        return segments_;
    }

    // Number of all paths, if it is known.
    std::optional<std::uint64_t> paths() const noexcept { return paths_; }

    const std::vector<ArchiveDamage>& damages() const noexcept {
        return damages_;
    }

    // The number after those of all segments that were found.
    std::uint64_t endNumber() const noexcept;

private:
    void readHeader();
    void readDirectory(const FileHeader& header);
    void followSegments();
    void recognizeEnd();
    std::optional<SegmentEntry> next() const;
    std::uint64_t end() const noexcept;

    std::span<const std::uint8_t> archive_;
    // Sound entries, by ascending offsets.
    std::vector<SegmentEntry> directory_;
    std::vector<SegmentEntry> segments_;
    std::vector<ArchiveDamage> damages_;
    std::optional<std::uint64_t> paths_;
};

}  // namespace tessel::archive
