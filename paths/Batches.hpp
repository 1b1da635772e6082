#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "paths/CharacterCounter.hpp"
#include "paths/PathList.hpp"
#include "paths/PathSplitter.hpp"

// The way of a list into the coder, and of the coder's texts back to paths.
// Consecutive paths of one folder make one folder entry with several files.
namespace tessel::paths {

using FolderTexts = std::vector<std::vector<std::u16string>>;

// What one call of the coder's insertion takes: the components of folder i
// are folders[i], the names of its files files[i].
struct Batch {
    FolderTexts folders;
    FolderTexts files;
    std::size_t pathCount = 0;
};

// Hands out a list as batches, in order.
//
// Ownership: keeps a reference to the splitter, which must outlive it.
// Cost: a batch takes some 100 bytes a path, and as many a folder's component.
class BatchReader {
public:
    static constexpr std::size_t usualPathsPerBatch = 500'000;

    // A batch ends at the first change of folder behind so many paths.
    explicit BatchReader(const PathSplitter& pathSplitter,
                         std::size_t batchPaths = usualPathsPerBatch)
        : splitter_(&pathSplitter), pathsPerBatch_(batchPaths) {}

    // Replaces `batch` by the next one. Returns false, with `batch` empty,
    // behind the last.
    bool next(Batch& batch);

private:
    const PathSplitter* splitter_;
    std::size_t pathsPerBatch_;
    std::size_t position_ = 0;
};

// The components of the folder of a path that is cut there, root first.
std::vector<std::u16string> folderTexts(std::string_view path,
                                        const PathSplit& split);

// True if both paths' folders have the same components.
bool sameFolder(std::string_view path, const PathSplit& split,
                std::string_view other, const PathSplit& otherSplit) noexcept;

// Input for the coder's code. A folder is counted once per batch in which it
// occurs.
CharacterCounts countCharacters(const PathSplitter& splitter);
CharacterCounts countCharacters(const FolderTexts& folders,
                                const FolderTexts& files);

// Appends the text of a folder as it stands before its files' names:
// components from the second on are followed by one '/' each.
void appendFolder(const std::vector<std::u16string>& components,
                  std::u16string& text);

// Appends the bytes of a path from its joined text. Returns false, with
// `path` unchanged, if it is no path's text.
bool textToPath(std::u16string_view joined, std::string& path);

}  // namespace tessel::paths
