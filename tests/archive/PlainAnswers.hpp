#pragma once

#include <cstdint>
#include <vector>

#include "tests/archive/Archives.hpp"

namespace support {

// Expects of an archive's bytes that every reading operation answers as a plain
// vector of the same paths does, and that the archive is undamaged.
void expectAllAnswers(const std::vector<std::uint8_t>& bytes,
                      const archives::Paths& paths);

// The same of reading paths by number and of their numbers alone, each asked
// for a few times: for lists that are long or have long paths.
void expectPaths(const std::vector<std::uint8_t>& bytes,
                 const archives::Paths& paths);

}  // namespace support
