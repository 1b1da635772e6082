#include "hosts/embedded/Host.hpp"
#include "tests/host/embedded/OwnClassFixture.hpp"

// Properties, copying, saving and loading, by the attributes of a class.
namespace tessel::embedded {

namespace {

class HostAttributesTest : public OwnClassTest {};

}  // namespace

// ---- Properties ----

TEST_F(HostAttributesTest, PublicPropertyIsReadAndWritten) {
    define();
    const Value instance = host_.construct(counterName);
    host_.set(instance, "Number", Value::scalar(5));
    EXPECT_EQ(number(host_.get(instance, "Number")), 5);
    EXPECT_EQ(key([&] { host_.set(instance, "Number", Value::text(u"5")); }),
              "wrongType");
    EXPECT_EQ(key([&] { host_.set(instance, "Number", Value::scalar(-1)); }),
              "nativeError");
    EXPECT_EQ(number(host_.get(instance, "Number")), 5);
}

TEST_F(HostAttributesTest,
       RestrictedSetterIsRefusedToUsersAllowedToLoadAndCopy) {
    behaviour_.setAccess = HostAccess::Restricted;
    define();
    Value saved = Value::structure();
    saved.setField("Number", Value::scalar(8));
    const Value loaded = host_.load(counterName, saved);
    EXPECT_EQ(key([&] { host_.set(loaded, "Number", Value::scalar(1)); }),
              "propertyRestricted");
    EXPECT_EQ(number(host_.get(host_.copy(loaded), "Number")), 8);
}

TEST_F(HostAttributesTest, OnlyPropertiesCopiedWithTheInstanceAreCopied) {
    behaviour_.bits = attr::isVisible;
    define();
    const Value instance = host_.construct(counterName);
    host_.set(instance, "Number", Value::scalar(5));
    EXPECT_EQ(number(host_.get(host_.copy(instance), "Number")), 0);
}

class UnsavedProperty : public HostAttributesTest,
                        public testing::WithParamInterface<std::uint32_t> {};

TEST_P(UnsavedProperty, IsNeitherSavedNorLoaded) {
    behaviour_.bits = GetParam();
    define();
    EXPECT_TRUE(host_.save(host_.construct(counterName)).fieldNames().empty());
    Value saved = Value::structure();
    saved.setField("Number", Value::scalar(8));
    const Value loaded = host_.load(counterName, saved);
    EXPECT_EQ(static_cast<Counter*>(loaded.instance(0)->native())->number, 0);
}

INSTANTIATE_TEST_SUITE_P(Bits, UnsavedProperty,
                         testing::Values(attr::isTransient, attr::isDependent,
                                         attr::isStatic, attr::isAbstract));

TEST_F(HostAttributesTest, AbstractPropertyHasNoValue) {
    behaviour_.bits = attr::isAbstract;
    define();
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(key([&] { host_.get(instance, "Number"); }),
              "propertyHasNoValue");
    EXPECT_EQ(key([&] { host_.set(instance, "Number", Value::scalar(1)); }),
              "propertyHasNoValue");
}

TEST_F(HostAttributesTest, StaticPropertyHasNoNativeObject) {
    behaviour_.bits = attr::isStatic;
    define();
    EXPECT_EQ(number(host_.get(host_.construct(counterName), "Number")), -1);
}

TEST_F(HostAttributesTest, InvisiblePropertyIsNotListed) {
    behaviour_.bits = attr::copiedWithInstance;
    define();
    EXPECT_TRUE(host_.propertyNames(counterName).empty());
}

TEST_F(HostAttributesTest, InspectionShowsPropertiesThatAllowIt) {
    behaviour_.bits = attr::inspectionAllowed;
    define();
    const Value shown = host_.inspect(host_.construct(counterName));
    EXPECT_EQ(shown.field("Number"), Value::scalar(0));
}

TEST_F(HostAttributesTest, ListenersAreNotifiedWhereAllowed) {
    behaviour_.bits = attr::getListenersAllowed | attr::setListenersAllowed;
    define();
    const Value instance = host_.construct(counterName);
    int gets = 0;
    int sets = 0;
    host_.listen(instance, "Number", ListenerKind::Get, [&] { ++gets; });
    host_.listen(instance, "Number", ListenerKind::Set, [&] { ++sets; });
    host_.set(instance, "Number", Value::scalar(1));
    host_.get(instance, "Number");
    host_.get(instance, "Number");
    EXPECT_EQ(gets, 2);
    EXPECT_EQ(sets, 1);
}

TEST_F(HostAttributesTest, AListenerMayDestroyTheInstance) {
    behaviour_.bits = attr::getListenersAllowed | attr::inspectionAllowed;
    define();
    const Value instance = host_.construct(counterName);
    host_.listen(instance, "Number", ListenerKind::Get,
                 [&] { host_.destroy(instance); });
    EXPECT_EQ(errorOf([&] { host_.inspect(instance); }).identifier(),
              errorOf([&] { host_.get(instance, "Number"); }).identifier());
    EXPECT_EQ(behaviour_.destroyed, 1);
}

TEST_F(HostAttributesTest, UnchangedValueAbortsTheSetWhereSoMarked) {
    behaviour_.bits = attr::abortSetWhenUnchanged | attr::setListenersAllowed;
    define();
    const Value instance = host_.construct(counterName);
    int sets = 0;
    host_.listen(instance, "Number", ListenerKind::Set, [&] { ++sets; });
    host_.set(instance, "Number", Value::scalar(0));
    EXPECT_EQ(sets, 0);
    host_.set(instance, "Number", Value::scalar(1));
    EXPECT_EQ(sets, 1);
}

TEST_F(HostAttributesTest, CopyErrorOnlyWarnsWhereSoMarked) {
    behaviour_.bits = attr::copiedWithInstance | attr::warnOnCopyError;
    define();
    const Value instance = host_.construct(counterName);
    static_cast<Counter*>(instance.instance(0)->native())->number = -3;
    EXPECT_TRUE(host_.isValid(host_.copy(instance)));
    EXPECT_EQ(
        host_.copyWarnings(),
        (std::vector<std::string>{"Number: 'Number' failed: Too small."}));
}

TEST_F(HostAttributesTest, CopyErrorIsRaisedOtherwiseAndLeavesNoInstance) {
    define();
    const Value instance = host_.construct(counterName);
    static_cast<Counter*>(instance.instance(0)->native())->number = -3;
    EXPECT_EQ(key([&] { host_.copy(instance); }), "nativeError");
    EXPECT_EQ(behaviour_.made, 2);
    EXPECT_EQ(behaviour_.destroyed, 1);
}

// ---- Class attributes ----

TEST_F(HostAttributesTest, ClassThatDoesNotCopyOrSaveIsNotCopiedOrSaved) {
    behaviour_.copies = false;
    behaviour_.saves = false;
    define();
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(key([&] { host_.copy(instance); }), "notCopyable");
    EXPECT_EQ(key([&] { host_.save(instance); }), "notSavable");
    EXPECT_EQ(key([&] { host_.load(counterName, Value::structure()); }),
              "notSavable");
}

TEST_F(HostAttributesTest, CustomSaveReplacesTheHostsOwn) {
    behaviour_.custom = true;
    define();
    EXPECT_EQ(host_.save(host_.construct(counterName)), Value::text(u"custom"));
}

TEST_F(HostAttributesTest, InstanceIsUpdatedAfterLoadAndCopy) {
    define();
    const auto updates = [](const Value& instance) {
        return static_cast<Counter*>(instance.instance(0)->native())->updates;
    };
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(updates(instance), 0);
    EXPECT_EQ(updates(host_.copy(instance)), 1);
    EXPECT_EQ(updates(host_.load(counterName, host_.save(instance))), 1);
}

TEST_F(HostAttributesTest, ExtensionFillsCopiesAndSavedForms) {
    define();
    host_.extendClass(counterName, {[](Host& own, const Value&) {
                                        Value made = own.construct(counterName);
                                        own.set(made, "Number",
                                                Value::scalar(9));
                                        return made;
                                    },
                                    [](Host&, const Value&, Value& saved) {
                                        saved.setField("More", Value());
                                    }});
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(number(host_.get(host_.copy(instance), "Number")), 0);
    EXPECT_EQ(host_.save(instance).fieldNames(),
              (std::vector<std::string>{"Number", "More"}));
}

}  // namespace tessel::embedded
