#include "tests/binding/unchecked/UncheckedHostFixture.hpp"

// The class descriptor in the unchecked host: declarations, native objects,
// properties and custom load, with and without memory.
namespace unchecked {

TEST_F(UncheckedHostTest, SignaturesAreBuiltInOrder) {
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

TEST_F(UncheckedHostTest, DescriptorsKeepTheHostsDefaults) {
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

TEST_F(UncheckedHostTest, PropertiesAreDeclaredAsCopiedAndVisible) {
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

TEST_F(InstanceTest, NativeObjectOfNothingIsNotDestroyed) {
    fill();
    const std::vector<std::uint8_t> before = storedForm();
    host_.errors.clear();
    const unsigned long releasedBefore = failing::blocksReleased();
    host_.registered->info->destroyNativeObject(nullptr);
    EXPECT_EQ(failing::blocksReleased(), releasedBefore);
    EXPECT_TRUE(host_.errors.empty());
    EXPECT_EQ(storedForm(), before);
}

TEST_F(UncheckedHostTest, NativeObjectIsDestroyedWithAllItHolds) {
    tessel::HostClassInfo& info = *host_.registered->info;
    void* const native = info.createNativeObject();
    const unsigned long releasedBefore = failing::blocksReleased();
    info.destroyNativeObject(native);
    EXPECT_GT(failing::blocksReleased(), releasedBefore);
}

TEST_F(UncheckedHostTest, RegistrationWithoutMemoryRegistersNothing) {
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

TEST_F(UncheckedHostTest, RegistrationWithoutNativeMemoryRegistersNothing) {
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

TEST_F(UncheckedHostTest, NoRoomForTheClassDescriptorIsTheHostsError) {
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

TEST_F(UncheckedHostTest, NativeObjectWithoutMemoryIsNotMade) {
    sweepAllocations([&] {
        tessel::HostClassInfo& info = *host_.registered->info;
        info.destroyNativeObject(
            intoPlugin([&] { return info.createNativeObject(); }));
    });
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

}  // namespace unchecked
