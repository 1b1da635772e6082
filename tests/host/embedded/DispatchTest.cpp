#include <new>

#include "hosts/embedded/Dispatch.hpp"
#include "tests/host/embedded/OwnClassFixture.hpp"

// Calls of methods, with the checks that their declarations ask for.
namespace tessel::embedded {

namespace {

class DispatchTest : public OwnClassTest {};

}  // namespace

TEST_F(DispatchTest, CountsMustBeTheDeclaredOnes) {
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

TEST_F(DispatchTest, OptionalTailLeavesCountsToTheMethod) {
    defineWithMethod({{counterName, "any", "any"}, {"any", "any"}, true});
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(host_.call(1, instance, "run").size(), 1U);
    EXPECT_EQ(host_.call(2, instance, "run", Value()).size(), 2U);
    EXPECT_EQ(keyOfCall(3, 0), "tooManyOutputs");
    EXPECT_EQ(keyOfCall(1, 3), "tooManyInputs");
}

TEST_F(DispatchTest, OutputsMarkAllowsFewerOutputs) {
    defineWithMethod({{counterName}, {"any", "any"}, false, true});
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(host_.call(1, instance, "run").size(), 1U);
    EXPECT_EQ(keyOfCall(1, 1), "tooManyInputs");
}

TEST_F(DispatchTest, DeclaredTypesAreCheckedBeforeTheMethodRuns) {
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

TEST_F(DispatchTest, ComplexDoubleIsDouble) {
    defineWithMethod({{counterName, "double"}, {}});
    const Value instance = host_.construct(counterName);
    host_.call(0, instance, "run", Value::complexDoubles({1, 1}, {1, 2}));
    EXPECT_EQ(runs_, 1);
}

TEST_F(DispatchTest, UnassignedRequestedOutputIsReportedAndTheRestReleased) {
    defineWithBody({"any", "any"}, [](HostFrame& frame) {
        frame.outputs[0] = Value::scalar(1).release();
    });
    const Value instance = host_.construct(counterName);
    EXPECT_EQ(key([&] { host_.call(2, instance, "run"); }),
              "outputNotAssigned");
}

TEST_F(DispatchTest, OutputsOfMethodThatThrowsAreReleased) {
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

TEST_F(DispatchTest, WhatMethodsThrowBecomesHostErrors) {
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

TEST_F(DispatchTest, ConstructorThatThrowsLeavesNoInstance) {
    define([](TestClass& own, HostClass* definedClass) {
        own.addMethod(definedClass, "Counter", {{}, {counterName}},
                      [](HostFrame&) { throw std::runtime_error("No."); });
    });
    EXPECT_EQ(key([&] { host_.construct(counterName); }), "nativeError");
    EXPECT_EQ(behaviour_.made, 1);
    EXPECT_EQ(behaviour_.destroyed, 1);
}

TEST_F(DispatchTest, ConstructorFindsItsInstanceInTheFirstOutput) {
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

TEST_F(DispatchTest, ClassWithoutConstructorTakesNoInputs) {
    define();
    EXPECT_EQ(key([&] { host_.construct(counterName, Value()); }),
              "tooManyInputs");
}

TEST_F(DispatchTest, MethodAttributesAreHonoured) {
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

}  // namespace tessel::embedded
