#pragma once

#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

#include "archive/ArchiveReader.hpp"
#include "archive/FindOptions.hpp"
#include "archive/PathVisitor.hpp"

namespace tessel::archive {

// Search over a whole archive, on several threads; see PathArchive::find.
//
// The stored paths are cut into stretches. Each is decoded and filtered on one
// thread; what it finds is handed over on the calling thread, in ascending
// order. Of a rearranged segment, the places found are first collected in one
// bit per path, then brought into the order of their numbers.

// Numbers of the paths that hold all of the texts, or for which the predicate
// is true.
std::vector<std::uint64_t> find(const ArchiveReader& archive,
                                std::span<const std::string_view> texts,
                                const FindOptions& options);
std::vector<std::uint64_t> find(const ArchiveReader& archive,
                                PathPredicate predicate,
                                const FindOptions& options);

// Shows the same paths until the visitor returns false.
void findEach(const ArchiveReader& archive,
              std::span<const std::string_view> texts, PathVisitor visitor,
              const FindOptions& options);
void findEach(const ArchiveReader& archive, PathPredicate predicate,
              PathVisitor visitor, const FindOptions& options);

}  // namespace tessel::archive
