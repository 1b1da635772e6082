#include <gtest/gtest.h>

#include <functional>
#include <new>
#include <optional>

#include "tests/host/FailingAllocation.hpp"
#include "tests/host/HostFixture.hpp"

// The class in the embedded host when memory runs out, at each allocation of an
// operation in turn, in the host as in the plug-in.
namespace tessel::embedded {

namespace {

// More than any of these operations makes.
constexpr long mostAllocations = 20'000;

// Calls operate() with its first, second ... allocation failing, until none is
// left to fail. It must raise this host error, or std::bad_alloc
// where the host itself lacks memory. Calls prepare() before and
// check(succeeded) after it.
template <class Prepare, class Operate, class Check>
void atEachAllocation(Prepare prepare, Operate operate, Check check,
                      const char* error = "VELOX:embedded:outOfMemory") {
    long n = 0;
    for (bool enough = false; !enough && n < mostAllocations;) {
        ++n;
        prepare();
        bool succeeded = true;
        {
            const failing::Allocation allocation(n);
            try {
                operate();
            } catch (const HostException& raised) {
                succeeded = false;
                EXPECT_EQ(raised.identifier(), error);
            } catch (const std::bad_alloc&) {
                succeeded = false;
            }
            enough = !allocation.hasFailed();
        }
        EXPECT_TRUE(succeeded || !enough) << "failed although there was memory";
        check(succeeded);
    }
    EXPECT_GT(n, 1) << "nothing was allocated";
    EXPECT_LT(n, mostAllocations);
}

// A folder that is there and one that is new, with names of many bytes.
Listing moreListing() {
    return {{{u"/", u"usr", u"bin"}, {u"/", u"usr", u"bin", u"gcc"}},
            {{u"cat.o"}, {std::u16string(300, u'c'), u"env.o"}}};
}

class HostMemory : public HostTest {
protected:
    // Whatever failed before, an instance with these paths answers by every
    // way out.
    void expectHolds(const Value& instance, const Listing& listing) {
        EXPECT_EQ(iterated(instance), pathsOf(listing));
        EXPECT_EQ(fetched(instance, numbersTo(pathsOf(listing).size())),
                  listing);
        const Value back =
            make(Value::text(u"tree"), Value::text(treeString(instance)),
                 Value::byteColumn(storedForm(instance)), Value::scalar(1));
        EXPECT_EQ(iterated(back), pathsOf(listing));
    }

    // Constructs an instance with each allocation failing. The last one, which
    // has all its memory, is handed to `check`.
    template <class Check, class... Inputs>
    void expectConstructs(Check check, const Inputs&... inputs) {
        std::optional<Value> made;
        atEachAllocation([&] { made.reset(); }, [&] { made = make(inputs...); },
                         [&](bool succeeded) {
                             ASSERT_EQ(made.has_value(), succeeded);
                             if (succeeded) check(*made);
                         });
    }

    // Calls a method, as often as it fails, and compares what it answers.
    template <class... Inputs>
    void expectAnswers(const Value& instance, std::int32_t requested,
                       const char* method, const Inputs&... inputs) {
        const auto right = host_.call(requested, instance, method, inputs...);
        std::vector<Value> answer;
        atEachAllocation(
            [&] { answer.clear(); },
            [&] {
                answer = host_.call(requested, instance, method, inputs...);
            },
            [&](bool succeeded) {
                EXPECT_EQ(answer, succeeded ? right : std::vector<Value>());
            });
        EXPECT_EQ(host_.call(requested, instance, method, inputs...), right);
    }

    const Listing listing_ = smallListing();
};

TEST_F(HostMemory, EachModeOfTheConstructorMakesAnInstanceOrNone) {
    const Value source = filled(listing_);
    const auto hasCode = [&](const Value& made) {
        EXPECT_EQ(treeString(made).size(), alphabetOf(listing_).size());
        add(made, listing_);
        expectHolds(made, listing_);
    };
    expectConstructs(
        [&](const Value& made) { EXPECT_EQ(treeString(made), u""); });
    expectConstructs(hasCode, Value::text(u"files"), foldersAndFiles(listing_));
    const std::u16string letters = alphabetOf(listing_);
    expectConstructs(hasCode, Value::text(u"frequencies"), Value::text(letters),
                     Value::column(numbersTo(letters.size())));
    const auto isSource = [&](const Value& made) {
        expectHolds(made, listing_);
        EXPECT_EQ(storedForm(made), storedForm(source));
    };
    expectConstructs(isSource, Value::text(u"copy"), source);
    expectConstructs(isSource, Value::text(u"tree"),
                     Value::text(treeString(source)),
                     Value::byteColumn(storedForm(source)), Value::scalar(1));
    expectHolds(source, listing_);
}

// The folders before the one that lacked memory stay added.
TEST_F(HostMemory, PathsAreAddedFolderByFolder) {
    const Listing more = moreListing();
    std::vector<std::vector<Texts>> possible = {pathsOf(listing_)};
    for (std::size_t folders = 1; folders <= more.folders.size(); ++folders) {
        Listing part = listing_;
        for (std::size_t i = 0; i < folders; ++i) {
            part.folders.push_back(more.folders[i]);
            part.files.push_back(more.files[i]);
        }
        possible.push_back(pathsOf(part));
    }
    for (auto& paths : possible) std::sort(paths.begin(), paths.end());
    std::optional<Value> instance;
    std::vector<bool> seen(possible.size());
    atEachAllocation(
        [&] { instance = filled(listing_); }, [&] { add(*instance, more); },
        [&](bool succeeded) {
            std::vector<Texts> paths = iterated(*instance);
            std::sort(paths.begin(), paths.end());
            const auto found =
                std::find(possible.begin(), possible.end(), paths);
            ASSERT_NE(found, possible.end());
            const auto folders =
                static_cast<std::size_t>(found - possible.begin());
            seen[folders] = true;
            EXPECT_TRUE(!succeeded || folders == more.folders.size());
            EXPECT_EQ(fetched(*instance, numbersTo(5)), listing_);
            // It goes on from there.
            add(*instance, {{{u"/", u"usr", u"nev"}}, {{u"ls"}}});
            EXPECT_EQ(iterated(*instance).size(), paths.size() + 1);
        });
    EXPECT_TRUE(seen.front());
    EXPECT_TRUE(seen.back());
}

TEST_F(HostMemory, EachMethodAnswersOrFails) {
    const Value instance = filled(listing_);
    const Value numbers = Value::column({1, 2, 4, 5});
    expectAnswers(instance, 1, "getPaths", numbers);
    expectAnswers(instance, 2, "getPaths", numbers);
    expectAnswers(instance, 1, "getPaths", numbers, Value::text(u"/"));
    expectAnswers(instance, 1, "serialize");
    expectAnswers(instance, 2, "serialize");
    host_.call(0, instance, "reset");
    expectAnswers(instance, 1, "hasNextPath");
    expectHolds(instance, listing_);
}

// A call that lacked memory leaves the pass before the path.
TEST_F(HostMemory, APassGoesOnAfterEachFailure) {
    const Value instance = filled(listing_);
    const std::vector<Texts> right = iterated(instance);
    for (const Texts& path : right) {
        std::optional<Value> next;
        if (path == right.front()) {
            atEachAllocation([] {}, [&] { host_.call(0, instance, "reset"); },
                             [](bool) {});
            host_.call(0, instance, "reset");
        }
        atEachAllocation(
            [] {}, [&] { next = host_.call(1, instance, "getNextPath").at(0); },
            [&](bool succeeded) { EXPECT_EQ(next.has_value(), succeeded); });
        EXPECT_EQ(textsOf(*next), path);
    }
    EXPECT_FALSE(host_.call(1, instance, "hasNextPath")[0].truth(0));
}

TEST_F(HostMemory, PropertiesAreReadOrNot) {
    const Value instance = filled(listing_);
    for (const char* const property : {"StringTree", "Frequencies"}) {
        const Value right = host_.get(instance, property);
        std::optional<Value> value;
        atEachAllocation(
            [&] { value.reset(); },
            [&] { value = host_.get(instance, property); },
            [&](bool succeeded) { EXPECT_EQ(value.has_value(), succeeded); });
        EXPECT_EQ(value, right);
    }
    std::optional<Value> shown;
    atEachAllocation([] {}, [&] { shown = host_.inspect(instance); },
                     [](bool) {});
    EXPECT_EQ(shown, host_.inspect(instance));
}

// Copying sets the properties of the copy.
TEST_F(HostMemory, AnInstanceIsCopiedOrNot) {
    const Value instance = filled(listing_);
    std::optional<Value> copied;
    atEachAllocation([&] { copied.reset(); },
                     [&] { copied = host_.copy(instance); },
                     [&](bool succeeded) {
                         EXPECT_EQ(copied.has_value(), succeeded);
                         EXPECT_TRUE(host_.copyWarnings().empty());
                     });
    expectHolds(*copied, listing_);
    expectHolds(instance, listing_);
    EXPECT_EQ(frequencies(*copied), frequencies(instance));
}

TEST_F(HostMemory, AnInstanceIsSavedOrNot) {
    const Value instance = filled(listing_);
    const Value right = host_.save(instance);
    std::optional<Value> saved;
    atEachAllocation(
        [&] { saved.reset(); }, [&] { saved = host_.save(instance); },
        [&](bool succeeded) { EXPECT_EQ(saved.has_value(), succeeded); });
    EXPECT_EQ(saved, right);
    expectHolds(instance, listing_);
}

// The class's own part of loading tells nobody that it failed: such an instance
// is not restored.
TEST_F(HostMemory, AnInstanceIsLoadedOrNotRestored) {
    const Value saved = host_.save(filled(listing_));
    std::optional<Value> loaded;
    bool wasIncomplete = false;
    atEachAllocation([&] { loaded.reset(); },
                     [&] { loaded = host_.load(filesetClassName, saved); },
                     [&](bool succeeded) {
                         ASSERT_EQ(loaded.has_value(), succeeded);
                         if (!succeeded) return;
                         if (host_.isRestored(*loaded))
                             expectHolds(*loaded, listing_);
                         else
                             wasIncomplete = true;
                     });
    EXPECT_TRUE(host_.isRestored(*loaded));
    EXPECT_TRUE(wasIncomplete);
}

TEST_F(HostMemory, AModuleIsLoadedOrNot) {
    host_.unloadModule(pluginFile());
    bool isLoaded = false;
    atEachAllocation(
        [&] {
            if (isLoaded) host_.unloadModule(pluginFile());
            isLoaded = false;
        },
        [&] { host_.loadModule(pluginFile()); },
        [&](bool succeeded) {
            isLoaded = succeeded;
            EXPECT_EQ(host_.hasClass(filesetClassName), succeeded);
        },
        "VELOX:embedded:entryFailed");
    expectHolds(filled(listing_), listing_);
}

}  // namespace

}  // namespace tessel::embedded
