#include "archive/Salvage.hpp"

#include <algorithm>
#include <iterator>
#include <memory>
#include <optional>
#include <utility>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/ArchiveReader.hpp"
#include "archive/PathCursor.hpp"
#include "archive/SegmentSurvey.hpp"
#include "archive/Verification.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::span<const std::uint8_t>;

// ---- One segment ----

// Shows the readable paths of one segment.
class SegmentSalvage {
public:
    SegmentSalvage(const Segment& segment, PathVisitor visitor,
                   SalvageReport& report)
        : segment_(segment), visitor_(visitor), report_(report) {
        paths_.emplace(segment_);
    }

    // False if the visitor ended the visit.
    bool run() {
        std::uint64_t number = 0;
        while (number < segment_.size()) {
            const std::uint64_t after = seek(number);
            if (after > number)
                lose(number, after);
            else if (!show(number))
                return false;
            number = std::max(after, number + 1);
        }
        return true;
    }

private:
    // Decodes the name with this number. Returns the number of the next path
    // that may be readable: this one, or one after it if this one is lost.
    std::uint64_t seek(std::uint64_t number) {
        try {
            const std::uint64_t place = placeOf(segment_, number);
            try {
                paths_->seek(place);
                return number;
            } catch (const DamagedArchiveException&) {
                paths_.emplace(segment_);
                return afterBlock(number);
            }
        } catch (const DamagedArchiveException&) {
            return number + 1;
        }
    }

    // What follows in the block of a lost name is lost, too.
    std::uint64_t afterBlock(std::uint64_t number) const noexcept {
        if (!isInPlace(segment_)) return number + 1;
        const std::uint64_t perBlock = segment_.head().namesPerBlock;
        return std::min(segment_.size(), (number / perBlock + 1) * perBlock);
    }

    bool show(std::uint64_t number) {
        std::string_view path;
        try {
            path = paths_->path();
        } catch (const DamagedArchiveException&) {
            paths_.emplace(segment_);
            lose(number, number + 1);
            return true;
        }
        ++report_.kept;
        return visitor_(segment_.entry().firstNumber + number, path);
    }

    void lose(std::uint64_t begin, std::uint64_t end) {
        const std::uint64_t first = segment_.entry().firstNumber;
        appendRange(report_.lost, {first + begin, first + end});
    }

    const Segment& segment_;
    PathVisitor visitor_;
    SalvageReport& report_;
    std::optional<PathCursor> paths_;
};

// ---- All segments ----

// The bytes of a segment. If the archive ends within it, it goes on with zeros
// in `filled`: then the rest is damaged, and what is there can be read. Nothing
// if less than half of it is there.
Bytes bytesOf(Bytes archive, const SegmentEntry& entry,
              std::vector<std::uint8_t>& filled) {
    const Bytes rest =
        archive.subspan(std::min<std::uint64_t>(entry.offset, archive.size()));
    if (entry.bytes <= rest.size()) return rest.first(entry.bytes);
    if (entry.bytes / 2 > rest.size()) return {};
    filled.assign(rest.begin(), rest.end());
    filled.resize(entry.bytes);
    return filled;
}

class ArchiveSalvage {
public:
    ArchiveSalvage(Bytes archive, PathVisitor visitor)
        : archive_(archive), visitor_(visitor) {}

    SalvageReport run() {
        const SegmentSurvey survey(archive_);
        if (survey.segments().empty() && !survey.paths())
            throw DamagedArchiveException(0, "This is no archive.");
        report_.damages = survey.damages();
        report_.complete = survey.paths().has_value();
        std::uint64_t next = 0;
        for (const SegmentEntry& entry : survey.segments()) {
            loseNumbers(next, entry.firstNumber);
            next = entry.firstNumber + entry.paths;
            if (!readSegment(entry)) return std::move(report_);
        }
        loseNumbers(next, std::max(next, survey.paths().value_or(next)));
        return std::move(report_);
    }

private:
    void loseNumbers(std::uint64_t begin, std::uint64_t end) {
        appendRange(report_.lost, {begin, end});
    }

    bool readSegment(const SegmentEntry& entry) {
        std::vector<std::uint8_t> filled;
        const auto segment = openSegment(entry, filled);
        if (segment) {
            const auto pieces = segment->pieces().pieces();
            std::ranges::move(damagedPieces(*segment, 0, pieces),
                              std::back_inserter(report_.damages));
            return SegmentSalvage(*segment, visitor_, report_).run();
        }
        loseNumbers(entry.firstNumber, entry.firstNumber + entry.paths);
        return true;
    }

    // The segment with its tables built, or nullptr if they are damaged.
    std::unique_ptr<const Segment> openSegment(
        const SegmentEntry& entry, std::vector<std::uint8_t>& filled) {
        try {
            auto segment = std::make_unique<const Segment>(
                bytesOf(archive_, entry, filled), entry);
            segment->tables();
            return segment;
        } catch (const DamagedArchiveException& damage) {
            report_.damages.push_back({damage.offset(), 0, damage.cause()});
            return nullptr;
        }
    }

    Bytes archive_;
    PathVisitor visitor_;
    SalvageReport report_;
};

}  // namespace

SalvageReport salvage(Bytes archive, PathVisitor visitor) {
    return ArchiveSalvage(archive, visitor).run();
}

}  // namespace tessel::archive
