#pragma once

#include <cstdint>
#include <span>
#include <utility>
#include <variant>
#include <vector>

#include "archive/FileMapping.hpp"

namespace tessel::archive {

// Where an archive's bytes are: a mapped file, owned memory, or memory that
// somebody else keeps.
class ArchiveBytes {
public:
    using Bytes = std::span<const std::uint8_t>;

    explicit ArchiveBytes(FileMapping mapping) : source_(std::move(mapping)) {}
    explicit ArchiveBytes(std::vector<std::uint8_t> bytes)
        : source_(std::move(bytes)) {}
    explicit ArchiveBytes(Bytes borrowed) : source_(borrowed) {}

    // Valid as long as this object, which must not be moved meanwhile.
    Bytes bytes() const noexcept {
        if (const auto* mapping = std::get_if<FileMapping>(&source_))
            return mapping->bytes();
        if (const auto* owned =
                std::get_if<std::vector<std::uint8_t>>(&source_))
            return *owned;
        return *std::get_if<Bytes>(&source_);
    }

    // See FileMapping; bytes in memory stay what they are.
    void requireIntact() const {
        if (const auto* mapping = std::get_if<FileMapping>(&source_))
            mapping->requireIntact();
    }

    // See FileMapping; bytes in memory stay.
    void releasePages() const noexcept {
        if (const auto* mapping = std::get_if<FileMapping>(&source_))
            mapping->releasePages();
    }

private:
    std::variant<FileMapping, std::vector<std::uint8_t>, Bytes> source_;
};

}  // namespace tessel::archive
