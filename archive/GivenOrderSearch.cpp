#include "archive/GivenOrderSearch.hpp"

#include <algorithm>
#include <cstddef>

namespace tessel::archive {

GivenOrderSearch::GivenOrderSearch(const Segment& segment)
    : segment_(segment),
      paths_(segment),
      buffer_(segment.head().maxFolderBytes + FolderDecoder::slack),
      folders_(segment, buffer_.data()) {}

// The start of the block in which the folder is first named.
std::uint64_t GivenOrderSearch::firstPlaceAfter(std::uint32_t folder) const {
    return std::uint64_t{
               segment_.blockNaming(folder, 0, segment_.nameBlocks() - 1)} *
           segment_.head().namesPerBlock;
}

std::uint64_t GivenOrderSearch::find(std::string_view path) {
    const std::size_t nameStart = path.rfind('/') + 1;  // 0 without '/'
    const std::string_view wanted = path.substr(0, nameStart);
    const std::string_view name = path.substr(nameStart);
    std::uint32_t folder = 0;
    while (folder < segment_.head().folders && folders_.at(folder) != wanted)
        ++folder;
    if (folder == segment_.head().folders) return segment_.size();
    std::uint64_t place = firstPlaceAfter(folder);
    for (; place < segment_.size(); ++place) {
        paths_.seek(place);
        if (paths_.folderNumber() == folder && paths_.name() == name) break;
    }
    return place;
}

std::vector<NumberRange> GivenOrderSearch::startingWith(
    std::string_view prefix) {
    std::vector<bool> fits(segment_.head().folders);
    for (std::uint32_t f = 0; f < segment_.head().folders; ++f)
        fits[f] = folders_.at(f).starts_with(prefix);
    const auto first = std::ranges::find(fits, true);
    std::vector<NumberRange> found;
    if (first == fits.end()) return found;
    for (auto place =
             firstPlaceAfter(static_cast<std::uint32_t>(first - fits.begin()));
         place < segment_.size(); ++place) {
        paths_.seek(place);
        if (fits.at(paths_.folderNumber()))
            appendRange(found, {place, place + 1});
    }
    return found;
}

}  // namespace tessel::archive
