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
    // Where in the segment's bits a decoder is. Steps work on a local copy,
    // which stays in registers: a member would have to be stored and loaded
    // again around every byte that is written.
    struct Position {
        std::uint64_t bit = 0;
        std::uint64_t end = 0;  // of the block
    };

    PieceDecoder(const Segment& segment, Section section)
        : segment_(&segment),
          tables_(&segment.tables()),
          stream_(segment.dataOf(section)),
          section_(section) {}

    static Position startOf(const Segment::Block& block) noexcept {
        return {std::uint64_t{block.begin} * 8, std::uint64_t{block.end} * 8};
    }

    // At least bitsPerLoad bits from the position on.
    std::uint64_t word(const Position& at) const {
        if (at.bit > at.end) [[unlikely]]
            fail(at, "A block's bits go on after its end.");
        return loadBits(stream_, at.bit);
    }

    // Decodes tokens, from the one in this context up to one that ends the
    // piece, to `out`. codeOf(context) is the code of a context. Returns the
    // end of the output, which is at most `limit`.
    template <class CodeOf>
    [[gnu::always_inline]] char* takeTokens(Position& at, unsigned context,
                                            CodeOf codeOf,
                                            const ContextTable& contexts,
                                            char* out,
                                            const char* limit) const {
        for (;;) {
            const Token token = codeOf(context).decode(word(at));
            at.bit += token.codeBits();
            out = append(token, out);
            if (out > limit) [[unlikely]]
                fail(at, "A name or folder is longer than the longest.");
            if (token.ends()) return out;
            context = token.context();
            if (token.isEscape()) [[unlikely]] {
                const auto byte = static_cast<std::uint8_t>(word(at) >> 56U);
                at.bit += 8;
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
    unsigned takeLongPrefix(Position& at) const;

    // Whether nothing more than padding of less than a byte follows.
    static bool isAtEnd(const Position& at) noexcept {
        return at.bit <= at.end && at.end - at.bit < 8;
    }

    [[noreturn]] void fail(const Position& at, const char* what) const {
        segment_->fail(section_, at.bit / 8, what);
    }

    const SegmentTables& tables() const noexcept { return *tables_; }
    const SegmentHead& head() const noexcept { return segment_->head(); }
    const Segment& segment() const noexcept { return *segment_; }

private:
    const Segment* segment_;
    const SegmentTables* tables_;
    const std::uint8_t* stream_;
    Section section_;
};

}  // namespace tessel::archive
