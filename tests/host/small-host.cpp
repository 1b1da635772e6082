#include <dlfcn.h>
#include <gtest/gtest.h>

#include <array>
#include <functional>
#include <optional>

#include "tests/host/FailingAllocation.hpp"
#include "tests/host/SmallHost.hpp"

// The plug-in in the small host: what it does when a host has other habits.
namespace small {

namespace {

using tessel::HostArray;
using tessel::HostFrame;

constexpr const char* fullName =
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
long failingAllocation = 0;
bool allocationFailed = false;

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
Outcome run(tessel::HostMethodInfo& method, std::int32_t requested,
            const std::vector<const Box*>& inputs, Box* instance = nullptr) {
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

class SmallHostTest : public testing::Test {
protected:
    SmallHostTest() { plugin_.initialize(); }
    ~SmallHostTest() override {
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

class InstanceTest : public SmallHostTest {
protected:
    InstanceTest() { instance_.emplace(host_, *host_.registered); }
};

}  // namespace

// ---- Entry and registration ----

TEST(Version, PluginRefusesAHostOfAnotherVersionWithoutTouchingIt) {
    const Plugin plugin;
    // Whoever called an operation through this would crash.
    std::array<unsigned char, 64> poison;
    poison.fill(0xFF);
    Host::gate() = {tessel::hostInterfaceVersion + 1,
                    reinterpret_cast<tessel::HostInterface*>(poison.data())};
    try {
        plugin.initialize();
        ADD_FAILURE() << "the plug-in accepted the host";
    } catch (const std::exception& refusal) {
        EXPECT_STREQ(refusal.what(),
                     "libqztessel needs version 1 of the host interface; this "
                     "host offers version 2.");
    }
    Host::gate() = {tessel::hostInterfaceVersion, nullptr};
}

TEST(Version, PluginRefusesAProcessWhoseHostIsNotThere) {
    const Plugin plugin;
    try {
        plugin.initialize();
        ADD_FAILURE() << "the plug-in accepted no host";
    } catch (const std::exception& refusal) {
        EXPECT_STREQ(refusal.what(), "This process runs no host at present.");
    }
}

TEST_F(SmallHostTest, AlternativeModeRegistersOnEveryCallWhatIsMissing) {
    plugin_.initialize();
    EXPECT_EQ(host_.registrations, 1);
    host_.registered.reset();
    plugin_.initialize();
    EXPECT_EQ(host_.registrations, 2);
}

TEST_F(SmallHostTest, TerminationDoesNothing) {
    plugin_.call("VXTerminate_libqztessel");
    EXPECT_NE(host_.registered, nullptr);
    EXPECT_EQ(host_.method("reset").name(), std::string("reset"));
}

TEST_F(SmallHostTest, SignaturesAreBuiltInOrder) {
    const auto calls = [&](const char* method) {
        return static_cast<const Signature*>(host_.method(method).signature())
            ->calls;
    };
    const std::string self = std::string("instance ") + fullName;
    using Calls = std::vector<std::string>;
    EXPECT_EQ(
        calls("HuffmanPaths"),
        (Calls{"input char createFrom",
               "input any uniqueCharsOrObjectOrFolders", "input any pathTree",
               "input any frequencies", "optional tail",
               std::string("output ") + fullName + " instance"}));
    EXPECT_EQ(calls("addPaths"),
              (Calls{self, "input cell folderpaths", "input cell files"}));
    EXPECT_EQ(
        calls("getPaths"),
        (Calls{self, "input double partitions", "input char filesep",
               "optional tail", "output cell paths", "output cell files"}));
    EXPECT_EQ(calls("getNextPath"), (Calls{self, "output cell path"}));
    EXPECT_EQ(calls("hasNextPath"), (Calls{self, "output any logical scalar"}));
    EXPECT_EQ(calls("reset"), (Calls{self}));
    EXPECT_EQ(calls("serialize"), (Calls{self, "output char uniqueChars",
                                         "output any PathTree", "outputs"}));
}

TEST_F(SmallHostTest, DescriptorsKeepTheHostsDefaults) {
    for (const auto& method : host_.registered->methods) {
        EXPECT_STREQ(method->description(), "");
        EXPECT_EQ(method->access(), tessel::HostAccess::Public);
        EXPECT_FALSE(method->isStatic());
        EXPECT_FALSE(method->isAbstract());
        EXPECT_FALSE(method->isSealed());
        EXPECT_TRUE(method->isVisible());
    }
    tessel::HostClassInfo& info = *host_.registered->info;
    EXPECT_STREQ(info.className(), "HuffmanPaths");
    EXPECT_TRUE(info.copiesInstances());
    EXPECT_TRUE(info.savesInstances());
    EXPECT_FALSE(info.isHidden());
    EXPECT_EQ(info.customSave(nullptr), nullptr);
}

TEST_F(SmallHostTest, PropertiesAreDeclaredAsCopiedAndVisible) {
    ASSERT_EQ(host_.registered->properties.size(), 2U);
    EXPECT_EQ(host_.registered->properties[0].name, "StringTree");
    EXPECT_EQ(host_.registered->properties[1].name, "Frequencies");
    for (const Class::Property& property : host_.registered->properties) {
        EXPECT_EQ(property.typeName, "any");
        EXPECT_FALSE(property.described);
        EXPECT_EQ(property.info.attributeBits, 2112U);
        EXPECT_EQ(static_cast<std::uint32_t>(property.info.getAccess), 0U);
        EXPECT_EQ(static_cast<std::uint32_t>(property.info.setAccess), 2U);
    }
}

TEST_F(SmallHostTest, NativeObjectOfNothingIsNotDestroyed) {
    host_.registered->info->destroyNativeObject(nullptr);
}

TEST_F(SmallHostTest, RegistrationWithoutMemoryRegistersNothing) {
    host_.registered.reset();
    sweepRequests([&] {
        host_.registered.reset();
        try {
            plugin_.initialize();
        } catch (const Raised&) {
            EXPECT_EQ(host_.registered, nullptr);
            EXPECT_EQ(host_.signatures, 0);
            throw;
        }
    });
    EXPECT_NE(host_.registered, nullptr);
}

TEST_F(SmallHostTest, RegistrationWithoutNativeMemoryRegistersNothing) {
    host_.registered.reset();
    sweepAllocations([&] {
        host_.registered.reset();
        try {
            intoPlugin([&] { plugin_.initialize(); });
        } catch (const std::exception&) {
            EXPECT_EQ(host_.registered, nullptr);
            EXPECT_EQ(host_.signatures, 0);
            throw;
        }
    });
    EXPECT_NE(host_.registered, nullptr);
}

TEST_F(SmallHostTest, NoRoomForTheClassDescriptorIsTheHostsError) {
    bool seen = false;
    for (long n = 1; n < 100; ++n) {
        host_.registered.reset();
        host_.requests = 0;
        try {
            const failing::Allocation allocation(n);
            plugin_.initialize();
        } catch (const Raised& raised) {
            EXPECT_EQ(raised.text, "outOfMemory");
            seen = seen || host_.requests == 0;  // no signature asked for yet
        } catch (const std::bad_alloc&) {
            continue;  // elsewhere
        }
    }
    EXPECT_TRUE(seen);
}

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

TEST_F(InstanceTest, GettersWithoutMemory) {
    fill();
    for (const Class::Property& property : host_.registered->properties) {
        const auto get = [&] {
            HostArray* const value = intoPlugin(
                [&] { return property.info.getter(instance_->box->native); });
            property.info.disposer(value);
        };
        sweepRequests(get);
        sweepAllocations(get);
    }
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

TEST_F(SmallHostTest, NativeObjectWithoutMemoryIsNotMade) {
    sweepAllocations([&] {
        tessel::HostClassInfo& info = *host_.registered->info;
        info.destroyNativeObject(
            intoPlugin([&] { return info.createNativeObject(); }));
    });
}

TEST_F(InstanceTest, AddPathsWithoutNativeMemoryLeavesAUsableInstance) {
    fill();
    sweepAllocations([&] { addPaths(); });
    call("reset", 0);
    call("getNextPath", 1);
    storedForm();
}

// ---- Properties ----

TEST_F(InstanceTest, SettersAndGettersWorkOnTheNativeObject) {
    const auto& properties = host_.registered->properties;
    const Array text = host_.text(u"xyz");
    const Array numbers = host_.column({3, 1, 2});
    properties[0].info.setter(instance_->box->native, text.get());
    properties[1].info.setter(instance_->box->native, numbers.get());
    const Array gotText(
        static_cast<Box*>(properties[0].info.getter(instance_->box->native)));
    const Array gotNumbers(
        static_cast<Box*>(properties[1].info.getter(instance_->box->native)));
    EXPECT_EQ(gotText->text, u"xyz");
    EXPECT_EQ(gotText->dimensions, (std::vector<std::size_t>{1, 3}));
    EXPECT_EQ(gotNumbers->numbers, (std::vector<double>{3, 1, 2}));
    EXPECT_EQ(gotNumbers->dimensions, (std::vector<std::size_t>{3, 1}));
    properties[0].info.disposer(nullptr);
    EXPECT_TRUE(host_.errors.empty());
}

// ---- Custom load ----

namespace {

class CustomLoadTest : public InstanceTest {
protected:
    CustomLoadTest() {
        fill();
        form_ = storedForm();
        alphabet_ = call("serialize", 1).outputs[0]->text;
        instance_.reset();
        instance_.emplace(host_, *host_.registered);
        host_.nativeGiven = 0;
    }

    // Loads what `makes` makes and gives what was printed.
    std::string printed(const std::function<Array()>& makes) {
        Saved saved;
        saved.makes = makes;
        const long before = host_.arrays;
        testing::internal::CaptureStdout();
        host_.registered->info->customLoad(instance_->box.get(), &saved);
        EXPECT_EQ(host_.arrays, before)
            << "the converted array is not released";
        return testing::internal::GetCapturedStdout();
    }
    Array structure(const std::u16string& stringTree,
                    const std::vector<std::uint8_t>& pathTree) {
        Array made = host_.structure();
        made->fields["StringTree"] = host_.text(stringTree);
        made->fields["PathTree"] = host_.byteColumn(pathTree);
        return made;
    }

    const std::string failureLine_ =
        "Error while custom loading CompressedFileSet.\n";
    std::vector<std::uint8_t> form_;
    std::u16string alphabet_;
};

}  // namespace

TEST_F(CustomLoadTest, RestoresAndHandsTheNativeObjectBackOnce) {
    EXPECT_EQ(printed([&] { return structure(alphabet_, form_); }), "");
    EXPECT_EQ(host_.nativeGiven, 1);
    EXPECT_EQ(storedForm(), form_);
}

TEST_F(CustomLoadTest, EmptyStringTreeDoesNothingMore) {
    EXPECT_EQ(printed([&] { return structure(u"", form_); }), "");
    EXPECT_EQ(host_.nativeGiven, 0);
    EXPECT_NE(storedForm(), form_);
}

TEST_F(CustomLoadTest, OtherValuesDoNothing) {
    const auto noPathTree = [&] {
        Array made = host_.structure();
        made->fields["StringTree"] = host_.text(alphabet_);
        return made;
    };
    const auto noStruct = [&] {
        Array made = structure(alphabet_, form_);
        made->isStruct = false;
        return made;
    };
    host_.nativeAsked = 0;
    EXPECT_EQ(printed(noPathTree), "");
    EXPECT_EQ(printed(noStruct), "");
    EXPECT_EQ(host_.nativeAsked, 0);
}

TEST_F(CustomLoadTest, EveryFailurePrintsTheLineAndReturns) {
    std::vector<std::uint8_t> damaged = form_;
    damaged.pop_back();
    EXPECT_EQ(printed([&] { return structure(alphabet_, damaged); }),
              failureLine_);
    EXPECT_EQ(printed([&]() -> Array { throw Raised("conversion"); }),
              failureLine_);
    EXPECT_EQ(printed([&]() -> Array { throw 5; }), failureLine_);
    host_.requests = 0;
    host_.failingRequest = 1;
    EXPECT_EQ(printed([&] { return structure(alphabet_, form_); }),
              failureLine_);
    EXPECT_EQ(host_.nativeGiven, 0);
    EXPECT_EQ(printed([&] { return structure(alphabet_, form_); }), "");
}

TEST_F(CustomLoadTest, WithoutNativeMemoryItPrintsTheLineOrRestoresAll) {
    int failures = 0;
    sweepAllocations(
        [&] {
            Saved saved;
            saved.makes = [&] { return structure(alphabet_, form_); };
            testing::internal::CaptureStdout();
            intoPlugin([&] {
                host_.registered->info->customLoad(instance_->box.get(),
                                                   &saved);
            });
            failingAllocation = 0;
            if (testing::internal::GetCapturedStdout().empty()) {
                EXPECT_EQ(storedForm(), form_);
            } else {
                EXPECT_TRUE(allocationFailed);
                ++failures;
            }
        },
        [&] {
            instance_.reset();
            instance_.emplace(host_, *host_.registered);
        });
    EXPECT_GT(failures, 10);
}

}  // namespace small
