#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/PieceDecoder.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/archive/ChangedSegment.hpp"

namespace tessel::archive {
namespace {

// Opens what decoders of names and folders build on.
class Bits : public PieceDecoder {
public:
    explicit Bits(const Segment& segment)
        : PieceDecoder(segment, Section::Names) {}

    using PieceDecoder::append;
    using PieceDecoder::isAtEnd;
    using PieceDecoder::Position;
    using PieceDecoder::startOf;
    using PieceDecoder::takeLongPrefix;
    using PieceDecoder::word;
};

// A segment whose names are these bytes, as far as they go.
class SegmentOfBits {
public:
    explicit SegmentOfBits(const std::vector<std::uint8_t>& bits)
        : changed_(archives::Paths{"some/name-to-replace", "z/another-name"},
                   [&](const SegmentHead& head, archives::Bytes& body) {
                       ASSERT_LE(bits.size(), head.bytesOf(Section::Names));
                       std::ranges::copy(
                           bits,
                           body.begin() + static_cast<std::ptrdiff_t>(
                                              head.offsetOf(Section::Names)));
                   }),
          segment_(changed_.bytes(), changed_.entry()) {}

    const Segment& operator*() const { return segment_; }

private:
    archives::ChangedSegment changed_;
    Segment segment_;
};

TEST(PieceDecoder, LoadsBitsUpToTheEndOfTheBlock) {
    const SegmentOfBits segment({0x12, 0x34, 0x56});
    const Bits bits(*segment);
    Bits::Position at = Bits::startOf({0, 2});
    EXPECT_EQ(bits.word(at) >> 40U, 0x123456U);
    at.bit = 4;
    EXPECT_EQ(bits.word(at) >> 44U, 0x23456U);
    at.bit = 16;
    EXPECT_NO_THROW(bits.word(at));
    at.bit = 17;
    EXPECT_THROW(bits.word(at), DamagedArchiveException);
}

TEST(PieceDecoder, TellsWhetherOnlyPaddingFollows) {
    Bits::Position at = Bits::startOf({1, 3});
    EXPECT_EQ(at.bit, 8U);
    EXPECT_EQ(at.end, 24U);
    at.bit = 16;
    EXPECT_FALSE(Bits::isAtEnd(at));
    at.bit = 17;
    EXPECT_TRUE(Bits::isAtEnd(at));
    at.bit = 24;
    EXPECT_TRUE(Bits::isAtEnd(at));
    at.bit = 25;
    EXPECT_FALSE(Bits::isAtEnd(at));
}

// n zero bits, then a number v of n + 1 bits: the prefix length is 124 + v.
TEST(PieceDecoder, TakesLongPrefixes) {
    const SegmentOfBits segment({0b1'010'011'0, 0b0100'0000});
    const Bits bits(*segment);
    Bits::Position at = Bits::startOf({0, 2});
    EXPECT_EQ(bits.takeLongPrefix(at), 125U);
    EXPECT_EQ(at.bit, 1U);
    EXPECT_EQ(bits.takeLongPrefix(at), 126U);
    EXPECT_EQ(at.bit, 4U);
    EXPECT_EQ(bits.takeLongPrefix(at), 127U);
    EXPECT_EQ(at.bit, 7U);
    EXPECT_EQ(bits.takeLongPrefix(at), 128U);
    EXPECT_EQ(at.bit, 12U);
}

TEST(PieceDecoder, RefusesPrefixesOfMoreThanAComponent) {
    // Twenty zeros, then a one and twenty zeros.
    const SegmentOfBits longest({0x00, 0x00, 0x08, 0x00, 0x00, 0x00});
    Bits::Position at = Bits::startOf({0, 6});
    EXPECT_EQ(Bits(*longest).takeLongPrefix(at), 124U + (1U << 20U));
    const SegmentOfBits longer({0x00, 0x00, 0x04, 0x00, 0x00, 0x00});
    at = Bits::startOf({0, 6});
    EXPECT_THROW(Bits(*longer).takeLongPrefix(at), DamagedArchiveException);
}

TEST(PieceDecoder, AppendsTokensOfAnyLength) {
    const archives::OpenArchive archive(
        archives::Paths(40, "a-long-name-that-becomes-one-token/in/all"));
    const Bits bits(archive.segment());
    const auto textBytes =
        static_cast<unsigned>(archive.segment().bytesOf(Section::TokenText));
    ASSERT_GT(textBytes, 0U);
    const std::string text(reinterpret_cast<const char*>(
                               archive.segment().dataOf(Section::TokenText)),
                           textBytes);
    for (unsigned length = 0; length <= std::min(31U, textBytes); ++length) {
        char out[Bits::slack];
        const char* const end =
            bits.append(Token({0, length, false}, 0, 1), out);
        EXPECT_EQ(std::string(std::as_const(out), end), text.substr(0, length));
    }
}

}  // namespace
}  // namespace tessel::archive
