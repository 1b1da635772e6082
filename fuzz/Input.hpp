#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <iostream>
#include <span>
#include <string>
#include <vector>

// The function that libFuzzer calls with each input.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size);

namespace tessel::fuzz {

// Takes a fuzzed input apart, front to back. Every read succeeds: beyond the
// end there are only zeros and empty ranges. Borrows the bytes.
class Input {
public:
    Input(const std::uint8_t* data, std::size_t size) : rest_(data, size) {}

    bool empty() const { return rest_.empty(); }

    std::uint8_t byte() {
        if (rest_.empty()) return 0;
        const std::uint8_t first = rest_.front();
        rest_ = rest_.subspan(1);
        return first;
    }

    std::uint16_t number() {
        const unsigned low = byte();
        return static_cast<std::uint16_t>(low | unsigned{byte()} << 8);
    }

    // At most n bytes.
    std::vector<std::uint8_t> bytes(std::size_t n) {
        const auto head = rest_.first(std::min(n, rest_.size()));
        rest_ = rest_.subspan(head.size());
        return {head.begin(), head.end()};
    }

    // A length byte, then at most that many bytes.
    std::vector<std::uint8_t> block() { return bytes(byte()); }

    // All that is left.
    std::vector<std::uint8_t> remainder() { return bytes(rest_.size()); }

    // At most n UTF-16 code units, two bytes each.
    std::u16string text(std::size_t n) {
        std::u16string units;
        while (units.size() < n && !rest_.empty())
            units.push_back(static_cast<char16_t>(number()));
        return units;
    }

private:
    std::span<const std::uint8_t> rest_;
};

// Ends the process, as a fuzzing engine expects of a finding.
inline void require(bool holds, const char* what) {
    if (holds) return;
    std::cerr << "does not hold: " << what << std::endl;
    std::abort();
}

}  // namespace tessel::fuzz
