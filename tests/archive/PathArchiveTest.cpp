#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <ostream>
#include <ranges>
#include <stdexcept>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

#include "archive/PathArchive.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel {
namespace {

using archives::archiveOf;
using archives::Paths;

static_assert(std::ranges::input_range<PathArchive>);

// ---- A list and its archive ----

// Names are all that is made of the cases where tests are only listed.
struct Case {
    std::string name;
    Paths (*paths)();
    ArchiveOptions options;
};

ArchiveOptions withIndex(ArchiveOptions options) {
    options.index = ArchiveIndex::WhereNeeded;
    return options;
}

// Lets a failure show the list's name instead of its bytes.
void PrintTo(const Case& list, std::ostream* out) { *out << list.name; }

Paths sorted() { return archives::sortedPaths(3000); }

Paths nastyShuffled() { return archives::shuffled(archives::nastyPaths()); }

Paths reversed() {
    Paths paths = sorted();
    std::ranges::reverse(paths);
    return paths;
}

Paths shuffled() { return archives::shuffled(sorted()); }

Paths oneFolder() {
    Paths paths;
    for (unsigned i = 0; i < 2000; ++i)
        paths.push_back("one/" + std::to_string(i * 7919 % 2000));
    return paths;
}

std::vector<Case> cases() {
    using archives::nastyPaths;
    using archives::segmentsOf;
    return {
        {"Empty", [] { return Paths(); }, segmentsOf(100)},
        {"OnePath", [] { return Paths{"a/b"}; }, segmentsOf(100)},
        {"Equal", [] { return Paths(1000, "the/same"); }, segmentsOf(8000)},
        {"Sorted", sorted, segmentsOf(8000)},
        {"SortedSegments", sorted, segmentsOf(700)},
        {"Reversed", reversed, segmentsOf(8000)},
        {"Shuffled", shuffled, segmentsOf(8000)},
        {"ShuffledIndex", shuffled, withIndex(segmentsOf(8000))},
        {"ShuffledSegments", shuffled, segmentsOf(501)},
        {"FolderRuns", [] { return archives::inFolderRuns(3000); },
         segmentsOf(8000)},
        {"OneFolder", oneFolder, segmentsOf(8000)},
        {"Nasty", nastyPaths, segmentsOf(8000)},
        {"NastySegments", nastyPaths, segmentsOf(64)},
        {"NastyShuffled", nastyShuffled, withIndex(segmentsOf(300))},
    };
}

class PathArchiveOf : public testing::TestWithParam<Case> {
protected:
    const Paths paths_ = GetParam().paths();
    PathArchive archive_ =
        PathArchive::own(archiveOf(paths_, GetParam().options));

    // Numbers of the paths for which `holds`.
    template <class Predicate>
    std::vector<std::uint64_t> numbersIf(Predicate holds) const {
        std::vector<std::uint64_t> numbers;
        for (std::uint64_t i = 0; i < paths_.size(); ++i)
            if (holds(paths_[i])) numbers.push_back(i);
        return numbers;
    }

    std::vector<std::uint64_t> numbersHolding(
        const std::vector<std::string_view>& texts) const {
        return numbersIf([&](const std::string& path) {
            return std::ranges::all_of(texts, [&](std::string_view text) {
                return path.find(text) != path.npos;
            });
        });
    }
};

INSTANTIATE_TEST_SUITE_P(Lists, PathArchiveOf, testing::ValuesIn(cases()),
                         [](const auto& list) { return list.param.name; });

std::vector<std::uint64_t> numbersIn(const std::vector<NumberRange>& ranges) {
    std::vector<std::uint64_t> numbers;
    for (const NumberRange range : ranges)
        for (auto n = range.begin; n < range.end; ++n) numbers.push_back(n);
    return numbers;
}

// ---- Paths by number ----

TEST_P(PathArchiveOf, GivesEachPathByItsNumber) {
    ASSERT_EQ(archive_.size(), paths_.size());
    EXPECT_EQ(archive_.empty(), paths_.empty());
    std::string path = "what was here before";
    for (std::uint64_t i = 0; i < paths_.size(); ++i) {
        archive_.read(i, path);
        ASSERT_EQ(path, paths_[i]) << i;
    }
    for (std::size_t i = 0; i < std::min<std::size_t>(1, paths_.size()); ++i)
        EXPECT_EQ(archive_[i], paths_[i]);
}

TEST_P(PathArchiveOf, VisitsRanges) {
    const std::uint64_t n = paths_.size();
    const std::vector<NumberRange> ranges = {
        {0, n}, {0, 0}, {n, n}, {n / 3, n / 2}, {n / 2, n / 2 + n % 2}};
    for (const auto [begin, end] : ranges) {
        std::uint64_t expected = begin;
        archive_.forEach(begin, end, [&](auto number, std::string_view path) {
            ASSERT_EQ(number, expected);
            ASSERT_EQ(path, paths_[number]);
            ++expected;
        });
        EXPECT_EQ(expected, end);
    }
}

TEST_P(PathArchiveOf, VisitsNumbersInTheOrderAsked) {
    if (paths_.empty()) return;
    std::vector<std::uint64_t> numbers;
    for (std::uint64_t i = 0; i < 500; ++i)
        numbers.push_back(i * i * 7907 % paths_.size());
    numbers.insert(numbers.end(), 3, numbers.back());  // repeats
    for (std::uint64_t i = 0; i < paths_.size(); i += 3) numbers.push_back(i);
    std::size_t next = 0;
    archive_.read(numbers, [&](auto number, std::string_view path) {
        ASSERT_EQ(number, numbers[next++]);
        ASSERT_EQ(path, paths_[number]);
    });
    EXPECT_EQ(next, numbers.size());
}

TEST_P(PathArchiveOf, EndsAVisitWhenTold) {
    const std::uint64_t wanted = std::min<std::size_t>(paths_.size(), 20);
    std::uint64_t seen = 0;
    const auto take = [&](auto, std::string_view) { return ++seen < wanted; };
    archive_.forEach(take);
    EXPECT_EQ(seen, wanted);
    std::vector<std::uint64_t> numbers(paths_.size());
    std::ranges::generate(numbers, [i = 0U]() mutable { return i++; });
    seen = 0;
    archive_.read(numbers, take);
    EXPECT_EQ(seen, wanted);
}

TEST_P(PathArchiveOf, IsARange) {
    std::uint64_t number = 0;
    for (const std::string_view path : archive_) {
        ASSERT_LT(number, paths_.size());
        ASSERT_EQ(path, paths_[number++]);
    }
    EXPECT_EQ(number, paths_.size());
}

TEST_P(PathArchiveOf, RefusesNumbersOutOfRange) {
    const std::uint64_t n = paths_.size();
    const auto nobody = [](auto, auto) { FAIL(); };
    std::string path;
    EXPECT_THROW(archive_.read(n, path), std::out_of_range);
    EXPECT_THROW(archive_[~std::uint64_t{0}], std::out_of_range);
    EXPECT_THROW(archive_.forEach(0, n + 1, nobody), std::out_of_range);
    EXPECT_THROW(archive_.forEach(1, 0, nobody), std::out_of_range);
    const std::array<std::uint64_t, 2> numbers = {0, n};
    EXPECT_THROW(archive_.read(numbers, nobody), std::out_of_range);
}

// ---- Numbers by path ----

TEST_P(PathArchiveOf, FindsTheFirstNumberOfEachPath) {
    const std::size_t step = std::max<std::size_t>(1, paths_.size() / 300);
    for (std::size_t i = 0; i < paths_.size(); i += step) {
        const auto first = std::ranges::find(paths_, paths_[i]);
        const auto expected =
            static_cast<std::uint64_t>(first - paths_.begin());
        ASSERT_EQ(archive_.numberOf(paths_[i]), expected) << paths_[i];
        ASSERT_TRUE(archive_.contains(paths_[i]));
    }
}

TEST_P(PathArchiveOf, DoesNotFindWhatIsNotThere) {
    Paths others = {
        "",    "/no",  "zzz",          "~",       std::string(1, '\0'),
        "usr", "usr/", "\xFF\xFF\xFF", "a/b/c/d", std::string(100'000, 'q')};
    for (std::size_t i = 0; i < paths_.size(); i += 1 + paths_.size() / 50) {
        others.push_back(paths_[i] + '\x01');
        others.push_back(paths_[i] + "/below");
        others.push_back(paths_[i].substr(0, paths_[i].size() - 1));
    }
    for (const std::string& other : others) {
        if (std::ranges::find(paths_, other) != paths_.end()) continue;
        EXPECT_EQ(archive_.numberOf(other), std::nullopt) << other;
        EXPECT_FALSE(archive_.contains(other));
    }
}

TEST_P(PathArchiveOf, ListsWhatIsBelowAFolder) {
    Paths folders = {"",           "/",       "a",   "a/",      "usr",
                     "usr/share0", "one",     "the", "home/12", "home/12/x",
                     "d/d/d",      "no/such", "al"};
    for (std::size_t i = 0; i < paths_.size(); i += 1 + paths_.size() / 20)
        folders.push_back(paths_[i].substr(0, paths_[i].rfind('/') + 1));
    for (const std::string& folder : folders) {
        std::string prefix = folder;
        if (!prefix.empty() && prefix.back() != '/') prefix += '/';
        const auto expected = numbersIf(
            [&](const std::string& path) { return path.starts_with(prefix); });
        const auto ranges = archive_.folder(folder);
        EXPECT_EQ(numbersIn(ranges), expected) << folder;
        for (std::size_t i = 1; i < ranges.size(); ++i)
            EXPECT_LT(ranges[i - 1].end, ranges[i].begin);
    }
}

// ---- Search ----

TEST_P(PathArchiveOf, FindsTexts) {
    const std::vector<std::vector<std::string_view>> searches = {
        {"share"},       {"e"},   {"1", "txt"}, {"share1/lib"},
        {"/", "2", "3"}, {},      {""},         {"nothing like this"},
        {"d/d/leaf"},    {"nnnm"}};
    for (const auto& texts : searches)
        for (const unsigned threads : {1U, 3U}) {
            FindOptions options;
            options.threads = threads;
            EXPECT_EQ(archive_.find(texts, options), numbersHolding(texts));
        }
    EXPECT_EQ(archive_.find("b"), numbersHolding({"b"}));
    EXPECT_EQ(archive_.find({"b", "/"}), numbersHolding({"b", "/"}));
}

TEST_P(PathArchiveOf, FindsByPredicate) {
    const auto isOdd = [](std::string_view path) {
        return path.size() % 2 == 1;
    };
    EXPECT_EQ(archive_.find(isOdd), numbersIf(isOdd));
}

TEST_P(PathArchiveOf, FindsBelowAFolder) {
    for (const std::string folder : {"usr", "usr/lib1/", "a", "home/7", ""}) {
        FindOptions options;
        options.folder = folder;
        std::string prefix = folder;
        if (!prefix.empty() && prefix.back() != '/') prefix += '/';
        EXPECT_EQ(archive_.find("1", options),
                  numbersIf([&](const std::string& path) {
                      return path.starts_with(prefix) &&
                             path.find('1') != path.npos;
                  }));
    }
}

TEST_P(PathArchiveOf, ShowsWhatItFindsInOrder) {
    const std::vector<std::string_view> texts = {"2"};
    std::vector<std::uint64_t> numbers;
    archive_.findEach(texts, [&](auto number, std::string_view path) {
        ASSERT_EQ(path, paths_[number]);
        numbers.push_back(number);
    });
    EXPECT_EQ(numbers, numbersHolding(texts));
    std::size_t shown = 0;
    archive_.findEach([](auto) { return true; },
                      [&](auto, auto) { return ++shown < 3; });
    EXPECT_EQ(shown, std::min<std::size_t>(3, paths_.size()));
}

// ---- Care ----

TEST_P(PathArchiveOf, IsUndamaged) {
    EXPECT_NO_THROW(archive_.verify());
    EXPECT_EQ(archive_.findDamage(), std::vector<ArchiveDamage>());
}

TEST_P(PathArchiveOf, SalvagesAllOfAnUndamagedArchive) {
    const auto bytes = archiveOf(paths_, GetParam().options);
    std::uint64_t next = 0;
    const SalvageReport report =
        PathArchive::salvage(bytes, [&](auto number, std::string_view path) {
            ASSERT_EQ(number, next++);
            ASSERT_EQ(path, paths_[number]);
        });
    EXPECT_EQ(report.kept, paths_.size());
    EXPECT_TRUE(report.lost.empty());
    EXPECT_TRUE(report.damages.empty());
    EXPECT_TRUE(report.complete);
}

TEST_P(PathArchiveOf, KnowsItsSizes) {
    const ArchiveInfo info = archive_.info();
    EXPECT_EQ(info.paths, paths_.size());
    std::uint64_t text = 0;
    for (const auto& path : paths_) text += path.size();
    EXPECT_EQ(info.textBytes, text);
    EXPECT_EQ(info.fileBytes, archiveOf(paths_, GetParam().options).size());
    std::uint64_t bytes = 0;
    for (const auto& section : info.sections) bytes += section.bytes;
    EXPECT_EQ(bytes, info.fileBytes);
}

// ---- Opening ----

TEST(PathArchive, MoreOfTheSameBytes) {
    const auto bytes = archiveOf({"a/b", "c"});
    const auto over = PathArchive::over(bytes);
    const auto overBytes = PathArchive::over(std::as_bytes(std::span(bytes)));
    PathArchive moved = PathArchive::own(bytes);
    const PathArchive copy = moved;
    const PathArchive last = std::move(moved);
    for (const PathArchive* archive : {&over, &overBytes, &copy, &last})
        EXPECT_EQ((*archive)[1], "c");
}

TEST(PathArchive, AnIteratorKeepsTheBytes) {
    auto it = PathArchive::own(archiveOf({"a/b", "c"})).begin();
    EXPECT_EQ(*it, "a/b");
    auto moved = std::move(it);
    ++moved;
    EXPECT_EQ(*moved, "c");
    EXPECT_EQ(moved.number(), 1U);
    ++moved;
    EXPECT_TRUE(moved == std::default_sentinel);
}

TEST(PathArchive, AnIteratorTakesThePlaceOfAnother) {
    auto it = PathArchive::own(archiveOf({"x"})).begin();
    it = PathArchive::own(archiveOf({"a/b", "c"})).begin();
    EXPECT_EQ(*it, "a/b");
    ++it;
    EXPECT_EQ(*it, "c");
}

TEST(PathArchive, AnIteratorAtTheEndStaysThere) {
    const auto archive = PathArchive::own(archiveOf({"a/b", "c"}));
    auto it = archive.begin();
    for (int i = 0; i < 5; ++i) ++it;
    EXPECT_TRUE(it == std::default_sentinel);
    EXPECT_EQ(it.number(), 2U);
    auto from = archive.begin();
    const auto moved = std::move(from);
    // NOLINTNEXTLINE(bugprone-use-after-move): what is tested
    EXPECT_TRUE(from == std::default_sentinel);
    ++from;
    EXPECT_EQ(*moved, "a/b");
}

TEST(PathArchive, AnIteratorThatMetDamageIsAtTheEnd) {
    const auto paths = archives::sortedPaths(5000);
    auto bytes = archiveOf(paths);
    bytes[bytes.size() / 2] ^= 1;
    const auto archive = PathArchive::own(bytes);
    auto it = archive.begin();
    std::size_t read = 0;
    EXPECT_THROW(for (; it != std::default_sentinel; ++it)
                     EXPECT_EQ(*it, paths[read++]),
                 DamagedArchiveException);
    EXPECT_TRUE(it == std::default_sentinel);
    EXPECT_EQ(it.number(), read);
    ++it;
    EXPECT_EQ(it.number(), read);
    EXPECT_LT(read, paths.size());
}

TEST(PathArchive, RefusesWhatIsNoArchive) {
    EXPECT_THROW(PathArchive::own({}), DamagedArchiveException);
    EXPECT_THROW(PathArchive::own(std::vector<std::uint8_t>(1000)),
                 DamagedArchiveException);
    EXPECT_THROW(PathArchive::open("/nonexistent/file"), std::system_error);
}

TEST(PathArchive, RefusesWhatWasCutOrLengthened) {
    auto bytes = archiveOf(archives::sortedPaths(100));
    bytes.push_back(0);
    EXPECT_THROW(PathArchive::own(bytes), DamagedArchiveException);
    bytes.resize(bytes.size() - 2);
    EXPECT_THROW(PathArchive::own(bytes), DamagedArchiveException);
}

TEST(PathArchive, NamesAVersionThatItDoesNotKnow) {
    archive::FileHeader header;
    header.version = 7;
    std::vector<std::uint8_t> bytes;
    header.pack(bytes);
    try {
        PathArchive::own(bytes);
        FAIL();
    } catch (const UnsupportedArchiveVersionException& unsupported) {
        EXPECT_EQ(unsupported.version(), 7U);
    }
}

}  // namespace
}  // namespace tessel
