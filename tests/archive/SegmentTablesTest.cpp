#include <gtest/gtest.h>

#include <cstdint>
#include <set>
#include <span>
#include <string>

#include "archive/ArchiveExceptions.hpp"
#include "archive/SegmentTables.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/archive/ChangedSegment.hpp"

namespace tessel::archive {
namespace {

using archives::Bytes;

// The tables of a segment after `change` was made to its body.
template <class Change>
void openTables(Change change) {
    archives::ChangedSegment(archives::Paths{"a/bc", "a/bd", "b"},
                             [&](const SegmentHead& head, Bytes& body) {
                                 change(head, body);
                                 const SegmentTables tables(head, body);
                             });
}

// Expects damage in a section after a byte of it got this value.
void expectDamage(Section section, std::uint64_t offset, std::uint8_t value) {
    try {
        openTables([&](const SegmentHead& head, Bytes& body) {
            body[head.offsetOf(section) + offset] = value;
        });
        ADD_FAILURE() << "section " << static_cast<unsigned>(section);
    } catch (const DamagedArchiveException& damage) {
        SegmentHead head;
        openTables([&](const SegmentHead& sound, Bytes&) { head = sound; });
        EXPECT_EQ(damage.offset(), head.offsetOf(section));
    }
}

// The archive of docs/archive-format.md.
TEST(SegmentTables, HoldTheCodesOfASmallList) {
    openTables([](const SegmentHead& head, const Bytes& body) {
        const SegmentTables tables(head, body);
        // Context 0 has the token "b" alone, context 2 the end or the escape.
        const Token first = tables.nameCode(0).decode(0);
        EXPECT_EQ(first.codeBits(), 0U);
        EXPECT_EQ(first.length(), 1U);
        EXPECT_EQ(tables.tokenText()[first.offset()], 'b');
        EXPECT_EQ(first.context(), 2U);
        EXPECT_TRUE(tables.nameCode(2).decode(0).ends());
        constexpr auto one = std::uint64_t{1} << 63U;
        EXPECT_TRUE(tables.nameCode(2).decode(one).isEscape());
        EXPECT_TRUE(tables.folderCode(5).decode(one).isEscape());
        // The first name of a block is in the next folder.
        EXPECT_EQ(tables.operationCode(firstInBlock).decode(0).symbol,
                  operationNextFolder);
        // After "c" comes "d".
        EXPECT_EQ(tables.replacedCode(replacedContext('c')).decode(0).symbol,
                  static_cast<unsigned>('d'));
        EXPECT_GE(tables.replacedCode(replacedContext('d')).decode(0).symbol,
                  256U);
    });
}

TEST(SegmentTables, HaveFirstCodesForSomeBytes) {
    openTables([](const SegmentHead& head, const Bytes& body) {
        const SegmentTables tables(head, body);
        for (unsigned byte = 0; byte < 300; ++byte)
            EXPECT_EQ(tables.firstCode(byte) != nullptr, byte == 'd') << byte;
    });
}

TEST(SegmentTables, RefuseCodesThatBreakTheRules) {
    // More codes of one bit than there are; more bits than a code may have.
    expectDamage(Section::TokenCodes, 3, 3);
    expectDamage(Section::TokenCodes, 0, maxTokenCodeBits + 1);
    // A bit for one more first byte, whose code is missing.
    expectDamage(Section::FirstTokenCodes, 0, 1);
    // More symbols than bytes for their lengths; more symbols than there are.
    expectDamage(Section::ReplacedCodes, 1, 200);
    expectDamage(Section::OperationCodes, 1, 200);
    // Text beyond the end of all text.
    expectDamage(Section::TokenEntries, 1, 1);
}

TEST(SegmentTables, RefuseTextWithTheByteZero) {
    expectDamage(Section::TokenEntries, 2, 0xFF);
    EXPECT_THROW(openTables([](const SegmentHead& head, Bytes& body) {
                     body[head.offsetOf(Section::TokenText)] = 0;
                 }),
                 DamagedArchiveException);
}

}  // namespace
}  // namespace tessel::archive
