#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "coder/HuffmanCode.hpp"
#include "coder/PathNumbering.hpp"
#include "coder/ThreadSafety.hpp"
#include "pathtree/ComponentArena.hpp"

namespace tessel {

// Folder i as a list of component texts, or the names of the files under it.
using FolderTexts = std::vector<std::vector<std::u16string>>;

// The texts of a batch and what they are encoded to, one entry per folder.
//
// Threads: a folder's texts and the places of its results belong to the worker
//   that takes the folder. The locks guard the lists as a whole: workers add
//   buffers, and others may read the lists meanwhile.
struct Batch {
    FolderTexts folders;
    FolderTexts files;

    mutable Mutex folderResultMutex;
    std::vector<ComponentList> encodedFolders
        QZTESSEL_GUARDED_BY(folderResultMutex);
    // What the encoded lists point into.
    std::vector<ComponentBuffers> buffers
        QZTESSEL_GUARDED_BY(folderResultMutex);
    mutable Mutex fileResultMutex;
    std::vector<ComponentList> encodedFiles
        QZTESSEL_GUARDED_BY(fileResultMutex);

    // Makes the result lists as long as the list of folders.
    void resizeResults();
    // Throws std::logic_error if a list of files or of results does not reach
    // to the folder before `end`.
    void requireRoom(std::uint64_t end) const;
    // Moves all that the other batch holds into this one.
    void takeOver(Batch& other);
    void clearResults();
    void clear();

    // Bytes on the heap, the slack of the buffers not included.
    std::size_t memoryBytes() const;
};

// Encodes one batch on several threads.
//
// All workers take folders from one queue, a few at a time and in order, so
// that a range of long folders keeps nobody else waiting.
//
// Ownership: an object lives for one call and owns the batch. It borrows the
//   code, which nobody may change meanwhile, and the maximum.
// Threads: use it from one; it starts workers and joins them.
// Cost: a worker's share of the texts, and a buffer of up to 64 KiB each.
class BatchEncoder {
public:
    // A half-open range of folders.
    struct FolderRange {
        std::uint64_t begin = 0;
        std::uint64_t end = 0;

        friend bool operator==(FolderRange a, FolderRange b) = default;
    };

    // Takes over both lists, which must be equally long.
    BatchEncoder(const HuffmanCode& code, AtomicMaximum& maxCodeBytes,
                 FolderTexts& folders, FolderTexts& files);

    // Encodes all folders, on as many workers as splitFolders gives ranges, but
    // at most maxWorkers, and releases their texts on the way. A single folder
    // is encoded without a worker and keeps its texts.
    //
    // If texts cannot be encoded or a thread cannot be started, all workers
    // end first; then the failure of the lowest folder is thrown, where a
    // missing thread counts as a failure of the first folder of its range.
    // maxCodeBytes is raised by what encoding in order would have met until
    // then.
    void encode(unsigned hardwareThreads);

    Batch& batch() noexcept { return batch_; }

    // Encodes a range of folders of any batch whose result lists are long
    // enough. Throws as encode does; what was encoded stays. Safe on several
    // threads whose ranges differ.
    static void encodeRange(const HuffmanCode& code, Batch& batch,
                            FolderRange folders, AtomicMaximum& maxCodeBytes);

    // No more threads than this are started, however many are said to run.
    static constexpr unsigned maxWorkers = 256;

    // How n folders are split among that many hardware threads (0: unknown,
    // two are assumed): a range per worker, the remainder to the last one.
    static std::vector<FolderRange> splitFolders(std::uint64_t n,
                                                 unsigned hardwareThreads);

private:
    struct Worker;

    FolderRange takeFolders() noexcept;
    void work(Worker& worker) noexcept;
    void releaseTexts(Worker& worker) noexcept QZTESSEL_REQUIRES(releaseMutex_);
    void runWorkers(std::vector<Worker>& workers,
                    const std::vector<FolderRange>& split);
    void collect(const std::vector<Worker>& workers);

    const HuffmanCode& code_;
    AtomicMaximum& maxCodeBytes_;
    Batch batch_;
    std::atomic<std::uint64_t> nextFolder_ = 0;  // the queue
    std::uint64_t foldersPerStep_ = 1;
    // Held by the worker that releases texts.
    Mutex releaseMutex_;
};

}  // namespace tessel
