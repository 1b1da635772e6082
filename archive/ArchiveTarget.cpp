#include "archive/ArchiveTarget.hpp"

#include <algorithm>
#include <utility>

namespace tessel::archive {

void MemoryTarget::append(Bytes bytes) {
    bytes_.insert(bytes_.end(), bytes.begin(), bytes.end());
}

void MemoryTarget::rewriteStart(Bytes bytes) {
    std::ranges::copy(bytes, bytes_.begin());
}

void MemoryTarget::commit() { out_ = std::move(bytes_); }

}  // namespace tessel::archive
