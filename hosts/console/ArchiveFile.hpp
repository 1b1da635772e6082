#pragma once

#include <cstdint>
#include <string>

#include "archive/PathArchive.hpp"
#include "hosts/console/Interrupts.hpp"

namespace tessel::console {

// Opens an archive: a regular file is mapped; standard input ("-") and pipes
// are read into memory. Throws ConsoleException, which names the file, if it
// is damaged or too new, and std::system_error.
PathArchive openArchive(const std::string& file, const Interrupts& interrupts);

// Bytes of the archive's list as a text, with one separator per path.
inline std::uint64_t listBytes(const ArchiveInfo& info) noexcept {
    return info.textBytes + info.paths;
}

}  // namespace tessel::console
