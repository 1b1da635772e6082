// Routes that must agree. The same paths are added in one batch on many
// workers, in one batch on one, and folder by folder; the three coders must
// have one stored form. A coder restored from it, and each of the others, must
// give back the paths that went in.
//
// Input: a byte with the number of worker threads, a byte with the number of
// characters, the characters with their frequencies, then folders: a byte
// with the number of components, a byte with the number of files, and the
// names, each a length byte and one byte a character (a position in the code's
// characters).
#include <algorithm>
#include <cstdint>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include "fuzz/Coders.hpp"

namespace tessel::fuzz {
namespace {

using Lists = std::vector<Texts>;

struct Batch {
    Lists folders;
    Lists files;
};

std::u16string takeName(Input& input, const std::u16string& alphabet) {
    std::u16string name;
    for (std::size_t length = 1 + input.byte() % 16; length > 0; --length)
        name.push_back(alphabet[input.byte() % alphabet.size()]);
    return name;
}

Texts takeNames(Input& input, const std::u16string& alphabet,
                std::size_t count) {
    Texts names;
    while (names.size() < count) names.push_back(takeName(input, alphabet));
    return names;
}

Batch takeBatch(Input& input, const std::u16string& alphabet) {
    Batch batch;
    while (!input.empty()) {
        const std::size_t depth = input.byte() % 6;
        const std::size_t count = input.byte() % 6;
        batch.folders.push_back(takeNames(input, alphabet, depth));
        batch.files.push_back(takeNames(input, alphabet, count));
    }
    return batch;
}

// The paths of a batch in the order of their numbers.
Lists pathsOf(const Batch& batch) {
    Lists paths;
    for (std::size_t i = 0; i < batch.folders.size(); ++i) {
        for (const std::u16string& file : batch.files[i]) {
            paths.push_back(batch.folders[i]);
            paths.back().push_back(file);
        }
    }
    return paths;
}

// True when every path is and stays a leaf of its own, and nothing else is
// one: no path is also a folder, and no folder is left without a file.
bool hasOnlyPathsAsLeaves(const Batch& batch) {
    std::set<Texts> folders;
    for (std::size_t i = 0; i < batch.folders.size(); ++i) {
        if (batch.files[i].empty()) return false;
        Texts folder;
        for (const std::u16string& component : batch.folders[i]) {
            folder.push_back(component);
            folders.insert(folder);
        }
    }
    const Lists paths = pathsOf(batch);
    return std::none_of(paths.begin(), paths.end(), [&](const Texts& path) {
        return folders.contains(path);
    });
}

// A batch directly under the root notes no position: its numbers count from
// the root's first child, so they hold only if it comes first.
bool keepsNumbers(const Batch& batch) {
    return std::none_of(batch.folders.begin() + 1, batch.folders.end(),
                        [](const Texts& folder) { return folder.empty(); });
}

Lists fetchAll(const HuffmanPathTree& coder) {
    std::vector<double> numbers;
    for (std::uint64_t n = 1; n <= coder.pathCount; ++n)
        numbers.push_back(static_cast<double>(n));
    std::vector<Components> folders;
    std::vector<Components> files;
    coder.getPath(folders, files, numbers);
    Lists paths;
    for (std::size_t i = 0; i < folders.size(); ++i) {
        const Texts folder = decode(coder, folders[i]);
        for (const std::u16string& file : decode(coder, files[i])) {
            paths.push_back(folder);
            paths.back().push_back(file);
        }
    }
    return paths;
}

Lists iterateAll(HuffmanPathTree& coder) {
    Lists paths;
    coder.resetPathsToBTree();
    for (Components path; coder.hasNextPathFromBTree();) {
        coder.getNextPathFromBTree(path);
        paths.push_back(decode(coder, path));
    }
    return paths;
}

void checkContent(HuffmanPathTree& coder, const Batch& batch) {
    Lists paths = pathsOf(batch);
    require(coder.pathCount == paths.size(), "every path is counted");
    if (paths.empty() || !hasOnlyPathsAsLeaves(batch)) return;
    if (keepsNumbers(batch))
        require(fetchAll(coder) == paths, "every path is found by its number");
    Lists iterated = iterateAll(coder);
    std::sort(iterated.begin(), iterated.end());
    std::sort(paths.begin(), paths.end());
    require(iterated == paths, "every path is iterated once");
}

void addFolderByFolder(HuffmanPathTree& coder, const Batch& batch) {
    for (std::size_t i = 0; i < batch.folders.size(); ++i) {
        Lists folders{batch.folders[i]};
        Lists files{batch.files[i]};
        coder.generateCodeAsyncAndAddPaths(folders, files);
    }
}

void checkRestored(const HuffmanPathTree& coder, const Batch& batch) {
    std::vector<std::uint8_t> form = formOf(coder, true);
    HuffmanPathTree restored;
    restored.deserialize(form, true);
    restored.inflateHuffman(coder.getTreeString());
    if (!batch.folders.empty()) checkContent(restored, batch);
    HuffmanPathTree again;
    form = formOf(restored, false);
    const std::vector<std::uint8_t> firstForm = form;
    again.deserialize(form, false);
    require(formOf(again, false) == firstForm, "what was read is written");
}

void compareWorkers(Input input) {
    const unsigned threads = 2U + input.byte() % 7;
    HuffmanPathTree onMany;
    const std::size_t characterCount = 2U + input.byte() % 30;
    buildCode(onMany, input, characterCount);
    const std::u16string alphabet = onMany.getTreeString();
    if (alphabet.empty()) return;

    HuffmanPathTree onOne;
    onOne.copyTree(onMany);
    HuffmanPathTree oneByOne;
    onOne.pathTree = std::make_unique<BPathTree>();  // a copy shares its nodes
    oneByOne.copyTree(onOne);
    oneByOne.pathTree = std::make_unique<BPathTree>();

    const Batch batch = takeBatch(input, alphabet);
    Batch given = batch;
    onMany.generateCodeAsyncAndAddPaths(given.folders, given.files, threads);
    given = batch;
    onOne.generateCodeAsyncAndAddPaths(given.folders, given.files, 1);
    addFolderByFolder(oneByOne, batch);

    checkContent(onMany, batch);
    const std::vector<std::uint8_t> form = formOf(onMany, false);
    require(form == formOf(onOne, false), "one worker and many agree");
    require(form == formOf(oneByOne, false), "one batch and many agree");
    checkRestored(onMany, batch);
}

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::compareWorkers({data, size});
    return 0;
}
