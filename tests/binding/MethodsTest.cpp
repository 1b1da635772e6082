#include <algorithm>
#include <limits>

#include "coder/HuffmanPathTree.hpp"
#include "tests/host/HostFixture.hpp"

// The methods of HuffmanPaths, called in the embedded host.
namespace tessel::embedded {

namespace {

class MethodsTest : public HostTest {
protected:
    // Adding refused: no code yet, but nothing else is wrong with it.
    void expectUsableAndEmpty(const Value& instance) {
        EXPECT_EQ(treeString(instance), u"");
        EXPECT_TRUE(frequencies(instance).empty());
        EXPECT_TRUE(iterated(instance).empty());
    }

    // What a raised addPaths must leave as it was.
    struct Content {
        std::vector<std::uint8_t> storedForm;
        std::vector<Texts> paths;
        bool operator==(const Content&) const = default;
    };
    Content contentOf(const Value& instance) {
        return {storedForm(instance), iterated(instance)};
    }

    HostException refusedAdd(const Value& instance, const Value& folders,
                             const Value& files) {
        const Content before = contentOf(instance);
        const HostException error = errorOf(
            [&] { host_.call(0, instance, "addPaths", folders, files); });
        EXPECT_EQ(contentOf(instance), before);
        return error;
    }
};

}  // namespace

// ---- Constructor ----

TEST_F(MethodsTest, ConstructorWithoutInputsYieldsUsableEmptyInstance) {
    expectUsableAndEmpty(make());
}

TEST_F(MethodsTest, ConstructorWithOneInputYieldsUsableEmptyInstance) {
    for (const char16_t* mode : {u"copy", u"files", u"frequencies", u"tree"})
        expectUsableAndEmpty(make(Value::text(mode)));
}

TEST_F(MethodsTest, ConstructorWithUnknownModeYieldsUsableEmptyInstance) {
    const Value source = filled(smallListing());
    const Value list = foldersAndFiles(smallListing());
    const Value two = Value::column({1, 2});
    expectUsableAndEmpty(make(Value::text(u"Copy"), source));
    expectUsableAndEmpty(make(Value::text(u"files "), list));
    expectUsableAndEmpty(
        make(Value::text(u"FREQUENCIES"), Value::text(u"ab"), two));
    expectUsableAndEmpty(make(Value::text(u""), list));
}

TEST_F(MethodsTest, ConstructorIgnoresModeWithWrongInputCount) {
    const Value source = filled(smallListing());
    const Value text = Value::text(u"ab");
    const Value two = Value::column({1, 2});
    expectUsableAndEmpty(make(Value::text(u"copy"), source, two));
    expectUsableAndEmpty(make(Value::text(u"files"), text, two));
    expectUsableAndEmpty(make(Value::text(u"frequencies"), text));
    expectUsableAndEmpty(make(Value::text(u"frequencies"), text, two, two));
    expectUsableAndEmpty(make(Value::text(u"tree"), text, two));
}

TEST_F(MethodsTest, FrequenciesModeBuildsCodeInOrderOfCharacters) {
    const Value instance =
        make(Value::text(u"frequencies"), Value::text(u"abcde"),
             Value::column({5, 1, 2, 1, 3}));
    EXPECT_EQ(treeString(instance), u"aecbd");
    EXPECT_EQ(frequencies(instance), (std::vector<double>{5, 3, 2, 1, 1}));
}

TEST_F(MethodsTest, FrequenciesModeReadsAsManyFrequenciesAsCharacters) {
    const Value instance =
        make(Value::text(u"frequencies"), Value::text(u"abc"),
             Value::column({2, 1, 1, 99, 99}));
    EXPECT_EQ(treeString(instance), u"abc");
}

TEST_F(MethodsTest, FrequenciesModeWithTooFewFrequenciesIsHostError) {
    const HostException error = errorOf([&] {
        make(Value::text(u"frequencies"), Value::text(u"abc"),
             Value::column({2, 1}));
    });
    EXPECT_EQ(error.identifier(), "VELOX:embedded:tooFewElements");
    EXPECT_EQ(argumentsOf(error), (std::vector<std::string>{"3", "2"}));
}

TEST_F(MethodsTest, FrequenciesModeRefusesWhatIsNotRealDouble) {
    const std::vector<Value> wrong = {
        Value::byteColumn({1, 2, 3}), Value::text(u"abc"), Value::cell({3, 1}),
        Value::logicals({3, 1}, {1, 0, 1}),
        Value::complexDoubles({3, 1}, {1, 2, 3, 4, 5, 6})};
    for (const Value& frequencies : wrong) {
        const HostException error = errorOf([&] {
            make(Value::text(u"frequencies"), Value::text(u"abc"), frequencies);
        });
        EXPECT_EQ(error.identifier(), "VELOX:embedded:wrongClass");
    }
}

TEST_F(MethodsTest, FilesModeWithOddElementCountRaisesFileListNotEven) {
    const HostException error = errorOf([&] {
        make(Value::text(u"files"), Value::textLists({{u"a"}, {u"b"}, {u"c"}}));
    });
    EXPECT_EQ(error.identifier(), componentName + "fileListNotEven");
    EXPECT_TRUE(error.arguments().empty());
    EXPECT_STREQ(error.what(),
                 "The list of folders and files must have an even number of "
                 "elements: folders first, then as many lists of files.");
}

TEST_F(MethodsTest, FilesModeCountsCharFoldersLikeCellFolders) {
    Value charFolders = Value::cell({4, 1});
    charFolders.setElement(0, Value::text(u"aab"));
    charFolders.setElement(1, Value::text(u"c"));
    charFolders.setElement(2, Value::texts({u"abb", u"d"}));
    charFolders.setElement(3, Value::texts({u"ddddd"}));
    const Value cellFolders =
        Value::textLists({{u"a", u"ab"}, {u"c"}, {u"abb", u"d"}, {u"ddddd"}});
    const Value fromChars = make(Value::text(u"files"), charFolders);
    const Value fromCells = make(Value::text(u"files"), cellFolders);
    EXPECT_EQ(treeString(fromChars), treeString(fromCells));
    EXPECT_EQ(frequencies(fromChars), frequencies(fromCells));
    std::vector<double> counted = frequencies(fromChars);
    std::sort(counted.begin(), counted.end());
    EXPECT_EQ(counted, (std::vector<double>{1, 3, 3, 6}));
}

TEST_F(MethodsTest, FilesModeDecidesFolderFormByFirstElementAlone) {
    Value list = Value::cell({4, 1});
    list.setElement(0, Value::text(u"ab"));
    list.setElement(1, Value::texts({u"cd"}));  // not the form of the first
    list.setElement(2, Value::texts({u"e"}));
    list.setElement(3, Value::texts({u"f"}));
    EXPECT_EQ(errorOf([&] { make(Value::text(u"files"), list); }).identifier(),
              "VELOX:embedded:wrongClass");
    Value mirrored = Value::cell({4, 1});
    mirrored.setElement(0, Value::texts({u"cd"}));
    mirrored.setElement(1, Value::text(u"ab"));
    mirrored.setElement(2, Value::texts({u"e"}));
    mirrored.setElement(3, Value::texts({u"f"}));
    EXPECT_EQ(
        errorOf([&] { make(Value::text(u"files"), mirrored); }).identifier(),
        "VELOX:embedded:wrongClass");
}

TEST_F(MethodsTest, FilesModeWithEmptyCellStaysWithoutCode) {
    expectUsableAndEmpty(make(Value::text(u"files"), Value::cell({0, 0})));
    expectUsableAndEmpty(make(Value::text(u"files"), Value::cell({0, 1})));
}

TEST_F(MethodsTest, CopyModeSharesPathsAndKeepsCode) {
    const Value source = filled(smallListing());
    const Value copy = make(Value::text(u"copy"), source);
    EXPECT_EQ(storedForm(copy), storedForm(source));
    EXPECT_EQ(treeString(copy), treeString(source));
    EXPECT_EQ(frequencies(copy), frequencies(source));
    EXPECT_EQ(iterated(copy), pathsOf(smallListing()));
}

TEST_F(MethodsTest, CopyModeOfAnotherValueIsHostError) {
    for (const Value& other : {Value::text(u"x"), Value(), Value::scalar(1)}) {
        EXPECT_EQ(
            errorOf([&] { make(Value::text(u"copy"), other); }).identifier(),
            "VELOX:embedded:notAnInstance");
    }
}

TEST_F(MethodsTest, TreeModeRebuildsFromSerializeAndFrequencies) {
    const Value source = filled(smallListing());
    const std::vector<Value> outputs = host_.call(2, source, "serialize");
    const Value rebuilt = make(Value::text(u"tree"), outputs[0], outputs[1],
                               host_.get(source, "Frequencies"));
    EXPECT_EQ(storedForm(rebuilt), storedForm(source));
    EXPECT_EQ(treeString(rebuilt), treeString(source));
    EXPECT_EQ(frequencies(rebuilt), frequencies(source));
    EXPECT_EQ(iterated(rebuilt), pathsOf(smallListing()));
}

TEST_F(MethodsTest, TreeModeWithEmptyTreeStringOnlySetsFrequencies) {
    const Value instance =
        make(Value::text(u"tree"), Value::text(u""),
             Value::byteColumn({0xFF, 0xFF}), Value::column({3, 1.5}));
    EXPECT_EQ(treeString(instance), u"");
    EXPECT_TRUE(iterated(instance).empty());
    EXPECT_EQ(frequencies(instance), (std::vector<double>{3, 1.5}));
}

TEST_F(MethodsTest, TreeModeTakesRealPartsOfComplexFrequencies) {
    const Value instance =
        make(Value::text(u"tree"), Value::text(u""), Value::byteColumn({}),
             Value::complexDoubles({2, 1}, {3, -7, 1.5, -8}));
    EXPECT_EQ(frequencies(instance), (std::vector<double>{3, 1.5}));
}

TEST_F(MethodsTest, TreeModeWithDamagedBytesIsHostErrorWithNativeText) {
    const Value source = filled(smallListing());
    std::vector<std::uint8_t> bytes = storedForm(source);
    bytes.resize(bytes.size() / 2);
    const HostException error = errorOf([&] {
        make(Value::text(u"tree"), Value::text(treeString(source)),
             Value::byteColumn(bytes), host_.get(source, "Frequencies"));
    });
    EXPECT_EQ(error.identifier(), "VELOX:embedded:nativeError");
    EXPECT_EQ(argumentsOf(error),
              (std::vector<std::string>{
                  "HuffmanPaths", "The stored form is truncated or damaged."}));
    EXPECT_STREQ(error.what(),
                 "'HuffmanPaths' failed: The stored form is truncated or "
                 "damaged.");
}

TEST_F(MethodsTest, TreeModeReadsNothingOutsideArraysOfOtherClasses) {
    const Value source = filled(smallListing());
    const Value text = Value::text(treeString(source));
    const Value bytes = Value::byteColumn(storedForm(source));
    const Value numbers = host_.get(source, "Frequencies");
    const auto refusal = [&](const Value& form, const Value& frequencies) {
        return errorOf(
                   [&] { make(Value::text(u"tree"), text, form, frequencies); })
            .identifier();
    };
    const std::string wrongClass = "VELOX:embedded:wrongClass";
    for (const Value& wrong : {Value::text(u"x"), Value::cell({2, 2}),
                               Value::logical(true), Value::structure()}) {
        EXPECT_EQ(refusal(wrong, numbers), wrongClass);
        EXPECT_EQ(refusal(bytes, wrong), wrongClass);
    }
    // Each the other's class: eight times too few bytes, or too many.
    EXPECT_EQ(refusal(numbers, bytes), wrongClass);
    EXPECT_EQ(refusal(bytes, bytes), wrongClass);
}

// ---- addPaths ----

TEST_F(MethodsTest, AddPathsWithUnequalCountsRaisesAndInsertsNothing) {
    const Value instance = filled(smallListing());
    const HostException error =
        refusedAdd(instance, Value::textLists({{u"/"}, {u"/"}, {u"/"}}),
                   Value::textLists({{u"env"}, {u"env"}}));
    EXPECT_EQ(error.identifier(), componentName + "unequalNumFolderFileList");
    EXPECT_TRUE(error.arguments().empty());
    EXPECT_STREQ(error.what(),
                 "The number of folders must be the number of lists of files.");
}

TEST_F(MethodsTest, AddPathsWithThirdFolderEmptyRaisesWithThree) {
    const Value instance = filled(smallListing());
    const HostException error =
        refusedAdd(instance, Value::textLists({{u"/"}, {u"/"}, {}}),
                   Value::textLists({{u"env"}, {u"env"}, {u"env"}}));
    EXPECT_EQ(error.identifier(), componentName + "folderElementEmpty");
    EXPECT_EQ(argumentsOf(error), (std::vector<std::string>{"3"}));
    EXPECT_STREQ(error.what(), "Element 3 of the folders is empty.");
}

TEST_F(MethodsTest, AddPathsWithFourthTextOfSecondFilesEmptyRaisesWithBoth) {
    const Value instance = filled(smallListing());
    const HostException error =
        refusedAdd(instance, Value::textLists({{u"/"}, {u"/"}}),
                   Value::textLists({{u"env"}, {u"a", u"b", u"c", u"", u""}}));
    EXPECT_EQ(error.identifier(), componentName + "fileElementEmpty");
    EXPECT_EQ(argumentsOf(error), (std::vector<std::string>{"2, 4"}));
    EXPECT_STREQ(error.what(), "Element 2, 4 of the files is empty.");
}

TEST_F(MethodsTest, AddPathsWithFirstFolderEmptyRaisesWithOne) {
    const Value instance = filled(smallListing());
    const HostException error = refusedAdd(instance, Value::textLists({{}}),
                                           Value::textLists({{u"env"}}));
    EXPECT_EQ(argumentsOf(error), (std::vector<std::string>{"1"}));
}

TEST_F(MethodsTest, AddPathsWithThirdTextOfTwelfthFilesEmptyRaisesWithBoth) {
    const Value instance = filled(smallListing());
    std::vector<Texts> files(12, Texts{u"env", u"ls", u"cat"});
    files[11][2].clear();
    const HostException error = refusedAdd(
        instance, Value::textLists(std::vector<Texts>(12, Texts{u"/"})),
        Value::textLists(files));
    EXPECT_EQ(error.identifier(), componentName + "fileElementEmpty");
    EXPECT_EQ(argumentsOf(error), (std::vector<std::string>{"12, 3"}));
}

TEST_F(MethodsTest, AddPathsChecksAllFoldersBeforeAnyFile) {
    const Value instance = filled(smallListing());
    const HostException error =
        refusedAdd(instance, Value::textLists({{u"/"}, {u"/", u""}}),
                   Value::textLists({{}, {u"env"}}));
    EXPECT_EQ(error.identifier(), componentName + "folderElementEmpty");
    EXPECT_EQ(argumentsOf(error), (std::vector<std::string>{"2, 2"}));
}

TEST_F(MethodsTest, AddPathsChecksCountsBeforeElements) {
    const Value instance = filled(smallListing());
    EXPECT_EQ(refusedAdd(instance, Value::textLists({{}}), Value::textLists({}))
                  .identifier(),
              componentName + "unequalNumFolderFileList");
}

TEST_F(MethodsTest, AddPathsTakesEmptyArraysOfAnyClassForEmptyElements) {
    const Value instance = filled(smallListing());
    const HostException entry =
        refusedAdd(instance, Value::cell({1, 1}), Value::textLists({{u"env"}}));
    EXPECT_EQ(entry.identifier(), componentName + "folderElementEmpty");
    EXPECT_EQ(argumentsOf(entry), (std::vector<std::string>{"1"}));
    const HostException inner =
        refusedAdd(instance, Value::cellRow({Value::cell({2, 1})}),
                   Value::textLists({{u"env"}}));
    EXPECT_EQ(argumentsOf(inner), (std::vector<std::string>{"1, 1"}));
}

TEST_F(MethodsTest, AddPathsRefusesElementsThatAreNoCellsOfTexts) {
    const Value instance = filled(smallListing());
    const Value files = Value::textLists({{u"env"}});
    const Value number = Value::cellRow({Value::scalar(7)});
    const Value innerNumber = Value::cellRow({number});
    EXPECT_EQ(refusedAdd(instance, number, files).identifier(),
              "VELOX:embedded:wrongClass");
    EXPECT_EQ(refusedAdd(instance, innerNumber, files).identifier(),
              "VELOX:embedded:wrongClass");
    EXPECT_EQ(
        refusedAdd(instance, Value::cellRow({Value::text(u"/usr")}), files)
            .identifier(),
        "VELOX:embedded:wrongClass");
}

TEST_F(MethodsTest, AddPathsWithUnknownCharacterIsHostErrorAndInsertsNothing) {
    const Value instance = filled(smallListing());
    for (const std::size_t folders : {std::size_t{1}, std::size_t{5}}) {
        std::vector<Texts> files(folders, Texts{u"env"});
        files.back() = {u"ls", u"#"};
        const HostException error = refusedAdd(
            instance,
            Value::textLists(std::vector<Texts>(folders, Texts{u"/"})),
            Value::textLists(files));
        EXPECT_EQ(error.identifier(), "VELOX:embedded:nativeError");
        EXPECT_EQ(argumentsOf(error),
                  (std::vector<std::string>{
                      "addPaths", "Code for the character not found."}));
    }
    add(instance, {{{u"/"}}, {{u"sbin"}}});
    EXPECT_EQ(joined(instance, {6}, u"/"), (Texts{u"/sbin"}));
}

TEST_F(MethodsTest, AddPathsWithoutFoldersAddsNothing) {
    const Value instance = filled(smallListing());
    const Content before = contentOf(instance);
    EXPECT_TRUE(host_
                    .call(0, instance, "addPaths", Value::cell({0, 0}),
                          Value::cell({0, 1}))
                    .empty());
    EXPECT_EQ(contentOf(instance), before);
}

TEST_F(MethodsTest, AddPathsAppendsBatchAfterBatch) {
    const Value instance = filled(smallListing());
    add(instance, {{{u"/", u"usr", u"bin"}}, {{u"sbin"}}});
    EXPECT_EQ(
        joined(instance, numbersTo(6), u"/"),
        (Texts{u"/usr/bin/env", u"/usr/bin/ls", u"/usr/bin/cat",
               u"/usr/lib/gcc/cc1", u"/usr/lib/gcc/crt.o", u"/usr/bin/sbin"}));
}

TEST_F(MethodsTest, TextIsTakenInColumnMajorOrder) {
    const Value instance =
        make(Value::text(u"frequencies"), Value::chars({2, 2}, u"abcd"),
             Value::column({1, 1, 1, 1}));
    EXPECT_EQ(treeString(instance), u"acbd");
    Value file = Value::cell({1, 1});
    file.setElement(0, Value::cellRow({Value::chars({2, 1, 2}, u"dcba")}));
    host_.call(0, instance, "addPaths", Value::textLists({{u"a"}}), file);
    EXPECT_EQ(joined(instance, {1}, u""), (Texts{u"adcba"}));
}

// ---- getPaths ----

TEST_F(MethodsTest, GetPathsWithoutSeparatorYieldsFoldersAndFiles) {
    const Value instance = filled(smallListing());
    EXPECT_EQ(fetched(instance, {2, 3, 5}),
              (Listing{{{u"/", u"usr", u"bin"}, {u"/", u"usr", u"lib", u"gcc"}},
                       {{u"ls", u"cat"}, {u"crt.o"}}}));
}

TEST_F(MethodsTest, GetPathsWithoutSeparatorFillsFilesAlsoForOneOutput) {
    const Value instance = filled(smallListing());
    const std::vector<Value> outputs =
        host_.call(1, instance, "getPaths", Value::column({4}));
    ASSERT_EQ(outputs.size(), 1U);
    EXPECT_EQ(listsOf(outputs[0]),
              (std::vector<Texts>{{u"/", u"usr", u"lib", u"gcc"}}));
}

TEST_F(MethodsTest, GetPathsWithSeparatorJoins) {
    const Value instance = filled(smallListing());
    EXPECT_EQ(joined(instance, {1, 4}, u"/"),
              (Texts{u"/usr/bin/env", u"/usr/lib/gcc/cc1"}));
    EXPECT_EQ(joined(instance, {1}, u"::"), (Texts{u"/usr::bin::env"}));
    EXPECT_EQ(joined(instance, {1}, u""), (Texts{u"/usrbinenv"}));
}

TEST_F(MethodsTest, GetPathsWithSeparatorAssignsOnlyPaths) {
    const Value instance = filled(smallListing());
    const HostException error = errorOf([&] {
        host_.call(2, instance, "getPaths", Value::column({1}),
                   Value::text(u"/"));
    });
    EXPECT_EQ(error.identifier(), "VELOX:embedded:outputNotAssigned");
    EXPECT_EQ(argumentsOf(error),
              (std::vector<std::string>{"files", "getPaths"}));
}

TEST_F(MethodsTest, GetPathsWithoutOutputDoesNothingEvenForInvalidNumbers) {
    const Value instance = filled(smallListing());
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const Value invalid = Value::column({nan, -1, 0});
    EXPECT_TRUE(host_.call(0, instance, "getPaths", invalid).empty());
    EXPECT_TRUE(host_.call(0, instance, "getPaths", invalid, Value::text(u"/"))
                    .empty());
    EXPECT_EQ(errorOf([&] {
                  host_.call(1, instance, "getPaths", invalid);
              }).identifier(),
              "VELOX:embedded:nativeError");
}

TEST_F(MethodsTest, GetPathsWithSeparatorOnRootAloneJoinsRootAndFile) {
    const Listing listing = {{{u"C:\\"}}, {{u"autoexec.bat"}}};
    EXPECT_EQ(joined(filled(listing), {1}, u"\\"),
              (Texts{u"C:\\autoexec.bat"}));
}

TEST_F(MethodsTest, GetPathsWithSeparatorSkipsFolderWithoutComponents) {
    // Such a folder cannot be added through the host; a stored form has it.
    HuffmanPathTree coder;
    const std::vector<double> equal(3, 1.0);
    coder.deflateHuffman(equal.data(), u"abc");
    HuffmanPathTree::FolderTexts folders = {{}, {u"a"}, {u"b"}};
    HuffmanPathTree::FolderTexts files = {{u"c", u"cc"}, {u"b"}, {u"c"}};
    coder.generateCodeAsyncAndAddPaths(folders, files);
    std::vector<std::uint8_t> bytes;
    coder.serialize(bytes, true);
    const Value instance =
        make(Value::text(u"tree"), Value::text(coder.getTreeString()),
             Value::byteColumn(bytes), Value::column(equal));

    const Value paths =
        host_.call(1, instance, "getPaths", Value::column({2, 3, 4}),
                   Value::text(u"/"))[0];
    ASSERT_EQ(paths.dimensions(), (Dimensions{3, 1}));
    EXPECT_EQ(paths.element(0), Value::text(u"ab"));
    EXPECT_EQ(paths.element(1), Value::text(u"bc"));
    EXPECT_EQ(paths.element(2), Value());
    EXPECT_EQ(fetched(instance, {2, 3, 4}),
              (Listing{{{}, {u"a"}, {u"b"}}, {{u"cc"}, {u"b"}, {u"c"}}}));
}

TEST_F(MethodsTest, GetPathsTakesNumbersBeyond32Bits) {
    // Ends that were set by hand make the second batch begin at 2^32 - 1.
    constexpr double border = 4294967296.0;
    HuffmanPathTree coder;
    const std::vector<double> equal(3, 1.0);
    coder.deflateHuffman(equal.data(), u"abc");
    HuffmanPathTree::FolderTexts folders = {{u"a"}, {u"b"}};
    HuffmanPathTree::FolderTexts files = {{u"a"}, {u"a", u"b", u"c"}};
    coder.generateCodeAsyncAndAddPaths(folders, files);
    coder.partitionEnds = {(std::uint64_t{1} << 32) - 2,
                           (std::uint64_t{1} << 32) + 1};
    std::vector<std::uint8_t> bytes;
    coder.serialize(bytes, true);
    const Value instance =
        make(Value::text(u"tree"), Value::text(coder.getTreeString()),
             Value::byteColumn(bytes), Value::column(equal));
    const Value loaded =
        host_.load(filesetClassName, host_.save(host_.copy(instance)));
    for (const Value& each : {instance, loaded}) {
        EXPECT_EQ(fetched(each, {1, border - 1, border, border + 1}),
                  (Listing{{{u"a"}, {u"b"}}, {{u"a"}, {u"a", u"b", u"c"}}}));
        EXPECT_EQ(joined(each, {border}, u"/"), (Texts{u"bb"}));
        EXPECT_EQ(fetched(each, {border + 2}), Listing());
        EXPECT_THROW(fetched(each, {2}), HostException);
    }
}

TEST_F(MethodsTest, GetPathsWithoutEndsYieldsFoldersOfPartitions) {
    // A stored form may have tracks alone.
    HuffmanPathTree coder;
    const std::vector<double> equal(3, 1.0);
    coder.deflateHuffman(equal.data(), u"abc");
    HuffmanPathTree::FolderTexts folders = {{u"a", u"b"}, {u"b"}};
    HuffmanPathTree::FolderTexts files = {{u"c", u"cc"}, {u"c"}};
    coder.generateCodeAsyncAndAddPaths(folders, files);
    coder.partitionEnds.clear();
    std::vector<std::uint8_t> bytes;
    coder.serialize(bytes, true);
    const Value instance =
        make(Value::text(u"tree"), Value::text(coder.getTreeString()),
             Value::byteColumn(bytes), Value::column(equal));

    const Value numbers = Value::column({2, 1});
    const std::vector<Value> outputs =
        host_.call(2, instance, "getPaths", numbers);
    EXPECT_EQ(listsOf(outputs[0]), (std::vector<Texts>{{u"b"}, {u"a", u"b"}}));
    EXPECT_EQ(outputs[1].dimensions(), (Dimensions{0, 1}));
    const Value joinedPaths =
        host_.call(1, instance, "getPaths", numbers, Value::text(u"/"))[0];
    ASSERT_EQ(joinedPaths.dimensions(), (Dimensions{2, 1}));
    EXPECT_EQ(joinedPaths.element(0), Value());
    EXPECT_EQ(joinedPaths.element(1), Value());
}

TEST_F(MethodsTest, GetPathsLeavesRowsForNumbersBeyondTheEndUnset) {
    const Value instance = filled(smallListing());
    const Value paths =
        host_.call(1, instance, "getPaths", Value::column({5, 6, 700}),
                   Value::text(u"/"))[0];
    ASSERT_EQ(paths.dimensions(), (Dimensions{3, 1}));
    EXPECT_EQ(paths.element(0), Value::text(u"/usr/lib/gcc/crt.o"));
    EXPECT_EQ(paths.element(1), Value());
    EXPECT_EQ(paths.element(2), Value());
}

TEST_F(MethodsTest, GetPathsOfNothingYieldsColumnsWithoutRows) {
    const Value instance = filled(smallListing());
    const std::vector<Value> outputs =
        host_.call(2, instance, "getPaths", Value::column({}));
    EXPECT_EQ(outputs[0].dimensions(), (Dimensions{0, 1}));
    EXPECT_EQ(outputs[1].dimensions(), (Dimensions{0, 1}));
}

TEST_F(MethodsTest, GetPathsReadsRealPartsOfComplexNumbers) {
    const Value instance = filled(smallListing());
    const Value numbers = Value::complexDoubles({1, 2}, {2, 40, 4, 50});
    const Value paths =
        host_.call(1, instance, "getPaths", numbers, Value::text(u"/"))[0];
    EXPECT_EQ(textsOf(paths), (Texts{u"/usr/bin/ls", u"/usr/lib/gcc/cc1"}));
}

// ---- Iteration ----

TEST_F(MethodsTest, IterationYieldsComponentsAsColumnsOfRows) {
    EXPECT_EQ(iterated(filled(smallListing())), pathsOf(smallListing()));
}

TEST_F(MethodsTest, ResetStartsFromTheFirstPathAgain) {
    const Value instance = filled(smallListing());
    host_.call(0, instance, "reset");
    host_.call(1, instance, "getNextPath");
    host_.call(1, instance, "getNextPath");
    EXPECT_EQ(iterated(instance), pathsOf(smallListing()));
}

TEST_F(MethodsTest, IterationSurvivesOtherCalls) {
    const Value instance = filled(smallListing());
    host_.call(0, instance, "reset");
    host_.call(1, instance, "getNextPath");
    host_.call(2, instance, "serialize");
    fetched(instance, {1, 5});
    EXPECT_EQ(textsOf(host_.call(1, instance, "getNextPath")[0]),
              (Texts{u"/", u"usr", u"bin", u"ls"}));
}

TEST_F(MethodsTest, GetNextPathAfterTheLastIsHostErrorWithNativeText) {
    const Value instance = filled(smallListing());
    iterated(instance);
    const HostException error =
        errorOf([&] { host_.call(1, instance, "getNextPath"); });
    EXPECT_EQ(error.identifier(), "VELOX:embedded:nativeError");
    EXPECT_EQ(
        argumentsOf(error),
        (std::vector<std::string>{"getNextPath", "No more paths to provide."}));
}

TEST_F(MethodsTest, HasNextPathWithoutOutputRequestedStillReturnsItsValue) {
    const Value instance = filled(smallListing());
    host_.call(0, instance, "reset");
    const std::vector<Value> outputs = host_.call(0, instance, "hasNextPath");
    ASSERT_EQ(outputs.size(), 1U);
    EXPECT_EQ(outputs[0], Value::logical(true));
    iterated(instance);
    EXPECT_EQ(host_.call(0, instance, "hasNextPath")[0], Value::logical(false));
}

// ---- serialize ----

TEST_F(MethodsTest, SerializeYieldsTreeStringAndBytes) {
    const Value instance = filled(smallListing());
    const std::vector<Value> outputs = host_.call(2, instance, "serialize");
    ASSERT_EQ(outputs.size(), 2U);
    EXPECT_EQ(outputs[0], host_.get(instance, "StringTree"));
    EXPECT_EQ(outputs[1].valueClass(), ValueClass::Uint8);
    EXPECT_EQ(outputs[1].dimensions(), (Dimensions{outputs[1].numel(), 1}));
}

TEST_F(MethodsTest, SerializeYieldsTheCodersOwnForm) {
    const Listing listing = smallListing();
    const std::u16string alphabet = alphabetOf(listing);
    const std::vector<double> ones(alphabet.size(), 1.0);
    const Value instance = make(Value::text(u"frequencies"),
                                Value::text(alphabet), Value::column(ones));
    add(instance, listing);

    HuffmanPathTree coder;
    coder.deflateHuffman(ones.data(), alphabet);
    HuffmanPathTree::FolderTexts folders = listing.folders;
    HuffmanPathTree::FolderTexts files = listing.files;
    coder.generateCodeAsyncAndAddPaths(folders, files);
    std::vector<std::uint8_t> bytes;
    coder.serialize(bytes, true);
    EXPECT_EQ(storedForm(instance), bytes);
    EXPECT_EQ(treeString(instance), coder.getTreeString());
}

TEST_F(MethodsTest, SerializeWithOneOutputYieldsTreeStringAlone) {
    const Value instance = filled(smallListing());
    EXPECT_EQ(host_.call(1, instance, "serialize").size(), 1U);
    const std::vector<Value> unasked = host_.call(0, instance, "serialize");
    ASSERT_EQ(unasked.size(), 1U);  // always filled
    EXPECT_EQ(unasked[0], host_.get(instance, "StringTree"));
}

// ---- Argument counts ----

TEST_F(MethodsTest, DispatchChecksOutputsThenInputsThenTypes) {
    const Value instance = filled(smallListing());
    const Value x = Value::scalar(1);
    struct Limits {
        const char* method;
        int mostInputs;
        int mostOutputs;
    };
    for (const Limits& limits :
         std::initializer_list<Limits>{{"addPaths", 2, 0},
                                       {"getPaths", 2, 2},
                                       {"getNextPath", 0, 1},
                                       {"hasNextPath", 0, 1},
                                       {"reset", 0, 0},
                                       {"serialize", 0, 2}}) {
        const auto called = [&](int outputs, int inputs) {
            const std::vector<const Value*> list(
                static_cast<std::size_t>(inputs), &x);
            return errorOf([&] {
                       host_.callWith(outputs, instance, limits.method, list);
                   })
                .identifier();
        };
        EXPECT_EQ(called(limits.mostOutputs + 1, limits.mostInputs + 1),
                  "VELOX:embedded:tooManyOutputs");
        EXPECT_EQ(called(limits.mostOutputs, limits.mostInputs + 1),
                  "VELOX:embedded:tooManyInputs");
        if (limits.mostInputs != 0) {
            EXPECT_EQ(called(limits.mostOutputs, 0),
                      "VELOX:embedded:tooFewInputs");
            EXPECT_EQ(called(limits.mostOutputs, limits.mostInputs),
                      "VELOX:embedded:wrongType");
        }
    }
}

TEST_F(MethodsTest, ConstructorCountsAreCheckedOutputsFirst) {
    const Value x = Value::scalar(1);
    const auto called = [&](std::int32_t outputs, std::size_t inputs) {
        const std::vector<const Value*> list(inputs, &x);
        return errorOf([&] {
                   host_.constructWith(filesetClassName, list, outputs);
               })
            .identifier();
    };
    EXPECT_EQ(called(2, 5), "VELOX:embedded:tooManyOutputs");
    EXPECT_EQ(called(1, 5), "VELOX:embedded:tooManyInputs");
    EXPECT_EQ(called(1, 4), "VELOX:embedded:wrongType");
}

}  // namespace tessel::embedded
