#include "archive/SegmentTables.hpp"

#include <bit>
#include <string>

#include "archive/ArchiveExceptions.hpp"
#include "archive/CodeTables.hpp"
#include "archive/Format.hpp"
#include "packing/ByteCursor.hpp"

namespace tessel::archive {
namespace {

using sixpacks::ByteCursor;

// Reads a count table whose symbols are the next entries of the token list.
CodePlaces takeCode(ByteCursor& cursor, std::uint32_t& entries,
                    const TokenList& tokens) {
    const auto counts = CountTable::unpack(cursor);
    require(counts.symbols() <= tokens.size() - entries);
    entries += static_cast<std::uint32_t>(counts.symbols());
    return CodePlaces(counts);
}

template <class Table>
Table takeTable(ByteCursor& cursor, unsigned symbols, unsigned maxBits) {
    return Table(LengthTable::unpack(cursor, symbols, maxBits));
}

std::span<const std::uint8_t> bytesOf(Section section, const SegmentHead& head,
                                      std::span<const std::uint8_t> body) {
    return body.subspan(head.offsetOf(section), head.bytesOf(section));
}

// Calls unpack; damage is told as damage of this section.
template <class Unpack>
void inSection(Section section, const SegmentHead& head,
               std::span<const std::uint8_t> body, Unpack unpack) {
    try {
        unpack(bytesOf(section, head, body));
    } catch (const DamagedFormException&) {
        throw DamagedArchiveException(head.offsetOf(section),
                                      "A table of codes breaks the rules.");
    }
}

}  // namespace

SegmentTables::SegmentTables(const SegmentHead& head,
                             std::span<const std::uint8_t> body)
    : tokens_{bytesOf(Section::TokenEntries, head, body),
              bytesOf(Section::TokenText, head, body)} {
    const auto in = [&](Section section, auto unpack) {
        inSection(section, head, body, unpack);
    };
    std::uint32_t entries = 0;
    in(Section::TokenEntries, [&](auto) { tokens_.validate(); });
    in(Section::TokenCodes,
       [&](auto bytes) { unpackTokenCodes(bytes, entries); });
    in(Section::FirstTokenCodes,
       [&](auto bytes) { unpackFirstTokenCodes(bytes, entries); });
    in(Section::TokenEntries,
       [&](auto) { require(entries == tokens_.size()); });
    in(Section::ReplacedCodes, [&](auto bytes) { unpackReplacedCodes(bytes); });
    in(Section::OperationCodes,
       [&](auto bytes) { unpackOperationCodes(bytes); });
}

static_assert(sizeof(SegmentTables) +
                      FolderStart * sizeof(SegmentTables::NameCode) +
                      (tokenContextCount - FolderStart) *
                          sizeof(SegmentTables::FolderCode) +
                      255 * sizeof(SegmentTables::FirstCode) <=
                  300'000,
              "The tables of a segment take more than 0.3 MB.");

void SegmentTables::unpackTokenCodes(std::span<const std::uint8_t> section,
                                     std::uint32_t& entries) {
    ByteCursor cursor(section);
    nameCodes_.reserve(FolderStart);
    folderCodes_.reserve(tokenContextCount - FolderStart);
    for (unsigned context = 0; context < tokenContextCount; ++context) {
        const std::uint32_t first = entries;
        const CodePlaces places = takeCode(cursor, entries, tokens_);
        if (context < FolderStart)
            nameCodes_.emplace_back(places, first, tokens_, nameContexts);
        else
            folderCodes_.emplace_back(places, first, tokens_, folderContexts);
    }
    require(cursor.empty());
}

void SegmentTables::unpackFirstTokenCodes(std::span<const std::uint8_t> section,
                                          std::uint32_t& entries) {
    ByteCursor cursor(section);
    const auto present = cursor.take(32);
    std::size_t count = 0;
    for (const std::uint8_t bits : present)
        count += static_cast<unsigned>(std::popcount(bits));
    firstCodes_.reserve(count);  // pointers to its elements are kept
    for (unsigned c = 0; c < 256; ++c) {
        if ((present[c / 8] >> (c % 8) & 1U) == 0) continue;
        const std::uint32_t first = entries;
        const CodePlaces places = takeCode(cursor, entries, tokens_);
        firstCodeOf_[c] =
            &firstCodes_.emplace_back(places, first, tokens_, nameContexts);
    }
    require(cursor.empty());
}

void SegmentTables::unpackReplacedCodes(std::span<const std::uint8_t> section) {
    ByteCursor cursor(section);
    for (ReplacedTable& code : replacedCodes_)
        code = takeTable<ReplacedTable>(cursor, 256, maxReplacedCodeBits);
    require(cursor.empty());
}

void SegmentTables::unpackOperationCodes(
    std::span<const std::uint8_t> section) {
    ByteCursor cursor(section);
    for (unsigned context = 0; context < operationCodeCount; ++context)
        operationCodes_[context] = takeTable<OperationTable>(
            cursor, context == jumpCode ? jumpSymbols : operationCount,
            maxOperationCodeBits);
    require(cursor.empty());
}

}  // namespace tessel::archive
