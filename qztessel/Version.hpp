#pragma once

// The version of the library, the plug-in, the command and the packages. It is
// written here and nowhere else: the build files read it from this header.
namespace tessel {

inline constexpr char versionText[] = "1.0.0";

}  // namespace tessel
