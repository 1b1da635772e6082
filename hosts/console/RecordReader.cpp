#include "hosts/console/RecordReader.hpp"

#include <fmt/format.h>

#include <utility>

#include "hosts/console/ConsoleException.hpp"

namespace tessel::console {

namespace {

// Per system call. 64 KiB to 1 MiB made no difference for lists in the page
// cache; a pipe gives at most 64 KiB.
constexpr std::size_t readSize = std::size_t{256} << 10;

}  // namespace

RecordReader::RecordReader(InputFile& input, Separator separator)
    : input_(&input), separator_(static_cast<char>(separator)) {}

std::optional<std::string_view> RecordReader::next() {
    for (;;) {
        const std::size_t end = block_.find(separator_, scanned_);
        if (end != std::string::npos) {
            ++line_;
            scanned_ = end + 1;
            const std::size_t begin = std::exchange(start_, scanned_);
            return std::string_view(block_).substr(begin, end - begin);
        }
        scanned_ = block_.size();
        if (scanned_ - start_ > maxRecord) failTooLong();
        if (fill()) continue;
        if (start_ == block_.size()) return std::nullopt;
        ++line_;
        return std::string_view(block_).substr(
            std::exchange(start_, block_.size()));
    }
}

bool RecordReader::hasNext() const noexcept {
    return block_.find(separator_, scanned_) != std::string::npos;
}

std::string_view RecordReader::peek(std::size_t bytes) {
    while (block_.size() < bytes && fill()) {
    }
    return std::string_view(block_).substr(0, bytes);
}

std::string RecordReader::takeRest() {
    while (fill()) {
    }
    block_.erase(0, std::exchange(start_, 0));
    scanned_ = 0;
    return std::exchange(block_, {});
}

void RecordReader::failTooLong() const {
    throw ConsoleException(
        ExitStatus::BadInput,
        fmt::format("{}: no path is so long (line {}); {}", name(), line_ + 1,
                    separator_ == '\0' ? "is the list NUL-separated?"
                                       : "a NUL-separated list needs -0"));
}

bool RecordReader::fill() {
    block_.erase(0, start_);
    scanned_ -= start_;
    start_ = 0;
    const std::size_t kept = block_.size();
    block_.resize(kept + readSize);
    const std::size_t got = input_->read(block_.data() + kept, readSize);
    block_.resize(kept + got);
    bytesRead_ += got;
    return got > 0;
}

}  // namespace tessel::console
