#include "binding/Methods.hpp"

#include <string>
#include <unordered_map>
#include <vector>

#include "binding/Conversions.hpp"
#include "binding/Errors.hpp"
#include "binding/PathCells.hpp"
#include "coder/PathIteration.hpp"

namespace tessel::binding {

namespace {

namespace errors = VELOX::datastoreio::huffmanpaths;

using CharacterCounts = std::unordered_map<char16_t, double>;

void countText(CharacterCounts& counts, const HostArray* text) {
    for (const char16_t character : host().hostGetUString(text))
        counts[character] += 1.0;
}

void countTexts(CharacterCounts& counts, const HostArray* cell) {
    HostInterface& from = host();
    const std::size_t count = from.hostNumel(cell);
    for (std::size_t i = 0; i < count; ++i)
        countText(counts, from.hostCellElement(cell, i));
}

// Counts the characters of `total` / 2 folders, all of them texts or all of
// them cells of texts as the first one is, and of as many cells of files.
CharacterCounts countCharacters(const HostArray* foldersAndFiles,
                                std::size_t total) {
    HostInterface& from = host();
    CharacterCounts counts;
    const bool foldersAreCells =
        from.hostIsCell(from.hostCellElement(foldersAndFiles, 0));
    const auto countFolder = foldersAreCells ? countTexts : countText;
    for (std::size_t i = 0; i < total; ++i) {
        const HostArray* const element =
            from.hostCellElement(foldersAndFiles, i);
        (i < total / 2 ? countFolder : countTexts)(counts, element);
    }
    return counts;
}

void fillFromFiles(HuffmanPathTree& coder, const HostArray* foldersAndFiles) {
    const std::size_t total = host().hostNumel(foldersAndFiles);
    if (total % 2 != 0) raiseHostError(errors::fileListNotEven());
    if (total == 0) return;
    coder.deflateHuffman(countCharacters(foldersAndFiles, total));
}

void fillFromFrequencies(HuffmanPathTree& coder, const HostArray* characters,
                         const HostArray* frequencies) {
    const std::u16string alphabet = host().hostGetUString(characters);
    coder.deflateHuffman(host().hostDoubleData(frequencies, alphabet.size()),
                         alphabet);
}

void fillFromStoredForm(HuffmanPathTree& coder, const HostArray* treeString,
                        const HostArray* pathTree,
                        const HostArray* frequencies) {
    if (host().hostNumel(treeString) != 0) {
        const std::u16string characters = host().hostGetUString(treeString);
        std::vector<std::uint8_t> storedForm = bytes(pathTree);
        coder.deserialize(storedForm, true);
        coder.inflateHuffman(characters);
    }
    std::vector<double> values = doubles(frequencies);
    coder.setFrequencies(values);
}

struct CountLimits {
    std::int32_t minInputs;
    std::int32_t maxInputs;
    std::int32_t maxOutputs;
};

void checkCounts(const HostFrame& frame, CountLimits limits) {
    HostInterface& to = host();
    if (frame.outputCount > limits.maxOutputs) {
        to.hostErrorTooManyOutputs();
    } else if (frame.inputCount > limits.maxInputs) {
        to.hostErrorTooManyInputs();
    } else if (frame.inputCount < limits.minInputs) {
        to.hostErrorTooFewInputs();
    } else {
        return;
    }
    throw HostReturnedException();
}

}  // namespace

void SignatureReleaser::operator()(HostSignature* signature) const noexcept {
    host().hostReleaseSignature(signature);
}

void runReportingAllocationFailure(MethodBody body, HostFrame& frame) {
    reportingAllocationFailure([&] { body(frame); });
}

void construct(HostFrame& frame) {
    checkCounts(frame, {0, 4, 1});
    HuffmanPathTree& coder = coderOf(frame.outputs[0]);
    const HostArray* const* const inputs = frame.inputs;
    if (frame.inputCount < 2) return;
    const std::string mode = host().hostGetString(inputs[0]);
    if (frame.inputCount == 4 && mode == "tree") {
        fillFromStoredForm(coder, inputs[1], inputs[2], inputs[3]);
    } else if (frame.inputCount == 3 && mode == "frequencies") {
        fillFromFrequencies(coder, inputs[1], inputs[2]);
    } else if (frame.inputCount == 2 && mode == "copy") {
        coder.copyTree(coderOf(inputs[1]));
    } else if (frame.inputCount == 2 && mode == "files") {
        fillFromFiles(coder, inputs[1]);
    }
}

void addPaths(HostFrame& frame) {
    checkCounts(frame, {3, 3, 0});
    HuffmanPathTree& coder = coderOf(frame.inputs[0]);
    const HostArray* const folderCell = frame.inputs[1];
    const HostArray* const fileCell = frame.inputs[2];
    if (host().hostNumel(folderCell) != host().hostNumel(fileCell))
        raiseHostError(errors::unequalNumFolderFileList());
    TextLists folders = textLists(folderCell, Element::Folder);
    TextLists files = textLists(fileCell, Element::File);
    coder.generateCodeAsyncAndAddPaths(folders, files);
}

void getPaths(HostFrame& frame) {
    checkCounts(frame, {2, 3, 2});
    if (frame.outputCount == 0) return;
    PathCells cells(coderOf(frame.inputs[0]));
    const std::vector<double> numbers = doubles(frame.inputs[1]);
    if (frame.inputCount == 3) {
        const std::u16string separator = host().hostGetUString(frame.inputs[2]);
        frame.outputs[0] = cells.joined(numbers, separator).release();
        return;
    }
    PathCells::FoldersAndFiles found = cells.foldersAndFiles(numbers);
    frame.outputs[0] = found.folders.release();
    frame.outputs[1] = found.files.release();
}

void getNextPath(HostFrame& frame) {
    checkCounts(frame, {1, 1, 1});
    HuffmanPathTree& coder = coderOf(frame.inputs[0]);
    OwnedArray names;
    PathIteration(*coder.pathTree, coder.numbering())
        .visitNext([&](const PathView& path) {
            names = PathCells(coder).components(path);
        });
    frame.outputs[0] = names.release();
}

void hasNextPath(HostFrame& frame) {
    checkCounts(frame, {1, 1, 1});
    HuffmanPathTree& coder = coderOf(frame.inputs[0]);
    OwnedArray answer = createLogical(coder.hasNextPathFromBTree());
    if (frame.outputCount == 0) frame.outputCount = 1;
    frame.outputs[0] = answer.release();
}

void reset(HostFrame& frame) {
    checkCounts(frame, {1, 1, 0});
    coderOf(frame.inputs[0]).resetPathsToBTree();
}

void serialize(HostFrame& frame) {
    checkCounts(frame, {1, 1, 2});
    HuffmanPathTree& coder = coderOf(frame.inputs[0]);
    OwnedArray treeString = createText(coder.getTreeString());
    if (frame.outputCount == 2) {
        std::vector<std::uint8_t> storedForm;
        coder.serialize(storedForm, true);
        frame.outputs[1] = column(storedForm).release();
    }
    frame.outputs[0] = treeString.release();
}

}  // namespace tessel::binding
