#include "archive/Verification.hpp"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <iterator>
#include <utility>

#include "archive/ArchiveExceptions.hpp"
#include "archive/OrderedScan.hpp"
#include "archive/SegmentRules.hpp"

namespace tessel::archive {
namespace {

// Work per chunk: about a millisecond.
constexpr std::uint64_t piecesPerTask = 256;
constexpr std::uint32_t blocksPerTask = 1024;

// What one task found.
struct Findings {
    std::vector<ArchiveDamage> damages;
    std::uint64_t textBytes = 0;
};

struct Task {
    enum class Kind { Pieces, Rules, End };

    const Segment* segment;
    Kind kind;
    std::function<Findings()> run;
};

// ---- Tasks ----

class TaskList {
public:
    explicit TaskList(const ArchiveReader& archive) {
        for (std::size_t i = 0; i < archive.segmentCount(); ++i)
            addSegment(archive.segment(i));
    }

    std::size_t size() const noexcept { return tasks_.size(); }
    const Task& operator[](std::size_t i) const { return tasks_[i]; }

private:
    void addSegment(const Segment& segment) {
        addPieces(segment);
        const SegmentRules rules(segment);
        addRule(segment, [rules] { rules.checkPadding(); });
        addBlocks(segment.folderBlocks(), [&](auto begin, auto end) {
            addRule(segment,
                    [rules, begin, end] { rules.checkFolders(begin, end); });
        });
        addBlocks(segment.nameBlocks(), [&](auto begin, auto end) {
            add(segment, Task::Kind::Rules, [rules, begin, end] {
                return Findings{{}, rules.checkNames(begin, end)};
            });
        });
        addRule(segment, [rules] { rules.checkFoldersDiffer(); });
        addRule(segment, [rules] { rules.checkFolderHeads(); });
        addRule(segment, [rules] { rules.checkOrder(); });
        add(segment, Task::Kind::End, [] { return Findings(); });
    }

    void addPieces(const Segment& segment) {
        const std::uint64_t pieces = segment.pieces().pieces();
        for (std::uint64_t p = 0; p < pieces; p += piecesPerTask)
            add(segment, Task::Kind::Pieces, [&segment, p, pieces] {
                const auto end = std::min(pieces, p + piecesPerTask);
                return Findings{damagedPieces(segment, p, end), 0};
            });
    }

    template <class AddRange>
    static void addBlocks(std::uint32_t blocks, AddRange addRange) {
        for (std::uint32_t b = 0; b < blocks; b += blocksPerTask)
            addRange(b, std::min(blocks, b + blocksPerTask));
    }

    template <class Check>
    void addRule(const Segment& segment, Check check) {
        add(segment, Task::Kind::Rules,
            [check] { return check(), Findings(); });
    }

    void add(const Segment& segment, Task::Kind kind,
             std::function<Findings()> run) {
        tasks_.push_back({&segment, kind, std::move(run)});
    }

    std::vector<Task> tasks_;
};

// A breach of the rules is a finding, too.
Findings resultOf(const Task& task) {
    try {
        return task.run();
    } catch (const DamagedArchiveException& damage) {
        return {{{damage.offset(), 0, damage.cause()}}, 0};
    }
}

// ---- Results ----

// Puts the findings of all tasks together, in the tasks' order.
class Collection {
public:
    void take(const Task& task, Findings findings) {
        textBytes_ += findings.textBytes;
        if (task.kind == Task::Kind::Pieces)
            hasDamagedPieces_ |= !findings.damages.empty();
        // What breaks the rules because its pieces are damaged is told once.
        if (task.kind == Task::Kind::Pieces || !hasDamagedPieces_)
            std::ranges::move(findings.damages, std::back_inserter(damages_));
        if (task.kind == Task::Kind::End) endSegment(*task.segment);
    }

    std::vector<ArchiveDamage> result() && {
        std::ranges::stable_sort(damages_, {}, &ArchiveDamage::offset);
        return std::move(damages_);
    }

private:
    void endSegment(const Segment& segment) {
        if (damages_.size() == before_ &&
            textBytes_ != segment.head().textBytes)
            damages_.push_back(
                {segment.entry().offset, segmentHeadBytes,
                 "A segment's head tells a wrong number of bytes."});
        before_ = damages_.size();
        textBytes_ = 0;
        hasDamagedPieces_ = false;
    }

    std::vector<ArchiveDamage> damages_;
    std::size_t before_ = 0;         // damages of earlier segments
    std::uint64_t textBytes_ = 0;    // of the current segment
    bool hasDamagedPieces_ = false;  // the same
};

}  // namespace

std::vector<ArchiveDamage> damagedPieces(const Segment& segment,
                                         std::uint64_t begin,
                                         std::uint64_t end) {
    const PieceVerifier& pieces = segment.pieces();
    std::vector<ArchiveDamage> damages;
    for (std::uint64_t piece = begin; piece < end; ++piece) {
        if (pieces.isSound(piece)) continue;
        const std::uint64_t at = pieces.inArchive(pieces.startOf(piece));
        if (!damages.empty() &&
            damages.back().offset + damages.back().size == at)
            damages.back().size += pieces.sizeOf(piece);
        else
            damages.push_back({at, pieces.sizeOf(piece),
                               "Bytes do not match their checksums."});
    }
    return damages;
}

std::vector<ArchiveDamage> findDamage(const ArchiveReader& archive,
                                      const ScanOptions& options) {
    const TaskList tasks(archive);
    OrderedScan scan(tasks.size(), options);
    std::vector<Findings> findings(scan.slots());
    Collection collection;
    scan.run(
        [&](std::uint64_t i) {
            findings[i % scan.slots()] = resultOf(tasks[i]);
        },
        [&](std::uint64_t i) {
            collection.take(tasks[i], std::move(findings[i % scan.slots()]));
            return true;
        });
    return std::move(collection).result();
}

}  // namespace tessel::archive
