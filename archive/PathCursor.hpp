#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "archive/FolderDecoder.hpp"
#include "archive/NameDecoder.hpp"
#include "archive/PathBuffer.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// PathCursor decodes the paths of a segment by their places in the stored
// order. It keeps its place: a path in the rest of the current block costs the
// names between, any other path the names before it in its block.
//
// A path is assembled without copying its name: names are decoded in place,
// and a folder is put in front of them when it changes.
//
//   | folder, as long as it is | name, rewritten from its shared prefix on |
//
// Two decoders of folders take turns, because a list goes back and forth
// between a folder and those in it: one for the folders that come for the
// first time, one for the others.
//
// After DamagedArchiveException, the object may only be destroyed.
//
// Ownership: borrows the segment.
// Threads: one thread at a time.
// Cost: 4 KiB, and on the heap three times the longest folder and name if that
//   is more.
class PathCursor {
public:
    explicit PathCursor(const Segment& segment);

    // The path at this place, which must be below the segment's size. Valid
    // until the next call. Throws DamagedArchiveException.
    std::string_view at(std::uint64_t place) {
        seek(place);
        return path();
    }

    // ---- In two steps, for those who need parts ----

    // Goes to a place and decodes its name only.
    void seek(std::uint64_t place) {
        if (place < next_ || place >= blockEnd_) startBlockOf(place);
        while (next_ <= place) {
            names_.next();
            ++next_;
        }
    }

    std::string_view name() const noexcept { return names_.name(); }
    // Below the number of folders. Throws DamagedArchiveException.
    std::uint32_t folderNumber() const {
        if (names_.folder() >= segment_.head().folders) [[unlikely]]
            segment_.fail(Section::Names, 0, "A name has no folder.");
        return names_.folder();
    }
    std::uint32_t foldersSeen() const noexcept { return names_.seen(); }

    // Whether the last name ends its block, but for padding.
    bool isAtBlockEnd() const noexcept {
        return next_ == blockEnd_ && names_.isAtEnd();
    }

    // The folder of the name, with its final '/', if any.
    std::string_view folder() {
        if (folder_ != names_.folder()) [[unlikely]]
            takeFolder();
        return {name_ - folderLength_, folderLength_};
    }
    std::string_view path() {
        const std::size_t folderLength = folder().size();
        return {name_ - folderLength, folderLength + names_.length()};
    }

private:
    void startBlockOf(std::uint64_t place);
    void takeFolder();

    const Segment& segment_;
    PathBuffer buffer_;
    char* name_;
    NameDecoder names_;
    FolderDecoder newest_;
    FolderDecoder earlier_;
    std::uint32_t perBlock_;
    std::uint64_t next_ = 0;      // the place that names_.next() decodes
    std::uint64_t blockEnd_ = 0;  // the first place of the next block
    std::uint64_t folder_ = ~std::uint64_t{0};  // in front of the name
    std::size_t folderLength_ = 0;
};

}  // namespace tessel::archive
