#include "paths/StoreAppender.hpp"

#include <algorithm>
#include <thread>
#include <utility>

#include "coder/HuffmanPathTree.hpp"
#include "paths/ChunkEncoder.hpp"

namespace tessel::paths {

void StoreAppender::add(std::string_view path) {
    chunk_.append(path);
    if (chunk_.size() >= maxPathsPerChunk ||
        chunk_.textBytes() >= maxBytesPerChunk)
        addChunk();
}

void StoreAppender::finish() {
    if (!chunk_.empty()) addChunk();
}

void StoreAppender::addChunk() {
    const std::size_t count = chunk_.size();
    const EncodedChunk encoded = encodeChunk(
        coder_->code(), chunk_, std::thread::hardware_concurrency());
    chunk_.clear();
    hasStarted_ = true;
    coder_->maxCodeBytes.raise(encoded.maxComponentBytes);
    try {
        coder_->encodedFolders = encoded.folders;
        coder_->encodedFiles = encoded.files;
        coder_->addPathToBTreeFromAsyncData();
    } catch (...) {
        // They refer to what is encoded here.
        coder_->clearThreadResources();
        throw;
    }
    pathCount_ += count;
}

}  // namespace tessel::paths
