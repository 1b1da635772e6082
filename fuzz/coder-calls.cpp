// Coders under wrong callers: any public operation in any order, twice, with
// what belongs to another coder, and with public state that was edited. Each
// call answers or throws a documented exception.
//
// Input: calls, each a byte that names it and the bytes that it takes.
#include <algorithm>
#include <array>
#include <cstdint>
#include <limits>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

#include "coder/PathNumbering.hpp"
#include "coder/PathRetrieval.hpp"
#include "fuzz/CallInput.hpp"
#include "fuzz/Coders.hpp"

namespace tessel::fuzz {
namespace {

using FolderTexts = HuffmanPathTree::FolderTexts;

class CoderCalls {
public:
    explicit CoderCalls(Input input) : input_(input) {
        for (auto& coder : coders_) coder = std::make_unique<HuffmanPathTree>();
    }

    void run() {
        for (std::size_t i = 0; i < maxCalls && !input_.empty(); ++i)
            answered([&] { call(); });
    }

private:
    using Call = void (CoderCalls::*)();

    void call() {
        static constexpr std::array calls{
            &CoderCalls::build,          &CoderCalls::buildInSteps,
            &CoderCalls::buildFromQueue, &CoderCalls::traverse,
            &CoderCalls::addCode,        &CoderCalls::inflate,
            &CoderCalls::setTexts,       &CoderCalls::encode,
            &CoderCalls::addBatch,       &CoderCalls::addOwnBatch,
            &CoderCalls::prepareBatch,   &CoderCalls::encodeRange,
            &CoderCalls::finishBatch,    &CoderCalls::startWorker,
            &CoderCalls::addComponents,  &CoderCalls::decode,
            &CoderCalls::iterate,        &CoderCalls::fetch,
            &CoderCalls::store,          &CoderCalls::restore,
            &CoderCalls::restoreTree,    &CoderCalls::replace,
            &CoderCalls::editCode,       &CoderCalls::editNode,
            &CoderCalls::editNumbers,    &CoderCalls::editLists,
            &CoderCalls::editTree};
        const Call chosen = calls[input_.byte() % calls.size()];
        (this->*chosen)();
    }

    HuffmanPathTree& coder() {
        return *coders_[input_.byte() % coders_.size()];
    }

    // A few characters, so that texts and codes meet.
    char16_t character() {
        return static_cast<char16_t>('a' + input_.byte() % 6);
    }
    std::u16string text() {
        std::u16string units;
        for (unsigned left = input_.byte() % 6; left > 0; --left)
            units.push_back(character());
        return units;
    }
    FolderTexts texts() {
        FolderTexts lists(input_.byte() % 4);
        for (auto& list : lists)
            for (unsigned left = input_.byte() % 4; left > 0; --left)
                list.push_back(text());
        return lists;
    }

    // ---- The code ----

    void build() {
        const std::u16string characters = text();
        std::vector<double> weights;
        std::unordered_map<char16_t, double> counts;
        for (const char16_t unit : characters) {
            weights.push_back(weight());
            counts[unit] = weights.back();
        }
        HuffmanPathTree& built = coder();
        switch (input_.byte() % 4) {
            case 0:
                return built.deflateHuffman(counts);
            case 1:
                return built.makeHeapAndTree(weights.data(), characters);
            case 2:
                return built.deflateHuffman(nullptr, characters);
            default:
                return built.deflateHuffman(weights.data(), characters);
        }
    }

    double weight() {
        constexpr std::array<double, 4> odd{
            std::numeric_limits<double>::quiet_NaN(),
            std::numeric_limits<double>::infinity(), -1.0, 0.0};
        const std::uint8_t choice = input_.byte();
        return choice < 0xF0 ? choice : odd[choice % odd.size()];
    }

    void buildInSteps() {
        HuffmanPathTree& built = coder();
        switch (input_.byte() % 3) {
            case 0:
                return built.generateCompressedTree();
            case 1:
                return built.generateCode();
            default:
                built.codeOf(character());
        }
    }

    HNode node() {
        HNode made;
        made.frequency = weight();
        made.character = character();
        made.index = wildPosition(input_);
        if (input_.byte() % 2 == 0) made.left = wildPosition(input_);
        if (input_.byte() % 2 == 0) made.right = wildPosition(input_);
        return made;
    }

    void buildFromQueue() {
        HuffmanPathTree::HeapQueue queue;
        for (unsigned left = input_.byte() % 5; left > 0; --left)
            queue.push(node());
        coder().generateTree(queue);
    }

    // The visitor may change the tree that it is shown.
    void traverse() {
        const std::uint8_t kind = input_.byte() % 3;
        coder().traverse([&](HuffmanPathTree* seen, HNode& shown) {
            shown.left = shown.right = wildPosition(input_);
            if (kind == 0) seen->nodes.clear();
            if (kind == 1) seen->rootIndex = wildPosition(input_);
        });
    }

    void addCode() { coder().addCode(node()); }

    void inflate() {
        HuffmanPathTree& inflated = coder();
        switch (input_.byte() % 4) {
            case 0:
                inflated.inflateFromBoolTree();
                return;
            case 1:
                return inflated.inflateFromCompressedTree();
            case 2:
                return inflated.inflate();
            default:
                return inflated.inflateHuffman(
                    input_.byte() % 2 == 0 ? coder().treeString : text());
        }
    }

    void setTexts() {
        coder().setTreeString(input_.byte() % 2 == 0 ? coder().treeString
                                                     : text());
        coder().setFrequencies(coder().frequencies);
        coder().getFrequencies();
        coder().getBoolTree();
    }

    // ---- Adding ----

    void encode() { component_ = coder().generateCodeFor(text()); }

    void addBatch() {
        FolderTexts folders = texts();
        FolderTexts files = texts();
        HuffmanPathTree& to = coder();
        const auto threads = static_cast<unsigned>(wildNumber(input_));
        if (input_.byte() % 8 == 0)
            return to.generateCodeAsyncAndAddPaths(folders, folders, threads);
        files.resize(folders.size());
        to.generateCodeAsyncAndAddPaths(folders, files, threads);
    }

    // What a refused batch left, or another coder's.
    void addOwnBatch() {
        HuffmanPathTree& from = coder();
        coder().generateCodeAsyncAndAddPaths(from.asyncFolders, from.asyncFiles,
                                             2);
    }

    void prepareBatch() {
        HuffmanPathTree& to = coder();
        to.asyncFolders = texts();
        to.asyncFiles = texts();
        to.encodedFolders.resize(input_.byte() % 5);
        to.encodedFiles.resize(input_.byte() % 5);
    }

    void encodeRange() {
        const std::uint64_t first = wildNumber(input_);
        coder().generateCodeForPath(first, wildNumber(input_));
    }

    void finishBatch() {
        HuffmanPathTree& to = coder();
        switch (input_.byte() % 3) {
            case 0:
                return to.clearThreadResources();
            case 1:
                return to.joinAllGenThreads();
            default:
                return to.addPathToBTreeFromAsyncData();
        }
    }

    // A worker of the caller, also one that ended or was never started.
    void startWorker() {
        HuffmanPathTree& to = coder();
        if (input_.byte() % 2 == 0)
            to.genThreads.emplace_back();
        else
            to.genThreads.emplace_back([] {});
        HuffmanPathTree::splitFolders(wildNumber(input_), input_.byte());
    }

    void addComponents() {
        Components folder = takeComponents(input_);
        Components files = takeComponents(input_);
        HuffmanPathTree& to = coder();
        switch (input_.byte() % 4) {
            case 0:
                return to.addPathToBTree(files);
            case 1:
                return to.addPathToBTree(files, files);
            case 2:
                files.push_back(component_);
                return to.addPathToBTree(files);
            default:
                return to.addPathToBTree(folder, files);
        }
    }

    // ---- Reading ----

    void decode() {
        const HuffmanPathTree& from = coder();
        answered([&] { from.generatePathFrom(takeComponent(input_)); });
        std::int32_t position = wildPosition(input_);
        std::u16string out;
        answered([&] { from.appendToPathIfLeaf(position, out); });
        out = from.generatePathFrom(component_);
        require(out.size() <= 8 * component_.size(),
                "a text has at most a character per bit");
    }

    void iterate() {
        HuffmanPathTree& from = coder();
        if (input_.byte() % 2 == 0) from.resetPathsToBTree();
        Components path;
        for (unsigned left = input_.byte() % 8; left > 0; --left)
            if (from.hasNextPathFromBTree())
                answered([&] { from.getNextPathFromBTree(path); });
        from.hasDuplicate(wildNumber(input_));
        from.getNextPathFromBTree(path);
    }

    void fetch() {
        std::vector<double> numbers;
        for (unsigned left = input_.byte() % 8; left > 0; --left)
            numbers.push_back(static_cast<double>(wildNumber(input_)) +
                              weight() * 0.001);
        std::vector<Components> folders;
        std::vector<Components> files;
        const HuffmanPathTree& from = coder();
        if (input_.byte() % 4 == 0)
            from.getPath(folders, folders, numbers);
        else
            from.getPath(folders, files, numbers);
        require(files.size() <= numbers.size(), "a number meets one folder");
    }

    void store() {
        form_.clear();
        coder().serialize(form_, compressed_ = input_.byte() % 2 == 0);
        coder().memoryUsage();
    }

    void restore() {
        if (!form_.empty() && input_.byte() % 2 == 0)
            form_[input_.number() % form_.size()] = input_.byte();
        std::vector<std::uint8_t> bytes = form_;
        coder().deserialize(bytes, compressed_);
    }

    void restoreTree() {
        std::vector<std::uint8_t> codes;
        Components values;
        coder().serializePathTree(codes, values);
        if (!codes.empty() && input_.byte() % 2 == 0)
            codes[input_.byte() % codes.size()] = input_.byte() % 5;
        coder().deserializePathTree(codes, values);
    }

    void replace() {
        if (input_.byte() % 2 == 0) return coder().copyTree(coder());
        coders_[input_.byte() % coders_.size()] =
            std::make_unique<HuffmanPathTree>();
    }

    // ---- Editing the public state ----

    void editCode() {
        HuffmanPathTree& edited = coder();
        switch (input_.byte() % 7) {
            case 0:
                edited.boolTree.push_back(input_.byte() % 2 == 0);
                return;
            case 1:
                edited.boolTree.resize(input_.byte() % 16);
                return;
            case 2:
                edited.rootIndex = wildPosition(input_);
                return;
            case 3:
                edited.parentOf.resize(input_.byte() % 16,
                                       wildPosition(input_));
                return;
            case 4:
                edited.codes = coder().codes;
                return;
            case 5:
                return editCodeTable(edited.codes);
            default:
                edited.frequencies.clear();
        }
    }

    void editCodeTable(CodeTable& codes) {
        CodeTable::Entry entry;
        entry.bits = wildNumber(input_);
        entry.leaf = wildPosition(input_);
        entry.length = input_.byte();
        entry.isLong = input_.byte() % 2 == 0;
        if (input_.byte() % 4 == 0) codes.clear();
        codes.insert(character(), entry);
    }

    void editNode() {
        HuffmanPathTree& edited = coder();
        switch (input_.byte() % 4) {
            case 0:
                edited.nodes.clear();
                return;
            case 1:
                edited.nodes.push_back(node());
                return;
            case 2:
                edited.nodes = coder().nodes;
                return;
            default:
                if (!edited.nodes.empty())
                    edited.nodes[input_.byte() % edited.nodes.size()] = node();
        }
    }

    void editNumbers() {
        HuffmanPathTree& edited = coder();
        const std::uint64_t value = wildNumber(input_);
        switch (input_.byte() % 7) {
            case 0:
                edited.pathCount = value;
                return;
            case 1:
                edited.nextPathNumber = value;
                return;
            case 2:
                edited.maxCodeBytes = value;
                return;
            case 3:
                edited.maxPartitionTrackLength = value;
                return;
            case 4:
                edited.maxDuplicateTrackLength = value;
                return;
            case 5:
                edited.maxDuplicatePathNumber = value;
                return;
            default:
                edited.numbering().partitionAtOrAfter(value,
                                                      wildNumber(input_));
        }
    }

    void editLists() {
        HuffmanPathTree& edited = coder();
        switch (input_.byte() % 7) {
            case 0:
                edited.partitionEnds.push_back(wildNumber(input_));
                return;
            case 1:
                std::ranges::reverse(edited.partitionEnds);
                return;
            case 2:
                edited.partitionEnds.clear();
                return;
            case 3:
                edited.partitionTracks.push_back(takeTrack(input_));
                return;
            case 4:
                edited.partitionTracks = coder().partitionTracks;
                return;
            case 5:
                edited.duplicates[wildNumber(input_)] = takeTrack(input_);
                return;
            default:
                edited.numbering().checkEnds();
        }
    }

    void editTree() {
        HuffmanPathTree& edited = coder();
        HuffmanPathTree& other = coder();
        switch (input_.byte() % 4) {
            case 0:
                edited.pathTree.reset();
                return;
            case 1:
                std::swap(edited.pathTree, other.pathTree);
                return;
            case 2:
                edited.pathTree = std::make_unique<BPathTree>();
                return;
            default:
                if (edited.pathTree && other.pathTree)
                    edited.pathTree->root = other.pathTree->root;
        }
    }

    Input input_;
    std::array<std::unique_ptr<HuffmanPathTree>, 3> coders_;
    Component component_;
    std::vector<std::uint8_t> form_;
    bool compressed_ = false;
};

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::CoderCalls({data, size}).run();
    return 0;
}
