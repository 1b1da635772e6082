#include "archive/PathCursor.hpp"

#include <algorithm>
#include <cstring>

namespace tessel::archive {
namespace {

constexpr std::size_t slack = NameDecoder::slack;

std::size_t folderRoom(const Segment& segment) {
    return segment.head().maxFolderBytes + slack;
}

std::size_t nameRoom(const Segment& segment) {
    return segment.head().maxNameBytes + slack;
}

}  // namespace

// The buffer holds both decoders' folders, a path's folder and its name.
PathCursor::PathCursor(const Segment& segment)
    : segment_(segment),
      buffer_(3 * folderRoom(segment) + nameRoom(segment)),
      name_(buffer_.data() + 3 * folderRoom(segment)),
      names_(segment, name_),
      newest_(segment, buffer_.data()),
      earlier_(segment, buffer_.data() + folderRoom(segment)),
      perBlock_(segment.head().namesPerBlock) {}

void PathCursor::startBlockOf(std::uint64_t place) {
    const auto block = static_cast<std::uint32_t>(place / perBlock_);
    const std::uint64_t start = std::uint64_t{block} * perBlock_;
    const Segment::NameBlock found = segment_.nameBlock(block);
    if (start != blockEnd_) segment_.prefetchBlock(found);  // not the next one
    next_ = start;
    blockEnd_ = std::min<std::uint64_t>(start + perBlock_, segment_.size());
    names_.start(found);
}

void PathCursor::takeFolder() {
    const std::uint32_t folder = names_.folder();
    FolderDecoder& decoder = folder + 1 == names_.seen() ? newest_ : earlier_;
    const std::string_view text = decoder.at(folder);
    std::memcpy(name_ - text.size(), text.data(), text.size());
    folder_ = folder;
    folderLength_ = text.size();
}

}  // namespace tessel::archive
