#pragma once

#include <dirent.h>

namespace tessel {

// OpenFolder reads the entries of a folder. Unlike the iterators of
// std::filesystem, which end the process if memory runs out for a name, it
// makes no copies.
//
// Ownership: owns the stream, and closes it.
// Threads: one thread at a time.
class OpenFolder {
public:
    // stream  what opendir or fdopendir returned; null: there are no entries
    explicit OpenFolder(DIR* stream) noexcept : stream_(stream) {}
    OpenFolder(const OpenFolder&) = delete;
    OpenFolder& operator=(const OpenFolder&) = delete;
    ~OpenFolder() {
        if (stream_ != nullptr) ::closedir(stream_);
    }

    DIR* get() const noexcept { return stream_; }

    // The next entry, "." and ".." included, valid until the next call. Null
    // at the end, and on a failure, which then is in errno.
    const dirent* next() noexcept {
        // One stream, one reader.
        // NOLINTNEXTLINE(concurrency-mt-unsafe)
        return stream_ == nullptr ? nullptr : ::readdir(stream_);
    }

private:
    DIR* stream_;
};

}  // namespace tessel
