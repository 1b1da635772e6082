#include "paths/Segments.hpp"

#include "paths/PathText.hpp"

namespace tessel::paths {

std::vector<std::u16string> folderTexts(std::string_view folders) {
    std::size_t count = 0;
    forEachSegment(folders, [&](std::string_view) { ++count; });
    std::vector<std::u16string> texts;
    if (count == 0) {
        texts.emplace_back(1, noName);
        return texts;
    }
    texts.reserve(count);
    forEachSegment(folders, [&](std::string_view segment) {
        texts.push_back(toText(segment));
    });
    return texts;
}

std::u16string fileText(std::string_view name) {
    return name.empty() ? std::u16string(1, noName) : toText(name);
}

bool appendSegment(std::u16string_view text, std::string& bytes) {
    if (text.size() == 1 && text.front() == noName) return true;
    return appendBytes(text, bytes);
}

}  // namespace tessel::paths
