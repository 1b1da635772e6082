#include "tests/binding/unchecked/UncheckedHostFixture.hpp"

// The methods in the unchecked host: counts, errors that return, slots, and
// every request and allocation that can fail.
namespace unchecked {

// ---- Argument counts ----

TEST_F(InstanceTest, CountsAreCheckedOutputsFirstAndBeforeAnythingElse) {
    struct Limits {
        const char* method;
        int fewest, most, outputs;
    };
    const Array anything = host_.text(u"x");
    for (const Limits& limits :
         std::initializer_list<Limits>{{"HuffmanPaths", 0, 4, 1},
                                       {"addPaths", 3, 3, 0},
                                       {"getPaths", 2, 3, 2},
                                       {"getNextPath", 1, 1, 1},
                                       {"hasNextPath", 1, 1, 1},
                                       {"reset", 1, 1, 0},
                                       {"serialize", 1, 1, 2}}) {
        const auto errorFor = [&](int outputs, int inputs) {
            host_.errors.clear();
            const std::vector<const Box*> list(static_cast<std::size_t>(inputs),
                                               anything.get());
            EXPECT_THROW(run(host_.method(limits.method), outputs, list),
                         Raised)
                << limits.method;
            return host_.errors.empty() ? "" : host_.errors.front();
        };
        EXPECT_EQ(errorFor(limits.outputs + 1, limits.most + 1),
                  "tooManyOutputs");
        EXPECT_EQ(errorFor(limits.outputs + 1, limits.most), "tooManyOutputs");
        EXPECT_EQ(errorFor(limits.outputs, limits.most + 1), "tooManyInputs");
        if (limits.fewest == 0) continue;
        EXPECT_EQ(errorFor(limits.outputs + 1, limits.fewest - 1),
                  "tooManyOutputs");
        EXPECT_EQ(errorFor(limits.outputs, limits.fewest - 1), "tooFewInputs");
    }
    EXPECT_EQ(host_.nativeAsked, 0);
}

TEST_F(InstanceTest, CountErrorsThatReturnStillEndTheMethod) {
    host_.standardErrorsReturn = true;
    EXPECT_THROW(call("reset", 1), std::exception);
    EXPECT_THROW(call("serialize", 3), std::exception);
    EXPECT_THROW(call("addPaths", 0), std::exception);
    EXPECT_EQ(host_.errors,
              (std::vector<std::string>{"tooManyOutputs", "tooManyOutputs",
                                        "tooFewInputs"}));
    EXPECT_EQ(host_.nativeAsked, 0);
}

// ---- Errors of the binding ----

TEST_F(InstanceTest, RaisedErrorsCarryIdentifierAndPosition) {
    fill();
    const std::vector<std::uint8_t> before = storedForm();
    std::vector<Array> lists;
    lists.push_back(host_.texts({u"a"}));
    lists.push_back(host_.texts({u"a", u"b", u"a", u""}));
    const Array files = host_.cell(std::move(lists));
    std::vector<Array> more;
    more.push_back(host_.texts({u"x"}));
    more.push_back(host_.texts({u"x"}));
    const Array folders = host_.cell(std::move(more));
    EXPECT_THROW(call("addPaths", 0, {folders.get(), files.get()}), Raised);
    EXPECT_THROW(call("addPaths", 0, {files.get(), folders.get()}), Raised);
    EXPECT_EQ(host_.errors,
              (std::vector<std::string>{
                  "VELOX:datastoreio:huffmanpaths:fileElementEmpty(2, 4)",
                  "VELOX:datastoreio:huffmanpaths:folderElementEmpty(2, 4)"}));
    EXPECT_EQ(storedForm(), before);
}

TEST_F(InstanceTest, ErrorEntryThatReturnsStillEndsTheMethod) {
    fill();
    host_.errorEntryReturns = true;
    const std::vector<std::uint8_t> before = storedForm();
    const Array one = host_.cell({});
    std::vector<Array> lists;
    lists.push_back(host_.texts({}));
    const Array two = host_.cell(std::move(lists));

    const auto thrownText = [&](const std::vector<const Box*>& inputs) {
        try {
            call("addPaths", 0, inputs);
        } catch (const std::exception& error) {
            return std::string(error.what());
        }
        return std::string("nothing was thrown");
    };
    const std::string component = "VELOX:datastoreio:huffmanpaths:";
    EXPECT_EQ(thrownText({one.get(), two.get()}),
              component + "unequalNumFolderFileList");
    EXPECT_EQ(thrownText({two.get(), two.get()}),
              component + "folderElementEmpty");
    EXPECT_EQ(host_.errors,
              (std::vector<std::string>{component + "unequalNumFolderFileList",
                                        component + "folderElementEmpty(1)"}));
    EXPECT_EQ(storedForm(), before);
}

TEST_F(InstanceTest, OddFileListIsRefusedAlsoIfTheErrorEntryReturns) {
    host_.errorEntryReturns = true;
    const Array mode = host_.text(u"files");
    const Array list = host_.texts({u"a"});
    EXPECT_THROW(construct({mode.get(), list.get()}), std::exception);
    EXPECT_EQ(host_.errors,
              (std::vector<std::string>{
                  "VELOX:datastoreio:huffmanpaths:fileListNotEven"}));
    EXPECT_EQ(call("serialize", 1).outputs[0]->text, u"");
}

TEST_F(InstanceTest, NativeExceptionsLeaveTheMethodUnchanged) {
    fill();
    call("reset", 0);
    for (int i = 0; i < 4; ++i) call("getNextPath", 1);
    try {
        call("getNextPath", 1);
        ADD_FAILURE() << "there was a fifth path";
    } catch (const std::exception& error) {
        EXPECT_STREQ(error.what(), "No more paths to provide.");
    }
    EXPECT_TRUE(host_.errors.empty());
}

// ---- Outputs ----

TEST_F(InstanceTest, HasNextPathRaisesTheOutputCountFromZero) {
    fill();
    call("reset", 0);
    const Outcome unasked = call("hasNextPath", 0);
    EXPECT_EQ(unasked.outputCount, 1);
    EXPECT_EQ(unasked.outputs[0]->bytes, (std::vector<std::uint8_t>{1}));
    EXPECT_EQ(call("hasNextPath", 1).outputCount, 1);
}

TEST_F(InstanceTest, GetPathsFillsBothOutputsWithoutSeparator) {
    fill();
    const Array numbers = host_.column({1, 4});
    for (const std::int32_t requested : {1, 2}) {
        const Outcome outcome = call("getPaths", requested, {numbers.get()});
        EXPECT_EQ(outcome.outputCount, requested);
        ASSERT_TRUE(outcome[0] && outcome[1]);
        EXPECT_EQ(outcome.outputs[0]->dimensions,
                  (std::vector<std::size_t>{2, 1}));
        EXPECT_EQ(outcome.outputs[1]->elements[1]->elements[0]->text, u"dad");
    }
}

TEST_F(InstanceTest, GetPathsFillsOneOutputWithSeparator) {
    fill();
    const Array numbers = host_.column({2, 4});
    const Array separator = host_.text(u"--");
    const Outcome outcome =
        call("getPaths", 2, {numbers.get(), separator.get()});
    ASSERT_TRUE(outcome[0]);
    EXPECT_FALSE(outcome[1]);
    EXPECT_EQ(outcome.outputs[0]->elements[0]->text, u"xy--b");
    EXPECT_EQ(outcome.outputs[0]->elements[1]->text, u"xz--w--dad");
}

TEST_F(InstanceTest, GetPathsWithoutOutputLooksAtNothing) {
    const Array numbers = host_.column({-1});
    host_.nativeAsked = 0;
    const Outcome outcome = call("getPaths", 0, {numbers.get()});
    EXPECT_FALSE(outcome[0]);
    EXPECT_EQ(host_.nativeAsked, 0);
}

TEST_F(InstanceTest, SerializeWithOneOutputDoesNotRunTheByteSerialization) {
    fill();
    for (int i = 0; i < 200; ++i) addPaths();
    host_.requests = 0;
    const auto asked = [&](std::int32_t requested) {
        const unsigned long before = failing::bytesAsked();
        call("serialize", requested);
        return failing::bytesAsked() - before;
    };
    EXPECT_LT(asked(1), 1000U);
    EXPECT_LT(asked(0), 1000U);
    EXPECT_EQ(host_.requests, 2);  // a tree string each
    EXPECT_GT(asked(2), 4000U);
    EXPECT_FALSE(call("serialize", 1)[1]);
}

TEST_F(InstanceTest, SerializedBytesAreFreshColumn) {
    fill();
    const Outcome outcome = call("serialize", 2);
    const Box& bytes = *outcome.outputs[1];
    EXPECT_EQ(bytes.dimensions,
              (std::vector<std::size_t>{bytes.bytes.size(), 1}));
    EXPECT_EQ(outcome.outputs[0]->text.size(), 8U);
}

// ---- Without memory ----

TEST_F(InstanceTest, GetPathsWithoutMemory) {
    fill();
    const Array numbers = host_.column({1, 2, 3, 4});
    const Array separator = host_.text(u"/");
    sweepRequests([&] { call("getPaths", 2, {numbers.get()}); });
    sweepRequests([&] {
        call("getPaths", 1, {numbers.get(), separator.get()});
    });
    sweepAllocations([&] { call("getPaths", 2, {numbers.get()}); });
    sweepAllocations([&] {
        call("getPaths", 1, {numbers.get(), separator.get()});
    });
}

TEST_F(InstanceTest, IterationWithoutMemory) {
    fill();
    const auto next = [&] {
        call("reset", 0);
        call("getNextPath", 1);
    };
    sweepRequests(next);
    sweepAllocations(next);
    sweepRequests([&] { call("hasNextPath", 1); });
    sweepAllocations([&] { call("hasNextPath", 1); });
    next();
}

TEST_F(InstanceTest, SerializeWithoutMemory) {
    fill();
    const std::vector<std::uint8_t> before = storedForm();
    sweepRequests([&] { call("serialize", 2); });
    sweepAllocations([&] { call("serialize", 2); });
    EXPECT_EQ(storedForm(), before);
}

TEST_F(InstanceTest, OutOfMemoryErrorThatReturnsStillEndsTheMethod) {
    fill();
    host_.standardErrorsReturn = true;
    host_.requests = 0;
    host_.failingRequest = 1;
    EXPECT_THROW(call("serialize", 1), std::bad_alloc);
}

TEST_F(InstanceTest, ConstructionWithoutNativeMemory) {
    const Array mode = host_.text(u"frequencies");
    const Array letters = host_.text(u"abcd");
    const Array numbers = host_.column({1, 2, 3, 4});
    sweepAllocations(
        [&] {
            construct({mode.get(), letters.get(), numbers.get()});
        },
        [&] {
            instance_.reset();
            instance_.emplace(host_, *host_.registered);
        });
    EXPECT_EQ(call("serialize", 1).outputs[0]->text.size(), 4U);
}

TEST_F(InstanceTest, AddPathsWithoutNativeMemoryLeavesAUsableInstance) {
    fill();
    sweepAllocations([&] { addPaths(); });
    const std::vector<std::u16string> added = {u"xy/a", u"xy/b", u"xy/ab",
                                               u"xz/w/dad"};
    EXPECT_EQ(joined({1, 2, 3, 4}), added);

    std::size_t met = 0;
    call("reset", 0);
    while (call("hasNextPath", 1).outputs[0]->bytes[0] != 0) {
        const Outcome next = call("getNextPath", 1);
        EXPECT_EQ(next.outputs[0]->elements[0]->text, u"x");
        ++met;
    }
    EXPECT_GE(met, 8U);

    // The last four are those of the one addition that had memory.
    const auto last = static_cast<double>(met);
    EXPECT_EQ(joined({last - 3, last - 2, last - 1, last}), added);
    const std::vector<std::uint8_t> before = storedForm();
    EXPECT_EQ(rebuiltStoredForm(), before);
}

}  // namespace unchecked
