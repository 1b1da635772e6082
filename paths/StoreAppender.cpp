#include "paths/StoreAppender.hpp"

#include <system_error>
#include <thread>
#include <utility>

#include "coder/HuffmanPathTree.hpp"

namespace tessel::paths {

void StoreAppender::add(std::string_view path) {
    chunk_.append(path);
    if (chunk_.size() >= pathsPerChunk_ ||
        chunk_.textBytes() >= maxBytesPerChunk)
        addChunk();
}

void StoreAppender::finish() {
    if (!chunk_.empty()) addChunk();
    insertWaiting();
}

EncodedChunk StoreAppender::encoded() const {
    return encodeChunk(coder_->code(), chunk_,
                       std::thread::hardware_concurrency());
}

void StoreAppender::addChunk() {
    std::future<EncodedChunk> next;
    // One chunk is not worth a thread that only waits for it.
    if (waiting_.pathCount > 0) next = begunEncoding();
    insertWaiting();
    waiting_ = next.valid() ? next.get() : encoded();
    chunk_.clear();
}

// Without a thread to be had, nothing is begun.
std::future<EncodedChunk> StoreAppender::begunEncoding() const {
    try {
        return std::async(std::launch::async, [this] { return encoded(); });
    } catch (const std::system_error&) {
        return {};
    }
}

void StoreAppender::insertWaiting() {
    const std::size_t count = waiting_.pathCount;
    if (count == 0) return;
    hasStarted_ = true;
    coder_->maxCodeBytes.raise(waiting_.maxComponentBytes);
    try {
        coder_->encodedFolders = std::move(waiting_.folders);
        coder_->encodedFiles = std::move(waiting_.files);
        coder_->addPathToBTreeFromAsyncData();
    } catch (...) {
        // They refer to what is encoded here.
        coder_->clearThreadResources();
        throw;
    }
    waiting_ = {};
    pathCount_ += count;
}

}  // namespace tessel::paths
