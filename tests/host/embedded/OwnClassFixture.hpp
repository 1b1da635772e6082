#pragma once

#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "tests/host/HostFixture.hpp"

// A class that a test defines itself in the embedded host.
namespace tessel::embedded {

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
    TestMethod(Behaviour& behaviour, HostInterface& host, std::string name,
               HostSignature* signature, Body body)
        : behaviour_(behaviour),
          host_(host),
          name_(std::move(name)),
          signature_(signature),
          body_(std::move(body)) {}
    ~TestMethod() override {
        host_.hostReleaseSignature(signature_);
        behaviour_.released.push_back(name_);
    }

    const char* name() const noexcept override { return name_.c_str(); }
    const HostSignature* signature() const noexcept override {
        return signature_;
    }
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
    std::string name_;
    HostSignature* signature_;
    Body body_;
};

inline HostArray* getNumber(void* native) {
    const double number =
        native == nullptr ? -1 : static_cast<Counter*>(native)->number;
    return Value::scalar(number).release();
}

inline void setNumber(void* native, const HostArray* value) {
    const double number = BorrowedValue(value)->doubleData().at(0);
    if (number < 0) throw std::range_error("Too small.");
    static_cast<Counter*>(native)->number = number;
}

inline void dispose(HostArray* value) {
    static_cast<void>(Value::adopt(value));
}

class TestClass : public HostClassInfo {
public:
    using Define = std::function<void(TestClass&, HostClass*)>;
    TestClass(Behaviour& behaviour, HostInterface& host, Define define)
        : behaviour_(behaviour), host_(host), define_(std::move(define)) {}
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

inline constexpr const char* counterName = "velox.test.Counter";

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

}  // namespace tessel::embedded
