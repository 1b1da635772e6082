#pragma once

#include <cstddef>
#include <cstdint>
#include <exception>
#include <stdexcept>
#include <string>

namespace tessel {

// An archive's bytes are not what its writer wrote: a checksum does not fit,
// the file was cut or lengthened, or a form breaks the format's rules.
class DamagedArchiveException : public std::runtime_error {
public:
    // offset  in the archive, of the piece or field that is wrong
    // cause   what is wrong with it, as a sentence
    DamagedArchiveException(std::uint64_t offset, const std::string& cause);

    // Byte offset in the archive of what is wrong.
    std::uint64_t offset() const noexcept { return offset_; }

    // What is wrong, without the offset. what() tells both.
    const char* cause() const noexcept { return what() + causeStart_; }

private:
    std::uint64_t offset_;
    std::size_t causeStart_;
};

// An archive of a version of the format that this library does not know.
class UnsupportedArchiveVersionException : public std::runtime_error {
public:
    explicit UnsupportedArchiveVersionException(std::uint32_t version);

    // The version that the archive names.
    std::uint32_t version() const noexcept { return version_; }

private:
    std::uint32_t version_;
};

// The caller asked for an operation to end early; it did, without effect.
class CancelledException : public std::exception {
public:
    const char* what() const noexcept override;
};

}  // namespace tessel
