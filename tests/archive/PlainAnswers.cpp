#include "tests/archive/PlainAnswers.hpp"

#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <optional>
#include <random>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include "archive/PathArchive.hpp"
#include "tests/archive/ArchiveLists.hpp"

namespace support {

namespace {

using tessel::NumberRange;
using tessel::PathArchive;

// ---- The plain vector's answers ----

std::optional<std::uint64_t> firstNumber(const Paths& paths,
                                         std::string_view path) {
    const auto found = std::find(paths.begin(), paths.end(), path);
    if (found == paths.end()) return std::nullopt;
    return static_cast<std::uint64_t>(found - paths.begin());
}

template <class Holds>
std::vector<std::uint64_t> numbersWhere(const Paths& paths, Holds holds) {
    std::vector<std::uint64_t> numbers;
    for (std::size_t i = 0; i < paths.size(); ++i)
        if (holds(std::string_view(paths[i]))) numbers.push_back(i);
    return numbers;
}

std::vector<std::uint64_t> numbersIn(const std::vector<NumberRange>& ranges) {
    std::vector<std::uint64_t> numbers;
    for (const NumberRange& range : ranges)
        for (std::uint64_t n = range.begin; n < range.end; ++n)
            numbers.push_back(n);
    return numbers;
}

// ---- Comparisons ----

void expectPathsByNumber(const PathArchive& archive, const Paths& paths) {
    ASSERT_EQ(archive.size(), paths.size());
    ASSERT_EQ(pathsOf(archive), paths);
    std::size_t at = 0;
    for (const std::string_view path : archive) ASSERT_EQ(path, paths[at++]);
    ASSERT_EQ(at, paths.size());
    std::string text = "left over";
    const std::size_t step = 1 + paths.size() / 300;
    for (std::size_t i = 0; i < paths.size(); i += step) {
        ASSERT_EQ(archive[i], paths[i]);
        archive.read(paths.size() - 1 - i, text);
        ASSERT_EQ(text, paths[paths.size() - 1 - i]);
    }
    EXPECT_THROW(archive[paths.size()], std::out_of_range);
    EXPECT_THROW(archive.read(~std::uint64_t{0}, text), std::out_of_range);
}

void expectBulk(const PathArchive& archive, const Paths& paths,
                std::mt19937& random) {
    if (paths.empty()) return;
    std::uniform_int_distribution<std::uint64_t> anyNumber(0, paths.size() - 1);
    std::vector<std::uint64_t> numbers(500);
    for (auto& number : numbers) number = anyNumber(random);
    for (const bool ascending : {false, true}) {
        if (ascending) std::sort(numbers.begin(), numbers.end());
        std::size_t at = 0;
        archive.read(numbers, [&](std::uint64_t number, std::string_view path) {
            ASSERT_EQ(number, numbers[at++]);
            ASSERT_EQ(path, paths[number]);
        });
        ASSERT_EQ(at, numbers.size());
    }
    const std::uint64_t first = anyNumber(random);
    std::uint64_t next = first;
    archive.forEach(first, paths.size(),
                    [&](std::uint64_t number, std::string_view path) {
                        ASSERT_EQ(number, next++);
                        ASSERT_EQ(path, paths[number]);
                    });
    ASSERT_EQ(next, paths.size());
    bool shown = false;
    numbers.push_back(paths.size());
    const auto show = [&](std::uint64_t, std::string_view) { shown = true; };
    EXPECT_THROW(archive.read(numbers, show), std::out_of_range);
    EXPECT_THROW(archive.forEach(0, paths.size() + 1, show), std::out_of_range);
    EXPECT_FALSE(shown);
}

void expectNumbers(const PathArchive& archive, const Paths& paths) {
    std::map<std::string_view, std::uint64_t> first;
    for (std::size_t i = paths.size(); i-- > 0;) first[paths[i]] = i;
    const std::size_t step = 1 + paths.size() / 200;
    for (std::size_t i = 0; i < paths.size(); i += step) {
        const std::string& path = paths[i];
        ASSERT_EQ(archive.numberOf(path), first[path]);
        for (const std::string& other :
             {path + "x", path + "/", path.substr(1), path + '\x01',
              path.substr(0, path.size() - 1)}) {
            if (other.empty()) continue;
            ASSERT_EQ(archive.numberOf(other), firstNumber(paths, other))
                << other;
            ASSERT_EQ(archive.contains(other), first.contains(other));
        }
    }
    EXPECT_EQ(archive.numberOf(""), std::nullopt);
    EXPECT_FALSE(archive.contains(std::string("a\0b", 3)));
}

std::set<std::string> someFolders(const Paths& paths) {
    std::set<std::string> folders = {"", "/", "usr", "no such folder"};
    const std::size_t step = 1 + paths.size() / 40;
    for (std::size_t i = 0; i < paths.size(); i += step)
        for (std::size_t at = 0;
             (at = paths[i].find('/', at)) != std::string::npos; ++at)
            if (at < 300) folders.insert(paths[i].substr(0, at));
    return folders;
}

void expectFolders(const PathArchive& archive, const Paths& paths) {
    for (const std::string& folder : someFolders(paths)) {
        const auto below = [&](std::string_view path) {
            return folder.empty() ||
                   path.starts_with(folder.back() == '/' ? folder
                                                         : folder + "/");
        };
        ASSERT_EQ(numbersIn(archive.folder(folder)), numbersWhere(paths, below))
            << "folder " << folder;
    }
}

void expectFinds(const PathArchive& archive, const Paths& paths) {
    for (const std::vector<std::string_view>& texts :
         std::vector<std::vector<std::string_view>>{{"a"},
                                                    {"/"},
                                                    {"README"},
                                                    {"e", "doc"},
                                                    {"share1/"},
                                                    {"x/x"},
                                                    {"no such text"},
                                                    {},
                                                    {"\xFF"},
                                                    {"nn", "/n"},
                                                    {"py", "1", "/"}}) {
        const auto expected = numbersWhere(paths, [&](std::string_view path) {
            return std::all_of(texts.begin(), texts.end(), [&](auto text) {
                return path.find(text) != path.npos;
            });
        });
        for (const unsigned threads : {1U, 2U, 3U}) {
            tessel::FindOptions options;
            options.threads = threads;
            ASSERT_EQ(archive.find(texts, options), expected);
        }
    }
    const auto isLong = [](std::string_view path) { return path.size() > 20; };
    ASSERT_EQ(archive.find(isLong), numbersWhere(paths, isLong));
    tessel::FindOptions below;
    below.folder = "usr";
    ASSERT_EQ(archive.find("1", below),
              numbersWhere(paths, [](std::string_view path) {
                  return path.starts_with("usr/") &&
                         path.find('1') != path.npos;
              }));
}

void expectReadFromTheLast(const PathArchive& archive, const Paths& paths) {
    std::vector<std::uint64_t> numbers;
    for (std::uint64_t n = paths.size(); n > 0; --n) numbers.push_back(n - 1);
    std::size_t at = paths.size();
    archive.read(numbers, [&](std::uint64_t number, std::string_view path) {
        ASSERT_EQ(number, --at);
        ASSERT_EQ(path, paths[number]);
    });
    ASSERT_EQ(at, 0U);
}

}  // namespace

void expectPaths(const std::vector<std::uint8_t>& bytes, const Paths& paths) {
    const PathArchive archive = PathArchive::over(bytes);
    expectPathsByNumber(archive, paths);
    expectReadFromTheLast(archive, paths);
    for (std::size_t i = 0; i < paths.size(); i += 1 + paths.size() / 200)
        ASSERT_EQ(archive.numberOf(paths[i]), firstNumber(paths, paths[i]));
    EXPECT_NO_THROW(archive.verify());
}

void expectAllAnswers(const std::vector<std::uint8_t>& bytes,
                      const Paths& paths) {
    const PathArchive archive = PathArchive::over(bytes);
    std::mt19937 random(11);
    expectPathsByNumber(archive, paths);
    expectBulk(archive, paths, random);
    expectNumbers(archive, paths);
    expectFolders(archive, paths);
    expectFinds(archive, paths);
    EXPECT_NO_THROW(archive.verify());
    EXPECT_TRUE(archive.findDamage().empty());
}

}  // namespace support
