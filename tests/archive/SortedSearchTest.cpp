#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string>

#include "archive/SortedSearch.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

using archives::OpenArchive;
using archives::Paths;

// What is in the list, and what would be just before and after it.
Paths questionsAbout(const Paths& list) {
    Paths questions = {"", "/", "\x01", "\xFF"};
    for (const std::string& path : list) {
        questions.push_back(path);
        questions.push_back(path + '\x01');
        questions.push_back(path + '/');
        questions.push_back(path.substr(0, path.size() - 1));
        questions.push_back(path.substr(0, path.rfind('/') + 1));
    }
    return questions;
}

void expectRightPlaces(Paths list) {
    std::ranges::sort(list);
    const OpenArchive archive(list);
    SortedSearch search(archive.segment());
    for (const std::string& path : questionsAbout(list)) {
        const auto expected = std::ranges::lower_bound(list, path);
        const auto place = static_cast<std::uint64_t>(expected - list.begin());
        ASSERT_EQ(search.lowerBound(path), place) << path;
        const bool isThere = expected != list.end() && *expected == path;
        ASSERT_EQ(search.find(path), isThere ? place : list.size()) << path;
    }
}

TEST(SortedSearch, AgreesWithBinarySearch) {
    expectRightPlaces(archives::sortedPaths(3000));
}

TEST(SortedSearch, AgreesOnNastyPaths) {
    expectRightPlaces(archives::nastyPaths());
}

TEST(SortedSearch, AgreesOnRepeats) {
    Paths list(100, "same/path");
    list.insert(list.end(), 50, "same/path2");
    list.insert(list.end(), 50, "same");
    expectRightPlaces(list);
}

TEST(SortedSearch, AgreesWhereAFolderFillsManyBlocks) {
    Paths list = {"a", "z/z"};
    for (int i = 0; i < 2000; ++i) {
        list.push_back("big/" + std::to_string(i));
        if (i % 100 == 0) list.push_back("big/" + std::to_string(i) + "/sub");
    }
    expectRightPlaces(list);
}

}  // namespace
}  // namespace tessel::archive
