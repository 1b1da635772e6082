#include <gtest/gtest.h>

#include <limits>
#include <new>
#include <stdexcept>

#include "hosts/embedded/HostException.hpp"
#include "tests/host/HostFixture.hpp"

// Values, names, packages, and what a plug-in can do with arrays.
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

namespace {

// What a plug-in sees, without one.
class OperationsTest : public testing::Test {
protected:
    std::string errorKey(const std::function<void()>& action) {
        return errorOf(action).identifier();
    }

    Host host_{testOptions()};
    HostInterface& operations_ = host_.operations();
};

}  // namespace

TEST_F(OperationsTest, NumberOfElements) {
    const Value none = Value::cell({});
    const Value cube = Value::cell({2, 3, 4});
    EXPECT_EQ(operations_.hostNumel(none.array()), 1U);
    EXPECT_EQ(operations_.hostNumel(cube.array()), 24U);
}

TEST_F(OperationsTest, NarrowTextIsUtf8AndKeepsLoneSurrogates) {
    const Value text = Value::text(u"a\u00E9\u20AC\U0001F600\xD800");
    EXPECT_EQ(operations_.hostGetString(text.array()),
              "a\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80\xED\xA0\x80");
}

TEST_F(OperationsTest, TextOfAnotherClassIsHostError) {
    for (const Value& other : {Value(), Value::cell({1, 1}), Value::scalar(1),
                               Value::bytes({1, 1}, {65})}) {
        EXPECT_EQ(errorKey([&] { operations_.hostGetString(other.array()); }),
                  "VELOX:embedded:wrongClass");
        EXPECT_EQ(errorKey([&] { operations_.hostGetUString(other.array()); }),
                  "VELOX:embedded:wrongClass");
    }
}

TEST_F(OperationsTest, RealElementsOfComplexDataAreEverySecondValue) {
    const Value complex = Value::complexDoubles({3, 1}, {1, -1, 2, -2, 3, -3});
    std::vector<double> real = {99};
    operations_.hostRealElements(complex.array(), real);
    EXPECT_EQ(real, (std::vector<double>{1, 2, 3}));
}

TEST_F(OperationsTest, ElementsAreReadAsTheirOwnClassOnly) {
    const Value doubles = Value::column({1, 2});
    const Value bytes = Value::byteColumn({1, 2});
    const Value truths = Value::logicals({2, 1}, {1, 0});
    std::vector<double> asDoubles;
    std::vector<std::uint8_t> asBytes;
    EXPECT_EQ(errorKey([&] {
                  operations_.hostRealElements(bytes.array(), asDoubles);
              }),
              "VELOX:embedded:wrongClass");
    EXPECT_EQ(errorKey([&] {
                  operations_.hostRealElements(doubles.array(), asBytes);
              }),
              "VELOX:embedded:wrongClass");
    EXPECT_EQ(errorKey([&] {
                  operations_.hostRealElements(truths.array(), asBytes);
              }),
              "VELOX:embedded:wrongClass");
}

TEST_F(OperationsTest, DoubleDataIsRefusedWhereItWouldBeReadOutside) {
    const Value two = Value::column({1, 2});
    EXPECT_EQ(operations_.hostDoubleData(two.array(), 2)[1], 2);
    EXPECT_EQ(errorKey([&] { operations_.hostDoubleData(two.array(), 3); }),
              "VELOX:embedded:tooFewElements");
}

TEST_F(OperationsTest, PlacesOutsideAreHostErrors) {
    const Value cell = Value::cell({2, 1});
    EXPECT_EQ(
        operations_.hostNumel(operations_.hostCellElement(cell.array(), 1)),
        0U);
    EXPECT_EQ(errorKey([&] { operations_.hostCellElement(cell.array(), 2); }),
              "VELOX:embedded:indexOutside");
    Value structure = Value::structure({0, 1});
    EXPECT_EQ(errorKey([&] {
                  operations_.hostFieldElement(structure.array(), "a", 0);
              }),
              "VELOX:embedded:fieldMissing");
    HostArray* const made = operations_.hostCreateCell(1, 1);
    EXPECT_EQ(errorKey([&] {
                  operations_.hostSetCell(
                      made, 1, operations_.hostCreateLogicalScalar(true));
              }),
              "VELOX:embedded:indexOutside");
    operations_.hostReleaseArray(made);
}

TEST_F(OperationsTest, FieldOfStructWithoutElementsIsHostError) {
    Value one = Value::structure();
    one.setField("a", Value::scalar(1));
    EXPECT_EQ(
        errorKey([&] { operations_.hostFieldElement(one.array(), "a", 1); }),
        "VELOX:embedded:indexOutside");
}

TEST_F(OperationsTest, ArraysThatNoMemoryCouldHoldAreOutOfMemory) {
    const std::size_t huge = std::numeric_limits<std::size_t>::max() / 4;
    EXPECT_EQ(errorKey([&] { operations_.hostCreateCell(huge, 5); }),
              "VELOX:embedded:outOfMemory");
    EXPECT_EQ(errorKey([&] { operations_.hostCreateCell(huge / 64, 5); }),
              "VELOX:embedded:outOfMemory");
    EXPECT_EQ(errorKey([&] {
                  operations_.hostCreateNumeric(huge, 5,
                                                HostNumericClass::Double);
              }),
              "VELOX:embedded:outOfMemory");
    EXPECT_EQ(errorKey([&] {
                  operations_.hostCreateNumeric(huge, 1,
                                                HostNumericClass::Double);
              }),
              "VELOX:embedded:outOfMemory");
}

TEST_F(OperationsTest, NamesAreInterned) {
    EXPECT_EQ(operations_.hostInternName("velox"),
              operations_.hostInternName(std::string("velox").c_str()));
    EXPECT_NE(operations_.hostInternName("velox"),
              operations_.hostInternName("Velox"));
    EXPECT_EQ(operations_.hostInternName(""), nullptr);
}

TEST_F(OperationsTest, PackagesAreFoundStepByStep) {
    HostPackage* package = operations_.hostGlobalPackage("velox");
    for (const char* name : {"io", "datastore", "internal", "fileset"}) {
        package = operations_.hostSubPackage(package, name);
        ASSERT_NE(package, nullptr);
    }
    EXPECT_STREQ(operations_.hostPackageFullName(package),
                 "velox.io.datastore.internal.fileset");
    EXPECT_EQ(operations_.hostSubPackage(package, "velox"), nullptr);
    EXPECT_EQ(operations_.hostGlobalPackage("fileset"), nullptr);
}

TEST_F(OperationsTest, ErrorsCarryIdentifierArgumentsAndFormattedText) {
    const std::vector<HostMessageArgument> arguments = {std::string("2, 4"),
                                                        std::int64_t{-7}};
    const HostException error = errorOf([&] {
        operations_.HostError("VELOX:datastoreio:huffmanpaths:fileElementEmpty",
                              arguments);
    });
    EXPECT_EQ(error.identifier(),
              "VELOX:datastoreio:huffmanpaths:fileElementEmpty");
    EXPECT_EQ(error.arguments(), arguments);
    EXPECT_STREQ(error.what(), "Element 2, 4 of the files is empty.");
}

TEST_F(OperationsTest, ErrorWithoutTextShowsIdentifierAndArguments) {
    const std::vector<HostMessageArgument> arguments = {std::string("x"),
                                                        std::int64_t{-7}};
    EXPECT_STREQ(
        errorOf([&] { operations_.HostError("A:b", arguments); }).what(),
        "A:b: x; -7");
}

}  // namespace tessel::embedded
