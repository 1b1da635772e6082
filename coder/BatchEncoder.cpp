#include "coder/BatchEncoder.hpp"

#include <algorithm>
#include <exception>
#include <stdexcept>
#include <thread>
#include <utility>

#include "coder/ArenaEncoder.hpp"
#include "pathtree/containers.hpp"

namespace tessel {

namespace {

// The number of hardware threads to assume where the platform knows none.
constexpr unsigned threadsIfUnknown = 2;

// Encodes folders of a batch into lists of its own.
class FolderEncoder {
public:
    FolderEncoder(const HuffmanCode& code, Batch& batch) noexcept
        : encoder_(code), batch_(batch) {}

    // Makes the place where keepBuffers puts what the lists point into, while
    // it may still fail.
    void reserveBuffers() {
        const MutexLock lock(batch_.folderResultMutex);
        buffersAt_ = batch_.buffers.size();
        batch_.buffers.emplace_back();
    }
    void keepBuffers() noexcept {
        const MutexLock lock(batch_.folderResultMutex);
        batch_.buffers[buffersAt_] = arena_.takeBuffers();
    }

    void encode(std::uint64_t folder) {
        folder_ = folder;
        maxInFolder_ = 0;
        const ComponentList components = encodeAll(batch_.folders[folder]);
        {
            const MutexLock lock(batch_.folderResultMutex);
            batch_.encodedFolders[folder] = components;
        }
        const ComponentList names = encodeAll(batch_.files[folder]);
        {
            const MutexLock lock(batch_.fileResultMutex);
            batch_.encodedFiles[folder] = names;
        }
        maxBefore_ = std::max(maxBefore_, maxInFolder_);
    }

    // The folder encoded last, or the one that failed.
    std::uint64_t folder() const noexcept { return folder_; }
    // The longest component of it so far, and of all before and it.
    std::uint64_t maxInFolder() const noexcept { return maxInFolder_; }
    std::uint64_t maxOfAll() const noexcept {
        return std::max(maxBefore_, maxInFolder_);
    }

private:
    ComponentList encodeAll(const std::vector<std::u16string>& texts) {
        for (const std::u16string& text : texts) {
            const std::size_t length = encoder_.append(text, arena_);
            maxInFolder_ = std::max<std::uint64_t>(maxInFolder_, length);
        }
        return arena_.finish();
    }

    ArenaEncoder encoder_;
    Batch& batch_;
    ComponentArena arena_;
    std::size_t buffersAt_ = 0;
    std::uint64_t folder_ = 0;
    std::uint64_t maxInFolder_ = 0;
    std::uint64_t maxBefore_ = 0;
};

}  // namespace

// ---- Batch ----

void Batch::resizeResults() {
    {
        const MutexLock lock(folderResultMutex);
        encodedFolders.resize(folders.size());
    }
    const MutexLock lock(fileResultMutex);
    encodedFiles.resize(folders.size());
}

void Batch::requireRoom(std::uint64_t end) const {
    bool hasRoom = files.size() >= end;
    {
        const MutexLock lock(folderResultMutex);
        hasRoom = hasRoom && encodedFolders.size() >= end;
    }
    const MutexLock lock(fileResultMutex);
    if (!hasRoom || encodedFiles.size() < end)
        throw std::logic_error("A folder has no files or no room for results.");
}

// No other thread can reach either batch.
void Batch::takeOver(Batch& other) QZTESSEL_NO_THREAD_SAFETY {
    folders = std::exchange(other.folders, {});
    files = std::exchange(other.files, {});
    encodedFolders = std::exchange(other.encodedFolders, {});
    encodedFiles = std::exchange(other.encodedFiles, {});
    buffers = std::exchange(other.buffers, {});
}

void Batch::clearResults() {
    {
        const MutexLock lock(folderResultMutex);
        releaseContents(encodedFolders);
        releaseContents(buffers);
    }
    const MutexLock lock(fileResultMutex);
    releaseContents(encodedFiles);
}

void Batch::clear() {
    releaseContents(folders);
    releaseContents(files);
    clearResults();
}

namespace {

// A text beyond the characters that a string object itself holds.
std::size_t heapBytes(const std::u16string& text) {
    const std::size_t inlineCapacity = std::u16string().capacity();
    if (text.capacity() <= inlineCapacity) return 0;
    return (text.capacity() + 1) * sizeof(char16_t);
}

std::size_t heapBytes(const FolderTexts& lists) {
    std::size_t bytes = lists.capacity() * sizeof(FolderTexts::value_type);
    for (const auto& texts : lists) {
        bytes += texts.capacity() * sizeof(std::u16string);
        for (const std::u16string& text : texts) bytes += heapBytes(text);
    }
    return bytes;
}

std::size_t heapBytes(const std::vector<ComponentList>& lists) {
    std::size_t bytes = lists.capacity() * sizeof(ComponentList);
    for (const ComponentList& list : lists) bytes += list.bytes().size();
    return bytes;
}

}  // namespace

std::size_t Batch::memoryBytes() const {
    std::size_t bytes = heapBytes(folders) + heapBytes(files);
    {
        const MutexLock lock(folderResultMutex);
        bytes += heapBytes(encodedFolders);
    }
    const MutexLock lock(fileResultMutex);
    return bytes + heapBytes(encodedFiles);
}

// ---- Workers ----

// What one worker uses and leaves behind. On cache lines of its own, because
// it is written all the time.
struct alignas(64) BatchEncoder::Worker {
    Worker(const HuffmanCode& code, Batch& batch) : encoder(code, batch) {}

    FolderEncoder encoder;
    std::vector<FolderRange> encodedRanges;  // whose texts are still there
    std::exception_ptr failure;
    std::uint64_t failedFolder = 0;
};

BatchEncoder::BatchEncoder(const HuffmanCode& code, AtomicMaximum& maxCodeBytes,
                           FolderTexts& folders, FolderTexts& files)
    : code_(code), maxCodeBytes_(maxCodeBytes) {
    batch_.folders = std::exchange(folders, {});
    batch_.files = std::exchange(files, {});
}

std::vector<BatchEncoder::FolderRange> BatchEncoder::splitFolders(
    std::uint64_t n, unsigned hardwareThreads) {
    if (n == 0) return {};
    const std::uint64_t threads =
        hardwareThreads == 0 ? threadsIfUnknown : hardwareThreads;
    const std::uint64_t workers = std::min(threads, n);
    const std::uint64_t chunk = n / workers;
    std::vector<FolderRange> ranges;
    for (std::uint64_t w = 0; w < workers; ++w)
        ranges.push_back({w * chunk, (w + 1) * chunk});
    ranges.back().end = n;
    return ranges;
}

void BatchEncoder::encode(unsigned hardwareThreads) {
    const std::uint64_t count = batch_.folders.size();
    batch_.resizeResults();
    if (count < 2) {
        encodeRange(code_, batch_, {0, count}, maxCodeBytes_);
        return;
    }
    // A worker comes back to the queue at least 64 times, so that it ends at
    // most 1/64 of its share after the others; more than 64 folders at a time
    // would save nothing, since a folder costs far more than a step.
    constexpr std::uint64_t minStepsPerWorker = 64;
    constexpr std::uint64_t maxFoldersPerStep = 64;
    const auto split =
        splitFolders(count, std::min(hardwareThreads, maxWorkers));
    foldersPerStep_ = std::clamp(count / split.size() / minStepsPerWorker,
                                 std::uint64_t{1}, maxFoldersPerStep);
    std::vector<Worker> workers;
    workers.reserve(split.size());
    for (std::size_t w = 0; w < split.size(); ++w)
        workers.emplace_back(code_, batch_).encoder.reserveBuffers();
    runWorkers(workers, split);
    collect(workers);
}

// Starts the workers and waits for them.
void BatchEncoder::runWorkers(std::vector<Worker>& workers,
                              const std::vector<FolderRange>& split) {
    std::vector<std::jthread> threads;
    try {
        threads.reserve(workers.size());
        for (Worker& worker : workers)
            threads.emplace_back([this, &worker] { work(worker); });
    } catch (...) {
        const std::size_t notStarted = threads.size();
        workers[notStarted].failure = std::current_exception();
        workers[notStarted].failedFolder = split[notStarted].begin;
    }
}

// The next few folders of the queue; none at its end. Relaxed: a worker reads
// nothing that another one has written, and joining it publishes the rest.
BatchEncoder::FolderRange BatchEncoder::takeFolders() noexcept {
    const std::uint64_t count = batch_.folders.size();
    const std::uint64_t begin =
        nextFolder_.fetch_add(foldersPerStep_, std::memory_order_relaxed);
    return {std::min(begin, count), std::min(begin + foldersPerStep_, count)};
}

void BatchEncoder::work(Worker& worker) noexcept {
    try {
        for (FolderRange range = takeFolders(); range.begin < range.end;
             range = takeFolders()) {
            for (std::uint64_t i = range.begin; i < range.end; ++i)
                worker.encoder.encode(i);
            worker.encodedRanges.push_back(range);
            if (releaseMutex_.try_lock()) {
                releaseTexts(worker);
                releaseMutex_.unlock();
            }
        }
    } catch (...) {
        worker.failure = std::current_exception();
        worker.failedFolder = worker.encoder.folder();
    }
    worker.encoder.keepBuffers();
    const MutexLock lock(releaseMutex_);
    releaseTexts(worker);
}

// Releases the texts that the worker has encoded: what is still in the cache
// is freed fastest, and the batch need not be in memory twice. One worker at
// a time does it while the others go on encoding: all texts come from the
// caller's thread, and the allocator would let threads that free them wait
// for each other.
void BatchEncoder::releaseTexts(Worker& worker) noexcept {
    for (const FolderRange range : worker.encodedRanges) {
        for (std::uint64_t i = range.begin; i < range.end; ++i) {
            releaseContents(batch_.folders[i]);
            releaseContents(batch_.files[i]);
        }
    }
    worker.encodedRanges.clear();
}

// Raises the maximum and throws the failure of the lowest folder. Folders are
// taken in order and a worker stops only at a failure or at the queue's end,
// so every folder below the lowest that failed has been encoded.
void BatchEncoder::collect(const std::vector<Worker>& workers) {
    const Worker* failed = nullptr;
    for (const Worker& worker : workers)
        if (worker.failure &&
            (failed == nullptr || worker.failedFolder < failed->failedFolder))
            failed = &worker;
    if (failed == nullptr) {
        for (const Worker& worker : workers)
            maxCodeBytes_.raise(worker.encoder.maxOfAll());
        return;
    }
    // What encoding in order would have met.
    if (failed->encoder.folder() == failed->failedFolder)
        maxCodeBytes_.raise(failed->encoder.maxInFolder());
    const auto raiseBy = [&](const std::vector<ComponentList>& lists) {
        for (std::uint64_t i = 0; i < failed->failedFolder; ++i)
            for (const ComponentView component : lists[i])
                maxCodeBytes_.raise(component.size());
    };
    {
        const MutexLock lock(batch_.folderResultMutex);
        raiseBy(batch_.encodedFolders);
    }
    {
        const MutexLock lock(batch_.fileResultMutex);
        raiseBy(batch_.encodedFiles);
    }
    std::rethrow_exception(failed->failure);
}

void BatchEncoder::encodeRange(const HuffmanCode& code, Batch& batch,
                               FolderRange folders,
                               AtomicMaximum& maxCodeBytes) {
    FolderEncoder encoder(code, batch);
    encoder.reserveBuffers();
    std::exception_ptr failure;
    try {
        for (std::uint64_t i = folders.begin; i < folders.end; ++i)
            encoder.encode(i);
    } catch (...) {
        failure = std::current_exception();
    }
    encoder.keepBuffers();
    maxCodeBytes.raise(encoder.maxOfAll());
    if (failure) std::rethrow_exception(failure);
}

}  // namespace tessel
