#pragma once

#include <cstdint>
#include <string_view>

#include "hosts/console/OutputBuffer.hpp"
#include "hosts/console/RecordReader.hpp"
#include "hosts/patterns/PathMatcher.hpp"

namespace tessel::console {

// Whether a path's number and a tab come before the path.
enum class Numbering { None, Numbers };

// PathOutput writes paths one per record: its number if asked for, the path,
// the separator.
//
// Ownership: borrows the output and the matcher.
class PathOutput {
public:
    PathOutput(OutputBuffer& output, Separator separator, Numbering numbering)
        : output_(&output),
          separator_(static_cast<char>(separator)),
          numbering_(numbering) {}

    // Colours what the matcher finds from now on.
    void colour(const patterns::PathMatcher& matches) noexcept {
        matches_ = &matches;
    }

    void write(std::uint64_t number, std::string_view path) {
        if (numbering_ == Numbering::Numbers) writeNumber(number);
        if (matches_ == nullptr)
            output_->write(path);
        else
            writeColoured(path);
        output_->put(separator_);
    }

private:
    void writeNumber(std::uint64_t number);
    void writeColoured(std::string_view path);

    OutputBuffer* output_;
    char separator_;
    Numbering numbering_;
    const patterns::PathMatcher* matches_ = nullptr;
};

}  // namespace tessel::console
