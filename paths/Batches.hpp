#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "paths/CharacterCounter.hpp"
#include "paths/PathList.hpp"
#include "paths/PathSplitter.hpp"

// From a list to the coder's input, and from the coder's texts back to paths,
// for programs that feed a coder or a host themselves. (PathStore has a way of
// its own.) Consecutive paths of one folder make one entry with several files.
namespace tessel::paths {

using FolderTexts = std::vector<std::vector<std::u16string>>;

// Input of one call of the coder's insertion: folders[i] has the components of
// folder i, files[i] the names of its files.
struct Batch {
    FolderTexts folders;
    FolderTexts files;
    std::size_t pathCount = 0;
};

// Hands out a list as batches, in order.
//
// Ownership: keeps a reference to the splitter, which must outlive it.
// Cost: a batch takes about 100 bytes per path and per component of a folder.
class BatchReader {
public:
    // About 50 MB; longer batches are not added faster.
    static constexpr std::size_t usualPathsPerBatch = 500'000;

    // A batch ends at the first change of folder after this many paths.
    explicit BatchReader(const PathSplitter& pathSplitter,
                         std::size_t batchPaths = usualPathsPerBatch)
        : splitter_(&pathSplitter), pathsPerBatch_(batchPaths) {}

    // Replaces `batch` by the next one. After the last one, returns false and
    // leaves `batch` empty.
    bool next(Batch& batch);

private:
    const PathSplitter* splitter_;
    std::size_t pathsPerBatch_;
    std::size_t position_ = 0;
};

// The components of a path's folder, root first.
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

// Appends the text of a folder to which a file's name can be appended: every
// component but the root is followed by one '/'.
void appendFolder(const std::vector<std::u16string>& components,
                  std::u16string& text);

// Appends the path that has this joined text. Returns false, with `path`
// unchanged, if no path has it.
bool textToPath(std::u16string_view joined, std::string& path);

}  // namespace tessel::paths
