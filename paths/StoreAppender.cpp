#include "paths/StoreAppender.hpp"

#include <string>

#include "coder/HuffmanPathTree.hpp"
#include "paths/Segments.hpp"

namespace tessel::paths {

namespace {

constexpr std::size_t maxPathsPerChunk = 100'000;
constexpr std::size_t maxBytesPerChunk = std::size_t{1} << 24U;

using FolderTexts = HuffmanPathTree::FolderTexts;

// Consecutive paths of one folder make one entry of both lists.
void convert(const PathList& paths, FolderTexts& folders, FolderTexts& files) {
    std::string_view lastFolders;
    for (std::size_t i = 0; i < paths.size(); ++i) {
        const std::string_view path = paths[i];
        const std::size_t cut = fileStartOf(path);
        if (i == 0 || path.substr(0, cut) != lastFolders) {
            lastFolders = path.substr(0, cut);
            folders.push_back(folderTexts(lastFolders));
            files.emplace_back();
        }
        files.back().push_back(fileText(path.substr(cut)));
    }
}

}  // namespace

void StoreAppender::add(std::string_view path) {
    chunk_.append(path);
    if (chunk_.size() >= maxPathsPerChunk ||
        chunk_.textBytes() >= maxBytesPerChunk)
        finish();
}

void StoreAppender::finish() {
    FolderTexts folders;
    FolderTexts files;
    convert(chunk_, folders, files);
    hasStarted_ = true;
    coder_->generateCodeAsyncAndAddPaths(folders, files);
    pathCount_ += chunk_.size();
    chunk_.clear();
}

}  // namespace tessel::paths
