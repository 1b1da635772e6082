#include "archive/SequentialReader.hpp"

#include <algorithm>

namespace tessel::archive {

void SequentialReader::enterSegment() {
    segment_ = &archive_.segment(archive_.segmentOf(number_));
    segmentEnd_ = segment_->entry().firstNumber + segment_->size();
    paths_.emplace(*segment_);
    batch_.reset();
    if (!isInPlace(*segment_)) batch_.emplace(*segment_);
    nextInBatch_ = 0;
}

// Takes the next paths of the segment into the batch, from number_ on.
void SequentialReader::fillBatch() {
    const PackedNumbers order(*segment_, Section::Order);
    const std::uint64_t first = number_ - segment_->entry().firstNumber;
    places_.resize(
        std::min<std::uint64_t>(batch_->room(), segmentEnd_ - number_));
    for (std::size_t i = 0; i < places_.size(); ++i)
        places_[i] = order.at(first + i);
    batch_->fill(places_);
    nextInBatch_ = 0;
}

std::string_view SequentialReader::nextInBatch() {
    if (nextInBatch_ == batch_->size()) fillBatch();
    return (*batch_)[nextInBatch_++];
}

std::string_view SequentialReader::next() {
    if (number_ == segmentEnd_) enterSegment();
    const std::string_view path =
        batch_ ? nextInBatch()
               : paths_->at(number_ - segment_->entry().firstNumber);
    archive_.requireIntact();
    ++number_;
    return path;
}

}  // namespace tessel::archive
