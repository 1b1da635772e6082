#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "hosts/embedded/demo/HostJob.hpp"
#include "tests/host/HostFixture.hpp"

// The main job in the embedded host, on lists that are hard to keep.
namespace tessel::embedded {

namespace {

JobResults runOn(const std::vector<std::string>& texts) {
    paths::PathList list;
    for (const std::string& text : texts) list.append(text);
    Host host(testOptions());
    host.loadModule(pluginFile());
    return HostJob(host, list).run();
}

}  // namespace

TEST(HostJobTest, PathsThatAreFoldersOfOthersComeBack) {
    std::vector<std::string> texts;
    for (int i = 0; i < 3000; ++i) {
        const std::string folder =
            "/srv/" + std::to_string(i % 70) + "/" + std::to_string(i);
        texts.push_back(folder);
        texts.push_back(folder + "/a");
        texts.push_back(folder + "/a/b");
    }
    const JobResults results = runOn(texts);
    EXPECT_EQ(results.paths, 9000U);
    EXPECT_EQ(results.keptApart, 6000U);
}

TEST(HostJobTest, PathsDirectlyUnderTheRootThatAreFoldersComeBack) {
    EXPECT_EQ(runOn({"/", "/a", "/a/b", "/a/b/c", "/bin", "/bin/ls", "x", "x/y",
                     "x/y/z", "x//q", "a", "/a/b/c"})
                  .paths,
              12U);
}

TEST(HostJobTest, BytesThatAreNoTextComeBack) {
    runOn({"/\xFF\xFE/b", "/\xED\xA0\x80", "/\xC3\xA9", "/\xC3",
           std::string("/a\0b", 4), "/\xF0\x9F\x98\x80/\n"});
}

TEST(HostJobTest, RepeatedPathsComeBackAtTheirNumbers) {
    runOn({"/a/b", "/a/b", "/a/c", "/a/b", "/b", "/a/b"});
}

TEST(HostJobTest, ListOfOneCharacterComesBack) { runOn({"aaa", "a", "aa"}); }

TEST(HostJobTest, MoreThanOneBatchComesBack) {
    std::vector<std::string> texts;
    for (int i = 0; i < 60000; ++i) {
        texts.push_back("/var/" + std::to_string(i / 1000) + "/" +
                        std::to_string(i % 777));
    }
    EXPECT_EQ(runOn(texts).paths, 60000U);
}

}  // namespace tessel::embedded
