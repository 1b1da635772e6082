#include <gtest/gtest.h>

#include <string>

#include "archive/TokenCoder.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

// Two tokens after lower-case letters, two after a shared prefix.
class TokenCoderTest : public testing::Test {
protected:
    TokenCoderTest() : model_({"ab", "cd"}, learnedUses(), 1), uses_(2) {
        for (int i = 0; i < 5; ++i)
            uses_.add(TokenRef::token(ab(), NameAfterLower));
        for (int i = 0; i < 2; ++i)
            uses_.add(TokenRef::token(cd(), NameAfterLower));
        uses_.add(TokenRef::literal('x', NameAfterLower));
        uses_.add(TokenRef::token(ab(), firstTokenContext));
        uses_.add(TokenRef::literal('a', firstTokenContext));
        uses_.add(TokenRef::token(cd(), firstTokenContext));
    }

    static TokenUses learnedUses() {
        TokenUses uses(2);
        for (int i = 0; i < 9; ++i)
            uses.add(TokenRef::token(i % 3 == 0 ? 1 : 0, NameAfterLower));
        return uses;
    }
    std::uint32_t ab() const { return model_.tokens()[0] == "ab" ? 0 : 1; }
    std::uint32_t cd() const { return 1 - ab(); }

    static Bytes put(const TokenCoder& coder, TokenRef step) {
        BitWriter out;
        coder.put(out, step);
        out.put(0b11, 2);  // shows where the code ends
        return out.take();
    }

    TokenModel model_;
    TokenUses uses_;
};

TEST_F(TokenCoderTest, FrequentTokensAreShort) {
    const TokenCoder coder(model_, uses_);
    EXPECT_EQ(put(coder, TokenRef::token(ab(), NameAfterLower)),
              Bytes{0b01100000});
    EXPECT_EQ(put(coder, TokenRef::token(cd(), NameAfterLower)),
              Bytes{0b10110000});
    // The escape, then the byte.
    EXPECT_EQ(put(coder, TokenRef::literal('x', NameAfterLower)),
              (Bytes{0b11011110, 0b00110000}));
}

TEST_F(TokenCoderTest, EachFirstByteHasItsOwnCode) {
    const TokenCoder coder(model_, uses_);
    // The only one of its byte takes no bits; of two, one bit each.
    EXPECT_EQ(put(coder, TokenRef::token(cd(), firstTokenContext)),
              Bytes{0b11000000});
    EXPECT_EQ(put(coder, TokenRef::token(ab(), firstTokenContext)),
              Bytes{0b01100000});
    EXPECT_EQ(put(coder, TokenRef::literal('a', firstTokenContext)),
              Bytes{0b11100000});
}

TEST_F(TokenCoderTest, SectionsHoldTablesAndEntries) {
    const TokenCoder coder(model_, uses_);
    EXPECT_EQ(coder.tokenCodes(), (Bytes{0, 0, 2, 1, 2, 0, 0, 0, 0}));
    Bytes first(32);
    first['a' / 8] = 1U << 'a' % 8 | 1U << 'c' % 8;
    first.insert(first.end(), {1, 2, 0});
    EXPECT_EQ(coder.firstTokenCodes(), first);
    // Six escapes of contexts without tokens, three entries of context 2, two
    // of the first byte a, one of c.
    EXPECT_EQ(coder.entries().size(), 3U * (6 + 3 + 2 + 1));
    EXPECT_EQ(coder.text().size(), 4U);
}

}  // namespace
}  // namespace tessel::archive
