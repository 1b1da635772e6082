#pragma once

#include <filesystem>
#include <system_error>

namespace tessel {

// Follows a symbolic link, and the links that it leads to, to the end, where
// there need not be a file. Returns the path itself if it is no link. Folders
// on the way may be links; they are not resolved.
//
// `error` is clear, or says what the system said, or, after more links than
// Linux follows, std::errc::too_many_symbolic_link_levels.
std::filesystem::path linkTarget(std::filesystem::path path,
                                 std::error_code& error);

}  // namespace tessel
