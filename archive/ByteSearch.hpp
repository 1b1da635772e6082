#pragma once

#include <cstddef>
#include <string_view>

namespace tessel::archive {

// ByteSearch finds one text in many short ones: it looks for the text's rarest
// byte with memchr and compares the rest where it finds one.
//
// Ownership: borrows the text.
// Threads: const members from any number of threads.
class ByteSearch {
public:
    // The text must not be empty.
    explicit ByteSearch(std::string_view text) noexcept;

    std::string_view text() const noexcept { return text_; }

    bool isIn(std::string_view hay) const noexcept;

private:
    std::string_view text_;
    std::size_t rarest_;  // place of the rarest byte in the text
};

}  // namespace tessel::archive
