#pragma once

#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "archive/PathArchive.hpp"

namespace tessel::python {

// StoredList is an archive and where it is: in a file that is mapped, or in
// memory.
//
// Ownership: shared by all lists that read it. Keeps its bytes, or an object
//   that keeps them.
// Threads: immutable.
class StoredList {
public:
    using Pointer = std::shared_ptr<const StoredList>;

    // All of them throw DamagedListException, std::invalid_argument for an
    // archive of a newer version, and FileException.

    static Pointer open(const std::string& file);
    static Pointer own(std::vector<std::uint8_t> bytes);

    // keeper  keeps the bytes, unchanged, as long as it lives
    static Pointer over(std::span<const std::uint8_t> bytes,
                        std::shared_ptr<const void> keeper);

    StoredList(std::string file, PathArchive archive,
               std::shared_ptr<const void> keeper)
        : file_(std::move(file)),
          keeper_(std::move(keeper)),
          archive_(std::move(archive)) {}

    const PathArchive& archive() const noexcept { return archive_; }
    // Empty for an archive in memory.
    const std::string& file() const noexcept { return file_; }
    bool isInMemory() const noexcept { return file_.empty(); }
    std::span<const std::uint8_t> bytes() const noexcept {
        return archive_.bytes();
    }
    // Whether paths of segments that are not sorted are found by an index.
    bool hasIndex() const;

private:
    std::string file_;
    std::shared_ptr<const void> keeper_;
    PathArchive archive_;
};

}  // namespace tessel::python
