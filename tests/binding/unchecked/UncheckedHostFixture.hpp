#pragma once

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <array>
#include <functional>
#include <optional>

#include "tests/host/FailingAllocation.hpp"
#include "tests/host/UncheckedHost.hpp"

// The plug-in in the unchecked host, whose habits a test chooses.
namespace unchecked {

using tessel::HostArray;
using tessel::HostFrame;

inline constexpr const char* fullName =
    "velox.io.datastore.internal.fileset.HuffmanPaths";

// The plug-in, loaded while it lives.
class Plugin {
public:
    Plugin() : handle_(dlopen(QZTESSEL_PLUGIN, RTLD_NOW | RTLD_LOCAL)) {
        if (handle_ == nullptr) ADD_FAILURE() << dlerror();
    }
    Plugin(const Plugin&) = delete;
    Plugin& operator=(const Plugin&) = delete;
    ~Plugin() { dlclose(handle_); }

    void call(const char* entry) const {
        reinterpret_cast<tessel::HostModuleEntry>(dlsym(handle_, entry))();
    }
    void initialize() const { call("VXInitialize_libqztessel"); }

private:
    void* handle_;
};

struct Outcome {
    std::int32_t outputCount = 0;
    std::vector<Array> outputs;
    bool operator[](std::size_t i) const { return outputs[i] != nullptr; }
};

// Which allocation of the next call into the plug-in fails (0: none), and
// whether it came.
inline long failingAllocation = 0;
inline bool allocationFailed = false;

// Calls into the plug-in; only what happens inside meets that failure.
template <class Action>
auto intoPlugin(Action action) {
    if (failingAllocation == 0) return action();
    const failing::Allocation allocation(failingAllocation);
    struct Note {
        const failing::Allocation& allocation;
        ~Note() { allocationFailed = allocation.hasFailed(); }
    } const note{allocation};
    return action();
}

// Runs a method on these inputs. When it throws, nothing may be in the slots.
inline Outcome run(tessel::HostMethodInfo& method, std::int32_t requested,
                   const std::vector<const Box*>& inputs,
                   Box* instance = nullptr) {
    std::array<HostArray*, 4> slots{instance};
    const std::vector<const HostArray*> arrays(inputs.begin(), inputs.end());
    HostFrame frame{requested, slots.data(),
                    static_cast<std::int32_t>(arrays.size()), arrays.data()};
    try {
        intoPlugin([&] { method.execute(frame); });
    } catch (...) {
        for (HostArray* const slot : slots)
            EXPECT_TRUE(slot == nullptr || slot == instance);
        throw;
    }
    Outcome outcome{frame.outputCount, {}};
    for (HostArray* const slot : slots) {
        outcome.outputs.emplace_back(
            slot == instance ? nullptr : static_cast<Box*>(slot));
    }
    return outcome;
}

// An instance: its native object and the array that stands for it.
class Instance {
public:
    Instance(Host& host, Class& instanceClass)
        : definition(instanceClass), box(host.text(u"an instance")) {
        box->native = definition.info->createNativeObject();
    }
    Instance(const Instance&) = delete;
    Instance& operator=(const Instance&) = delete;
    ~Instance() { definition.info->destroyNativeObject(box->native); }

    Class& definition;
    Array box;
};

class UncheckedHostTest : public testing::Test {
protected:
    UncheckedHostTest() { plugin_.initialize(); }
    ~UncheckedHostTest() override {
        instance_.reset();
        host_.registered.reset();
        EXPECT_EQ(host_.arrays, 0);
        EXPECT_EQ(host_.signatures, 0);
    }

    Outcome call(const char* method, std::int32_t requested,
                 std::vector<const Box*> inputs = {}) {
        inputs.insert(inputs.begin(), instance_->box.get());
        return run(host_.method(method), requested, inputs);
    }
    void construct(const std::vector<const Box*>& inputs,
                   std::int32_t requested = 1) {
        run(host_.method("HuffmanPaths"), requested, inputs,
            instance_->box.get());
    }

    // Gives the instance a code and paths: 1 to 3 in x/y, 4 in x/z/w.
    void fill() {
        const Array mode = host_.text(u"frequencies");
        const Array letters = host_.text(u"abcdxyzw");
        const Array numbers = host_.column({1, 2, 3, 4, 5, 6, 7, 8});
        construct({mode.get(), letters.get(), numbers.get()});
        addPaths();
    }
    void addPaths() {
        std::vector<Array> folders;
        folders.push_back(host_.texts({u"x", u"y"}));
        folders.push_back(host_.texts({u"x", u"z", u"w"}));
        std::vector<Array> files;
        files.push_back(host_.texts({u"a", u"b", u"ab"}));
        files.push_back(host_.texts({u"dad"}));
        const Array folderCell = host_.cell(std::move(folders));
        const Array fileCell = host_.cell(std::move(files));
        call("addPaths", 0, {folderCell.get(), fileCell.get()});
    }
    std::vector<std::uint8_t> storedForm() {
        return call("serialize", 2).outputs[1]->bytes;
    }
    // The joined paths of these numbers.
    std::vector<std::u16string> joined(const std::vector<double>& numbers) {
        const Array column = host_.column(numbers);
        const Array separator = host_.text(u"/");
        const Outcome paths =
            call("getPaths", 1, {column.get(), separator.get()});
        std::vector<std::u16string> texts;
        for (const Array& element : paths.outputs[0]->elements)
            texts.push_back(element->text);
        return texts;
    }
    // The stored form of another instance, made of this one's outputs.
    std::vector<std::uint8_t> rebuiltStoredForm() {
        const Outcome stored = call("serialize", 2);
        const Array mode = host_.text(u"tree");
        const Array frequencies = host_.column({1});
        Instance other(host_, *host_.registered);
        run(host_.method("HuffmanPaths"), 1,
            {mode.get(), stored.outputs[0].get(), stored.outputs[1].get(),
             frequencies.get()},
            other.box.get());
        return run(host_.method("serialize"), 2, {other.box.get()})
            .outputs[1]
            ->bytes;
    }

    // Runs an action with the n-th request refused, for every n up to the
    // first that is not reached. Each time the host's out-of-memory error must
    // come, and all arrays of the failed action must be gone.
    void sweepRequests(const std::function<void()>& action) {
        for (long n = 1; n < 1000; ++n) {
            const long arraysBefore = host_.arrays;
            host_.requests = 0;
            host_.failingRequest = n;
            host_.errors.clear();
            try {
                action();
            } catch (const Raised& raised) {
                EXPECT_EQ(raised.text, "outOfMemory");
            }
            host_.failingRequest = 0;
            EXPECT_EQ(host_.arrays, arraysBefore) << "request " << n;
            if (host_.requests < n) {
                EXPECT_TRUE(host_.errors.empty());
                EXPECT_GT(n, 1) << "the action asks for nothing";
                return;
            }
            EXPECT_EQ(host_.errors, (std::vector<std::string>{"outOfMemory"}));
        }
        FAIL() << "no end of requests";
    }

    // The same for every allocation of native memory, in the plug-in as in the
    // host, made by the action inside intoPlugin.
    void sweepAllocations(
        const std::function<void()>& action,
        const std::function<void()>& prepare = [] {}) {
        for (long n = 1; n < 100000; ++n) {
            prepare();
            const long arraysBefore = host_.arrays;
            failingAllocation = n;
            try {
                action();
            } catch (const std::exception&) {
                EXPECT_TRUE(allocationFailed);
            }
            failingAllocation = 0;
            EXPECT_EQ(host_.arrays, arraysBefore) << "allocation " << n;
            if (!allocationFailed) {
                EXPECT_GT(n, 1) << "the action allocates nothing";
                return;
            }
        }
        FAIL() << "no end of allocations";
    }

    Plugin plugin_;
    Host host_;
    std::optional<Instance> instance_;
};

class InstanceTest : public UncheckedHostTest {
protected:
    InstanceTest() { instance_.emplace(host_, *host_.registered); }
};

}  // namespace unchecked
