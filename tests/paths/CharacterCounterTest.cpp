// Counting characters, and the code that is made for them.

#include <gtest/gtest.h>

#include <string>
#include <string_view>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "paths/CharacterCounter.hpp"
#include "paths/PathText.hpp"

namespace {

using namespace tessel::paths;

TEST(CharacterCounter, CountsUnitsOfAllPages) {
    CharacterCounter counter;
    counter.add(u"aba\xFFFF");
    counter.add(u'\0');
    counter.addBytes("a\xC3\xA9\xFF\xF0\x9F\x98\x80");
    const CharacterCounts counts = counter.result();
    EXPECT_EQ(counts.characters,
              (std::u16string{u'\0', u'a', u'b', 0xE9, 0xD83D, 0xDCFF, 0xDE00,
                              0xFFFF}));
    EXPECT_EQ(counts.frequencies,
              (std::vector<double>{1, 3, 1, 1, 1, 1, 1, 1}));
}

TEST(CharacterCounter, AUnitOfAnotherPageIsCountedWhereverItIs) {
    for (std::size_t length = 1; length < 12; ++length) {
        for (std::size_t at = 0; at < length; ++at) {
            for (const char16_t far : {u'\x100', u'\xFF61', u'\xFF'}) {
                std::u16string text(length, u'a');
                text[at] = far;
                CharacterCounter counter;
                counter.add(text);
                const CharacterCounts counts = counter.result();
                const auto others = static_cast<double>(length - 1);
                if (length == 1) {
                    EXPECT_EQ(counts.characters, text);
                    continue;
                }
                EXPECT_EQ(counts.characters, (std::u16string{u'a', far}));
                EXPECT_EQ(counts.frequencies, (std::vector<double>{others, 1}));
            }
        }
    }
}

TEST(CharacterCounter, BytesAreCountedAsTheirText) {
    for (std::size_t length = 1; length < 30; ++length) {
        for (std::size_t at = 0; at < length; ++at) {
            for (const std::string_view far : {"\xC3\xA9", "\xFF", "\x7F"}) {
                std::string bytes(length, 'a');
                bytes.replace(at, 1, far);
                CharacterCounter ofBytes;
                ofBytes.addBytes(bytes);
                CharacterCounter ofText;
                for (const char16_t unit : toText(bytes)) ofText.add(unit);
                EXPECT_EQ(ofBytes.result().characters,
                          ofText.result().characters);
                EXPECT_EQ(ofBytes.result().frequencies,
                          ofText.result().frequencies);
            }
        }
    }
}

TEST(CharacterCounter, StartsWithNothing) {
    const CharacterCounts counts = CharacterCounter().result();
    EXPECT_TRUE(counts.characters.empty());
    EXPECT_TRUE(counts.frequencies.empty());
}

TEST(CoderFor, OneCharacterGetsACode) {
    for (const char16_t only : {u'a', u'\0', u'\1'}) {
        const auto coder = coderFor({std::u16string(1, only), {3}});
        EXPECT_EQ(coder->codeOf(only).size(), 1U);
        EXPECT_EQ(coder->getTreeString().size(), 2U);
    }
}

TEST(CoderFor, NoCharactersGiveNoCode) {
    EXPECT_TRUE(coderFor({})->getTreeString().empty());
}

TEST(CoderFor, FrequentCharactersGetShortCodes) {
    const auto coder = coderFor({u"abc", {1, 1, 10}});
    EXPECT_EQ(coder->codeOf(u'c').size(), 1U);
    EXPECT_EQ(coder->codeOf(u'a').size(), 2U);
}

}  // namespace
