#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <vector>

#include "archive/Contexts.hpp"
#include "archive/FrontCoder.hpp"

namespace tessel::archive {

// Contexts of a token: seven of its own code, and "after a shared prefix".
inline constexpr std::size_t contextSlots = tokenContextCount + 1;

// One step of a cut piece: a token, or a byte that no token covers.
class TokenRef {
public:
    TokenRef() = default;
    static TokenRef token(std::uint32_t number, std::uint8_t context) {
        return TokenRef(number | std::uint32_t{context} << contextShift);
    }
    static TokenRef literal(std::uint8_t byte, std::uint8_t context) {
        return TokenRef(literalFlag | byte |
                        std::uint32_t{context} << contextShift);
    }

    bool isLiteral() const noexcept { return (bits_ & literalFlag) != 0; }
    // The token's number or the literal's byte.
    std::uint32_t value() const noexcept { return bits_ & valueMask; }
    std::uint8_t context() const noexcept {
        return static_cast<std::uint8_t>(bits_ >> contextShift & 7U);
    }
    // The piece ends with this step.
    bool isLast() const noexcept { return (bits_ & lastFlag) != 0; }
    void markLast() noexcept { bits_ |= lastFlag; }

private:
    explicit TokenRef(std::uint32_t bits) : bits_(bits) {}

    static constexpr std::uint32_t literalFlag = std::uint32_t{1} << 31;
    static constexpr std::uint32_t lastFlag = std::uint32_t{1} << 30;
    static constexpr unsigned contextShift = 27;
    static constexpr std::uint32_t valueMask =
        (std::uint32_t{1} << contextShift) - 1;

    std::uint32_t bits_ = 0;
};

// How often each token and each literal is used in each context.
class TokenUses {
public:
    TokenUses() = default;
    explicit TokenUses(std::size_t tokens) : counts_(tokens * contextSlots) {}

    void add(TokenRef step) {
        if (!step.isLiteral())
            ++counts_[step.value() * contextSlots + step.context()];
        else if (step.context() == firstTokenContext)
            ++firstLiterals_[step.value()];
        else
            ++literals_[step.context()];
    }

    std::uint32_t of(std::size_t token, std::size_t context) const {
        return counts_[token * contextSlots + context];
    }
    // Literals after the shared prefix, by their byte, and all others.
    std::uint32_t firstLiterals(std::uint8_t byte) const {
        return firstLiterals_[byte];
    }
    std::uint32_t literals(std::size_t context) const {
        return literals_[context];
    }

    bool isUsed(std::size_t token) const {
        const auto row =
            counts_.begin() + static_cast<std::ptrdiff_t>(token * contextSlots);
        return std::any_of(row, row + contextSlots,
                           [](std::uint32_t count) { return count > 0; });
    }

    // Of the same tokens.
    TokenUses& operator+=(const TokenUses& other) {
        const auto add = [](auto& sums, const auto& counts) {
            std::ranges::transform(sums, counts, sums.begin(), std::plus<>());
        };
        add(counts_, other.counts_);
        add(firstLiterals_, other.firstLiterals_);
        add(literals_, other.literals_);
        return *this;
    }

private:
    std::vector<std::uint32_t> counts_;
    std::array<std::uint32_t, 256> firstLiterals_{};
    std::array<std::uint32_t, contextSlots> literals_{};
};

}  // namespace tessel::archive
