#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "archive/PieceDecoder.hpp"

namespace tessel::archive {

// NameDecoder decodes the names of a block one by one, each in the place of
// its predecessor, with the numbers of their folders.
//
// Ownership: borrows the segment and the output.
// Threads: one thread at a time.
// Cost: no allocation; about 15 ns per name.
class NameDecoder : private PieceDecoder {
public:
    using PieceDecoder::slack;

    // name  takes up to maxNameBytes + slack bytes
    NameDecoder(const Segment& segment, char* name)
        : PieceDecoder(segment, Section::Names),
          name_(name),
          limit_(name + segment.head().maxNameBytes) {}

    // Goes to the start of a block, before its first name.
    void start(const Segment::NameBlock& block) noexcept {
        position_ = startOf(block);
        seen_ = block.seen;
        folder_ = block.seen - 1;
        length_ = 0;
        context_ = firstInBlock;
        previous_ = operationNextFolder;
    }

    // Decodes the next name of the block. The caller counts the names. Throws
    // DamagedArchiveException.
    void next();

    std::string_view name() const noexcept { return {name_, length_}; }
    std::size_t length() const noexcept { return length_; }

    // The folder of the name: if the archive is sound, less than seen().
    std::uint32_t folder() const noexcept { return folder_; }

    // Folders named so far, in all blocks up to this name.
    std::uint32_t seen() const noexcept { return seen_; }

    // Whether the block holds nothing more than padding of less than a byte.
    bool isAtEnd() const noexcept { return PieceDecoder::isAtEnd(position_); }

private:
    unsigned takePrefix(Position& at);
    Position takeRareOperation(Position at, unsigned symbol, unsigned& prefix);
    void takeNextFolder(const Position& at);
    void takeJump(Position& at);
    char* takeShortened(Position& at, unsigned prefix) const;
    char* takeRest(Position& at, unsigned context, char* out) const;

    Position position_;
    char* name_;
    const char* limit_;
    std::size_t length_ = 0;
    std::uint32_t seen_ = 0;
    std::uint32_t folder_ = 0;
    unsigned context_ = 0;   // of the next operation
    unsigned previous_ = 0;  // operation, or operationNextFolder at the start
};

// ---- Hot paths ----

[[gnu::always_inline]] inline unsigned NameDecoder::takePrefix(Position& at) {
    const auto [symbol, bits] =
        tables().operationCode(context_).decode(word(at));
    at.bit += bits;
    if (symbol > maxShortPrefix) {
        unsigned prefix = 0;
        at = takeRareOperation(at, symbol, prefix);
        return prefix;
    }
    const unsigned operation = operationOfSymbol(symbol, previous_);
    previous_ = operation;
    context_ = operationContexts[operation];
    if (operation > length_) [[unlikely]]
        fail(at, "A name shares more than its predecessor has.");
    return operation;
}

// The tokens up to the name's end.
[[gnu::always_inline]] inline char* NameDecoder::takeRest(Position& at,
                                                          unsigned context,
                                                          char* out) const {
    const auto codeOf = [this](unsigned c) -> const auto& {
        return tables().nameCode(c);
    };
    return takeTokens(at, context, codeOf, nameContexts, out, limit_);
}

// The name goes on with another byte than its predecessor, or ends.
[[gnu::always_inline]] inline char* NameDecoder::takeShortened(
    Position& at, unsigned prefix) const {
    const unsigned context =
        prefix == length_
            ? replacedEnd
            : replacedContexts[static_cast<std::uint8_t>(name_[prefix])];
    const std::uint64_t bits = word(at);
    const auto [byte, byteBits] = tables().replacedCode(context).decode(bits);
    at.bit += byteBits;
    char* out = name_ + prefix;
    if (byte == 0) return out;
    const auto* const first = tables().firstCode(byte);
    if (first == nullptr) [[unlikely]]
        fail(at, "A name goes on with a byte that has no code.");
    const Token token = first->decode(bits << byteBits);
    at.bit += token.codeBits();
    unsigned next = token.context();
    if (token.isEscape()) {
        *out++ = static_cast<char>(byte);
        next = nameContexts[byte];
    } else {
        out = append(token, out);
    }
    if (out > limit_) [[unlikely]]
        fail(at, "A name is longer than the longest.");
    if (token.ends()) return out;
    return takeRest(at, next, out);
}

inline void NameDecoder::next() {
    Position at = position_;
    const unsigned prefix = takePrefix(at);
    const char* const end = prefix == 0 ? takeRest(at, NameStart, name_)
                                        : takeShortened(at, prefix);
    length_ = static_cast<std::size_t>(end - name_);
    position_ = at;
}

}  // namespace tessel::archive
