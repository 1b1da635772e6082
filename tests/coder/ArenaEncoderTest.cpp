// Texts encoded into arenas, beside the model of the code.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <string>
#include <vector>

#include "coder/ArenaEncoder.hpp"
#include "coder/CoderErrors.hpp"
#include "tests/support/Coders.hpp"

namespace {

using support::Bytes;
using support::CoderPtr;
using tessel::ArenaEncoder;
using tessel::ComponentArena;
using tessel::ComponentList;

std::vector<Bytes> componentsOf(const ComponentList& list) {
    std::vector<Bytes> components;
    for (const tessel::ComponentView value : list)
        components.emplace_back(value.begin(), value.end());
    return components;
}

// A code for ASCII and for two characters beyond it. Each frequency is the one
// before times the factor: with 1 all codes are of about the same length, with
// 2 they are of every length up to the number of characters.
struct Code {
    explicit Code(double factor) {
        std::vector<double> frequencies;
        double frequency = 1;
        const auto add = [&](char16_t unit) {
            characters.push_back(unit);
            frequencies.push_back(frequency);
            frequency *= factor;
        };
        for (char16_t unit = u'!'; unit < 0x7F; ++unit) add(unit);
        add(0xE9);
        add(0x6F22);
        coder = support::coderWith(characters, frequencies);
    }

    Bytes encoded(const std::u16string& text) const {
        return coder->generateCodeFor(text);
    }

    std::u16string characters;
    CoderPtr coder;
};

const Code& codeOfFactor(double factor) {
    static const Code even(1);
    static const Code usual(1.1);
    static const Code deep(2);
    return factor == 1 ? even : factor == 2 ? deep : usual;
}

// Texts of all the code's characters, of the frequent ones, or of the last
// four: of these, texts of any length are encoded without a long code.
std::u16string anyText(const Code& code) {
    const std::size_t first =
        code.characters.size() -
        *rc::gen::element<std::size_t>(4, 30, code.characters.size());
    const std::size_t length = *rc::gen::weightedOneOf<std::size_t>(
        {{8, rc::gen::inRange<std::size_t>(1, 20)},
         {1, rc::gen::inRange<std::size_t>(250, 260)},
         {1, rc::gen::inRange<std::size_t>(400, 3000)}});
    std::u16string text;
    for (const std::size_t at : *rc::gen::container<std::vector<std::size_t>>(
             length, rc::gen::inRange(first, code.characters.size())))
        text.push_back(code.characters[at]);
    return text;
}

RC_GTEST_PROP(ArenaEncoder, AppendsWhatTheCoderEncodesTextsTo, ()) {
    const Code& code = codeOfFactor(*rc::gen::element(1.0, 1.1, 2.0));
    const ArenaEncoder encoder(code.coder->code());
    ComponentArena arena;
    std::vector<Bytes> expected;
    const int count = *rc::gen::inRange(0, 12);
    for (int i = 0; i < count; ++i) {
        const std::u16string text = anyText(code);
        expected.push_back(code.encoded(text));
        const std::string bytes(text.begin(), text.end());
        const bool isAscii =
            text.find_first_of(u"\u00E9\u6F22") == std::u16string::npos;
        const std::size_t length =
            isAscii ? encoder.appendAscii(bytes, arena) : 0;
        if (length == 0)
            RC_ASSERT(encoder.append(text, arena) == expected.back().size());
        else
            RC_ASSERT(length == expected.back().size());
    }
    RC_ASSERT(componentsOf(arena.finish()) == expected);
}

TEST(ArenaEncoder, ShortAsciiIsEncodedFromBytesWhateverItsLength) {
    const Code& code = codeOfFactor(1);
    const ArenaEncoder encoder(code.coder->code());
    for (std::size_t length = 1; length <= 255; ++length) {
        ComponentArena arena;
        const std::string bytes(length, 'a');
        const Bytes expected = code.encoded(std::u16string(length, u'a'));
        ASSERT_EQ(encoder.appendAscii(bytes, arena), expected.size());
        ASSERT_EQ(componentsOf(arena.finish()), std::vector<Bytes>{expected});
    }
}

TEST(ArenaEncoder, OtherBytesAreLeftToTheirText) {
    const ArenaEncoder usual(codeOfFactor(1).coder->code());
    const ArenaEncoder deep(codeOfFactor(2).coder->code());
    ComponentArena arena;
    EXPECT_EQ(usual.appendAscii("", arena), 0U);
    EXPECT_EQ(usual.appendAscii(std::string(256, 'a'), arena), 0U);
    EXPECT_EQ(deep.appendAscii("~~~!~~~", arena), 0U);  // a long code
    for (std::size_t length = 1; length < 10; ++length) {
        for (std::size_t at = 0; at < length; ++at) {
            for (const char other : {' ', '\x7F', '\x80', '\xE9', '\xFF'}) {
                std::string bytes(length, 'a');
                bytes[at] = other;
                EXPECT_EQ(usual.appendAscii(bytes, arena), 0U);
            }
        }
    }
    EXPECT_TRUE(arena.finish().empty());
}

TEST(ArenaEncoder, ATextThatCannotBeEncodedAppendsNothing) {
    const ArenaEncoder encoder(codeOfFactor(1).coder->code());
    ComponentArena arena;
    encoder.append(u"ab", arena);
    EXPECT_THROW(encoder.append(u"", arena), tessel::NoCodeForEmptyString);
    for (const std::u16string& text :
         {std::u16string(u" "), std::u16string(u"abcd\u0100"),
          std::u16string(u"abc\uFFFFdefgh"), std::u16string(300, u' ')})
        EXPECT_THROW(encoder.append(text, arena),
                     tessel::CodeNotFoundException);
    encoder.append(u"c", arena);
    const std::vector<Bytes> expected = {codeOfFactor(1).encoded(u"ab"),
                                         codeOfFactor(1).encoded(u"c")};
    EXPECT_EQ(componentsOf(arena.finish()), expected);
}

TEST(ArenaEncoder, ACodeWithoutBitsGivesEmptyComponents) {
    tessel::HuffmanPathTree coder;
    coder.boolTree = {true};
    coder.inflateHuffman(u"a");
    const ArenaEncoder encoder(coder.code());
    ComponentArena arena;
    EXPECT_EQ(encoder.appendAscii("aa", arena), 0U);
    EXPECT_EQ(encoder.append(u"aa", arena), 0U);
    EXPECT_EQ(componentsOf(arena.finish()), std::vector<Bytes>{Bytes()});
}

}  // namespace
