#include "hosts/console/PathOutput.hpp"

#include <fmt/format.h>

#include <cstddef>

namespace tessel::console {

namespace {

// Bold red, as grep colours its matches.
constexpr std::string_view colourStart = "\x1b[01;31m";
constexpr std::string_view colourEnd = "\x1b[m";

}  // namespace

void PathOutput::writeNumber(std::uint64_t number) {
    const fmt::format_int digits(number);
    output_->write({digits.data(), digits.size()});
    output_->put('\t');
}

void PathOutput::writeColoured(std::string_view path) {
    std::size_t at = 0;
    for (const patterns::Span& span : matches_->spans(path)) {
        output_->write(path.substr(at, span.begin - at));
        output_->write(colourStart);
        output_->write(path.substr(span.begin, span.end - span.begin));
        output_->write(colourEnd);
        at = span.end;
    }
    output_->write(path.substr(at));
}

}  // namespace tessel::console
