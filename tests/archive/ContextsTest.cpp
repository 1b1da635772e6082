#include <gtest/gtest.h>

#include <set>

#include "archive/Contexts.hpp"

namespace tessel::archive {
namespace {

std::uint8_t nameContext(char c) {
    return nameContexts[static_cast<std::uint8_t>(c)];
}

TEST(ContextsTest, TheByteBeforeChoosesTheTokenCode) {
    EXPECT_EQ(nameContext('0'), NameAfterDigit);
    EXPECT_EQ(nameContext('9'), NameAfterDigit);
    EXPECT_EQ(nameContext('a'), NameAfterLower);
    EXPECT_EQ(nameContext('z'), NameAfterLower);
    EXPECT_EQ(nameContext('A'), NameAfterUpper);
    EXPECT_EQ(nameContext('\x80'), NameAfterUpper);
    EXPECT_EQ(nameContext('\xFF'), NameAfterUpper);
    for (const char other : {'/', ':', '@', '[', '`', '{', '\x7F', '\x01'})
        EXPECT_EQ(nameContext(other), NameAfterOther) << other;
    EXPECT_EQ(folderContexts['/'], FolderStart);
    EXPECT_EQ(folderContexts['a'], FolderInside);
}

TEST(ContextsTest, ReplacedBytesHaveContextsOfTheirOwn) {
    EXPECT_EQ(replacedContexts[0x20], 0);
    EXPECT_EQ(replacedContexts[0x7F], 95);
    EXPECT_EQ(replacedContexts[0x1F], replacedOther);
    EXPECT_EQ(replacedContexts[0x80], replacedOther);
    EXPECT_LT(replacedEnd, replacedContextCount);
}

TEST(ContextsTest, OperationsAreGroupedByPrefixLength) {
    struct Group {
        unsigned first, last;
        std::uint8_t context;
    };
    for (const Group group :
         {Group{0, 0, 1}, Group{1, 2, 2}, Group{3, 4, 3}, Group{5, 6, 4},
          Group{7, 8, 5}, Group{9, 10, 6}, Group{11, 12, 7}, Group{13, 15, 8},
          Group{16, 19, 9}, Group{20, 24, 10}, Group{25, 31, 11},
          Group{32, 41, 12}, Group{42, 55, 13}, Group{56, 125, 14},
          Group{126, 127, 0}})
        for (unsigned op = group.first; op <= group.last; ++op)
            EXPECT_EQ(operationContexts[op], group.context) << op;
}

TEST(ContextsTest, SymbolsAreAPermutationOfOperations) {
    for (unsigned previous = 0; previous < operationCount; ++previous) {
        std::set<unsigned> symbols;
        for (unsigned op = 0; op < operationCount; ++op) {
            const unsigned symbol = symbolOfOperation(op, previous);
            EXPECT_EQ(operationOfSymbol(symbol, previous), op);
            symbols.insert(symbol);
        }
        EXPECT_EQ(symbols.size(), operationCount);
        EXPECT_EQ(*symbols.rbegin(), operationCount - 1);
    }
}

TEST(ContextsTest, TheSameLengthAgainIsSymbolZero) {
    EXPECT_EQ(symbolOfOperation(17, 17), 0U);
    EXPECT_EQ(symbolOfOperation(0, 17), 1U);
    EXPECT_EQ(symbolOfOperation(16, 17), 17U);
    EXPECT_EQ(symbolOfOperation(18, 17), 18U);
    EXPECT_EQ(symbolOfOperation(17, operationLongPrefix), 17U);
    EXPECT_EQ(symbolOfOperation(operationLongPrefix, operationLongPrefix),
              operationLongPrefix);
}

}  // namespace
}  // namespace tessel::archive
