// Lengths and counts on both sides of each border where a representation
// changes: coder, store and archive answer as plain lists do.
//
//   border      | what changes beyond it
//   ------------+----------------------------------------------------------
//   8           | a file's entry takes more room than a folder's, 9 bytes
//   16, 128, 256| an archive's block, folder head or group is full
//   31          | an archive's token is full
//   32          | a folder's chain no longer fits its buffer
//   62          | a folder's name has its length in 8 bytes
//   124         | a shared prefix of an archive is written as a long one
//   127, 16383  | a varint takes another byte
//   192         | a block of children leaves its node for the heap
//   252         | a packed component has its length in 8 bytes
//   255, 65535  | integers of stored forms and of blocks take twice as much
//   1024        | a folder's name leaves its slab for the heap
//   2^k         | a number of an archive's order, or a jump to a folder that
//               | was named before, takes another bit
//   2^20        | no archive takes a longer name or folder

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "paths/PathStore.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/archive/PlainAnswers.hpp"
#include "tests/paths/Stores.hpp"
#include "tests/support/Coders.hpp"
#include "tests/support/Sizes.hpp"

namespace {

using support::CoderPtr;
using support::shareOf;
using support::Texts;
using tessel::HuffmanPathTree;
using tessel::PathStore;
using Strings = std::vector<std::string>;
using Sizes = std::vector<std::size_t>;

// The borders that are tried: sanitizers do without those that take them long.
Sizes tried(Sizes borders) {
#ifdef QZTESSEL_SLOWED
    std::erase_if(borders, [](std::size_t border) { return border > 5000; });
#endif
    return borders;
}

// The two sizes on either side of each border, with sanitizers one, and the
// border itself; ascending, each once.
Sizes around(const Sizes& borders, std::size_t least = 1) {
    constexpr std::size_t reach = shareOf(2);
    std::set<std::size_t> sizes;
    for (const std::size_t border : tried(borders))
        for (std::size_t size = border - std::min(border, reach);
             size <= border + reach; ++size)
            if (size >= least) sizes.insert(size);
    return {sizes.begin(), sizes.end()};
}

Sizes countBorders() { return tried({16, 127, 255, 65535}); }

// ---- The coder ----

struct Batch {
    Texts folder;
    Texts files;
};
using Batches = std::vector<Batch>;

// A text that the four-letter coder encodes in so many bytes, at least 3: two
// bits per letter, a byte that may be without bits, and one that says how many
// are in use. Different seeds give different texts, as far as there are any.
std::u16string textOf(std::size_t encodedBytes, std::size_t seed) {
    constexpr std::size_t lettersPerByte = 4;
    const std::size_t letters =
        lettersPerByte * (encodedBytes - 2) + seed % lettersPerByte;
    std::u16string text(letters, u'a');
    std::size_t digits = seed / lettersPerByte;
    for (std::size_t i = 0; i < text.size(); ++i, digits /= 4)
        text[i] = static_cast<char16_t>(u'a' + (digits + i) % 4);
    return text;
}

std::vector<Texts> pathsOf(const Batches& batches) {
    std::vector<Texts> paths;
    for (const Batch& batch : batches)
        for (const std::u16string& file : batch.files) {
            paths.push_back(batch.folder);
            paths.back().push_back(file);
        }
    return paths;
}

void expectAllTogether(const HuffmanPathTree& coder, const Batches& batches,
                       std::size_t count) {
    std::vector<double> numbers;
    for (std::size_t n = 1; n <= count; ++n)
        numbers.push_back(static_cast<double>(n));
    const auto answer = support::found(coder, numbers);
    ASSERT_TRUE(answer);
    ASSERT_EQ(answer->folders.size(), batches.size());
    ASSERT_EQ(answer->files.size(), batches.size());
    for (std::size_t k = 0; k < batches.size(); ++k) {
        ASSERT_EQ(support::decodedBy(coder, answer->folders[k]),
                  batches[k].folder);
        ASSERT_EQ(support::decodedBy(coder, answer->files[k]),
                  batches[k].files);
    }
}

// Of batches whose order of addition is that of iteration, too.
void expectAnswers(HuffmanPathTree& coder, const Batches& batches) {
    const std::vector<Texts> paths = pathsOf(batches);
    ASSERT_EQ(coder.pathCount, paths.size());
    expectAllTogether(coder, batches, paths.size());
    for (std::size_t i = 0; i < paths.size(); i += 1 + paths.size() / 300) {
        const auto one = support::found(coder, {static_cast<double>(i + 1)});
        ASSERT_TRUE(one && one->folders.size() == 1);
        Texts path = support::decodedBy(coder, one->folders[0]);
        path.push_back(support::decodedBy(coder, one->files[0]).at(0));
        ASSERT_EQ(path, paths[i]);
    }
    ASSERT_EQ(support::iterated(coder), paths);
}

// The same again from stored forms and from a copy.
void expectCoderHolds(HuffmanPathTree& coder, const Batches& batches) {
    expectAnswers(coder, batches);
    const support::Bytes form = support::formOf(coder, false);
    const CoderPtr plain = support::restoredFrom(form, false, coder);
    expectAnswers(*plain, batches);
    EXPECT_EQ(support::formOf(*plain, false), form);
    const CoderPtr inflated =
        support::restoredFrom(support::formOf(coder, true), true, coder);
    expectAnswers(*inflated, batches);
    HuffmanPathTree copy;
    copy.copyTree(coder);
    expectAnswers(copy, batches);
    EXPECT_EQ(support::formOf(copy, false), form);
}

void add(HuffmanPathTree& coder, const Batches& batches) {
    std::vector<Texts> folders;
    std::vector<Texts> files;
    for (const Batch& batch : batches) {
        folders.push_back(batch.folder);
        files.push_back(batch.files);
    }
    support::addBatches(coder, folders, files);
}

void expectCoderKeeps(const Batches& batches) {
    const CoderPtr together = support::fourLetterCoder();
    add(*together, batches);
    expectCoderHolds(*together, batches);
}

Sizes encodedLengths() {
    return around({8, 31, 62, 127, 192, 252, 255, 1024, 16383, 65535}, 3);
}

// A file of each length in one folder, and one in a folder of each length.
Batches batchesOfAllLengths() {
    Batches batches = {{{u"d"}, {}}};
    for (const std::size_t length : encodedLengths()) {
        batches[0].files.push_back(textOf(length, 1));
        batches.push_back({{u"d", textOf(length, 2)}, {textOf(length, 3)}});
    }
    return batches;
}

TEST(Borders, EachEncodedLengthAlone) {
    for (const std::size_t length : encodedLengths()) {
        SCOPED_TRACE(length);
        const std::u16string name = textOf(length, 6);
        const CoderPtr coder = support::fourLetterCoder();
        ASSERT_EQ(coder->generateCodeFor(name).size(), length);
        expectCoderKeeps({{{name}, {u"a"}}});
        expectCoderKeeps({{{u"a"}, {name}}});
        expectCoderKeeps({{{name, name}, {name, textOf(length, 7)}}});
    }
}

TEST(Borders, AllEncodedLengthsInOneFolder) {
    const Batches batches = batchesOfAllLengths();
    expectCoderKeeps(batches);
    expectCoderKeeps({batches.rbegin(), batches.rend()});
}

// Each file is a batch of its own, so that the folder grows by one.
TEST(Borders, AFolderThatGrowsByEachEncodedLength) {
    for (const bool ascending : {true, false}) {
        Batches batches;
        const CoderPtr coder = support::fourLetterCoder();
        Texts files = batchesOfAllLengths()[0].files;
        if (!ascending) std::reverse(files.begin(), files.end());
        for (const std::u16string& file : files) {
            batches.push_back({{u"d"}, {file}});
            support::addBatch(*coder, {u"d"}, {file});
            expectAnswers(*coder, batches);
        }
        expectCoderHolds(*coder, batches);
    }
}

TEST(Borders, WholePathsOfEachEncodedLengthAreRepeated) {
    const CoderPtr coder = support::fourLetterCoder();
    std::vector<Texts> paths;
    for (const std::size_t length : encodedLengths())
        paths.push_back({textOf(length, 4), textOf(length, 5)});
    for (int round = 0; round < 2; ++round)
        for (const Texts& path : paths) support::addWhole(*coder, path);
    ASSERT_EQ(coder->duplicates.size(), paths.size());
    std::vector<Texts> twice = paths;
    twice.insert(twice.end(), paths.begin(), paths.end());
    EXPECT_EQ(support::iterated(*coder), twice);
    const auto restored =
        support::restoredFrom(support::formOf(*coder, true), true, *coder);
    EXPECT_EQ(restored->duplicates, coder->duplicates);
}

// Every second file of a folder becomes a folder.
TEST(Borders, FilesOfEachEncodedLengthBecomeFolders) {
    const CoderPtr coder = support::fourLetterCoder();
    const Texts files = batchesOfAllLengths()[0].files;
    support::addBatch(*coder, {u"d"}, files);
    std::vector<Texts> expected;
    for (std::size_t i = 0; i < files.size(); ++i) {
        if (i % 2 == 0) {
            expected.push_back({u"d", files[i]});
            continue;
        }
        support::addBatch(*coder, {u"d", files[i]}, {u"b"});
        expected.push_back({u"d", files[i], u"b"});
        const auto one =
            support::found(*coder, {static_cast<double>(coder->pathCount)});
        ASSERT_TRUE(one);
        EXPECT_EQ(support::decodedBy(*coder, one->folders.at(0)),
                  (Texts{u"d", files[i]}));
    }
    EXPECT_EQ(support::iterated(*coder), expected);
    const auto restored =
        support::restoredFrom(support::formOf(*coder, true), true, *coder);
    EXPECT_EQ(support::iterated(*restored), expected);
}

// ---- Counts in the coder ----

// Grows a coder over each border, one batch at a time: two before it, the rest
// has come together.
void expectGrowth(const Batches& all) {
    const CoderPtr coder = support::fourLetterCoder();
    Batches batches;
    for (const std::size_t border : countBorders()) {
        const auto from = static_cast<std::ptrdiff_t>(batches.size());
        const auto until = static_cast<std::ptrdiff_t>(border) - 2;
        const Batches first(all.begin() + from, all.begin() + until);
        add(*coder, first);
        batches.insert(batches.end(), first.begin(), first.end());
        for (; batches.size() <= border + 2;
             batches.push_back(all[batches.size()])) {
            SCOPED_TRACE(batches.size());
            expectAllTogether(*coder, batches, batches.size());
            if (batches.size() == border + 1) expectCoderHolds(*coder, batches);
            add(*coder, {all[batches.size()]});
        }
    }
}

std::size_t mostBatches() { return countBorders().back() + 3; }

// The folder's children pass each border, and so do numbers of paths and of
// batches.
TEST(Borders, EachNumberOfBatchesInAFolder) {
    Batches batches;
    for (std::size_t i = 0; i < mostBatches(); ++i)
        batches.push_back({{u"d"}, {textOf(6, i)}});
    expectGrowth(batches);
}

TEST(Borders, EachNumberOfFoldersInAFolder) {
    Batches batches;
    for (std::size_t i = 0; i < mostBatches(); ++i)
        batches.push_back({{u"d", textOf(6, i)}, {u"a"}});
    expectGrowth(batches);
}

TEST(Borders, EachNumberOfFilesInABatch) {
    for (const std::size_t count : around(countBorders())) {
        SCOPED_TRACE(count);
        Batch batch{{u"d"}, {}};
        for (std::size_t i = 0; i < count; ++i)
            batch.files.push_back(textOf(6, i));
        const CoderPtr coder = support::fourLetterCoder();
        add(*coder, {batch});
        expectAnswers(*coder, {batch});
        const CoderPtr restored = support::restoredFrom(
            support::formOf(*coder, false), false, *coder);
        expectAnswers(*restored, {batch});
    }
}

TEST(Borders, EachDepth) {
    for (const std::size_t depth : around({32, 127, 255, 65535})) {
        SCOPED_TRACE(depth);
        const Texts folder(depth, u"c");
        const CoderPtr alone = support::fourLetterCoder();
        support::addBatch(*alone, folder, {u"a"});
        support::addBatch(*alone, folder, {u"b"});
        EXPECT_EQ(alone->maxPartitionTrackLength, depth + 1);
        expectCoderHolds(*alone, {{folder, {u"a"}}, {folder, {u"b"}}});
    }
}

// ---- Lists of strings, for the store and the archive ----

std::string letters(std::size_t length, std::size_t seed) {
    std::mt19937 random(static_cast<std::uint32_t>(seed));
    std::string text(length, 'a');
    for (char& letter : text) letter = static_cast<char>('a' + random() % 26);
    return text;
}

Sizes textLengths() {
    return around(
        {8, 16, 31, 62, 124, 127, 192, 252, 255, 1024, 4096, 16383, 65535});
}

struct NamedList {
    std::string name;
    Strings paths;
};

std::vector<NamedList> listsOfLengths() {
    NamedList files{"files", {}};
    NamedList folders{"folders", {}};
    NamedList both{"both", {}};
    NamedList same{"one letter", {}};
    for (const std::size_t length : textLengths()) {
        files.paths.push_back("d/" + letters(length, 1));
        folders.paths.push_back(letters(length, 2) + "/f");
        both.paths.push_back(letters(length, 3) + "/" + letters(length, 4));
        same.paths.push_back(std::string(length, 'x'));
    }
    return {files, folders, both, same};
}

// Neighbours that share so many bytes: then one ends, or both go on.
NamedList listOfPrefixes(const std::string& what, const std::string& end) {
    Sizes borders = {31, 62, 124, 127, 255, 65535};
    for (std::size_t more = 1; more < 20'000; more *= 2)
        borders.push_back(124 + more);
    NamedList list{what, {}};
    std::size_t seed = 0;
    for (const std::size_t length : around(borders)) {
        const std::string shared = letters(length, ++seed);
        const std::string folder =
            end.empty() ? "d" + std::to_string(seed) + "/" : "";
        for (const char* rest : {"", "a", "b"})
            list.paths.push_back(folder + shared + rest + end);
    }
    return list;
}

// Names whose blocks of 16 have lengths near 255 bytes.
NamedList listOfBlocks() {
    NamedList list{"blocks", {}};
    std::mt19937 random(5);
    for (std::size_t i = 0; i < shareOf(4000); ++i)
        list.paths.push_back("d" + std::to_string(i / 600) + "/" +
                             letters(18 + i / 200, random()));
    return list;
}

// A folder whose second file comes after so many other folders.
NamedList listOfJumps() {
    NamedList list{"jumps", {}};
    Sizes borders = {1};
    for (std::size_t distance = 2; distance <= 512; distance *= 2)
        borders.push_back(distance);
    char name = 'A';
    for (const std::size_t distance : around(borders)) {
        const std::string folder =
            "f" + std::to_string(10'000'000 + distance) + "/";
        list.paths.push_back(folder + "a");
        for (std::size_t i = 0; i < distance; ++i)
            list.paths.push_back(folder + "b" + std::to_string(1'000'000 + i) +
                                 "/" + name);
        list.paths.push_back(folder + "c");
        name = name == 'Z' ? 'A' : static_cast<char>(name + 1);
    }
    return list;
}

NamedList listOfDepths() {
    NamedList list{"depths", {}};
    for (const std::size_t depth : around({32, 127, 255, 65535})) {
        std::string folder;
        for (std::size_t i = 0; i < depth; ++i) folder += "d/";
        list.paths.push_back(folder + "f");
        list.paths.push_back(folder);
    }
    return list;
}

std::vector<NamedList> listsOfManyKinds() {
    std::vector<NamedList> lists = listsOfLengths();
    lists.push_back(listOfPrefixes("prefixes of names", ""));
    lists.push_back(listOfPrefixes("prefixes of folders", "/"));
    lists.push_back(listOfBlocks());
    lists.push_back(listOfJumps());
    lists.push_back(listOfDepths());
    return lists;
}

Strings inSomeOrder(const Strings& paths, int order) {
    if (order == 0) return paths;
    return order == 1 ? stores::sorted(paths) : archives::shuffled(paths);
}

constexpr int orders = 3;

// ---- The store ----

TEST(Borders, AStoreKeepsListsOfManyKinds) {
    for (const auto& [name, paths] : listsOfManyKinds())
        for (int order = 0; order < orders; ++order) {
            SCOPED_TRACE(name + " " + std::to_string(order));
            const Strings list = inSomeOrder(paths, order);
            PathStore store = PathStore::from(list);
            stores::expectHolds(store, list);
            // What was restored grows on.
            store = PathStore::load(store.save());
            store.append(paths);
            Strings twice = list;
            twice.insert(twice.end(), paths.begin(), paths.end());
            EXPECT_EQ(stores::iterated(store), twice);
        }
}

TEST(Borders, AStoreKeepsEachTextLengthAlone) {
    for (const auto& [name, paths] : listsOfLengths())
        for (const std::string& path : paths) {
            SCOPED_TRACE(name + " " + std::to_string(path.size()));
            stores::expectHolds(PathStore::from(Strings{path}), {path});
        }
}

// ---- The archive ----

tessel::ArchiveOptions indexed() {
    tessel::ArchiveOptions options;
    options.index = tessel::ArchiveIndex::WhereNeeded;
    return options;
}

TEST(Borders, AnArchiveKeepsListsOfManyKinds) {
    for (const auto& [name, paths] : listsOfManyKinds())
        for (int order = 0; order < orders; ++order) {
            SCOPED_TRACE(name + " " + std::to_string(order));
            const Strings list = inSomeOrder(paths, order);
            support::expectPaths(archives::archiveOf(list, indexed()), list);
        }
}

TEST(Borders, AnArchiveKeepsEachTextLengthAlone) {
    for (const auto& [name, paths] : listsOfLengths())
        for (const std::string& path : paths) {
            SCOPED_TRACE(name + " " + std::to_string(path.size()));
            support::expectPaths(archives::archiveOf({path}), {path});
        }
}

TEST(Borders, AnArchiveKeepsTheLongestNamesAndFolders) {
    constexpr std::size_t longest = std::size_t{1} << 20;
    Strings paths;
    for (std::size_t less = 0; less < shareOf(3); ++less) {
        paths.push_back("d/" + letters(longest - less, less));
        paths.push_back(letters(longest - 1 - less, less + 3) + "/f");
        paths.push_back(std::string(longest - less, 'x'));
    }
    support::expectPaths(archives::archiveOf(paths), paths);
    std::vector<std::uint8_t> bytes;
    tessel::ArchiveWriter writer(bytes);
    EXPECT_THROW(writer.add(letters(longest + 1, 1)), std::length_error);
    EXPECT_THROW(writer.add(letters(longest, 1) + "/"), std::length_error);
    EXPECT_EQ(writer.size(), 0U);
}

// Each number of paths: all in one folder, and each in a folder of its own in
// no order.
void expectCountIsKept(std::size_t count) {
    Strings files;
    Strings folders;
    for (std::size_t i = 0; i < count; ++i) {
        const std::string digits = std::to_string(100'000 + i);
        files.push_back("d/" + digits);
        folders.push_back("d" + digits + "/f");
    }
    support::expectPaths(archives::archiveOf(files), files);
    const Strings mixed = archives::shuffled(folders);
    support::expectPaths(archives::archiveOf(mixed, indexed()), mixed);
}

TEST(Borders, AnArchiveKeepsEachNumberOfSegments) {
    const Strings paths = archives::sortedPaths(258);
    tessel::ArchiveOptions single = archives::segmentsOf(1);
    single.level = tessel::ArchiveLevel::Fast;
    for (const std::size_t count : around({255})) {
        SCOPED_TRACE(count);
        const Strings some(paths.begin(),
                           paths.begin() + static_cast<std::ptrdiff_t>(count));
        support::expectPaths(archives::archiveOf(some, single), some);
    }
}

TEST(Borders, AnArchiveKeepsEachNumberOfPaths) {
    Sizes borders = countBorders();
    for (std::size_t power = 1; power <= 512; power *= 2)
        borders.push_back(power);
    for (const std::size_t count : around(borders)) {
        SCOPED_TRACE(count);
        expectCountIsKept(count);
    }
}

}  // namespace
