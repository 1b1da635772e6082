#include "paths/Segments.hpp"

#include "paths/PathText.hpp"

namespace tessel::paths {

bool appendSegment(std::u16string_view text, std::string& bytes) {
    if (text.size() == 1 && text.front() == noName) return true;
    return appendBytes(text, bytes);
}

}  // namespace tessel::paths
