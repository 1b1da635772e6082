#include "archive/SequentialReader.hpp"

namespace tessel::archive {

void SequentialReader::enterSegment() {
    segment_ = &archive_.segment(archive_.segmentOf(number_));
    segmentEnd_ = segment_->entry().firstNumber + segment_->size();
    paths_.emplace(*segment_);
}

std::string_view SequentialReader::next() {
    if (number_ == segmentEnd_) enterSegment();
    const std::uint64_t inSegment = number_ - segment_->entry().firstNumber;
    const std::string_view path = paths_->at(placeOf(*segment_, inSegment));
    ++number_;
    return path;
}

}  // namespace tessel::archive
