#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <functional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "archive/PathSearch.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

using archives::OpenArchive;
using archives::Paths;
using Numbers = std::vector<std::uint64_t>;
using Texts = std::vector<std::string_view>;

FindOptions findOnThreads(unsigned threads) {
    FindOptions options;
    options.threads = threads;
    return options;
}

Numbers numbersThat(const Paths& list,
                    const std::function<bool(const std::string&)>& holds) {
    Numbers numbers;
    for (std::uint64_t i = 0; i < list.size(); ++i)
        if (holds(list[i])) numbers.push_back(i);
    return numbers;
}

Numbers numbersWith(const Paths& list, const Texts& texts) {
    return numbersThat(list, [&](const std::string& path) {
        return std::ranges::all_of(texts, [&](std::string_view text) {
            return path.find(text) != std::string::npos;
        });
    });
}

// In two segments, each stored in another order.
std::vector<Paths> searchedLists() {
    return {archives::sortedPaths(60), archives::scatteredPaths(60),
            archives::inFolderRuns(60)};
}

TEST(PathSearch, FindsPathsThatHoldAllTexts) {
    const std::vector<Texts> questions = {
        {},         {""},       {"s"},           {"usr/"},   {"e/x"},
        {"x/file"}, {"i", "1"}, {"usr", ".txt"}, {"/", "-"}, {"nothing"}};
    for (const Paths& list : searchedLists()) {
        const OpenArchive archive(list, archives::segmentsOf(35));
        for (const Texts& texts : questions)
            for (const unsigned threads : {1U, 2U})
                EXPECT_EQ(find(archive.reader(), texts, findOnThreads(threads)),
                          numbersWith(list, texts));
    }
}

TEST(PathSearch, FindsWhatAPredicateTakes) {
    const auto isOdd = [](std::string_view path) {
        return path.size() % 2 == 1;
    };
    for (const Paths& list : searchedLists()) {
        const OpenArchive archive(list, archives::segmentsOf(35));
        EXPECT_EQ(find(archive.reader(), isOdd, findOnThreads(2)),
                  numbersThat(list, isOdd));
    }
}

TEST(PathSearch, KeepsWithinAFolder) {
    for (const Paths& list : searchedLists()) {
        const OpenArchive archive(list, archives::segmentsOf(35));
        FindOptions options = findOnThreads(1);
        for (const std::string folder : {"usr", "home/", "usr/lib1", "no"}) {
            options.folder = folder;
            const std::string prefix =
                folder.ends_with('/') ? folder : folder + '/';
            EXPECT_EQ(find(archive.reader(), Texts{"e"}, options),
                      numbersThat(list,
                                  [&](const std::string& path) {
                                      return path.starts_with(prefix) &&
                                             path.find('e') !=
                                                 std::string::npos;
                                  }))
                << folder;
        }
    }
}

TEST(PathSearch, ShowsPathsInAscendingOrderUntilAsked) {
    for (const Paths& list : searchedLists()) {
        const OpenArchive archive(list, archives::segmentsOf(35));
        const Numbers all = numbersWith(list, {"e"});
        ASSERT_GT(all.size(), 5U);
        Numbers shown;
        const auto keep = [&](std::uint64_t number, std::string_view path) {
            EXPECT_EQ(path, list[number]);
            shown.push_back(number);
            return shown.size() < 5;
        };
        findEach(archive.reader(), Texts{"e"}, keep, findOnThreads(2));
        EXPECT_EQ(shown, Numbers(all.begin(), all.begin() + 5));
    }
}

TEST(PathSearch, HandsOnWhatAPredicateThrows) {
    const OpenArchive archive(archives::sortedPaths(40));
    const auto fail = [](std::string_view) -> bool {
        throw std::domain_error("mine");
    };
    for (const unsigned threads : {1U, 2U})
        EXPECT_THROW(find(archive.reader(), fail, findOnThreads(threads)),
                     std::domain_error);
}

}  // namespace
}  // namespace tessel::archive
