#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "archive/Contexts.hpp"
#include "archive/Format.hpp"
#include "archive/SymbolTable.hpp"
#include "archive/TokenCode.hpp"

namespace tessel::archive {

// The codes of a segment, ready to decode with.
//
// Ownership: borrows the token entries and the token text.
// Threads: const members from any number of threads.
// Cost: 120 to 270 KB, depending on how many different bytes names have.
class SegmentTables {
public:
    // Bits of a code that one lookup decodes. Measured on lists of a million
    // paths: about half of the tokens have longer codes than ten bits, and
    // twelve save no time because the tables leave the first-level cache.
    static constexpr unsigned tokenLookupBits = 10;
    static constexpr unsigned firstLookupBits = 6;

    using TokenTable = TokenCode<tokenLookupBits>;
    using OperationTable = SymbolTable<maxOperationCodeBits>;
    using ReplacedTable = SymbolTable<maxReplacedCodeBits>;

    // The first token of names that share a prefix and go on with `byte`.
    struct FirstToken {
        std::uint8_t byte;
        TokenCode<firstLookupBits> code;
    };

    // body: the whole body of the segment, with sound bytes in the sections up
    // to TokenText. Throws DamagedArchiveException, whose offset is that of
    // the section within the body, if they break the format's rules.
    SegmentTables(const SegmentHead& head, std::span<const std::uint8_t> body);

    // The code tables point into this object.
    SegmentTables(const SegmentTables&) = delete;
    SegmentTables& operator=(const SegmentTables&) = delete;
    ~SegmentTables() = default;

    const std::uint8_t* tokenText() const noexcept {
        return tokens_.text.data();
    }
    const TokenTable& tokenCode(unsigned context) const noexcept {
        return tokenCodes_[context];
    }
    // By one of the operation contexts, folderPrefixCode or jumpCode.
    const OperationTable& operationCode(unsigned context) const noexcept {
        return operationCodes_[context];
    }
    const ReplacedTable& replacedCode(unsigned context) const noexcept {
        return replacedCodes_[context];
    }
    // The first-token code of a byte, or nullptr.
    const FirstToken* firstToken(unsigned byte) const noexcept {
        return byte < 256 ? firstTokenOf_[byte] : nullptr;
    }

private:
    void unpackTokenCodes(std::span<const std::uint8_t> section,
                          std::uint32_t& entries);
    void unpackFirstTokenCodes(std::span<const std::uint8_t> section,
                               std::uint32_t& entries);
    void unpackReplacedCodes(std::span<const std::uint8_t> section);
    void unpackOperationCodes(std::span<const std::uint8_t> section);

    TokenList tokens_;
    std::vector<TokenTable> tokenCodes_;
    std::vector<FirstToken> firstTokens_;
    std::array<const FirstToken*, 256> firstTokenOf_{};
    std::array<ReplacedTable, replacedContextCount> replacedCodes_;
    std::array<OperationTable, operationCodeCount> operationCodes_;
};

}  // namespace tessel::archive
