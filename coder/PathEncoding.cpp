// From texts to encoded components, on several threads, and into the tree.

#include <algorithm>
#include <array>
#include <bit>
#include <cstring>
#include <stdexcept>
#include <utility>

#include "coder/HuffmanPathTree.hpp"
#include "pathtree/containers.hpp"

namespace tessel {

namespace {

constexpr unsigned bitsPerByte = 8;

// The number of hardware threads to assume where the platform knows none.
constexpr unsigned threadsIfUnknown = 2;

// Size of the bit block that holds this many bits.
std::size_t bitBlockBytes(std::size_t bits) {
    return bits == 0 ? 0 : bits / bitsPerByte + 2;
}

// Writes bits to bytes, least significant first. May write seven bytes more
// than the bits need.
class BitWriter {
public:
    explicit BitWriter(std::uint8_t* to) noexcept : out_(to) {}

    // Appends the `count` (at most 56) low bits; those above must be 0.
    void put(std::uint64_t bits, unsigned count) noexcept {
        held_ |= bits << heldBits_;
        heldBits_ += count;
        flush();
    }

    // Ends the block: the last bits, then how many they are.
    void finish() noexcept {
        *out_++ = static_cast<std::uint8_t>(held_);
        *out_++ = static_cast<std::uint8_t>(heldBits_);
    }

private:
    void flush() noexcept {
        static_assert(std::endian::native == std::endian::little);
        std::memcpy(out_, &held_, sizeof held_);
        const unsigned full = heldBits_ / bitsPerByte;
        out_ += full;
        held_ = full == sizeof held_ ? 0 : held_ >> (full * bitsPerByte);
        heldBits_ %= bitsPerByte;
    }

    std::uint8_t* out_;
    std::uint64_t held_ = 0;
    unsigned heldBits_ = 0;  // below 8 between calls
};

}  // namespace

const char* NoCodeForEmptyString::what() const noexcept {
    return "No code for an empty string.";
}

const char* CodeNotFoundException::what() const noexcept {
    return "Code for the character not found.";
}

// ---- One component ----

std::size_t HuffmanPathTree::encodedBytes(const std::u16string& text) const {
    if (text.empty()) throw NoCodeForEmptyString();
    std::size_t bits = 0;
    for (const char16_t character : text) {
        const CodeTable::Entry& entry = codes[character];
        if (!entry.exists()) throw CodeNotFoundException();
        bits += entry.isLong ? codeOf(character).size() : entry.length;
    }
    return bitBlockBytes(bits);
}

void HuffmanPathTree::encodeTo(const std::u16string& text,
                               std::uint8_t* to) const {
    BitWriter writer(to);
    for (const char16_t character : text) {
        const CodeTable::Entry& entry = codes[character];
        if (!entry.isLong) {
            writer.put(entry.bits, entry.length);
        } else {
            for (const bool bit : codeOf(character)) writer.put(bit ? 1 : 0, 1);
        }
    }
    writer.finish();
}

Component HuffmanPathTree::generateCodeFor(const std::u16string& text) {
    const std::size_t length = encodedBytes(text);
    Component bytes(length + ComponentPacker::slack);
    if (length > 0) encodeTo(text, bytes.data());
    bytes.resize(length);
    raiseMaxCodeBytes(length);
    return bytes;
}

void HuffmanPathTree::raiseMaxCodeBytes(std::uint64_t length) noexcept {
    std::uint64_t known = maxCodeBytes.load(std::memory_order_relaxed);
    while (length > known && !maxCodeBytes.compare_exchange_weak(
                                 known, length, std::memory_order_relaxed)) {
    }
}

// ---- A batch ----

// The folders that one worker begins with. It takes a few at a time from the
// front, and workers that have finished their own then help with the rest, so
// that a range of long folders does not keep all others waiting. On a cache
// line of its own: usually only its own worker touches it.
class alignas(64) HuffmanPathTree::WorkerRange {
public:
    void set(const FirstAndLast& folders) noexcept {
        next_.store(folders.first, std::memory_order_relaxed);
        last_ = folders.second;
        step_ = std::clamp((last_ - folders.first + 1) / leastSteps,
                           std::uint64_t{1}, mostFoldersAStep);
    }

    // The next few folders; none if the first lies behind the last.
    FirstAndLast take() noexcept {
        const std::uint64_t first =
            next_.fetch_add(step_, std::memory_order_relaxed);
        return {first, std::min(first + step_ - 1, last_)};
    }

private:
    static constexpr std::uint64_t leastSteps = 64;
    static constexpr std::uint64_t mostFoldersAStep = 64;

    std::atomic<std::uint64_t> next_ = 0;
    std::uint64_t last_ = 0;
    std::uint64_t step_ = 1;
};

// What one worker has at hand and leaves behind; on cache lines of its own,
// because it is written all the time.
struct alignas(64) HuffmanPathTree::Worker {
    ComponentPacker packer;
    std::size_t buffersAt = 0;  // place of its buffers in encodedBuffers
    std::vector<FirstAndLast> unreleased;  // folders with encoded texts
    std::uint64_t folder = 0;              // at hand
    std::uint64_t longestInFolder = 0;     // component of the one at hand
    std::uint64_t longest = 0;             // component of those before it
    std::exception_ptr failure;            // in or behind the folder at hand
};

std::vector<HuffmanPathTree::FirstAndLast> HuffmanPathTree::splitFolders(
    std::uint64_t n, unsigned hardwareThreads) {
    if (n == 0) return {};
    const std::uint64_t threads =
        hardwareThreads == 0 ? threadsIfUnknown : hardwareThreads;
    const std::uint64_t workers = std::min(threads, n);
    const std::uint64_t chunk = n / workers;
    std::vector<FirstAndLast> ranges;
    for (std::uint64_t w = 0; w < workers; ++w)
        ranges.emplace_back(w * chunk, (w + 1) * chunk - 1);
    ranges.back().second = n - 1;
    return ranges;
}

void HuffmanPathTree::generateCodeAsyncAndAddPaths(FolderTexts& folders,
                                                   FolderTexts& files) {
    generateCodeAsyncAndAddPaths(folders, files,
                                 std::thread::hardware_concurrency());
}

void HuffmanPathTree::generateCodeAsyncAndAddPaths(FolderTexts& folders,
                                                   FolderTexts& files,
                                                   unsigned hardwareThreads) {
    if (folders.size() != files.size() ||
        (&folders == &files && !folders.empty()))
        throw std::invalid_argument(
            "Each folder needs exactly one list of files.");
    if (folders.empty()) return;
    joinAllGenThreads();
    // They may be what a batch that was refused has left in this very object.
    FolderTexts newFolders = std::exchange(folders, {});
    FolderTexts newFiles = std::exchange(files, {});
    clearThreadResources();
    asyncFolders = std::move(newFolders);
    asyncFiles = std::move(newFiles);
    encodeOnWorkers(hardwareThreads);
    releaseContents(asyncFolders);
    releaseContents(asyncFiles);
    addPathToBTreeFromAsyncData();
}

void HuffmanPathTree::encodeOnWorkers(unsigned hardwareThreads) {
    joinAllGenThreads();
    encodedFolders.resize(asyncFolders.size());
    encodedFiles.resize(asyncFolders.size());
    if (asyncFolders.size() < 2) {
        generateCodeForPath(0, 0);
        return;
    }
    const auto split = splitFolders(asyncFolders.size(), hardwareThreads);
    std::vector<WorkerRange> ranges(split.size());
    for (std::size_t w = 0; w < split.size(); ++w) ranges[w].set(split[w]);
    std::vector<Worker> workers(split.size());
    for (Worker& worker : workers) reserveBuffers(worker);
    try {
        genThreads.reserve(split.size());
        for (std::size_t w = 0; w < split.size(); ++w)
            genThreads.emplace_back(
                [this, &ranges, w, &workers] { work(ranges, w, workers[w]); });
    } catch (...) {
        const std::size_t notStarted = genThreads.size();
        workers[notStarted].folder = split[notStarted].first;
        workers[notStarted].failure = std::current_exception();
    }
    joinAllGenThreads();
    collect(workers);
}

// The body of the worker that begins with range `own`.
void HuffmanPathTree::work(std::vector<WorkerRange>& ranges, std::size_t own,
                           Worker& worker) noexcept {
    try {
        for (std::size_t k = 0; k < ranges.size(); ++k) {
            WorkerRange& range = ranges[(own + k) % ranges.size()];
            for (auto folders = range.take(); folders.first <= folders.second;
                 folders = range.take()) {
                encodeFolders(folders.first, folders.second, worker);
                worker.unreleased.push_back(folders);
                const std::unique_lock turn(releaseMutex_, std::try_to_lock);
                if (turn) releaseEncoded(worker);
            }
        }
    } catch (...) {
        worker.failure = std::current_exception();
    }
    keepBuffers(worker);
    const std::lock_guard turn(releaseMutex_);
    releaseEncoded(worker);
}

// Releases the texts that the worker has encoded: what is still warm is freed
// fastest, and the batch need not stand in memory twice. One worker at a time
// does it and the others go on encoding, because all texts come from the
// caller's thread and the allocator would let threads that free them wait
// for each other.
void HuffmanPathTree::releaseEncoded(Worker& worker) noexcept {
    for (const auto& [first, last] : worker.unreleased) {
        for (std::uint64_t i = first; i <= last; ++i) {
            releaseContents(asyncFolders[i]);
            releaseContents(asyncFiles[i]);
        }
    }
    worker.unreleased.clear();
}

// Notes the longest component and throws the failure of the lowest folder.
// A worker leaves its own range only when it fails or when all of it is taken,
// and the folders of a range are taken in order: so every folder below the
// lowest that failed has been encoded.
void HuffmanPathTree::collect(const std::vector<Worker>& workers) {
    const Worker* failed = nullptr;
    for (const Worker& worker : workers)
        if (worker.failure &&
            (failed == nullptr || worker.folder < failed->folder))
            failed = &worker;
    if (failed == nullptr) {
        for (const Worker& worker : workers) raiseMaxCodeBytes(worker.longest);
        return;
    }
    // What encoding in order would have met.
    raiseMaxCodeBytes(failed->longestInFolder);
    const auto include = [this](const PackedComponents& list) {
        for (const ComponentView component : list)
            raiseMaxCodeBytes(component.size());
    };
    for (std::uint64_t i = 0; i < failed->folder; ++i) {
        include(encodedFolders[i]);
        include(encodedFiles[i]);
    }
    std::rethrow_exception(failed->failure);
}

void HuffmanPathTree::generateCodeForPath(std::uint64_t first,
                                          std::uint64_t last) {
    Worker worker;
    reserveBuffers(worker);
    try {
        encodeFolders(first, last, worker);
    } catch (...) {
        worker.failure = std::current_exception();
    }
    keepBuffers(worker);
    raiseMaxCodeBytes(std::max(worker.longest, worker.longestInFolder));
    if (worker.failure) std::rethrow_exception(worker.failure);
}

PackedComponents HuffmanPathTree::encodeAll(
    const std::vector<std::u16string>& texts, Worker& worker) const {
    for (const std::u16string& text : texts) {
        const std::size_t length = encodedBytes(text);
        std::uint8_t* to = worker.packer.extend(length);
        if (length > 0) encodeTo(text, to);
        worker.longestInFolder =
            std::max<std::uint64_t>(worker.longestInFolder, length);
    }
    return worker.packer.finish();
}

void HuffmanPathTree::encodeFolders(std::uint64_t first, std::uint64_t last,
                                    Worker& worker) {
    for (std::uint64_t i = first; i <= last && i < asyncFolders.size(); ++i) {
        worker.folder = i;
        worker.longestInFolder = 0;
        const PackedComponents folder = encodeAll(asyncFolders[i], worker);
        {
            const std::lock_guard lock(folderResultMutex);
            encodedFolders[i] = folder;
        }
        const PackedComponents names = encodeAll(asyncFiles[i], worker);
        const std::lock_guard lock(fileResultMutex);
        encodedFiles[i] = names;
        worker.longest = std::max(worker.longest, worker.longestInFolder);
    }
}

// The encoded lists stand in the packer's buffers, which from the worker's end
// on live as long as they do. Their place is made before, when that may fail.
void HuffmanPathTree::reserveBuffers(Worker& worker) {
    const std::lock_guard lock(folderResultMutex);
    worker.buffersAt = encodedBuffers.size();
    encodedBuffers.emplace_back();
}

void HuffmanPathTree::keepBuffers(Worker& worker) noexcept {
    const std::lock_guard lock(folderResultMutex);
    encodedBuffers[worker.buffersAt] = worker.packer.takeBuffers();
}

void HuffmanPathTree::joinAllGenThreads() {
    for (std::thread& worker : genThreads)
        if (worker.joinable()) worker.join();
    releaseContents(genThreads);
}

void HuffmanPathTree::clearThreadResources() {
    releaseContents(asyncFolders);
    releaseContents(asyncFiles);
    releaseContents(encodedFolders);
    releaseContents(encodedFiles);
    releaseContents(encodedBuffers);
}

// ---- Insertion ----

namespace {

// The hashes of a batch's folders, computed some folders ahead so that what
// the memo will touch is on its way when its turn comes.
class FoldersAhead {
public:
    FoldersAhead(const std::vector<PackedComponents>& list,
                 const FolderMemo& batchMemo)
        : folders_(list), memo_(batchMemo) {
        for (std::size_t i = 0; i < farthest; ++i) begin(i);
    }

    // The hash of folder i; folders are asked for one after the other.
    std::uint32_t hashOf(std::size_t i) {
        begin(i + farthest);
        if (i + 2 * stride < folders_.size())
            memo_.fetchFolder(hashes_[(i + 2 * stride) % ring]);
        if (i + stride < folders_.size())
            memo_.fetchNode(hashes_[(i + stride) % ring]);
        return hashes_[i % ring];
    }

private:
    static constexpr std::size_t stride = 5;
    static constexpr std::size_t farthest = 3 * stride;
    static constexpr std::size_t ring = 16;  // more than farthest
    static_assert(ring > farthest);

    void begin(std::size_t i) {
        if (i >= folders_.size()) return;
        hashes_[i % ring] = FolderMemo::hashOf(folders_[i]);
        memo_.fetchEntry(hashes_[i % ring]);
    }

    const std::vector<PackedComponents>& folders_;
    const FolderMemo& memo_;
    std::array<std::uint32_t, ring> hashes_{};
};

}  // namespace

void HuffmanPathTree::addPathToBTreeFromAsyncData() {
    const std::size_t folders = encodedFolders.size();
    FolderMemo memo;
    FoldersAhead ahead(encodedFolders, memo);
    PathTrack track;
    for (std::size_t i = 0; i < folders; ++i)
        insertEncoded(i, ahead.hashOf(i), memo, track);
    clearThreadResources();
    // Search memory is worth keeping only while it serves many more folders
    // than this batch had.
    constexpr std::size_t childrenWorthAFolder = 16;
    pathTree->releaseFinder(folders * childrenWorthAFolder);
}

// Inserts partition i of the batch; `track` is memory to work in.
void HuffmanPathTree::insertEncoded(std::size_t i, std::uint32_t hash,
                                    FolderMemo& memo, PathTrack& track) {
    const PackedComponents& folderComponents = encodedFolders[i];
    const PackedComponents& fileNames = encodedFiles[i];
    reserveForPartition(folderComponents.size());
    track.clear();
    track.reserve(folderComponents.size() + 1);
    const FolderMemo::Folder* known = memo.find(folderComponents, hash);
    if (known != nullptr) {
        const auto positions = memo.trackOf(*known);
        track.assign(positions.begin(), positions.end());
        const std::uint64_t first = pathTree->addFiles(*known->node, fileNames);
        notePartition(track, true, first, fileNames.size());
        return;
    }
    const std::size_t depth = folderComponents.size();
    memo.reserveFor(depth);
    const BPathTree::AddedBatch added =
        pathTree->addBatch(folderComponents, fileNames, track);
    notePartition(track, added.existed, added.firstFile, fileNames.size());
    // Without components the root takes the files and never counts as found.
    if (depth == 0) return;
    track.resize(depth);
    memo.add(folderComponents, hash, added.folder, track);
}

void HuffmanPathTree::addPathToBTree(Components& folderComponents,
                                     Components& fileNames) {
    const std::size_t fileCount = fileNames.size();
    reserveForPartition(folderComponents.size());
    PathTrack track;
    track.reserve(folderComponents.size() + 1);
    std::uint64_t first = 0;
    const bool existed =
        pathTree->addPath(folderComponents, fileNames, track, first);
    notePartition(track, existed, first, fileCount);
}

// After this, notePartition cannot throw, so that the tree and the
// bookkeeping never disagree.
void HuffmanPathTree::reserveForPartition(std::size_t trackLength) {
    reserveGently(partitionEnds, 1);
    partitionTracks.reserveFor(trackLength + 1);
}

// The track has room for one more position.
void HuffmanPathTree::notePartition(PathTrack& track, bool existed,
                                    std::uint64_t firstFileIndex,
                                    std::size_t fileCount) {
    if (existed) {
        track.push_back(firstFileIndex);
        maxPartitionTrackLength =
            std::max<std::uint64_t>(maxPartitionTrackLength, track.size());
    }
    pathCount += fileCount;
    endsAscend_ = endsAscend_ &&
                  (partitionEnds.empty() || partitionEnds.back() <= pathCount);
    partitionEnds.push_back(pathCount);
    partitionTracks.push_back(track);
}

void HuffmanPathTree::addPathToBTree(Components& components) {
    PathTrack track;
    const bool existed = pathTree->addPath(components, track);
    const std::uint64_t number = pathCount + 1;
    if (existed) {
        const std::uint64_t length = track.size();
        duplicates[number] = std::move(track);
        maxDuplicateTrackLength = std::max(maxDuplicateTrackLength, length);
        maxDuplicatePathNumber = std::max(maxDuplicatePathNumber, number);
    }
    pathCount = number;
}

bool HuffmanPathTree::hasDuplicate(std::uint64_t pathNumber) const {
    return duplicates.contains(pathNumber);
}

}  // namespace tessel
