#include "hosts/embedded/Registry.hpp"
#include "tests/host/embedded/OwnClassFixture.hpp"

// Which classes there are, and what they may get.
namespace tessel::embedded {

namespace {

class RegistryTest : public OwnClassTest {};

}  // namespace

TEST_F(RegistryTest, ClassIsRegisteredOnce) {
    define();
    EXPECT_EQ(key([&] { define(); }), "classExists");
    EXPECT_EQ(host_.classNames(), (std::vector<std::string>{counterName}));
}

TEST_F(RegistryTest, ClassThatFailsToDefineIsForgottenAndReleased) {
    behaviour_.failsToDefine = true;
    const auto methods = [](TestClass& own, HostClass* definedClass) {
        for (const char* name : {"first", "second", "third"})
            own.addMethod(definedClass, name, {}, [](HostFrame&) {});
    };
    EXPECT_THROW(define(methods), std::runtime_error);
    EXPECT_FALSE(host_.hasClass(counterName));
    EXPECT_EQ(
        behaviour_.released,
        (std::vector<std::string>{"third", "second", "first", "the class"}));
    behaviour_.failsToDefine = false;
    define(methods);
    EXPECT_TRUE(host_.hasClass(counterName));
}

TEST_F(RegistryTest, MembersCanOnlyBeAddedDuringDefinition) {
    HostClass* kept = nullptr;
    define([&](TestClass&, HostClass* definedClass) { kept = definedClass; });
    EXPECT_EQ(key([&] {
                  host_.operations().hostAddProperty(
                      kept,
                      {"Late", nullptr, "any", 0, HostAccess::Public,
                       HostAccess::Public, getNumber, setNumber, dispose});
              }),
              "notDefining");
}

TEST_F(RegistryTest, HiddenClassIsNotListed) {
    behaviour_.hidden = true;
    define();
    EXPECT_TRUE(host_.classNames().empty());
    EXPECT_TRUE(host_.isValid(host_.construct(counterName)));
}

TEST_F(RegistryTest, UnknownNamesAreReported) {
    define();
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(key([&] { host_.construct("velox.test.Nothing"); }),
              "classMissing");
    EXPECT_EQ(key([&] { host_.call(0, instance, "nothing"); }),
              "methodMissing");
    EXPECT_EQ(key([&] { host_.get(instance, "Nothing"); }), "propertyMissing");
    EXPECT_EQ(key([&] { host_.call(0, Value::scalar(1), "run"); }),
              "notAnInstance");
}

}  // namespace tessel::embedded
