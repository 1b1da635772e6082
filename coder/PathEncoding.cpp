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
    explicit BitWriter(std::uint8_t* to) noexcept : out(to) {}

    // Appends the `count` (at most 56) low bits; those above must be 0.
    void put(std::uint64_t bits, unsigned count) noexcept {
        held |= bits << heldBits;
        heldBits += count;
        flush();
    }

    // Ends the block: the last bits, then how many they are.
    void finish() noexcept {
        *out++ = static_cast<std::uint8_t>(held);
        *out++ = static_cast<std::uint8_t>(heldBits);
    }

private:
    void flush() noexcept {
        static_assert(std::endian::native == std::endian::little);
        std::memcpy(out, &held, sizeof held);
        const unsigned full = heldBits / bitsPerByte;
        out += full;
        held = full == sizeof held ? 0 : held >> (full * bitsPerByte);
        heldBits %= bitsPerByte;
    }

    std::uint8_t* out;
    std::uint64_t held = 0;
    unsigned heldBits = 0;  // below 8 between calls
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

// What a worker leaves behind; on a cache line of its own, because workers
// write theirs all the time.
struct alignas(64) HuffmanPathTree::WorkerOutcome {
    std::uint64_t longest = 0;  // component up to the failure
    std::exception_ptr failure;
};

std::vector<std::pair<std::uint64_t, std::uint64_t>>
HuffmanPathTree::splitFolders(std::uint64_t n, unsigned hardwareThreads) {
    const std::uint64_t threads =
        hardwareThreads == 0 ? threadsIfUnknown : hardwareThreads;
    const std::uint64_t workers = std::min(threads, n);
    const std::uint64_t chunk = n / workers;
    std::vector<std::pair<std::uint64_t, std::uint64_t>> ranges;
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
    if (folders.size() != files.size())
        throw std::invalid_argument(
            "Each folder needs exactly one list of files.");
    if (folders.empty()) return;
    joinAllGenThreads();
    clearThreadResources();
    encodedFolders.resize(folders.size());
    encodedFiles.resize(folders.size());
    asyncFolders = std::exchange(folders, {});
    asyncFiles = std::exchange(files, {});
    if (asyncFolders.size() == 1)
        generateCodeForPath(0, 0);
    else
        encodeOnWorkers(hardwareThreads);
    addPathToBTreeFromAsyncData();
}

void HuffmanPathTree::encodeOnWorkers(unsigned hardwareThreads) {
    const auto ranges = splitFolders(asyncFolders.size(), hardwareThreads);
    std::vector<WorkerOutcome> outcomes(ranges.size());
    try {
        genThreads.reserve(ranges.size());
        for (std::size_t w = 0; w < ranges.size(); ++w)
            genThreads.emplace_back(
                [this, range = ranges[w], &outcome = outcomes[w]] {
                    encodeRange(range.first, range.second, outcome);
                });
    } catch (...) {
        outcomes[genThreads.size()].failure = std::current_exception();
    }
    joinAllGenThreads();
    for (const WorkerOutcome& outcome : outcomes) {
        raiseMaxCodeBytes(outcome.longest);
        if (outcome.failure) std::rethrow_exception(outcome.failure);
    }
}

void HuffmanPathTree::generateCodeForPath(std::uint64_t first,
                                          std::uint64_t last) {
    WorkerOutcome outcome;
    encodeRange(first, last, outcome);
    raiseMaxCodeBytes(outcome.longest);
    if (outcome.failure) std::rethrow_exception(outcome.failure);
}

// Encodes the texts and releases them: what is still warm is freed fastest,
// and the batch need not stand in memory twice.
PackedComponents HuffmanPathTree::encodeAll(std::vector<std::u16string>& texts,
                                            ComponentPacker& packer,
                                            std::uint64_t& longest) const {
    for (const std::u16string& text : texts) {
        const std::size_t length = encodedBytes(text);
        std::uint8_t* to = packer.extend(length);
        if (length > 0) encodeTo(text, to);
        longest = std::max<std::uint64_t>(longest, length);
    }
    releaseContents(texts);
    return packer.finish();
}

void HuffmanPathTree::encodeRange(std::uint64_t first, std::uint64_t last,
                                  WorkerOutcome& outcome) noexcept {
    ComponentPacker packer;
    try {
        for (std::uint64_t i = first; i <= last && i < asyncFolders.size();
             ++i) {
            const PackedComponents folder =
                encodeAll(asyncFolders[i], packer, outcome.longest);
            {
                const std::lock_guard lock(folderResultMutex);
                encodedFolders[i] = folder;
            }
            const PackedComponents names =
                encodeAll(asyncFiles[i], packer, outcome.longest);
            const std::lock_guard lock(fileResultMutex);
            encodedFiles[i] = names;
        }
    } catch (...) {
        outcome.failure = std::current_exception();
    }
    keepBuffers(packer, outcome);
}

// The encoded lists stand in the packer's buffers, which from now on live as
// long as they do.
void HuffmanPathTree::keepBuffers(ComponentPacker& packer,
                                  WorkerOutcome& outcome) noexcept {
    try {
        const std::lock_guard lock(folderResultMutex);
        encodedBuffers.push_back(packer.takeBuffers());
    } catch (...) {
        if (!outcome.failure) outcome.failure = std::current_exception();
    }
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
        : folders(list), memo(batchMemo) {
        for (std::size_t i = 0; i < farthest; ++i) begin(i);
    }

    // The hash of folder i; folders are asked for one after the other.
    std::uint32_t hashOf(std::size_t i) {
        begin(i + farthest);
        if (i + 2 * stride < folders.size())
            memo.fetchFolder(hashes[(i + 2 * stride) % ring]);
        if (i + stride < folders.size())
            memo.fetchNode(hashes[(i + stride) % ring]);
        return hashes[i % ring];
    }

private:
    static constexpr std::size_t stride = 5;
    static constexpr std::size_t farthest = 3 * stride;
    static constexpr std::size_t ring = 16;  // more than farthest
    static_assert(ring > farthest);

    void begin(std::size_t i) {
        if (i >= folders.size()) return;
        hashes[i % ring] = FolderMemo::hashOf(folders[i]);
        memo.fetchEntry(hashes[i % ring]);
    }

    const std::vector<PackedComponents>& folders;
    const FolderMemo& memo;
    std::array<std::uint32_t, ring> hashes{};
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
    BNode* folder = nullptr;
    bool existed = known != nullptr;
    if (existed) {
        folder = known->node;
        const auto positions = memo.trackOf(*known);
        track.assign(positions.begin(), positions.end());
    } else {
        folder = &pathTree->addFolder(folderComponents, track, existed);
        // Without components the root takes the files and never counts as
        // found.
        if (!folderComponents.empty())
            memo.add(folderComponents, hash, *folder, track);
    }
    const std::uint64_t first = pathTree->addFiles(*folder, fileNames);
    notePartition(track, existed, first, fileNames.size());
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
    endsAscend = endsAscend &&
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
