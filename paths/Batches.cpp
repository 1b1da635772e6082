#include "paths/Batches.hpp"

#include "paths/PathText.hpp"

namespace tessel::paths {

namespace {

// Visits the paths from `first` on: calls onFolder(path, split) at each change
// of folder and onFile(path, split) for each path. Ends at the change of folder
// where enough(paths visited) is true. Returns the first path not visited.
template <class OnFolder, class OnFile, class Enough>
std::size_t visitPaths(const PathSplitter& splitter, std::size_t first,
                       OnFolder onFolder, OnFile onFile, Enough enough) {
    const PathList& list = splitter.list();
    std::string_view folderPath;
    PathSplit folderSplit;
    for (std::size_t i = first; i < list.size(); ++i) {
        const std::string_view path = list[i];
        const PathSplit split = splitter.split(i);
        if (i == first || !sameFolder(path, split, folderPath, folderSplit)) {
            if (i != first && enough(i - first)) return i;
            folderPath = path;
            folderSplit = split;
            onFolder(path, split);
        }
        onFile(path, split);
    }
    return list.size();
}

}  // namespace

bool BatchReader::next(Batch& batch) {
    batch = Batch();
    const std::size_t first = position_;
    position_ = visitPaths(
        *splitter_, first,
        [&](std::string_view path, const PathSplit& split) {
            batch.folders.push_back(folderTexts(path, split));
            batch.files.emplace_back();
        },
        [&](std::string_view path, const PathSplit& split) {
            appendText(path.substr(split.fileStart),
                       batch.files.back().emplace_back());
        },
        [&](std::size_t visited) { return visited >= pathsPerBatch_; });
    batch.pathCount = position_ - first;
    return batch.pathCount != 0;
}

std::vector<std::u16string> folderTexts(std::string_view path,
                                        const PathSplit& split) {
    std::size_t count = 1;
    forEachFolder(path, split, [&](std::string_view) { ++count; });
    std::vector<std::u16string> components;
    components.reserve(count);
    components.push_back(split.rootEnd == 0
                             ? std::u16string(1, noRoot)
                             : toText(path.substr(0, split.rootEnd)));
    forEachFolder(path, split, [&](std::string_view folder) {
        components.push_back(toText(folder));
    });
    return components;
}

bool sameFolder(std::string_view path, const PathSplit& split,
                std::string_view other, const PathSplit& otherSplit) noexcept {
    return split == otherSplit &&
           path.substr(0, split.fileStart) == other.substr(0, split.fileStart);
}

CharacterCounts countCharacters(const PathSplitter& splitter) {
    CharacterCounter counter;
    visitPaths(
        splitter, 0,
        [&](std::string_view path, const PathSplit& split) {
            if (split.rootEnd == 0) counter.add(noRoot);
            counter.addBytes(path.substr(0, split.rootEnd));
            forEachFolder(path, split, [&](std::string_view folder) {
                counter.addBytes(folder);
            });
        },
        [&](std::string_view path, const PathSplit& split) {
            counter.addBytes(path.substr(split.fileStart));
        },
        [](std::size_t) { return false; });
    return counter.result();
}

CharacterCounts countCharacters(const FolderTexts& folders,
                                const FolderTexts& files) {
    CharacterCounter counter;
    for (const FolderTexts* texts : {&folders, &files}) {
        for (const auto& list : *texts) {
            for (const std::u16string& text : list) counter.add(text);
        }
    }
    return counter.result();
}

void appendFolder(const std::vector<std::u16string>& components,
                  std::u16string& text) {
    for (std::size_t i = 0; i < components.size(); ++i) {
        text += components[i];
        if (i > 0) text += u'/';
    }
}

bool textToPath(std::u16string_view joined, std::string& path) {
    if (!joined.empty() && joined.front() == noRoot) joined.remove_prefix(1);
    return appendBytes(joined, path);
}

}  // namespace tessel::paths
