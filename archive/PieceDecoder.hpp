#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "archive/BitLoad.hpp"
#include "archive/Contexts.hpp"
#include "archive/Format.hpp"
#include "archive/Segment.hpp"
#include "archive/SegmentTables.hpp"

namespace tessel::archive {

// PieceDecoder reads the bit stream of one block and decodes pieces from it:
// what the decoders of names and folders have in common.
//
// The bits may be hostile. Before each load, the position is compared with the
// block's end; before each copy, the output with its limit. Every step either
// ends the piece or appends a byte, so a piece ends.
//
// Ownership: borrows the segment and the output.
// Threads: one thread at a time.
class PieceDecoder {
public:
    // Bytes that must follow the limit of any output, because text is copied
    // in blocks of this size.
    static constexpr std::size_t slack = 32;

protected:
    PieceDecoder(const Segment& segment, Section section)
        : segment_(&segment),
          tables_(&segment.tables()),
          stream_(segment.dataOf(section)),
          section_(section) {}

    void startAt(const Segment::Block& block) noexcept {
        bit_ = std::uint64_t{block.begin} * 8;
        end_ = std::uint64_t{block.end} * 8;
    }

    // At least bitsPerLoad bits from the current position on.
    std::uint64_t word() const {
        if (bit_ > end_) [[unlikely]]
            fail("A block's bits go on after its end.");
        return loadBits(stream_, bit_);
    }

    // Decodes tokens, from the one in this context up to one that ends the
    // piece, to `out`. Returns the end of the output, which is at most
    // `limit`.
    [[gnu::always_inline]] char* takeTokens(unsigned context,
                                            const ContextTable& contexts,
                                            char* out, const char* limit) {
        for (;;) {
            const Token token = tables_->tokenCode(context).decode(word());
            bit_ += token.codeBits();
            out = append(token, out);
            if (out > limit) [[unlikely]]
                fail("A name or folder is longer than the longest.");
            if (token.ends()) return out;
            context = token.context();
            if (token.isEscape()) [[unlikely]] {
                const auto byte = static_cast<std::uint8_t>(word() >> 56U);
                bit_ += 8;
                if (byte == 0) return out;
                *out++ = static_cast<char>(byte);
                context = contexts[byte];
            }
        }
    }

    // Copies the token's text and returns its end. Writes up to `slack` bytes.
    char* append(Token token, char* out) const noexcept {
        const std::uint8_t* const text = tables_->tokenText() + token.offset();
        std::memcpy(out, text, 16);
        if (token.length() > 16) [[unlikely]]
            std::memcpy(out + 16, text + 16, 16);
        return out + token.length();
    }

    // The rest of a prefix length above maxShortPrefix (Elias's gamma code).
    unsigned takeLongPrefix();

    [[noreturn]] void fail(const char* what) const {
        segment_->fail(section_, bit_ / 8, what);
    }

    // NOLINTBEGIN(cppcoreguidelines-non-private-member-variables-in-classes)
    const Segment* segment_;
    const SegmentTables* tables_;
    const std::uint8_t* stream_;
    std::uint64_t bit_ = 0;
    std::uint64_t end_ = 0;  // of the block
    Section section_;
    // NOLINTEND(cppcoreguidelines-non-private-member-variables-in-classes)
};

}  // namespace tessel::archive
