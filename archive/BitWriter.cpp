#include "archive/BitWriter.hpp"

namespace tessel::archive {

void BitWriter::grow() { bytes_.resize(2 * size_ + 64); }

}  // namespace tessel::archive
