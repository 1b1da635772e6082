// Lists of components in one buffer. (ComponentArenaTest has what fills it.)

#include <gtest/gtest.h>

#include "pathtree/ComponentArena.hpp"
#include "pathtree/ComponentList.hpp"
#include "tests/support/Trees.hpp"

namespace {

using tessel::Component;
using tessel::ComponentArena;
using tessel::ComponentList;
using tessel::Components;

Components copied(const ComponentList& list) {
    Components values;
    for (const tessel::ComponentView value : list)
        values.emplace_back(value.begin(), value.end());
    return values;
}

TEST(ComponentList, OneOfNothingIsEmpty) {
    const ComponentList list;
    EXPECT_TRUE(list.empty());
    EXPECT_EQ(list.size(), 0U);
    EXPECT_TRUE(list.bytes().empty());
    EXPECT_TRUE(copied(list).empty());
}

TEST(ComponentList, LengthsAboutTheMarkOfLongOnesComeBack) {
    ComponentArena arena;
    Components values;
    for (const std::size_t length :
         {0U, 1U, 252U, 253U, 254U, 255U, 256U, 70000U})
        values.emplace_back(length, static_cast<std::uint8_t>(length % 251));
    const ComponentList list = support::packedBy(arena, values);
    EXPECT_FALSE(list.empty());
    EXPECT_EQ(list.size(), values.size());
    EXPECT_EQ(copied(list), values);
}

TEST(ComponentList, ItsBytesTellListsOfEqualTextApart) {
    ComponentArena arena;
    const auto whole = support::packedBy(arena, support::components({"ab"}));
    const auto parts =
        support::packedBy(arena, support::components({"a", "b"}));
    const auto again = support::packedBy(arena, support::components({"ab"}));
    EXPECT_FALSE(tessel::sameComponent(whole.bytes(), parts.bytes()));
    EXPECT_TRUE(tessel::sameComponent(whole.bytes(), again.bytes()));
    EXPECT_EQ(whole.bytes().size(), 3U);
    EXPECT_EQ(parts.bytes().size(), 4U);
}

}  // namespace
