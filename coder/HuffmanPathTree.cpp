#include "coder/HuffmanPathTree.hpp"

#include <stdexcept>

#include "coder/BatchEncoder.hpp"
#include "coder/BatchInserter.hpp"
#include "coder/ComponentDecoder.hpp"
#include "coder/ComponentEncoder.hpp"
#include "coder/HuffmanCode.hpp"
#include "coder/PathIteration.hpp"
#include "coder/PathNumbering.hpp"
#include "coder/PathRetrieval.hpp"
#include "pathtree/TreeInserter.hpp"
#include "pathtree/containers.hpp"

namespace tessel {

namespace {

// The map's entries in the map's own order.
struct CharacterList {
    explicit CharacterList(const std::unordered_map<char16_t, double>& map) {
        for (const auto& [character, frequency] : map) {
            characters.push_back(character);
            frequencies.push_back(frequency);
        }
    }

    std::u16string characters;
    std::vector<double> frequencies;
};

}  // namespace

// No worker is there yet that could write to the batch.
HuffmanPathTree::HuffmanPathTree() QZTESSEL_NO_THREAD_SAFETY
    : code_(std::make_unique<HuffmanCode>()),
      numbering_(std::make_unique<PathNumbering>()),
      batch_(std::make_unique<Batch>()),
      boolTree(code_->boolTree),
      treeString(code_->treeString),
      frequencies(code_->frequencies),
      rootIndex(code_->rootIndex),
      nodes(code_->nodes),
      codes(code_->codes),
      parentOf(code_->parentOf),
      pathTree(std::make_unique<BPathTree>()),
      duplicates(numbering_->duplicates),
      partitionEnds(numbering_->partitionEnds),
      partitionTracks(numbering_->partitionTracks),
      maxPartitionTrackLength(numbering_->maxPartitionTrackLength),
      maxDuplicateTrackLength(numbering_->maxDuplicateTrackLength),
      maxCodeBytes(numbering_->maxCodeBytes),
      maxDuplicatePathNumber(numbering_->maxDuplicatePathNumber),
      nextPathNumber(numbering_->nextPathNumber),
      pathCount(numbering_->pathCount),
      asyncFolders(batch_->folders),
      asyncFiles(batch_->files),
      encodedFolders(batch_->encodedFolders),
      encodedFiles(batch_->encodedFiles),
      folderResultMutex(batch_->folderResultMutex),
      fileResultMutex(batch_->fileResultMutex) {}

HuffmanPathTree::~HuffmanPathTree() { joinAllGenThreads(); }

BPathTree& HuffmanPathTree::tree() const {
    if (pathTree == nullptr)
        throw std::logic_error("The coder's path tree was taken away.");
    return *pathTree;
}

// ---- The Huffman code ----

void HuffmanPathTree::deflateHuffman(const double* characterFrequencies,
                                     const std::u16string& characters) {
    code_->build(characterFrequencies, characters);
}

void HuffmanPathTree::deflateHuffman(
    const std::unordered_map<char16_t, double>& characterFrequencies) {
    const CharacterList list(characterFrequencies);
    code_->build(list.frequencies.data(), list.characters);
}

void HuffmanPathTree::makeHeapAndTree(const double* characterFrequencies,
                                      const std::u16string& characters) {
    code_->makeHeapAndTree(characterFrequencies, characters);
}

void HuffmanPathTree::makeHeapAndTree(
    const std::unordered_map<char16_t, double>& characterFrequencies) {
    const CharacterList list(characterFrequencies);
    code_->makeHeapAndTree(list.frequencies.data(), list.characters);
}

void HuffmanPathTree::generateTree(HeapQueue& queue) {
    code_->generateTree(queue);
}

void HuffmanPathTree::traverse(Visitor visit) {
    code_->traverse([&](HNode& node) { visit(this, node); });
}

void HuffmanPathTree::generateCode() { code_->generateCode(); }

void HuffmanPathTree::addCode(const HNode& leaf) { code_->addCode(leaf); }

std::vector<bool> HuffmanPathTree::codeOf(char16_t character) const {
    return code_->codeOf(character);
}

std::vector<double> HuffmanPathTree::getFrequencies() const {
    return code_->frequencies;
}

void HuffmanPathTree::setFrequencies(std::vector<double>& newFrequencies) {
    code_->frequencies = std::exchange(newFrequencies, {});
}

// All copies are made before the first member is replaced.
void HuffmanPathTree::copyTree(const HuffmanPathTree& other) {
    auto newTree = std::make_unique<BPathTree>(other.tree());
    if (&other != this) {
        HuffmanCode newCode = *other.code_;
        PathNumbering newNumbering = *other.numbering_;
        *code_ = std::move(newCode);
        *numbering_ = std::move(newNumbering);
    }
    pathTree = std::move(newTree);
}

// ---- Compact form ----

void HuffmanPathTree::generateCompressedTree() {
    code_->generateCompressedTree();
}

std::vector<bool> HuffmanPathTree::getBoolTree() const {
    return code_->boolTree;
}

std::u16string HuffmanPathTree::getTreeString() const {
    return code_->treeString;
}

void HuffmanPathTree::setTreeString(const std::u16string& newTreeString) {
    code_->treeString = newTreeString;
}

std::size_t HuffmanPathTree::inflateFromBoolTree() {
    return code_->inflateFromBoolTree();
}

void HuffmanPathTree::inflateFromCompressedTree() {
    code_->inflateFromCompressedTree();
}

void HuffmanPathTree::inflate() { code_->inflate(); }

void HuffmanPathTree::inflateHuffman(const std::u16string& newTreeString) {
    code_->restore(newTreeString);
}

// ---- Encoding and adding ----

Component HuffmanPathTree::generateCodeFor(const std::u16string& text) {
    const ComponentEncoder encoder(*code_);
    const std::size_t length = encoder.bytesFor(text);
    Component bytes(length + ComponentEncoder::slack);
    if (length > 0) encoder.write(text, bytes.data());
    bytes.resize(length);
    numbering_->maxCodeBytes.raise(length);
    return bytes;
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
    // The texts may be what a refused batch left in this very object.
    BatchEncoder encoder(*code_, numbering_->maxCodeBytes, folders, files);
    clearThreadResources();
    try {
        encoder.encode(hardwareThreads);
    } catch (...) {
        batch_->takeOver(encoder.batch());
        if (batch_->folders.size() > 1) batch_->clearResults();
        throw;
    }
    insertBatch(encoder.batch());
}

void HuffmanPathTree::generateCodeForPath(std::uint64_t first,
                                          std::uint64_t last) {
    const std::uint64_t end =
        last < asyncFolders.size() ? last + 1 : asyncFolders.size();
    if (first < end) batch_->requireRoom(end);
    BatchEncoder::encodeRange(*code_, *batch_, {first, end},
                              numbering_->maxCodeBytes);
}

std::vector<std::pair<std::uint64_t, std::uint64_t>>
HuffmanPathTree::splitFolders(std::uint64_t n, unsigned hardwareThreads) {
    std::vector<std::pair<std::uint64_t, std::uint64_t>> ranges;
    for (const auto [begin, end] :
         BatchEncoder::splitFolders(n, hardwareThreads))
        ranges.emplace_back(begin, end - 1);
    return ranges;
}

void HuffmanPathTree::joinAllGenThreads() {
    for (std::thread& worker : genThreads)
        if (worker.joinable()) worker.join();
    releaseContents(genThreads);
}

void HuffmanPathTree::clearThreadResources() { batch_->clear(); }

void HuffmanPathTree::addPathToBTreeFromAsyncData() { insertBatch(*batch_); }

// No worker is left that could write to the batch.
void HuffmanPathTree::insertBatch(Batch& batch) QZTESSEL_NO_THREAD_SAFETY {
    const std::size_t folders = batch.encodedFolders.size();
    if (batch.encodedFiles.size() != folders)
        throw std::logic_error("Each folder needs exactly one list of files.");
    BatchInserter(tree(), *numbering_)
        .insert(batch.encodedFolders, batch.encodedFiles);
    batch.clear();
    // Search memory is worth keeping only while it serves many more folders
    // than this batch had: it is rebuilt at about the price of an insertion
    // per child.
    constexpr std::size_t childrenWorthAFolder = 16;
    tree().inserter().releaseIndex(folders * childrenWorthAFolder);
}

void HuffmanPathTree::addPathToBTree(Components& folderComponents,
                                     Components& fileNames) {
    const std::size_t fileCount = fileNames.size();
    numbering_->reserveForPartition(folderComponents.size(), fileCount);
    PathTrack track;
    track.reserve(folderComponents.size() + 1);
    std::uint64_t first = 0;
    const bool existed =
        tree().addPath(folderComponents, fileNames, track, first);
    numbering_->notePartition(track, existed, first, fileCount);
}

void HuffmanPathTree::addPathToBTree(Components& components) {
    PathTrack track;
    const bool existed = tree().addPath(components, track);
    numbering_->noteWholePath(track, existed);
}

bool HuffmanPathTree::hasDuplicate(std::uint64_t pathNumber) const {
    return numbering_->hasDuplicate(pathNumber);
}

// ---- Decoding, iteration, retrieval ----

std::u16string HuffmanPathTree::generatePathFrom(const Component& bytes) const {
    std::u16string text;
    appendPathFrom(bytes, text);
    return text;
}

void HuffmanPathTree::appendPathFrom(ComponentView bytes,
                                     std::u16string& text) const {
    ComponentDecoder(*code_).appendText(bytes, text);
}

bool HuffmanPathTree::appendToPathIfLeaf(std::int32_t& position,
                                         std::u16string& text) const {
    return ComponentDecoder(*code_).appendIfLeaf(position, text);
}

bool HuffmanPathTree::hasNextPathFromBTree() const {
    return PathIteration(tree(), *numbering_).hasNext();
}

void HuffmanPathTree::getNextPathFromBTree(Components& components) {
    PathIteration(tree(), *numbering_).getNext(components);
}

void HuffmanPathTree::resetPathsToBTree() {
    PathIteration(tree(), *numbering_).reset();
    joinAllGenThreads();
    clearThreadResources();
}

void HuffmanPathTree::getPath(std::vector<Components>& folderPaths,
                              std::vector<Components>& filePaths,
                              const std::vector<double>& partitions) const {
    PathRetrieval(tree(), *numbering_)
        .getPath(folderPaths, filePaths, partitions);
}

// ---- Memory ----

HuffmanPathTree::MemoryUsage HuffmanPathTree::memoryUsage() const {
    const BPathTree::MemoryUsage ofTree = tree().memoryUsage();
    MemoryUsage usage;
    usage.names = ofTree.names;
    usage.nodes = ofTree.nodes;
    usage.childLists = ofTree.childLists;
    usage.partitionTracks = numbering_->partitionBytes();
    usage.duplicates = numbering_->duplicateBytes();
    usage.code = code_->memoryBytes();
    usage.batch = batch_->memoryBytes();
    usage.other = sizeof(HuffmanPathTree) + sizeof(HuffmanCode) +
                  sizeof(PathNumbering) + sizeof(Batch) + sizeof(BPathTree) +
                  sizeof(TreeInserter) + ofTree.childIndex + ofTree.iteration;
    return usage;
}

}  // namespace tessel
