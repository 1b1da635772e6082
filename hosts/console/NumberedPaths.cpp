#include "hosts/console/NumberedPaths.hpp"

namespace tessel::console {

NumberedPaths::NumberedPaths(const PathArchive& archive, PathOutput& output,
                             ProgressBar& bar)
    : archive_(&archive), output_(&output), bar_(&bar) {
    numbers_.reserve(maxNumbers);
}

void NumberedPaths::add(std::uint64_t number) {
    numbers_.push_back(number);
    if (numbers_.size() == maxNumbers) flush();
}

void NumberedPaths::add(const NumberRange& range) {
    for (std::uint64_t number = range.begin; number < range.end; ++number)
        add(number);
}

void NumberedPaths::flush() {
    archive_->read(numbers_,
                   [this](std::uint64_t number, std::string_view path) {
                       output_->write(number, path);
                   });
    written_ += numbers_.size();
    numbers_.clear();
    bar_->update(written_);
}

}  // namespace tessel::console
