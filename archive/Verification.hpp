#pragma once

#include <vector>

#include "archive/ArchiveReader.hpp"
#include "archive/ArchiveReports.hpp"
#include "archive/ScanOptions.hpp"

namespace tessel::archive {

// All damage of an archive, in the order of its bytes: every piece that does
// not match its checksum, and of segments whose pieces are all sound, what
// breaks the format's rules, one breach per stretch of blocks. Throws
// CancelledException.
std::vector<ArchiveDamage> findDamage(const ArchiveReader& archive,
                                      const ScanOptions& options);

// The damaged pieces of one segment from `begin` up to, but without, `end`;
// neighbours are told as one.
std::vector<ArchiveDamage> damagedPieces(const Segment& segment,
                                         std::uint64_t begin,
                                         std::uint64_t end);

}  // namespace tessel::archive
