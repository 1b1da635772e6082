#pragma once

#include <string>

#include "hosts/console/ArchiveReport.hpp"

namespace tessel::console {

// The report as a picture (SVG): how the file's bytes divide, and the lengths
// of the paths. Needs no other file to be shown.
std::string pictureOf(const ArchiveReport& report);

}  // namespace tessel::console
