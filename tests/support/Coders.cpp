#include "tests/support/Coders.hpp"

#include <algorithm>
#include <stdexcept>

namespace support {

using tessel::Component;
using tessel::Components;
using tessel::HuffmanPathTree;

CoderPtr coderWith(const std::u16string& characters,
                   const std::vector<double>& frequencies) {
    auto coder = std::make_unique<HuffmanPathTree>();
    coder->deflateHuffman(frequencies.data(), characters);
    return coder;
}

CoderPtr fourLetterCoder() { return coderWith(u"abcd", {1, 1, 1, 1}); }

std::string codeText(const HuffmanPathTree& coder, char16_t character) {
    return bitText(coder.codeOf(character));
}

void addBatches(HuffmanPathTree& coder, std::vector<Texts> folders,
                std::vector<Texts> files, unsigned hardwareThreads) {
    coder.generateCodeAsyncAndAddPaths(folders, files, hardwareThreads);
}

void addBatch(HuffmanPathTree& coder, const Texts& folder, const Texts& files) {
    addBatches(coder, {folder}, {files});
}

void addWhole(HuffmanPathTree& coder, const Texts& texts) {
    Components components;
    for (const std::u16string& text : texts)
        components.push_back(coder.generateCodeFor(text));
    coder.addPathToBTree(components);
}

Components encodedBy(const HuffmanPathTree& coder, const Texts& texts) {
    Components components;
    for (const std::u16string& text : texts) {
        std::vector<bool> bits;
        for (const char16_t character : text) {
            const std::vector<bool> code = coder.codeOf(character);
            bits.insert(bits.end(), code.begin(), code.end());
        }
        components.push_back(model::packBits(bits));
    }
    return components;
}

Texts decodedBy(const HuffmanPathTree& coder, const Components& components) {
    Texts texts;
    for (const Component& component : components)
        texts.push_back(coder.generatePathFrom(component));
    return texts;
}

std::vector<Texts> iterated(HuffmanPathTree& coder, std::size_t most) {
    std::vector<Texts> paths;
    coder.resetPathsToBTree();
    while (paths.size() < most && coder.hasNextPathFromBTree()) {
        Components components;
        coder.getNextPathFromBTree(components);
        paths.push_back(decodedBy(coder, components));
    }
    return paths;
}

std::optional<model::Found> found(const HuffmanPathTree& coder,
                                  const std::vector<double>& numbers) {
    model::Found answer;
    try {
        coder.getPath(answer.folders, answer.files, numbers);
    } catch (const std::out_of_range&) {
        if (!answer.folders.empty() || !answer.files.empty())
            throw std::runtime_error("outputs changed by a refused getPath");
        return {};
    }
    return answer;
}

Bytes formOf(const HuffmanPathTree& coder, bool compress) {
    Bytes form;
    coder.serialize(form, compress);
    return form;
}

CoderPtr restoredFrom(Bytes form, bool compress, const HuffmanPathTree& like) {
    auto coder = std::make_unique<HuffmanPathTree>();
    coder->deserialize(form, compress);
    coder->inflateHuffman(like.getTreeString());
    std::vector<double> frequencies = like.getFrequencies();
    coder->setFrequencies(frequencies);
    return coder;
}

std::pair<Bytes, Components> storedTree(const tessel::BPathTree& tree) {
    std::pair<Bytes, Components> stored;
    tree.serialize(stored.first, stored.second);
    return stored;
}

std::vector<tessel::PathTrack> tracksOf(const HuffmanPathTree& coder) {
    std::vector<tessel::PathTrack> tracks;
    for (std::size_t i = 0; i < coder.partitionTracks.size(); ++i)
        tracks.push_back(coder.partitionTracks[i]);
    return tracks;
}

// ---- Comparison with the model ----

namespace {

struct Counter {
    const char* name;
    std::uint64_t expected;
    std::uint64_t actual;
};

std::string counterDifference(const model::Coder& expected,
                              const HuffmanPathTree& coder) {
    const Counter counters[] = {
        {"pathCount", expected.pathCount, coder.pathCount},
        {"nextPathNumber", expected.nextPathNumber, coder.nextPathNumber},
        {"maxCodeBytes", expected.maxCodeBytes, coder.maxCodeBytes},
        {"maxPartitionTrackLength", expected.maxPartitionTrackLength,
         coder.maxPartitionTrackLength},
        {"maxDuplicateTrackLength", expected.maxDuplicateTrackLength,
         coder.maxDuplicateTrackLength},
        {"maxDuplicatePathNumber", expected.maxDuplicatePathNumber,
         coder.maxDuplicatePathNumber},
    };
    for (const Counter& counter : counters)
        if (counter.expected != counter.actual)
            return std::string(counter.name) + ": expected " +
                   std::to_string(counter.expected) + ", got " +
                   std::to_string(counter.actual);
    return "";
}

std::string codeDifference(const model::Code& expected,
                           const HuffmanPathTree& coder) {
    if (coder.getBoolTree() != expected.shape) return "boolTree";
    if (coder.getTreeString() != expected.leaves) return "treeString";
    if (coder.codes.size() != expected.codes.size()) return "number of codes";
    for (const auto& [character, bits] : expected.codes)
        if (coder.codeOf(character) != bits)
            return "code of " + std::to_string(character);
    return "";
}

}  // namespace

std::string differenceFrom(const model::Coder& expected,
                           const HuffmanPathTree& coder) {
    std::string difference = counterDifference(expected, coder);
    if (difference.empty()) difference = codeDifference(expected.code, coder);
    if (!difference.empty()) return difference;
    if (coder.partitionEnds != expected.partitionEnds) return "partitionEnds";
    if (tracksOf(coder) != expected.partitionTracks) return "partitionTracks";
    if (std::map<std::uint64_t, model::Track>(coder.duplicates.begin(),
                                              coder.duplicates.end()) !=
        expected.duplicates)
        return "duplicates";
    std::pair<Bytes, model::Path> stored;
    expected.tree.store(stored.first, stored.second);
    if (storedTree(*coder.pathTree) != stored) return "path tree";
    return "";
}

// ---- Self-check ----

namespace {

std::string brokenInCode(const HuffmanPathTree& coder) {
    const std::size_t size = coder.nodes.size();
    const auto names = [size](std::int32_t position) {
        return position == -1 ||
               (position >= 0 && static_cast<std::size_t>(position) < size);
    };
    if (size == 0) return "";
    if (coder.rootIndex < 0 || !names(coder.rootIndex))
        return "rootIndex names no node";
    for (std::size_t i = 0; i < size; ++i) {
        const tessel::HNode& node = coder.nodes[i];
        if (node.index != static_cast<std::int32_t>(i))
            return "a node's index is not its position";
        if (!names(node.left) || !names(node.right))
            return "a node's child does not exist";
        if (node.isLeaf() && !coder.codes[node.character].exists())
            return "a leaf's character has no code";
    }
    const auto leaves = static_cast<std::size_t>(
        std::count(coder.boolTree.begin(), coder.boolTree.end(), true));
    if (coder.treeString.size() != leaves)
        return "the tree string has not one character a leaf";
    return "";
}

std::string brokenInPartitions(const HuffmanPathTree& coder) {
    if (coder.partitionEnds.size() != coder.partitionTracks.size())
        return "not as many partition ends as tracks";
    if (!std::is_sorted(coder.partitionEnds.begin(), coder.partitionEnds.end()))
        return "partition ends fall";
    if (!coder.partitionEnds.empty() &&
        coder.partitionEnds.back() > coder.pathCount)
        return "a partition ends after the last path";
    return "";
}

std::string brokenInDuplicates(const HuffmanPathTree& coder) {
    for (const auto& [number, track] : coder.duplicates) {
        if (number == 0) return "path number 0 is a duplicate";
        if (number > coder.maxDuplicatePathNumber)
            return "maxDuplicatePathNumber is too small";
        if (track.size() > coder.maxDuplicateTrackLength)
            return "maxDuplicateTrackLength is too small";
        Components components;
        coder.pathTree->traversePath(track, components);
        if (components.size() != track.size())
            return "a duplicate's track leads nowhere";
    }
    return "";
}

// The folder at the end of a track, or nullptr.
const tessel::FolderNode* folderAt(const tessel::FolderNode& root,
                                   const tessel::PathTrack& track) {
    const tessel::FolderNode* folder = &root;
    for (const std::uint64_t position : track) {
        if (folder == nullptr || position >= folder->children().count())
            return nullptr;
        folder = folder->child(position).folder;
    }
    return folder;
}

std::string brokenInShortcuts(const HuffmanPathTree& coder) {
    const tessel::PathTracks& tracks = coder.partitionTracks;
    const tessel::FolderNode* const root = coder.pathTree->root->folder();
    for (std::size_t k = 0; k < tracks.size(); ++k) {
        const auto [folder, isEnd] = tracks.folders().find(k, root);
        if (folder == nullptr) continue;
        tessel::PathTrack track = tracks[k];
        if (track.empty()) return "a shortcut for an empty track";
        if (!isEnd) track.pop_back();
        if (folderAt(*root, track) != folder)
            return "a shortcut leads elsewhere than its track";
    }
    return "";
}

}  // namespace

std::string brokenInvariant(const HuffmanPathTree& coder, bool loaded) {
    if (!coder.pathTree) return "pathTree is null";
    if (!coder.pathTree->root) return "the path tree has no root";
    if (!coder.pathTree->root->value().empty()) return "the root has a value";
    if (!coder.genThreads.empty()) return "a worker is left behind";
    std::string broken = brokenInShortcuts(coder);
    if (loaded) return broken;
    if (broken.empty()) broken = brokenInCode(coder);
    if (broken.empty()) broken = brokenInPartitions(coder);
    if (broken.empty()) broken = brokenInDuplicates(coder);
    return broken;
}

}  // namespace support
