#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string_view>
#include <vector>

#include "archive/TokenCode.hpp"
#include "packing/ByteCursor.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

// A code of one symbol per length from 1 to `longest`, and a second one of
// that length.
CountTable onePerLength(unsigned longest) {
    CountTable counts;
    counts.maxLength = longest;
    for (unsigned bits = 1; bits <= longest; ++bits) counts.counts[bits] = 1;
    ++counts.counts[longest];
    return counts;
}

// Entry i is the text's byte i; the last one ends.
struct Letters {
    explicit Letters(std::string_view letters)
        : text(letters.begin(), letters.end()) {
        for (std::uint32_t i = 0; i < text.size(); ++i) {
            const std::uint32_t bits =
                TokenEntry{i, 1, i + 1 == text.size()}.packed();
            for (unsigned shift = 0; shift < 24; shift += 8)
                entries.push_back(static_cast<std::uint8_t>(bits >> shift));
        }
    }

    TokenList list() const { return {entries, text}; }

    Bytes text;
    Bytes entries;
};

// A word that starts with so many ones and goes on with zeros.
std::uint64_t ones(unsigned count) {
    return count == 0 ? 0 : ~std::uint64_t{0} << (64 - count);
}

TEST(CodePlaces, FindsEveryLength) {
    for (unsigned longest = 1; longest <= maxTokenCodeBits; ++longest) {
        const CodePlaces places(onePerLength(longest));
        EXPECT_EQ(places.shortest(), 1U);
        for (unsigned place = 0; place <= longest; ++place) {
            const auto found = places.find(ones(place), 1);
            EXPECT_EQ(found.place, place);
            EXPECT_EQ(found.bits, std::min(place + 1, longest));
        }
    }
}

TEST(CodePlaces, FindsTheOnlySymbol) {
    const CodePlaces places((CountTable()));
    for (const std::uint64_t word : {ones(0), ones(64)}) {
        EXPECT_EQ(places.find(word, 0).place, 0U);
        EXPECT_EQ(places.find(word, 0).bits, 0U);
    }
}

TEST(TokenCode, ShortAndLongCodesGiveTheSameTokens) {
    const Letters letters("aZ0-bY1/cX2");
    const TokenList list = letters.list();
    const CodePlaces places(onePerLength(10));
    const TokenCode<10> all(places, 0, list, nameContexts);
    const TokenCode<3> few(places, 0, list, nameContexts);
    for (unsigned i = 0; i <= 10; ++i) {
        for (const Token token : {all.decode(ones(i)), few.decode(ones(i))}) {
            EXPECT_EQ(token.offset(), i);
            EXPECT_EQ(token.length(), 1U);
            EXPECT_EQ(token.codeBits(), std::min(i + 1, 10U));
            EXPECT_EQ(token.ends(), i == 10);
            EXPECT_EQ(token.context(), nameContextAfter(letters.text[i]));
        }
    }
}

TEST(TokenList, RefusesEntriesBeyondTheText) {
    Letters letters("abc");
    EXPECT_NO_THROW(letters.list().validate());
    letters.text.pop_back();
    EXPECT_THROW(letters.list().validate(), DamagedFormException);
}

TEST(TokenList, RefusesHalfAnEntry) {
    Letters letters("abc");
    letters.entries.pop_back();
    EXPECT_THROW(letters.list().validate(), DamagedFormException);
}

TEST(TokenList, RefusesTheByteZero) {
    Letters letters("abc");
    letters.text[1] = 0;
    EXPECT_THROW(letters.list().validate(), DamagedFormException);
}

}  // namespace
}  // namespace tessel::archive
