#include "tests/host/HostFixture.hpp"

// The class HuffmanPaths in the embedded host: its members, properties,
// copying, saving and loading.
namespace tessel::embedded {

namespace {

const std::string customLoadLine =
    "Error while custom loading CompressedFileSet.\n";

class ClassTest : public HostTest {
protected:
    // Loads a saved value and gives what was printed meanwhile.
    std::string printedByLoad(const Value& saved, Value& loaded) {
        testing::internal::CaptureStdout();
        loaded = host_.load(filesetClassName, saved);
        return testing::internal::GetCapturedStdout();
    }

    void expectSilentlyEmpty(const Value& saved) {
        Value loaded;
        EXPECT_EQ(printedByLoad(saved, loaded), "");
        EXPECT_EQ(storedForm(loaded), storedForm(make()));
        EXPECT_TRUE(iterated(loaded).empty());
    }
};

}  // namespace

// ---- Registration ----

TEST_F(ClassTest, EntryCalledTwiceRegistersTheClassOnce) {
    host_.loadModule(pluginFile());
    host_.loadModule(pluginFile());
    EXPECT_EQ(host_.classNames(), (std::vector<std::string>{filesetClassName}));
}

TEST_F(ClassTest, MembersAreInOrder) {
    EXPECT_EQ(host_.methodNames(filesetClassName),
              (std::vector<std::string>{"HuffmanPaths", "addPaths", "getPaths",
                                        "getNextPath", "hasNextPath", "reset",
                                        "serialize"}));
    EXPECT_EQ(host_.propertyNames(filesetClassName),
              (std::vector<std::string>{"StringTree", "Frequencies"}));
}

TEST_F(ClassTest, OnceRegisteredClassIsNotRegisteredAgainByTheEntry) {
    host_.removeClasses(pluginFile());
    host_.loadModule(pluginFile());
    EXPECT_FALSE(host_.hasClass(filesetClassName));
}

// ---- Properties ----

TEST_F(ClassTest, FrequenciesOfFreshInstanceAreZeroByOneDouble) {
    EXPECT_EQ(host_.get(make(), "Frequencies"), Value::doubles({0, 1}, {}));
}

TEST_F(ClassTest, FrequenciesAreColumnInOrderOfStringTree) {
    const Value instance = make(Value::text(u"frequencies"),
                                Value::text(u"abc"), Value::column({1, 2, 4}));
    EXPECT_EQ(host_.get(instance, "StringTree"), Value::text(u"abc"));
    EXPECT_EQ(host_.get(instance, "Frequencies"), Value::column({1, 2, 4}));
}

TEST_F(ClassTest, StringTreeOfFreshInstanceIsRowWithoutElements) {
    EXPECT_EQ(host_.get(make(), "StringTree"), Value::chars({1, 0}, u""));
}

TEST_F(ClassTest, SettersAreRefusedToUsersAndChangeNothing) {
    const Value instance = filled(smallListing());
    const Value before = host_.save(instance);
    const HostException text = errorOf(
        [&] { host_.set(instance, "StringTree", Value::text(u"xyz")); });
    EXPECT_EQ(text.identifier(), "VELOX:embedded:propertyRestricted");
    EXPECT_EQ(argumentsOf(text), (std::vector<std::string>{"StringTree"}));
    EXPECT_EQ(errorOf([&] {
                  host_.set(instance, "Frequencies", Value::column({1}));
              }).identifier(),
              "VELOX:embedded:propertyRestricted");
    EXPECT_EQ(host_.save(instance), before);
}

TEST_F(ClassTest, PropertiesHaveNoListenersAndAreNotInspected) {
    const Value instance = make();
    for (const ListenerKind kind : {ListenerKind::Get, ListenerKind::Set}) {
        EXPECT_EQ(errorOf([&] {
                      host_.listen(instance, "StringTree", kind, [] {});
                  }).identifier(),
                  "VELOX:embedded:listenerRefused");
    }
    EXPECT_TRUE(host_.inspect(instance).fieldNames().empty());
}

// ---- Copying ----

TEST_F(ClassTest, CopyHasContentOfItsSource) {
    const Value source = filled(smallListing());
    const Value copy = host_.copy(source);
    EXPECT_EQ(host_.save(copy), host_.save(source));
    EXPECT_EQ(iterated(copy), pathsOf(smallListing()));
}

TEST_F(ClassTest, CopyIteratesOnItsOwn) {
    const Value source = filled(smallListing());
    host_.call(0, source, "reset");
    host_.call(1, source, "getNextPath");
    const Value copy = host_.copy(source);
    EXPECT_EQ(iterated(copy), pathsOf(smallListing()));
    EXPECT_EQ(textsOf(host_.call(1, source, "getNextPath")[0]),
              pathsOf(smallListing())[1]);
}

TEST_F(ClassTest, CopyOutlivesItsSource) {
    Value source = filled(smallListing());
    const Value copy = host_.copy(source);
    host_.destroy(source);
    EXPECT_EQ(iterated(copy), pathsOf(smallListing()));
}

TEST_F(ClassTest, CopyOfFreshInstanceIsUsable) {
    const Value copy = host_.copy(make());
    EXPECT_TRUE(iterated(copy).empty());
}

// ---- Saving and loading ----

TEST_F(ClassTest, SavedFormHasPropertiesAndStoredForm) {
    const Value source = filled(smallListing());
    const Value saved = host_.save(source);
    EXPECT_EQ(
        saved.fieldNames(),
        (std::vector<std::string>{"StringTree", "Frequencies", "PathTree"}));
    EXPECT_EQ(saved.field("PathTree"), Value::byteColumn(storedForm(source)));
}

TEST_F(ClassTest, LoadRestoresPathsCodeAndFrequencies) {
    const Value source = filled(smallListing());
    Value loaded;
    EXPECT_EQ(printedByLoad(host_.save(source), loaded), "");
    EXPECT_EQ(host_.save(loaded), host_.save(source));
    EXPECT_EQ(iterated(loaded), pathsOf(smallListing()));
    add(loaded, {{{u"/", u"usr"}}, {{u"sbin"}}});
    EXPECT_EQ(joined(loaded, {6}, u"/"), (Texts{u"/usr/sbin"}));
}

TEST_F(ClassTest, CustomLoadRestoresNoFrequencies) {
    const Value saved = host_.save(filled(smallListing()));
    Value withoutFrequencies = Value::structure();
    for (const char* const field : {"StringTree", "PathTree"})
        withoutFrequencies.setField(field, saved.field(field));
    const Value loaded = host_.load(filesetClassName, withoutFrequencies);
    EXPECT_TRUE(host_.isRestored(loaded));
    EXPECT_TRUE(frequencies(loaded).empty());
    EXPECT_EQ(iterated(loaded), pathsOf(smallListing()));
}

TEST_F(ClassTest, LoadWithEmptyStringTreeYieldsEmptyCoderAndNoMessage) {
    Value saved = host_.save(filled(smallListing()));
    saved.setField("StringTree", Value::text(u""));
    expectSilentlyEmpty(saved);
    saved.setField("PathTree", Value::text(u"not even bytes"));
    expectSilentlyEmpty(saved);
}

TEST_F(ClassTest, LoadOfFreshInstanceYieldsEmptyCoder) {
    expectSilentlyEmpty(host_.save(make()));
}

TEST_F(ClassTest, LoadOfOtherValuesLeavesInstanceAsCreated) {
    Value noPathTree = Value::structure();
    noPathTree.setField("Frequencies", Value::column({}));
    expectSilentlyEmpty(noPathTree);
    expectSilentlyEmpty(Value::scalar(3));
    expectSilentlyEmpty(Value::text(u"PathTree"));
    expectSilentlyEmpty(Value::cell({2, 2}));
}

TEST_F(ClassTest, LoadOfDamagedPathTreePrintsOneLineAndDoesNotRaise) {
    const Value saved = host_.save(filled(smallListing()));
    const std::vector<std::uint8_t> whole = saved.field("PathTree").byteData();
    for (std::size_t length = 0; length < whole.size(); ++length) {
        Value damaged = saved;
        damaged.setField(
            "PathTree",
            Value::byteColumn(
                {whole.begin(), whole.begin() + static_cast<long>(length)}));
        Value loaded;
        EXPECT_EQ(printedByLoad(damaged, loaded), customLoadLine);
        EXPECT_FALSE(host_.isRestored(loaded));
        EXPECT_TRUE(iterated(loaded).empty());
    }
}

TEST_F(ClassTest, LoadOfUnfittingFieldsPrintsOneLineAndDoesNotRaise) {
    const Value saved = host_.save(filled(smallListing()));
    Value loaded;

    Value shortText = saved;
    shortText.setField("StringTree", Value::text(u"ab"));
    EXPECT_EQ(printedByLoad(shortText, loaded), customLoadLine);

    Value wrongClass = saved;
    wrongClass.setField("PathTree", Value::column({1, 2, 3}));
    EXPECT_EQ(printedByLoad(wrongClass, loaded), customLoadLine);

    Value noStringTree = Value::structure();
    noStringTree.setField("PathTree", saved.field("PathTree"));
    EXPECT_EQ(printedByLoad(noStringTree, loaded), customLoadLine);
}

TEST_F(ClassTest, LoadTakesFirstElementOfStructArray) {
    const Value first = host_.save(filled(smallListing()));
    Value both = Value::structure({1, 2});
    for (const std::string& field : first.fieldNames()) {
        both.setField(field, first.field(field), 0);
        both.setField(field, Value::text(u"of the second"), 1);
    }
    const Value loaded = host_.load(filesetClassName, both);
    EXPECT_EQ(iterated(loaded), pathsOf(smallListing()));
}

TEST_F(ClassTest, LoadWithUnfittingFrequenciesIsHostError) {
    Value saved = host_.save(filled(smallListing()));
    saved.setField("Frequencies", Value::text(u"many"));
    EXPECT_EQ(
        errorOf([&] { host_.load(filesetClassName, saved); }).identifier(),
        "VELOX:embedded:wrongClass");
}

// ---- Lifetime ----

TEST_F(ClassTest, DestroyedInstanceIsInvalidInEveryUse) {
    const Value instance = filled(smallListing());
    const Value other = instance;
    host_.destroy(instance);
    EXPECT_FALSE(host_.isValid(other));
    const std::vector<std::function<void()>> uses = {
        [&] { host_.call(0, other, "reset"); },
        [&] { host_.get(other, "StringTree"); },
        [&] { host_.set(other, "StringTree", Value::text(u"")); },
        [&] { host_.copy(other); },
        [&] { host_.save(other); },
        [&] { host_.destroy(other); },
        [&] { make(Value::text(u"copy"), other); },
        [&] { host_.listen(other, "StringTree", ListenerKind::Get, [] {}); }};
    for (const auto& use : uses)
        EXPECT_EQ(errorOf(use).identifier(), "VELOX:embedded:invalidInstance");
}

TEST_F(ClassTest, ValuesOfOneInstanceShareIt) {
    const Value instance = makeFor(smallListing());
    const Value other = instance;
    add(other, smallListing());
    EXPECT_EQ(iterated(instance), pathsOf(smallListing()));
}

TEST_F(ClassTest, MethodsUseFirstElementOfInstanceArray) {
    const Value first = filled(smallListing());
    const Value second = make();
    const Value both =
        Value::objects({1, 2}, {first.instance(0), second.instance(0)});
    EXPECT_EQ(iterated(both), pathsOf(smallListing()));
    const Value none = Value::objects({0, 1}, {});
    EXPECT_EQ(errorOf([&] { host_.call(0, none, "reset"); }).identifier(),
              "VELOX:embedded:notAnInstance");
}

TEST(HostLifetime, InstancesEndWithTheirHost) {
    Value kept;
    {
        Host host(testOptions());
        host.loadModule(pluginFile());
        kept = host.construct(filesetClassName, Value::text(u"files"),
                              foldersAndFiles(smallListing()));
        EXPECT_TRUE(host.isValid(kept));
    }
    const Host next(testOptions());
    EXPECT_FALSE(next.isValid(kept));
}

TEST(HostLifetime, OneHostAtATime) {
    const Host host(testOptions());
    EXPECT_THROW(Host{testOptions()}, std::logic_error);
}

}  // namespace tessel::embedded
