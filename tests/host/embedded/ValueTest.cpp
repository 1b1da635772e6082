#include <gtest/gtest.h>

#include <limits>
#include <memory>
#include <stdexcept>
#include <variant>

#include "hosts/embedded/Classes.hpp"
#include "hosts/embedded/Value.hpp"
#include "tests/support/Sizes.hpp"

namespace tessel::embedded {

TEST(ValueTest, DefaultIsZeroByZeroDouble) {
    const Value value;
    EXPECT_EQ(value.valueClass(), ValueClass::Double);
    EXPECT_EQ(value.dimensions(), (Dimensions{0, 0}));
    EXPECT_EQ(value.numel(), 0U);
}

TEST(ValueTest, NumberOfElementsIsProductOfDimensions) {
    EXPECT_EQ(Value::cell({2, 3, 4}).numel(), 24U);
    EXPECT_EQ(Value::cell({7}).numel(), 7U);
    EXPECT_EQ(Value::cell({5, 0, 3}).numel(), 0U);
    EXPECT_EQ(Value::cell({5, 0, 3}).dimensions(), (Dimensions{5, 0, 3}));
}

TEST(ValueTest, ArrayWithoutDimensionsHasOneElement) {
    EXPECT_EQ(Value::cell({}).numel(), 1U);
    EXPECT_EQ(Value::doubles({}, {3}).numel(), 1U);
}

TEST(ValueTest, ElementsMustFitDimensions) {
    EXPECT_THROW(Value::chars({2, 2}, u"abc"), std::invalid_argument);
    EXPECT_THROW(Value::doubles({2, 1}, {1}), std::invalid_argument);
    EXPECT_THROW(Value::complexDoubles({1, 1}, {1}), std::invalid_argument);
    EXPECT_THROW(Value::complexDoubles({2, 1}, {1, 2}), std::invalid_argument);
    EXPECT_THROW(Value::bytes({0, 0}, {1}), std::invalid_argument);
    EXPECT_THROW(Value::objects({1, 1}, {nullptr}), std::invalid_argument);
}

TEST(ValueTest, DimensionsThatOverflowAreRefused) {
    const std::size_t huge = std::numeric_limits<std::size_t>::max() / 2;
    EXPECT_THROW(Value::cell({huge, 3}), std::length_error);
    EXPECT_THROW(Value::structure({3, huge}), std::length_error);
    EXPECT_EQ(elementCount({huge, 0}), 0U);
}

TEST(ValueTest, CopiesAreDeep) {
    Value cell = Value::cell({1, 2});
    cell.setElement(0, Value::text(u"a"));
    Value copy = cell;
    copy.setElement(0, Value::text(u"b"));
    EXPECT_EQ(cell.element(0), Value::text(u"a"));
    EXPECT_NE(cell, copy);
}

TEST(ValueTest, MovedFromValueHasNoElements) {
    Value source = Value::chars({2, 1, 2}, u"abcd");
    const Value target = std::move(source);
    EXPECT_EQ(source.numel(), 0U);  // NOLINT(bugprone-use-after-move)
    EXPECT_EQ(target.charData(), u"abcd");
    EXPECT_EQ(target.dimensions(), (Dimensions{2, 1, 2}));
}

TEST(ValueTest, EqualityComparesClassShapeAndElements) {
    EXPECT_EQ(Value::logical(true), Value::logicals({1, 1}, {1}));
    EXPECT_NE(Value::logical(true), Value::bytes({1, 1}, {1}));
    EXPECT_NE(Value::chars({1, 2}, u"ab"), Value::chars({2, 1}, u"ab"));
    EXPECT_NE(Value::doubles({1, 2}, {1, 2}),
              Value::complexDoubles({1, 1}, {1, 2}));
}

TEST(ValueTest, StructFieldsAreSetElementByElement) {
    Value value = Value::structure({1, 2});
    value.setField("b", Value::scalar(1), 1);
    value.setField("a", Value::scalar(2));
    EXPECT_EQ(value.fieldNames(), (std::vector<std::string>{"b", "a"}));
    EXPECT_EQ(value.field("b", 0), Value());
    EXPECT_EQ(value.field("b", 1), Value::scalar(1));
    EXPECT_EQ(value.field("a"), Value::scalar(2));
    EXPECT_FALSE(value.hasField("c"));
    EXPECT_THROW(value.field("c"), std::out_of_range);
    EXPECT_THROW(value.field("a", 2), std::out_of_range);
}

TEST(ValueTest, CopiesShareOneArrayUntilOneIsChanged) {
    Value cell = Value::cell({1, 2});
    const Value copy = cell;
    EXPECT_EQ(copy.array(), cell.array());
    cell.setElement(1, Value::scalar(1));
    EXPECT_NE(copy.array(), cell.array());
    EXPECT_EQ(copy.element(1), Value());
    const HostArray* const alone = cell.array();
    cell.setElement(0, Value::scalar(2));
    EXPECT_EQ(cell.array(), alone);
}

TEST(ValueTest, StructOfACopyIsChangedAlone) {
    Value value = Value::structure();
    value.setField("a", Value::scalar(1));
    const Value copy = value;
    value.setField("a", Value::scalar(2));
    value.setField("b", Value());
    EXPECT_EQ(copy.field("a"), Value::scalar(1));
    EXPECT_FALSE(copy.hasField("b"));
}

TEST(ValueTest, CellThatHoldsItselfHoldsACopy) {
    Value cell = Value::cell({1, 1});
    cell.setElement(0, cell);
    EXPECT_EQ(cell.element(0), Value::cell({1, 1}));
}

TEST(ValueTest, AssignmentToItselfKeepsTheValue) {
    Value value = Value::text(u"abc");
    const Value& same = value;
    value = same;
    EXPECT_EQ(value, Value::text(u"abc"));
}

TEST(ValueTest, ReleasedArrayIsAdoptedWithItsReference) {
    Value source = Value::text(u"abc");
    const Value witness = source;
    HostArray* const array = source.release();
    EXPECT_EQ(source, Value());
    EXPECT_EQ(BorrowedValue(array)->charData(), u"abc");
    const Value adopted = Value::adopt(array);
    EXPECT_EQ(adopted.array(), witness.array());
    EXPECT_EQ(Value::adopt(nullptr), Value());
}

TEST(ValueTest, EmptyValueIsReleasedAsAnArray) {
    Value empty;
    const Value adopted = Value::adopt(empty.release());
    EXPECT_EQ(adopted, Value());
    EXPECT_NE(adopted.array(), empty.array());
}

TEST(ValueTest, SharedArrayOutlivesItsFirstValue) {
    Value source = Value::texts({u"a", u"b"});
    const Value shared = Value::share(source.array());
    source = Value();
    EXPECT_EQ(shared, Value::texts({u"a", u"b"}));
}

TEST(ValueTest, OwnArrayIsNotSharedWithCopies) {
    Value value = Value::column({1, 2});
    const Value copy = value;
    EXPECT_NE(value.ownArray(), copy.array());
    static_cast<double*>(value.ownNumericData())[0] = 7;
    EXPECT_EQ(value, Value::column({7, 2}));
    EXPECT_EQ(copy, Value::column({1, 2}));
}

TEST(ValueTest, AccessorsForAnotherClassThrow) {
    EXPECT_THROW(Value::scalar(1).charData(), std::bad_variant_access);
    EXPECT_THROW(Value::text(u"a").doubleData(), std::bad_variant_access);
    EXPECT_THROW(Value::text(u"a").byteData(), std::bad_variant_access);
    EXPECT_THROW(Value::text(u"a").element(0), std::bad_variant_access);
    EXPECT_THROW(Value::byteColumn({1}).truth(0), std::bad_variant_access);
    EXPECT_THROW(Value().setField("a", Value()), std::bad_variant_access);
}

TEST(ValueTest, IndicesOutsideThrow) {
    Value cell = Value::cell({2, 1});
    EXPECT_THROW(cell.element(2), std::out_of_range);
    EXPECT_THROW(cell.setElement(2, Value()), std::out_of_range);
    EXPECT_THROW(Value::logical(true).truth(1), std::out_of_range);
}

// ---- Nesting ----

// As deep as memory allows, on the usual stack of 8 MiB.
constexpr std::size_t deepest = support::shareOf(1'000'000);

Value nestedCells(std::size_t depth, Value innermost) {
    Value value = std::move(innermost);
    for (std::size_t i = 0; i < depth; ++i) {
        Value outer = Value::cell(1, 1);
        outer.setElement(0, std::move(value));
        value = std::move(outer);
    }
    return value;
}

// The nested value is the last element, after a text and an empty cell; every
// other one is a field of a struct.
Value nestedValues(std::size_t depth, Value innermost) {
    Value value = std::move(innermost);
    for (std::size_t i = 0; i < depth; ++i) {
        Value outer = Value::cell(1, 3);
        outer.setElement(0, Value::text(u"name"));
        outer.setElement(1, Value::cell(0, 1));
        outer.setElement(2, std::move(value));
        value = Value::structure();
        value.setField("first", Value::scalar(1));
        value.setField("inner", std::move(outer));
    }
    return value;
}

TEST(ValueTest, DeeplyNestedValuesAreReleased) {
    nestedCells(deepest, Value::text(u"x"));
    nestedValues(deepest / 4, Value::text(u"x"));
}

TEST(ValueTest, DeeplyNestedValuesAreCompared) {
    const Value cells = nestedCells(deepest, Value::text(u"x"));
    EXPECT_TRUE(cells == nestedCells(deepest, Value::text(u"x")));
    EXPECT_FALSE(cells == nestedCells(deepest, Value::text(u"y")));
    EXPECT_FALSE(cells == nestedCells(deepest - 1, Value::text(u"x")));
    const Value values = nestedValues(deepest / 4, Value::scalar(1));
    EXPECT_TRUE(values == nestedValues(deepest / 4, Value::scalar(1)));
    EXPECT_FALSE(values == nestedValues(deepest / 4, Value::scalar(2)));
}

TEST(ValueTest, DeeplyNestedValuesAreCopiedAndChanged) {
    Value value = nestedCells(deepest, Value::text(u"x"));
    const Value copy = value.clone();
    value.setElement(0, Value());
    EXPECT_FALSE(value == copy);
    Value inner = copy.element(0);
    EXPECT_EQ(inner.valueClass(), ValueClass::Cell);
}

// What a part of a nested value is shared with stays as it is.
TEST(ValueTest, SharedPartsOfAReleasedValueStay) {
    const Value shared = nestedValues(3, Value::text(u"shared"));
    const Value same = nestedValues(3, Value::text(u"shared"));
    for (const std::size_t place : {0U, 1U, 2U}) {
        Value outer = Value::cell(1, 3);
        outer.setElement(place, shared);
        outer.setElement((place + 1) % 3, outer);
        nestedCells(5, std::move(outer));
        EXPECT_EQ(shared, same);
    }
    Value twice = Value::structure({1, 2});
    twice.setField("a", shared, 0);
    twice.setField("a", shared, 1);
    twice = Value();
    EXPECT_EQ(shared, same);
}

TEST(ValueTest, WideNestedValuesAreReleased) {
    Value wide = Value::cell(300, 1);
    for (std::size_t i = 0; i < 300; ++i) {
        Value inner = Value::cell(i % 4, 1);
        for (std::size_t k = 0; k < i % 4; ++k)
            inner.setElement(k, nestedValues(k, Value::text(u"leaf")));
        wide.setElement(i, std::move(inner));
    }
    const Value copy = wide.clone();
    wide = Value();
    EXPECT_EQ(copy.element(7).element(2),
              nestedValues(2, Value::text(u"leaf")));
}

}  // namespace tessel::embedded
