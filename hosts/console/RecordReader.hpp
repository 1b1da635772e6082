#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "hosts/console/InputFile.hpp"

namespace tessel::console {

// What separates the paths of a list.
enum class Separator : char { Newline = '\n', Nul = '\0' };

// RecordReader cuts an input at a separator. Bytes after the last separator
// are a record, too, if there are any.
//
// Ownership: borrows the input.
// Memory: one block, or the longest record if that is longer. A record of more
//   than maxRecord bytes ends with a ConsoleException: no path is so long.
class RecordReader {
public:
    static constexpr std::size_t maxRecord = (std::size_t{2} << 20) + 1;

    RecordReader(InputFile& input, Separator separator);

    // The next record, or nothing at the end. The view is valid until the
    // next call.
    std::optional<std::string_view> next();

    // Number of the last record, counted from 1, as users count lines.
    std::uint64_t line() const noexcept { return line_; }

    // Whether the next record is there without waiting for input.
    bool hasNext() const noexcept;

    std::uint64_t bytesRead() const noexcept { return bytesRead_; }

    const std::string& name() const noexcept { return input_->name(); }
    Separator separator() const noexcept {
        return static_cast<Separator>(separator_);
    }

    // The first bytes of the input, fewer only if it ends before. They are
    // still read as records. Call it before next.
    std::string_view peek(std::size_t bytes);

    // The rest of the input as it is, what was peeked at included.
    std::string takeRest();

private:
    // Reads more after what is left of the block. Returns false at the end.
    bool fill();
    [[noreturn]] void failTooLong() const;

    InputFile* input_;
    char separator_;
    std::string block_;
    std::size_t start_ = 0;    // of what is not handed out
    std::size_t scanned_ = 0;  // no separator between start_ and here
    std::uint64_t line_ = 0;
    std::uint64_t bytesRead_ = 0;
};

}  // namespace tessel::console
