#pragma once

#include "archive/ArchiveReader.hpp"
#include "archive/ArchiveReports.hpp"

namespace tessel::archive {

// Counts, and how the bytes divide; see PathArchive::info.
ArchiveInfo infoOf(const ArchiveReader& archive);

}  // namespace tessel::archive
