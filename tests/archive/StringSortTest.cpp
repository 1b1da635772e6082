#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "archive/StringSort.hpp"

namespace tessel::archive {
namespace {

void expectTextsSorted(const std::vector<std::string>& texts) {
    std::vector<StringItem> items(texts.size());
    for (std::uint32_t i = 0; i < items.size(); ++i)
        items[i] = {texts[i], 0, i};
    sortStrings(items);
    std::vector<std::pair<std::string, std::uint32_t>> expected;
    for (std::uint32_t i = 0; i < texts.size(); ++i)
        expected.emplace_back(texts[i], i);
    std::ranges::sort(expected);
    for (std::size_t i = 0; i < items.size(); ++i) {
        ASSERT_EQ(items[i].text, expected[i].first) << i;
        ASSERT_EQ(items[i].number, expected[i].second) << i;
    }
}

TEST(StringSortTest, SortsFewStrings) {
    expectTextsSorted({});
    expectTextsSorted({"one"});
    expectTextsSorted({"b", "a", "", "b", "ab", "\xFF", "\x01"});
}

TEST(StringSortTest, SortsManyWithSharedPrefixes) {
    std::mt19937 random(3);
    std::vector<std::string> texts(5000);
    for (std::string& text : texts) {
        // Lengths around the eight bytes that are compared at a time.
        text = std::string(random() % 20, 'x');
        for (std::size_t i = random() % 12; i > 0; --i)
            text += static_cast<char>(random() % 2 == 0 ? 'a' : 0xE9);
    }
    expectTextsSorted(texts);
}

TEST(StringSortTest, EqualStringsStayInOrder) {
    expectTextsSorted(
        std::vector<std::string>(1000, "the same, longer than eight"));
    expectTextsSorted(std::vector<std::string>(1000, "eight by"));
    expectTextsSorted(std::vector<std::string>(1000, ""));
}

TEST(StringSortTest, LongStringsNeedNoStack) {
    std::vector<std::string> texts(40, std::string(1 << 16, 'z'));
    for (std::size_t i = 0; i < texts.size(); ++i)
        texts[i] += std::to_string(i * 7 % 40);
    expectTextsSorted(texts);
}

}  // namespace
}  // namespace tessel::archive
