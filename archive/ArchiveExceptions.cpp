#include "archive/ArchiveExceptions.hpp"

namespace tessel {

namespace {

std::string placeText(std::uint64_t offset) {
    return "The archive is damaged at byte " + std::to_string(offset) + ": ";
}

}  // namespace

DamagedArchiveException::DamagedArchiveException(std::uint64_t offset,
                                                 const std::string& cause)
    : std::runtime_error(placeText(offset) + cause),
      offset_(offset),
      causeStart_(placeText(offset).size()) {}

UnsupportedArchiveVersionException::UnsupportedArchiveVersionException(
    std::uint32_t version)
    : std::runtime_error("The archive has version " + std::to_string(version) +
                         " of the format, which this library cannot read."),
      version_(version) {}

const char* CancelledException::what() const noexcept {
    return "The operation was cancelled.";
}

}  // namespace tessel
