#include <gtest/gtest.h>

#include <stdexcept>
#include <string_view>
#include <thread>

#include "hosts/embedded/Array.hpp"

namespace tessel::embedded {

namespace {

using TextArray = InlineArray<char16_t>;
using Numbers = ContainerArray<std::vector<double>>;

TextArray* textOf(std::u16string_view text) {
    return TextArray::make(ValueClass::Char, Shape(1, text.size()), text);
}

// Counts how many of its kind there are.
struct Counted {
    Counted() noexcept { ++alive; }
    Counted(const Counted& /*other*/) noexcept { ++alive; }
    Counted& operator=(const Counted&) = default;
    ~Counted() { --alive; }
    friend bool operator==(const Counted&, const Counted&) { return true; }

    static int alive;
};
int Counted::alive = 0;

}  // namespace

TEST(ShapeTest, TwoDimensionsAreEqualHoweverTheyAreGiven) {
    EXPECT_EQ(Shape(2, 3), Shape(Dimensions{2, 3}));
    EXPECT_EQ(Shape(2, 3).count(), 6U);
    EXPECT_FALSE(Shape(2, 3) == Shape(3, 2));
    EXPECT_FALSE(Shape(2, 3) == Shape(Dimensions{2, 3, 1}));
    EXPECT_FALSE(Shape(Dimensions{}) == Shape(1, 1));
}

TEST(ShapeTest, OtherNumbersOfDimensionsAreKept) {
    for (const Dimensions& dimensions :
         {Dimensions{}, Dimensions{4}, Dimensions{2, 3, 4}}) {
        const Shape shape(dimensions);
        const Shape copy = shape;  // NOLINT(performance-unnecessary-copy*)
        EXPECT_EQ(copy.dimensions(), dimensions);
        EXPECT_EQ(copy, shape);
    }
}

TEST(ShapeTest, CountsThatOverflowAreRefused) {
    const std::size_t huge = std::size_t{1} << 63U;
    EXPECT_THROW(Shape(huge, 2), std::length_error);
    EXPECT_THROW(Shape(Dimensions{2, huge}), std::length_error);
    EXPECT_EQ(Shape(huge, 1).count(), huge);
    EXPECT_EQ(Shape(huge, 0).count(), 0U);
}

TEST(ArrayTest, NewArrayHasOneReference) {
    const TextArray* const array = textOf(u"abc");
    EXPECT_TRUE(array->isUnique());
    array->addReference();
    EXPECT_FALSE(array->isUnique());
    array->drop();
    EXPECT_TRUE(array->isUnique());
    EXPECT_EQ(array->elements()[2], u'c');
    array->drop();
}

TEST(ArrayTest, LastReferenceDestroysTheElements) {
    auto* const array =
        InlineArray<Counted>::make(ValueClass::Logical, Shape(2, 2));
    EXPECT_EQ(Counted::alive, 4);
    Array* const copy = array->clone();
    EXPECT_EQ(Counted::alive, 8);
    array->addReference();
    array->drop();
    EXPECT_EQ(Counted::alive, 8);
    array->drop();
    copy->drop();
    EXPECT_EQ(Counted::alive, 0);
}

TEST(ArrayTest, CloneIsEqualAndSeparate) {
    TextArray* const array = textOf(u"abc");
    Array* const copy = array->clone();
    EXPECT_TRUE(array->hasElementsOf(*copy));
    EXPECT_EQ(copy->shape(), array->shape());
    EXPECT_EQ(copy->valueClass(), ValueClass::Char);
    array->elements()[0] = u'x';
    EXPECT_FALSE(array->hasElementsOf(*copy));
    array->drop();
    copy->drop();
}

TEST(ArrayTest, ContainerIsClonedWithItsContent) {
    auto* const array = new Numbers(ValueClass::Double, Shape(2, 1), {1, 2});
    auto* const copy = static_cast<Numbers*>(array->clone());
    copy->content[1] = 3;
    EXPECT_EQ(array->content, (std::vector<double>{1, 2}));
    EXPECT_FALSE(array->hasElementsOf(*copy));
    array->drop();
    copy->drop();
}

TEST(ArrayTest, MoreThanCanBeAddressedIsRefused) {
    EXPECT_THROW(
        TextArray::make(ValueClass::Char, Shape(std::size_t{1} << 47U, 1)),
        std::bad_alloc);
}

TEST(ArrayTest, ReferencesAreCountedOnManyThreads) {
    TextArray* const array = textOf(u"abc");
    const auto share = [array] {
        for (int i = 0; i < 10'000; ++i) {
            array->addReference();
            EXPECT_EQ(array->elements()[1], u'b');
            array->drop();
        }
    };
    std::thread first(share);
    std::thread second(share);
    first.join();
    second.join();
    EXPECT_TRUE(array->isUnique());
    array->drop();
}

}  // namespace tessel::embedded
