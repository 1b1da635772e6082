#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include "archive/BitWriter.hpp"
#include "archive/TokenModel.hpp"
#include "archive/TokenUses.hpp"

namespace tessel::archive {

// The token codes of a segment: seven by context, and one per first byte after
// a shared prefix. Each has the tokens that are used there, and the escape if
// a literal is.
//
// Ownership: borrows nothing once it is made.
// Threads: reading from several threads is safe.
class TokenCoder {
public:
    TokenCoder(const TokenModel& model, const TokenUses& uses);

    // The step must be among the counted uses.
    void put(BitWriter& out, TokenRef step) const {
        const std::uint8_t context = step.context();
        if (!step.isLiteral()) {
            put(out, codes_[step.value() * contextSlots + context]);
        } else if (context == firstTokenContext) {
            put(out, firstLiteralCodes_[step.value()]);
        } else {
            put(out, literalCodes_[context]);
            out.put(step.value(), 8);
        }
    }

    // ---- Sections ----

    const std::vector<std::uint8_t>& tokenCodes() const { return tokenCodes_; }
    const std::vector<std::uint8_t>& firstTokenCodes() const {
        return firstTokenCodes_;
    }
    const std::vector<std::uint8_t>& entries() const { return entries_; }
    const std::string& text() const { return text_; }

private:
    struct Code {
        std::uint32_t bits = 0;
        std::uint32_t length = 0;
    };
    // A token, or the escape, with its count.
    struct Symbol {
        std::uint32_t token;
        std::uint64_t count;
    };
    static constexpr std::uint32_t escape = 0xFFFFFFFF;

    static void put(BitWriter& out, const Code& code) {
        out.put(code.bits, code.length);
    }
    class Builder;

    std::vector<Code> codes_;  // [token * contextSlots + context]
    std::array<Code, contextSlots> literalCodes_;
    std::array<Code, 256> firstLiteralCodes_;
    std::vector<std::uint8_t> tokenCodes_;
    std::vector<std::uint8_t> firstTokenCodes_;
    std::vector<std::uint8_t> entries_;
    std::string text_;
};

}  // namespace tessel::archive
