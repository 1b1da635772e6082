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
// Cost: 200 to 300 KB per segment. There is one small table for each different
//   byte with which a name can go on after a prefix shared with the name
//   before.
class SegmentTables {
public:
    // Bits of a code that one lookup decodes. Measured on a million paths: a
    // lookup of twelve bits instead of ten decodes names in nine tenths of the
    // time and spends 60 KB more; for folders it makes a search by path 5 %
    // faster and spends 24 KB more.
    static constexpr unsigned nameLookupBits = 12;
    static constexpr unsigned folderLookupBits = 12;
    static constexpr unsigned firstLookupBits = 5;

    using NameCode = TokenCode<nameLookupBits>;
    using FolderCode = TokenCode<folderLookupBits>;
    using FirstCode = TokenCode<firstLookupBits>;
    using OperationTable = SymbolTable<maxOperationCodeBits>;
    using ReplacedTable = SymbolTable<maxReplacedCodeBits>;

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
    // By one of the token contexts of names, or of folders.
    const NameCode& nameCode(unsigned context) const noexcept {
        return nameCodes_[context];
    }
    const FolderCode& folderCode(unsigned context) const noexcept {
        return folderCodes_[context - FolderStart];
    }
    // By one of the operation contexts, folderPrefixCode or jumpCode.
    const OperationTable& operationCode(unsigned context) const noexcept {
        return operationCodes_[context];
    }
    const ReplacedTable& replacedCode(unsigned context) const noexcept {
        return replacedCodes_[context];
    }
    // The code of the first token of names that share a prefix and go on with
    // this byte, or nullptr.
    const FirstCode* firstCode(unsigned byte) const noexcept {
        return byte < 256 ? firstCodeOf_[byte] : nullptr;
    }

private:
    void unpackTokenCodes(std::span<const std::uint8_t> section,
                          std::uint32_t& entries);
    void unpackFirstTokenCodes(std::span<const std::uint8_t> section,
                               std::uint32_t& entries);
    void unpackReplacedCodes(std::span<const std::uint8_t> section);
    void unpackOperationCodes(std::span<const std::uint8_t> section);

    TokenList tokens_;
    std::vector<NameCode> nameCodes_;
    std::vector<FolderCode> folderCodes_;
    std::vector<FirstCode> firstCodes_;
    std::array<const FirstCode*, 256> firstCodeOf_{};
    std::array<ReplacedTable, replacedContextCount> replacedCodes_;
    std::array<OperationTable, operationCodeCount> operationCodes_;
};

}  // namespace tessel::archive
