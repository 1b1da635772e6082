#include <limits>

#include "hosts/embedded/Operations.hpp"
#include "tests/host/HostFixture.hpp"

// What a plug-in can do with arrays, names, packages and errors.
namespace tessel::embedded {

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

TEST_F(OperationsTest, CellThatIsHeldElsewhereIsNotChanged) {
    Value cell = Value::cell({1, 1});
    HostArray* const own = cell.ownArray();
    const Value witness = cell;
    EXPECT_EQ(errorKey([&] {
                  operations_.hostSetCell(
                      own, 0, operations_.hostCreateLogicalScalar(true));
              }),
              "VELOX:embedded:arrayShared");
    EXPECT_EQ(witness.element(0), Value());
}

TEST_F(OperationsTest, ConvertedArrayMayBeChangedAndLeavesTheSavedValue) {
    const Value cell = Value::cell({1, 1});
    const SavedValue saved(cell);
    HostArray* const converted = operations_.hostConvert(&saved, "any");
    operations_.hostSetCell(converted, 0,
                            operations_.hostCreateLogicalScalar(true));
    EXPECT_EQ(Value::adopt(converted).element(0), Value::logical(true));
    EXPECT_EQ(cell.element(0), Value());
}

TEST_F(OperationsTest, NumericDataIsWrittenThrough) {
    HostArray* const made =
        operations_.hostCreateNumeric(2, 1, HostNumericClass::Uint8);
    static_cast<std::uint8_t*>(operations_.hostNumericData(made))[1] = 9;
    EXPECT_EQ(Value::adopt(made), Value::byteColumn({0, 9}));
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
