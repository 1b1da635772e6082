#pragma once

#include <cstdint>
#include <span>

#include "archive/ArchiveReports.hpp"
#include "archive/PathVisitor.hpp"

namespace tessel::archive {

// Shows every path of a damaged archive whose pieces are sound, under its own
// number; see PathArchive::salvage.
//
// Segments are found by the directory where its entries are sound, and one
// after the other by their heads where they are not. Of a segment that is cut,
// what is missing counts as damaged.
SalvageReport salvage(std::span<const std::uint8_t> archive,
                      PathVisitor visitor);

}  // namespace tessel::archive
