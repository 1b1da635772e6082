#include "tests/archive/ArchiveLists.hpp"

#include <algorithm>

#include "archive/ArchiveWriter.hpp"
#include "tests/support/Sizes.hpp"

namespace support {

namespace {

std::size_t drawBelow(std::mt19937& random, std::size_t limit) {
    return std::uniform_int_distribution<std::size_t>(0, limit - 1)(random);
}

// A component of up to maxLength bytes; an empty one now and then.
std::string randomComponent(std::mt19937& random, std::size_t maxLength) {
    static constexpr std::string_view letters = "abAB019._-\xC3\xA9\xFF\x01";
    std::string text(drawBelow(random, maxLength + 1), 'x');
    const bool any = drawBelow(random, 8) == 0;
    for (char& c : text)
        c = any ? static_cast<char>(1 + drawBelow(random, 255))
                : letters[drawBelow(random, letters.size())];
    return text;
}

std::string randomPath(std::mt19937& random, const Paths& before) {
    if (!before.empty() && drawBelow(random, 3) != 0) {
        std::string path = before[drawBelow(random, before.size())];
        path.resize(drawBelow(random, path.size() + 1));
        path += randomComponent(random, 6);
        if (!path.empty()) return path;
    }
    std::string path;
    for (std::size_t depth = drawBelow(random, 5); depth > 0; --depth)
        path += randomComponent(random, 4) + "/";
    path += randomComponent(random, 12);
    return path.empty() ? "/" : path;
}

Paths everyByte() {
    Paths paths;
    for (int byte = 1; byte < 256; ++byte) {
        const std::string text(1, static_cast<char>(byte));
        paths.push_back(text);
        paths.push_back("d/" + text + text);
        paths.push_back(text + "/" + text);
    }
    return paths;
}

// Lengths on both sides of each limit: token length, one-byte block lengths,
// short prefixes, and the longest name and folder of all.
Paths borderLengths() {
    Paths paths;
    for (const std::size_t length :
         {1U, 30U, 31U, 32U, 123U, 124U, 125U, 126U, 127U, 254U, 255U, 256U,
          4095U, 4096U, 65535U, 65536U, 1048575U, 1048576U}) {
        const std::string text(length, 'n');
        paths.push_back(text);
        paths.push_back(text.substr(1) + "m");
        paths.push_back(text.substr(1) + "/n");
    }
    return paths;
}

Paths deepFolders() {
    Paths paths;
    std::string folder;
    for (int depth = 0; depth < 2000; ++depth) {
        folder += "d/";
        if (depth % 50 == 0) paths.push_back(folder + "leaf");
    }
    paths.push_back(folder + "leaf");
    return paths;
}

Paths numbersAsNames() {
    Paths paths;
    for (int i = 0; i < 3000; ++i) paths.push_back(std::to_string(i * 7919));
    return paths;
}

}  // namespace

Paths pathsOf(const tessel::PathArchive& archive) {
    Paths paths;
    archive.forEach([&](std::uint64_t, std::string_view path) {
        paths.emplace_back(path);
    });
    return paths;
}

Paths fileList(std::size_t count, std::uint32_t seed) {
    static constexpr std::string_view words[] = {
        "share", "doc", "lib", "python3", "README", "test", "data", "index"};
    static constexpr std::string_view endings[] = {".py", ".html", ".so.1", "",
                                                   ".png"};
    std::mt19937 random(seed);
    const auto word = [&] {
        return std::string(words[drawBelow(random, std::size(words))]) +
               std::to_string(drawBelow(random, 30));
    };
    Paths paths;
    while (paths.size() < count) {
        const std::string folder = "usr/" + word() + "/" + word() + "/";
        for (std::size_t n = 1 + drawBelow(random, 20); n > 0; --n)
            paths.push_back(
                folder + word() +
                std::string(endings[drawBelow(random, std::size(endings))]));
    }
    paths.resize(count);
    std::sort(paths.begin(), paths.end());
    return paths;
}

Paths randomList(std::mt19937& random, std::size_t maxCount) {
    Paths paths;
    for (std::size_t n = drawBelow(random, maxCount + 1); n > 0; --n)
        paths.push_back(randomPath(random, paths));
    switch (drawBelow(random, 4)) {
        case 0:
            std::sort(paths.begin(), paths.end());
            break;
        case 1:
            std::sort(paths.rbegin(), paths.rend());
            break;
        default:
            break;
    }
    return paths;
}

std::vector<NamedList> nastyLists() {
    std::vector<NamedList> lists = {
        {"nothing", {}},
        {"one path", {"a"}},
        {"one byte", {"\xFF"}},
        {"the root", {"/"}},
        {"slashes",
         {"/", "//", "///", "a//b", "a//", "/a", "//a", "./x", "../x", "a/",
          "a", "a/b", "a/./b"}},
        {"equal paths", Paths(shareOf(5000), "usr/share/same")},
        {"equal names", {"a/x", "b/x", "a/x", "b/x", "c/x", "x", "x"}},
        {"prefixes of each other", {"a", "aa", "aaa", "a/a", "aa/a", "aaaa"}},
        {"every byte", everyByte()},
        {"border lengths", borderLengths()},
        {"deep folders", deepFolders()},
        {"numbers as names", numbersAsNames()},
        {"files", fileList(shareOf(5000), 1)},
    };
    std::mt19937 random(7);
    Paths shuffled = fileList(shareOf(5000), 2);
    std::shuffle(shuffled.begin(), shuffled.end(), random);
    lists.push_back({"shuffled", shuffled});
    Paths reversed = fileList(shareOf(3000), 3);
    std::reverse(reversed.begin(), reversed.end());
    lists.push_back({"reversed", reversed});
    Paths runs = fileList(shareOf(3000), 4);
    std::rotate(runs.begin(), runs.begin() + shareOf(1234), runs.end());
    lists.push_back({"two sorted runs", runs});
    return lists;
}

}  // namespace support
