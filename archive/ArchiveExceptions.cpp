#include "archive/ArchiveExceptions.hpp"

namespace tessel {

DamagedArchiveException::DamagedArchiveException(std::uint64_t where,
                                                 const std::string& what)
    : std::runtime_error("The archive is damaged at byte " +
                         std::to_string(where) + ": " + what),
      offset_(where) {}

UnsupportedArchiveVersionException::UnsupportedArchiveVersionException(
    std::uint32_t version)
    : std::runtime_error("The archive has version " + std::to_string(version) +
                         " of the format, which this library cannot read."),
      version_(version) {}

const char* CancelledException::what() const noexcept {
    return "The operation was cancelled.";
}

}  // namespace tessel
