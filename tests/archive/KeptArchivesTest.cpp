// Archives that were written once and are kept as files: every later version
// reads them.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "archive/PathArchive.hpp"
#include "tests/archive/ArchiveLists.hpp"

namespace {

// The paths of a kept list, each of which ends with a NUL byte.
support::Paths keptList(const std::filesystem::path& file) {
    std::ifstream in(file, std::ios::binary);
    support::Paths paths;
    for (std::string path; std::getline(in, path, '\0');) paths.push_back(path);
    return paths;
}

}  // namespace

TEST(KeptArchives, AreReadByThisVersion) {
    std::size_t read = 0;
    for (const auto& entry :
         std::filesystem::directory_iterator(QZTESSEL_KEPT_ARCHIVES)) {
        std::filesystem::path file = entry.path();
        if (file.extension() != ".tessel") continue;
        SCOPED_TRACE(file.string());
        const auto archive = tessel::PathArchive::open(file.string());
        EXPECT_EQ(support::pathsOf(archive),
                  keptList(file.replace_extension(".paths")));
        EXPECT_NO_THROW(archive.verify());
        ++read;
    }
    EXPECT_EQ(read, 6U);
}
