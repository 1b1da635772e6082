// Stores are saved and loaded while each call to the system fails once, one
// after the other.

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <random>
#include <string>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

#include "paths/PathStore.hpp"
#include "tests/support/FailingCalls.hpp"
#include "tests/support/TemporaryFolder.hpp"

namespace {

namespace fs = std::filesystem;
using tessel::PathStore;

// What a kind of call can fail with; 0: it does a half of what it should.
const std::vector<std::pair<const char*, std::vector<int>>> failures = {
    {"open", {EIO, ENOSPC, EMFILE}},
    {"write", {EIO, ENOSPC, EDQUOT, EINTR, 0}},
    {"read", {EIO, EINTR, 0}},
    {"fsync", {EIO, ENOSPC, EDQUOT}},
    {"rename", {EIO, ENOSPC}},
    {"close", {EIO, EINTR}},
    {"fstat", {EIO}},
    {"stat", {EIO}},
    {"lstat", {EIO}},
    {"flock", {ENOLCK, EINTR}},
    {"fchmod", {EIO, EPERM}},
    {"readdir", {EIO}}};

// Moments at which a writer is killed; more of them find rarer ones.
int killedWriters() {
    const char* const wanted = std::getenv("KILLED_WRITERS");
    return wanted == nullptr ? 50 : std::stoi(wanted);
}

class WholeFileDisks : public ::testing::Test {
protected:
    ~WholeFileDisks() override { failCall("", "", 0, 0); }

    std::string path(const std::string& name) const {
        return folder_.file(name);
    }
    std::vector<std::string> names() const {
        std::vector<std::string> names;
        for (const auto& entry : fs::directory_iterator(folder_.path()))
            names.push_back(entry.path().filename().string());
        return names;
    }

    // Does work with the first, second ... call of every kind failing until
    // none is left. Tells `end` whether the work succeeded.
    void eachFailure(const std::function<void()>& prepare,
                     const std::function<void()>& work,
                     const std::function<void(bool isDone)>& end) const {
        for (const auto& [kind, errors] : failures)
            for (const int error : errors)
                for (long number = 1;; ++number) {
                    SCOPED_TRACE(std::string(kind) + " " +
                                 std::to_string(number) + " " +
                                 std::to_string(error));
                    ASSERT_LT(number, 100);
                    prepare();
                    failCall(folder_.path().c_str(), kind, number, error);
                    const bool isDone = succeeds(work);
                    const bool isOver = hasFailed() == 0;
                    failCall("", "", 0, 0);
                    end(isDone);
                    if (isOver) break;
                }
    }

private:
    bool succeeds(const std::function<void()>& work) const {
        try {
            work();
            return true;
        } catch (const std::system_error& error) {
            EXPECT_NE(std::string(error.what()).find(folder_.path().string()),
                      std::string::npos)
                << error.what();
            return false;
        }
    }

    support::TemporaryFolder folder_;
};

PathStore storeOf(const std::vector<std::string>& paths) {
    PathStore store;
    store.append(paths);
    return store;
}

std::vector<std::string> loaded(const std::string& file) {
    const PathStore store = PathStore::loadFile(file);
    std::vector<std::string> paths;
    store.read(0, store.size(), [&](std::size_t, std::string_view path) {
        paths.emplace_back(path);
    });
    return paths;
}

const std::vector<std::string> oldPaths = {"old/a", "old/b"};
const std::vector<std::string> newPaths = {"new/a", "new/b", "new/c"};

TEST_F(WholeFileDisks, SavingLeavesTheOldStoreOrTheNewOne) {
    const PathStore store = storeOf(newPaths);
    const std::string left = ".a.tessel-abc123.tmp";
    int refused = 0;
    eachFailure(
        [&] {
            storeOf(oldPaths).saveFile(path("a"));
            fs::permissions(path("a"), fs::perms::owner_all);
            std::ofstream(path(left)) << "left by a killed process";
        },
        [&] { store.saveFile(path("a")); },
        [&](bool isDone) {
            EXPECT_EQ(loaded(path("a")), isDone ? newPaths : oldPaths);
            if (!isDone) ++refused;
            for (const std::string& name : names())
                EXPECT_TRUE(name == "a" || name == left) << name;
        });
    EXPECT_GT(refused, 10);
}

TEST_F(WholeFileDisks, AKilledProcessLeavesTheOldStoreOrTheNewOne) {
    std::mt19937 random(3);
    const std::vector<std::string> paths[] = {oldPaths, newPaths};
    const PathStore stores[] = {storeOf(paths[0]), storeOf(paths[1])};
    stores[1].saveFile(path("a"));
    for (int moment = 0; moment < killedWriters(); ++moment) {
        const pid_t child = ::fork();
        if (child == 0)
            for (std::size_t i = 0;; ++i) stores[i % 2].saveFile(path("a"));
        std::this_thread::sleep_for(
            std::chrono::microseconds(random() % 10'000));
        ::kill(child, SIGKILL);
        ::waitpid(child, nullptr, 0);
        const auto found = loaded(path("a"));
        EXPECT_TRUE(found == paths[0] || found == paths[1]);
        EXPECT_LE(names().size(), 2U);
        if (moment % 5 != 0) continue;
        stores[1].saveFile(path("a"));
        EXPECT_EQ(names(), std::vector<std::string>{"a"});
    }
}

TEST_F(WholeFileDisks, LoadingGivesTheStoreOrAnError) {
    storeOf(oldPaths).saveFile(path("a"));
    int refused = 0;
    std::vector<std::string> found;
    eachFailure([&] { found.clear(); }, [&] { found = loaded(path("a")); },
                [&](bool isDone) {
                    EXPECT_EQ(found,
                              isDone ? oldPaths : std::vector<std::string>());
                    if (!isDone) ++refused;
                });
    EXPECT_GE(refused, 4);
}

}  // namespace
