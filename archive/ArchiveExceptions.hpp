#pragma once

#include <cstdint>
#include <stdexcept>
#include <string>

namespace tessel {

// An archive's bytes are not what its writer wrote: a checksum does not fit,
// the file was cut or lengthened, or a form breaks the format's rules.
class DamagedArchiveException : public std::runtime_error {
public:
    // where  byte offset in the archive of the piece or field that is wrong
    // what   what is wrong with it, as a sentence without the offset
    DamagedArchiveException(std::uint64_t where, const std::string& what);

    // Byte offset in the archive of what is wrong.
    std::uint64_t offset() const noexcept { return offset_; }

private:
    std::uint64_t offset_;
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
