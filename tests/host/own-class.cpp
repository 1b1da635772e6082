#include <new>
#include <optional>
#include <stdexcept>

#include "tests/host/HostFixture.hpp"

// The embedded host's class system, with a class that the test defines itself.
namespace tessel::embedded {

namespace {

namespace attr = attributes;

// The native object of the test's class.
struct Counter {
    double number = 0;
    int updates = 0;
};

// What the class does, chosen by each test.
struct Behaviour {
    bool copies = true;
    bool saves = true;
    bool hidden = false;
    bool custom = false;
    bool failsToDefine = false;
    std::uint32_t bits = attr::copiedWithInstance | attr::isVisible;
    HostAccess setAccess = HostAccess::Public;
    std::string typeName = "double";
    int made = 0;
    int destroyed = 0;
    std::vector<std::string> released;  // descriptors
};

class TestMethod : public HostMethodInfo {
public:
    using Body = std::function<void(HostFrame&)>;
    TestMethod(Behaviour& classBehaviour, HostInterface& hostInterface,
               std::string methodName, HostSignature* heldSignature,
               Body methodBody)
        : behaviour_(classBehaviour),
          host_(hostInterface),
          ownName_(std::move(methodName)),
          held_(heldSignature),
          body_(std::move(methodBody)) {}
    ~TestMethod() override {
        host_.hostReleaseSignature(held_);
        behaviour_.released.push_back(ownName_);
    }

    const char* name() const noexcept override { return ownName_.c_str(); }
    const HostSignature* signature() const noexcept override { return held_; }
    void execute(HostFrame& frame) override { body_(frame); }
    HostAccess access() const noexcept override { return ownAccess; }
    bool isStatic() const noexcept override { return callsStatically; }
    bool isAbstract() const noexcept override { return hasNoBody; }
    bool isVisible() const noexcept override { return shown; }

    HostAccess ownAccess = HostAccess::Public;
    bool callsStatically = false;
    bool hasNoBody = false;
    bool shown = true;

private:
    Behaviour& behaviour_;
    HostInterface& host_;
    std::string ownName_;
    HostSignature* held_;
    Body body_;
};

HostArray* getNumber(void* native) {
    const double number =
        native == nullptr ? -1 : static_cast<Counter*>(native)->number;
    return Value::scalar(number).release();
}

void setNumber(void* native, const HostArray* value) {
    const double number = BorrowedValue(value)->doubleData().at(0);
    if (number < 0) throw std::range_error("Too small.");
    static_cast<Counter*>(native)->number = number;
}

void dispose(HostArray* value) { static_cast<void>(Value::adopt(value)); }

class TestClass : public HostClassInfo {
public:
    using Define = std::function<void(TestClass&, HostClass*)>;
    TestClass(Behaviour& classBehaviour, HostInterface& hostInterface,
              Define defineMethods)
        : behaviour_(classBehaviour),
          host_(hostInterface),
          define_(std::move(defineMethods)) {}
    ~TestClass() override { behaviour_.released.emplace_back("the class"); }

    const char* className() const noexcept override { return "Counter"; }
    void defineMembers(HostClass* definedClass) override {
        define_(*this, definedClass);
        host_.hostAddProperty(
            definedClass,
            {"Number", "A number", behaviour_.typeName.c_str(), behaviour_.bits,
             HostAccess::Public, behaviour_.setAccess, getNumber, setNumber,
             dispose});
        if (behaviour_.failsToDefine) throw std::runtime_error("No members.");
    }
    void* createNativeObject() override {
        ++behaviour_.made;
        return new Counter();
    }
    void destroyNativeObject(void* native) noexcept override {
        ++behaviour_.destroyed;
        delete static_cast<Counter*>(native);
    }
    void updateInstance(void* native) override {
        ++static_cast<Counter*>(native)->updates;
    }
    bool copiesInstances() const noexcept override { return behaviour_.copies; }
    bool savesInstances() const noexcept override { return behaviour_.saves; }
    bool isHidden() const noexcept override { return behaviour_.hidden; }
    HostArray* customSave(const HostArray* /*instance*/) override {
        return behaviour_.custom ? Value::text(u"custom").release() : nullptr;
    }

    struct Types {
        std::vector<const char*> inputs = {};
        std::vector<const char*> outputs = {};
        bool optionalTail = false;
        bool fewerOutputs = false;
    };
    TestMethod& addMethod(HostClass* definedClass, const char* name,
                          const Types& types, TestMethod::Body body) {
        HostSignature* const signature = host_.hostCreateSignature();
        for (const char* type : types.inputs)
            host_.hostSignatureAddInput(signature, type, "input");
        for (const char* type : types.outputs)
            host_.hostSignatureAddOutput(signature, type, "output");
        if (types.optionalTail) host_.hostSignatureMarkOptionalTail(signature);
        if (types.fewerOutputs) host_.hostSignatureMarkOutputs(signature);
        auto method = std::make_unique<TestMethod>(behaviour_, host_, name,
                                                   signature, std::move(body));
        TestMethod& added = *method;
        host_.hostAddMethod(definedClass, std::move(method));
        return added;
    }

private:
    Behaviour& behaviour_;
    HostInterface& host_;
    Define define_;
};

constexpr const char* counterName = "velox.test.Counter";

class OwnClassTest : public testing::Test {
protected:
    void define(const TestClass::Define& methods = [](TestClass&, HostClass*) {
    }) {
        host_.defineClass("velox.test",
                          std::make_unique<TestClass>(
                              behaviour_, host_.operations(), methods));
    }
    // A class with one method that only notes that it ran.
    void defineWithMethod(const TestClass::Types& types) {
        define([&](TestClass& own, HostClass* definedClass) {
            own.addMethod(definedClass, "run", types, [&](HostFrame& frame) {
                ++runs_;
                for (std::int32_t i = 0; i < frame.outputCount; ++i)
                    frame.outputs[i] = Value::scalar(i).release();
            });
        });
    }
    // The same, with this body and no declared inputs.
    void defineWithBody(const std::vector<const char*>& outputs,
                        const TestMethod::Body& body) {
        define([&](TestClass& own, HostClass* definedClass) {
            own.addMethod(definedClass, "run", {{counterName}, outputs}, body);
        });
    }
    std::string key(const std::function<void()>& action) {
        const std::string identifier = errorOf(action).identifier();
        return identifier.substr(identifier.rfind(':') + 1);
    }
    std::string keyOfCall(std::int32_t requested, std::size_t inputs,
                          const Value& input = Value::scalar(1)) {
        const Value instance = host_.construct(counterName);
        const std::vector<const Value*> list(inputs, &input);
        return key([&] { host_.callWith(requested, instance, "run", list); });
    }
    static double number(const Value& value) {
        return value.doubleData().at(0);
    }

    Behaviour behaviour_;
    int runs_ = 0;
    Host host_{testOptions()};
};

}  // namespace

// ---- Registration ----

TEST_F(OwnClassTest, ClassIsRegisteredOnce) {
    define();
    EXPECT_EQ(key([&] { define(); }), "classExists");
    EXPECT_EQ(host_.classNames(), (std::vector<std::string>{counterName}));
}

TEST_F(OwnClassTest, ClassThatFailsToDefineIsForgottenAndReleased) {
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

TEST_F(OwnClassTest, MembersCanOnlyBeAddedDuringDefinition) {
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

TEST_F(OwnClassTest, HiddenClassIsNotListed) {
    behaviour_.hidden = true;
    define();
    EXPECT_TRUE(host_.classNames().empty());
    EXPECT_TRUE(host_.isValid(host_.construct(counterName)));
}

TEST_F(OwnClassTest, UnknownNamesAreReported) {
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

// ---- Dispatch ----

TEST_F(OwnClassTest, CountsMustBeTheDeclaredOnes) {
    defineWithMethod({{counterName, "any"}, {"any", "any"}});
    EXPECT_EQ(keyOfCall(3, 2), "tooManyOutputs");
    EXPECT_EQ(keyOfCall(1, 2), "tooFewOutputs");
    EXPECT_EQ(keyOfCall(2, 2), "tooManyInputs");
    EXPECT_EQ(keyOfCall(2, 0), "tooFewInputs");
    EXPECT_EQ(runs_, 0);
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(host_.call(2, instance, "run", Value()).size(), 2U);
    EXPECT_EQ(host_.call(0, instance, "run", Value()).size(), 0U);
    EXPECT_EQ(runs_, 2);
}

TEST_F(OwnClassTest, OptionalTailLeavesCountsToTheMethod) {
    defineWithMethod({{counterName, "any", "any"}, {"any", "any"}, true});
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(host_.call(1, instance, "run").size(), 1U);
    EXPECT_EQ(host_.call(2, instance, "run", Value()).size(), 2U);
    EXPECT_EQ(keyOfCall(3, 0), "tooManyOutputs");
    EXPECT_EQ(keyOfCall(1, 3), "tooManyInputs");
}

TEST_F(OwnClassTest, OutputsMarkAllowsFewerOutputs) {
    defineWithMethod({{counterName}, {"any", "any"}, false, true});
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(host_.call(1, instance, "run").size(), 1U);
    EXPECT_EQ(keyOfCall(1, 1), "tooManyInputs");
}

TEST_F(OwnClassTest, DeclaredTypesAreCheckedBeforeTheMethodRuns) {
    const Value instance = [&] {
        define([&](TestClass& own, HostClass* definedClass) {
            for (const char* type : {"char", "cell", "double", "uint8",
                                     "logical", "struct", counterName, "any"}) {
                own.addMethod(definedClass, type, {{counterName, type}},
                              [&](HostFrame&) { ++runs_; });
            }
        });
        return host_.construct(counterName);
    }();
    const std::vector<std::pair<std::string, Value>> values = {
        {"char", Value::text(u"x")},
        {"cell", Value::cell({1, 1})},
        {"double", Value::scalar(1)},
        {"uint8", Value::byteColumn({1})},
        {"logical", Value::logical(true)},
        {"struct", Value::structure()},
        {counterName, instance}};
    for (const auto& [type, ignored] : values) {
        for (const auto& [given, value] : values) {
            if (type == given) {
                host_.call(0, instance, type, value);
                continue;
            }
            const HostException error = errorOf(
                [&, &t = type, &v = value] { host_.call(0, instance, t, v); });
            EXPECT_EQ(error.identifier(), "VELOX:embedded:wrongType");
            EXPECT_EQ(argumentsOf(error),
                      (std::vector<std::string>{"input", type, given}));
        }
        host_.call(0, instance, "any", instance);
    }
    EXPECT_EQ(runs_, 14);
}

TEST_F(OwnClassTest, ComplexDoubleIsDouble) {
    defineWithMethod({{counterName, "double"}, {}});
    const Value instance = host_.construct(counterName);
    host_.call(0, instance, "run", Value::complexDoubles({1, 1}, {1, 2}));
    EXPECT_EQ(runs_, 1);
}

TEST_F(OwnClassTest, UnassignedRequestedOutputIsReportedAndTheRestReleased) {
    defineWithBody({"any", "any"}, [](HostFrame& frame) {
        frame.outputs[0] = Value::scalar(1).release();
    });
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(key([&] { host_.call(2, instance, "run"); }),
              "outputNotAssigned");
}

TEST_F(OwnClassTest, OutputsOfMethodThatThrowsAreReleased) {
    defineWithBody({"any"}, [](HostFrame& frame) {
        frame.outputs[0] = Value::scalar(1).release();
        throw std::runtime_error("After all.");
    });
    const Value instance = host_.construct(counterName);
    const HostException error =
        errorOf([&] { host_.call(1, instance, "run"); });
    EXPECT_EQ(argumentsOf(error),
              (std::vector<std::string>{"run", "After all."}));
}

TEST_F(OwnClassTest, WhatMethodsThrowBecomesHostErrors) {
    std::function<void()> action;
    defineWithBody({}, [&](HostFrame&) { action(); });
    const Value instance = host_.construct(counterName);
    const auto call = [&] { host_.call(0, instance, "run"); };
    action = [] { throw std::bad_alloc(); };
    EXPECT_EQ(key(call), "outOfMemory");
    action = [] { throw 42; };
    EXPECT_EQ(key(call), "nativeError");
    action = [&] { host_.operations().hostErrorTooFewInputs(); };
    EXPECT_EQ(key(call), "tooFewInputs");
}

TEST_F(OwnClassTest, ConstructorThatThrowsLeavesNoInstance) {
    define([](TestClass& own, HostClass* definedClass) {
        own.addMethod(definedClass, "Counter", {{}, {counterName}},
                      [](HostFrame&) { throw std::runtime_error("No."); });
    });
    EXPECT_EQ(key([&] { host_.construct(counterName); }), "nativeError");
    EXPECT_EQ(behaviour_.made, 1);
    EXPECT_EQ(behaviour_.destroyed, 1);
}

TEST_F(OwnClassTest, ConstructorFindsItsInstanceInTheFirstOutput) {
    define([](TestClass& own, HostClass* definedClass) {
        own.addMethod(definedClass, "Counter", {{"double"}, {counterName}},
                      [](HostFrame& frame) {
                          const BorrowedValue made(frame.outputs[0]);
                          setNumber(made->instance(0)->native(),
                                    frame.inputs[0]);
                      });
    });
    EXPECT_EQ(number(host_.get(host_.construct(counterName, Value::scalar(7)),
                               "Number")),
              7);
    const Value instance = host_.construct(counterName, Value::scalar(7));
    EXPECT_EQ(
        key([&] { host_.call(1, instance, "Counter", Value::scalar(1)); }),
        "methodMissing");
}

TEST_F(OwnClassTest, ClassWithoutConstructorTakesNoInputs) {
    define();
    EXPECT_EQ(key([&] { host_.construct(counterName, Value()); }),
              "tooManyInputs");
}

TEST_F(OwnClassTest, MethodAttributesAreHonoured) {
    define([&](TestClass& own, HostClass* definedClass) {
        const auto add = [&](const char* name) -> TestMethod& {
            return own.addMethod(definedClass, name, {{}, {}, true},
                                 [&](HostFrame&) { ++runs_; });
        };
        add("restricted").ownAccess = HostAccess::Restricted;
        add("static").callsStatically = true;
        add("abstract").hasNoBody = true;
        add("invisible").shown = false;
    });
    EXPECT_EQ(host_.methodNames(counterName),
              (std::vector<std::string>{"restricted", "static", "abstract"}));
    const Value instance = host_.construct(counterName);
    const auto called = [&](const char* name) {
        return key([&] { host_.call(0, instance, name); });
    };
    EXPECT_EQ(called("restricted"), "methodRestricted");
    EXPECT_EQ(called("static"), "methodMissing");
    EXPECT_EQ(called("abstract"), "methodMissing");
    EXPECT_EQ(runs_, 0);
    host_.callStatic(0, counterName, "static", {});
    EXPECT_EQ(runs_, 1);
}

// ---- Instances ----

TEST_F(OwnClassTest, NativeObjectGoesWithTheLastValue) {
    define();
    std::optional<Value> first = host_.construct(counterName);
    std::optional<Value> second = *first;
    Value cell = Value::cell({1, 1});
    cell.setElement(0, *second);
    first.reset();
    second.reset();
    EXPECT_EQ(behaviour_.destroyed, 0);
    cell = Value();
    EXPECT_EQ(behaviour_.destroyed, 1);
    EXPECT_EQ(behaviour_.made, 1);
}

TEST_F(OwnClassTest, DestroyedInstanceIsDestroyedOnce) {
    define();
    {
        const Value instance = host_.construct(counterName);
        host_.destroy(instance);
        EXPECT_EQ(behaviour_.destroyed, 1);
    }
    EXPECT_EQ(behaviour_.destroyed, 1);
}

// ---- Properties ----

TEST_F(OwnClassTest, PublicPropertyIsReadAndWritten) {
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

TEST_F(OwnClassTest, RestrictedSetterIsRefusedToUsersAllowedToLoadAndCopy) {
    behaviour_.setAccess = HostAccess::Restricted;
    define();
    Value saved = Value::structure();
    saved.setField("Number", Value::scalar(8));
    const Value loaded = host_.load(counterName, saved);
    EXPECT_EQ(key([&] { host_.set(loaded, "Number", Value::scalar(1)); }),
              "propertyRestricted");
    EXPECT_EQ(number(host_.get(host_.copy(loaded), "Number")), 8);
}

TEST_F(OwnClassTest, OnlyPropertiesCopiedWithTheInstanceAreCopied) {
    behaviour_.bits = attr::isVisible;
    define();
    const Value instance = host_.construct(counterName);
    host_.set(instance, "Number", Value::scalar(5));
    EXPECT_EQ(number(host_.get(host_.copy(instance), "Number")), 0);
}

class UnsavedProperty : public OwnClassTest,
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

TEST_F(OwnClassTest, AbstractPropertyHasNoValue) {
    behaviour_.bits = attr::isAbstract;
    define();
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(key([&] { host_.get(instance, "Number"); }),
              "propertyHasNoValue");
    EXPECT_EQ(key([&] { host_.set(instance, "Number", Value::scalar(1)); }),
              "propertyHasNoValue");
}

TEST_F(OwnClassTest, StaticPropertyHasNoNativeObject) {
    behaviour_.bits = attr::isStatic;
    define();
    EXPECT_EQ(number(host_.get(host_.construct(counterName), "Number")), -1);
}

TEST_F(OwnClassTest, InvisiblePropertyIsNotListed) {
    behaviour_.bits = attr::copiedWithInstance;
    define();
    EXPECT_TRUE(host_.propertyNames(counterName).empty());
}

TEST_F(OwnClassTest, InspectionShowsPropertiesThatAllowIt) {
    behaviour_.bits = attr::inspectionAllowed;
    define();
    const Value shown = host_.inspect(host_.construct(counterName));
    EXPECT_EQ(shown.field("Number"), Value::scalar(0));
}

TEST_F(OwnClassTest, ListenersAreNotifiedWhereAllowed) {
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

TEST_F(OwnClassTest, UnchangedValueAbortsTheSetWhereSoMarked) {
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

TEST_F(OwnClassTest, CopyErrorOnlyWarnsWhereSoMarked) {
    behaviour_.bits = attr::copiedWithInstance | attr::warnOnCopyError;
    define();
    const Value instance = host_.construct(counterName);
    static_cast<Counter*>(instance.instance(0)->native())->number = -3;
    EXPECT_TRUE(host_.isValid(host_.copy(instance)));
    EXPECT_EQ(
        host_.copyWarnings(),
        (std::vector<std::string>{"Number: 'Number' failed: Too small."}));
}

TEST_F(OwnClassTest, CopyErrorIsRaisedOtherwiseAndLeavesNoInstance) {
    define();
    const Value instance = host_.construct(counterName);
    static_cast<Counter*>(instance.instance(0)->native())->number = -3;
    EXPECT_EQ(key([&] { host_.copy(instance); }), "nativeError");
    EXPECT_EQ(behaviour_.made, 2);
    EXPECT_EQ(behaviour_.destroyed, 1);
}

// ---- Class attributes ----

TEST_F(OwnClassTest, ClassThatDoesNotCopyOrSaveIsNotCopiedOrSaved) {
    behaviour_.copies = false;
    behaviour_.saves = false;
    define();
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(key([&] { host_.copy(instance); }), "notCopyable");
    EXPECT_EQ(key([&] { host_.save(instance); }), "notSavable");
    EXPECT_EQ(key([&] { host_.load(counterName, Value::structure()); }),
              "notSavable");
}

TEST_F(OwnClassTest, CustomSaveReplacesTheHostsOwn) {
    behaviour_.custom = true;
    define();
    EXPECT_EQ(host_.save(host_.construct(counterName)), Value::text(u"custom"));
}

TEST_F(OwnClassTest, InstanceIsUpdatedAfterLoadAndCopy) {
    define();
    const auto updates = [](const Value& instance) {
        return static_cast<Counter*>(instance.instance(0)->native())->updates;
    };
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(updates(instance), 0);
    EXPECT_EQ(updates(host_.copy(instance)), 1);
    EXPECT_EQ(updates(host_.load(counterName, host_.save(instance))), 1);
}

TEST_F(OwnClassTest, ExtensionFillsCopiesAndSavedForms) {
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
