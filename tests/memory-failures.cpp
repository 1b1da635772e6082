// What is left when memory runs out, at every allocation in turn.

#include <gtest/gtest.h>
#include <zlib.h>

#include <new>

#include "coder/PathNumbering.hpp"
#include "coder/PathRetrieval.hpp"
#include "tests/support/AllocationMeter.hpp"
#include "tests/support/Coders.hpp"
#include "tests/support/EachAllocation.hpp"
#include "tests/support/Trees.hpp"

namespace {

bool zlibHasMemory = true;

}  // namespace

// The linker sends the calls of these two to the wrappers.
extern "C" {
int __real_compress2(Bytef* to, uLongf* toBytes, const Bytef* from,
                     uLong fromBytes, int level);
int __real_inflateInit_(z_streamp stream, const char* version, int size);

int __wrap_compress2(Bytef* to, uLongf* toBytes, const Bytef* from,
                     uLong fromBytes, int level) {
    return zlibHasMemory ? __real_compress2(to, toBytes, from, fromBytes, level)
                         : Z_MEM_ERROR;
}

int __wrap_inflateInit_(z_streamp stream, const char* version, int size) {
    return zlibHasMemory ? __real_inflateInit_(stream, version, size)
                         : Z_MEM_ERROR;
}
}

namespace {

using support::AllocationFailure;
using support::Bytes;
using support::CoderPtr;
using support::Texts;
using tessel::Components;
using tessel::HuffmanPathTree;

// More than any of these operations makes.
constexpr std::size_t mostAllocations = 5000;

// Calls test(n) with n = 0, 1, 2 and so on: the operation in it has n
// allocations to spend. Ends when test says that they were enough.
template <class Test>
void forEachAllocation(Test test) {
    std::size_t n = 0;
    while (n < mostAllocations && !test(n)) ++n;
    EXPECT_GT(n, 0U) << "nothing was allocated";
    EXPECT_LT(n, mostAllocations);
}

// Runs the operation with n allocations to spend. Returns false if it threw
// std::bad_alloc, which it must only do when one failed.
template <class Operation>
bool succeedsWith(std::size_t n, Operation operation) {
    bool threw = false;
    bool happened = false;
    {
        const AllocationFailure failure(n);
        try {
            operation();
        } catch (const std::bad_alloc&) {
            threw = true;
        }
        happened = failure.happened();
    }
    EXPECT_EQ(threw, happened);
    return !threw;
}

CoderPtr filledCoder() {
    CoderPtr coder = support::fourLetterCoder();
    support::addBatches(*coder, {{u"a", u"b"}, {u"c"}, {u"a", u"b"}},
                        {{u"a", u"d"}, {u"b"}, {u"c", u"cc"}});
    support::addWhole(*coder, {u"d", u"a"});
    support::addWhole(*coder, {u"d", u"a"});
    return coder;
}

TEST(MemoryFailures, ACodeIsBuiltOrTheCoderCanStillGetOne) {
    const std::vector<double> frequencies = {5, 1, 2, 1, 3};
    const std::u16string characters = u"abc\x161\x4e2d";
    const CoderPtr expected = support::coderWith(characters, frequencies);
    const auto compare = [&](const HuffmanPathTree& coder) {
        EXPECT_EQ(coder.getBoolTree(), expected->getBoolTree());
        EXPECT_EQ(coder.getTreeString(), expected->getTreeString());
        EXPECT_EQ(coder.codes.size(), characters.size());
        for (const char16_t character : characters)
            EXPECT_EQ(coder.codeOf(character), expected->codeOf(character));
    };
    forEachAllocation([&](std::size_t n) {
        HuffmanPathTree coder;
        const bool built = succeedsWith(
            n, [&] { coder.deflateHuffman(frequencies.data(), characters); });
        if (!built) {
            EXPECT_EQ(coder.codes.size(), 0U);
            EXPECT_TRUE(coder.nodes.empty());
            coder.deflateHuffman(frequencies.data(), characters);
        }
        compare(coder);
        return built;
    });
    forEachAllocation([&](std::size_t n) {
        HuffmanPathTree coder;
        coder.boolTree = expected->boolTree;
        const bool built = succeedsWith(
            n, [&] { coder.inflateHuffman(expected->treeString); });
        if (!built) coder.inflateHuffman(expected->treeString);
        compare(coder);
        return built;
    });
}

TEST(MemoryFailures, ABatchLeavesTheFoldersBeforeTheFailureAdded) {
    const std::vector<Texts> folders = {{u"b", std::u16string(300, u'a')}};
    forEachAllocation([&](std::size_t n) {
        const CoderPtr coder = filledCoder();
        const std::uint64_t before = coder->pathCount;
        std::vector<Texts> batch = folders;
        std::vector<Texts> files = {Texts(40, std::u16string(90, u'c'))};
        const bool added = succeedsWith(
            n, [&] { coder->generateCodeAsyncAndAddPaths(batch, files, 1); });
        EXPECT_EQ(support::brokenInvariant(*coder), "");
        EXPECT_EQ(coder->pathCount, added ? before + 40 : before);
        EXPECT_EQ(coder->partitionEnds.size(), added ? 4U : 3U);
        // Neither the folder nor any of its files is there unless all are.
        EXPECT_EQ(support::iterated(*coder).size(), coder->pathCount);
        support::addBatch(*coder, {u"a", u"b"}, {u"dd"});
        const CoderPtr back = support::restoredFrom(
            support::formOf(*coder, false), false, *coder);
        EXPECT_EQ(support::tracksOf(*back), support::tracksOf(*coder));
        return added;
    });
}

// A folder that was there appends one position to its track once its files are
// in the tree: that must not fail any more.
TEST(MemoryFailures, FilesOfAFolderThatWasThereAreNumberedOrNotAdded) {
    for (const std::size_t depth : {1U, 2U, 4U, 8U}) {
        forEachAllocation([&](std::size_t n) {
            const CoderPtr coder = support::fourLetterCoder();
            const Texts folder(depth, u"a");
            support::addBatch(*coder, folder, {u"b"});
            std::vector<Texts> batch = {folder};
            std::vector<Texts> files = {{u"c", u"d"}};
            const bool added = succeedsWith(n, [&] {
                coder->generateCodeAsyncAndAddPaths(batch, files, 1);
            });
            EXPECT_EQ(coder->pathCount, added ? 3U : 1U);
            EXPECT_EQ(support::iterated(*coder).size(), coder->pathCount);
            EXPECT_EQ(support::brokenInvariant(*coder), "");
            return added;
        });
    }
}

TEST(MemoryFailures, ABatchOnWorkersIsRefusedOrAddedInPart) {
    forEachAllocation([&](std::size_t n) {
        const CoderPtr coder = filledCoder();
        std::vector<Texts> folders = {{u"b"}, {u"a"}, {u"b", u"c"}};
        std::vector<Texts> files(3, Texts{u"a", u"b", u"c", u"d"});
        const bool added = succeedsWith(
            n, [&] { coder->generateCodeAsyncAndAddPaths(folders, files, 2); });
        EXPECT_EQ(support::brokenInvariant(*coder), "");
        EXPECT_EQ((coder->pathCount - 7) % 4, 0U);
        if (added) {
            EXPECT_EQ(coder->pathCount, 19U);
        }
        EXPECT_EQ(coder->partitionEnds.size(), 3 + (coder->pathCount - 7) / 4);
        support::addBatch(*coder, {u"a", u"b"}, {u"dd"});
        EXPECT_EQ(support::brokenInvariant(*coder), "");
        return added;
    });
}

// The same if the workers have no memory either, in folders that are not added
// unless all before them are.
TEST(MemoryFailures, ABatchWhoseWorkersLackMemoryIsRefusedOrAddedInPart) {
    std::vector<Texts> manyFolders;
    for (std::size_t i = 0; i < 200; ++i)
        manyFolders.push_back({u"b", std::u16string(1 + i, u'c')});
    const std::vector<Texts> manyFiles(200, Texts{u"a", u"b", u"c", u"d"});
    CoderPtr coder;
    std::vector<Texts> folders;
    std::vector<Texts> files;
    for (const auto kind : {support::FailingAllocations::AllLater,
                            support::FailingAllocations::One})
        support::atEachAllocation(
            [&] {
                coder = filledCoder();
                folders = manyFolders;
                files = manyFiles;
            },
            [&] { coder->generateCodeAsyncAndAddPaths(folders, files, 3); },
            [&](bool succeeded) {
                EXPECT_EQ(support::brokenInvariant(*coder), "");
                const std::uint64_t added = coder->pathCount - 7;
                EXPECT_EQ(added % 4, 0U);
                EXPECT_TRUE(added == 800 || !succeeded);
                EXPECT_EQ(coder->partitionEnds.size(), 3 + added / 4);
                support::addBatches(*coder, manyFolders, manyFiles, 3);
                EXPECT_EQ(coder->pathCount, 7 + added + 800);
                EXPECT_EQ(support::brokenInvariant(*coder), "");
            },
            {.threads = support::FailingThreads::All,
             .allocations = kind,
             .allUpTo = 100,
             .step = 7});
}

TEST(MemoryFailures, ABatchThatFailsBeforeItIsEncodedKeepsItsTexts) {
    for (const std::size_t n : {0U, 1U, 2U, 3U}) {
        const CoderPtr coder = filledCoder();
        std::vector<Texts> folders = {{u"b"}, {u"a"}};
        std::vector<Texts> files(2, Texts{u"a", u"b"});
        const std::vector<Texts> folderTexts = folders;
        const std::vector<Texts> fileTexts = files;
        ASSERT_FALSE(succeedsWith(n, [&] {
            coder->generateCodeAsyncAndAddPaths(folders, files, 2);
        }));
        EXPECT_EQ(coder->asyncFolders, folderTexts) << n;
        EXPECT_EQ(coder->asyncFiles, fileTexts) << n;
    }
}

TEST(MemoryFailures, APartitionIsAddedOrNot) {
    forEachAllocation([](std::size_t n) {
        const CoderPtr coder = filledCoder();
        Components folder = {{1}, Bytes(300, 2)};
        Components files(30, Bytes(100, 3));
        const bool added =
            succeedsWith(n, [&] { coder->addPathToBTree(folder, files); });
        EXPECT_EQ(support::brokenInvariant(*coder), "");
        EXPECT_EQ(coder->pathCount, added ? 37U : 7U);
        EXPECT_EQ(coder->partitionTracks.size(), added ? 4U : 3U);
        return added;
    });
}

TEST(MemoryFailures, AWholePathIsCountedOnlyIfItIsAdded) {
    for (const Texts& path : {Texts{u"d", u"a"}, Texts{u"d", u"b", u"c"}}) {
        forEachAllocation([&path](std::size_t n) {
            const CoderPtr coder = filledCoder();
            Components components = support::encodedBy(*coder, path);
            const bool added =
                succeedsWith(n, [&] { coder->addPathToBTree(components); });
            EXPECT_EQ(support::brokenInvariant(*coder), "");
            EXPECT_EQ(coder->pathCount, added ? 8U : 7U);
            if (!added) {
                EXPECT_EQ(coder->duplicates.size(), 1U);
            }
            support::addWhole(*coder, {u"a"});
            return added;
        });
    }
}

TEST(MemoryFailures, AFormIsReadOrTheCoderIsAsItWas) {
    for (const bool compress : {false, true}) {
        const CoderPtr source = filledCoder();
        const Bytes form = support::formOf(*source, compress);
        forEachAllocation([&](std::size_t n) {
            const CoderPtr coder = support::fourLetterCoder();
            support::addBatch(*coder, {u"d"}, {u"a", u"b"});
            const Bytes before = support::formOf(*coder, false);
            Bytes in = form;
            const bool read =
                succeedsWith(n, [&] { coder->deserialize(in, compress); });
            if (!read) {
                EXPECT_EQ(support::formOf(*coder, false), before);
                EXPECT_EQ(coder->pathCount, 2U);
                EXPECT_EQ(support::iterated(*coder).size(), 2U);
            } else {
                EXPECT_EQ(coder->partitionEnds.size(), 4U);
            }
            return read;
        });
    }
}

TEST(MemoryFailures, LookupsLeaveTheirOutputsAsTheyWere) {
    const CoderPtr coder = filledCoder();
    forEachAllocation([&coder](std::size_t n) {
        std::vector<Components> folders = {{{1}}};
        std::vector<Components> files = {{{2}}};
        const bool found = succeedsWith(n, [&] {
            coder->getPath(folders, files, {1, 2, 3, 4, 5});
        });
        EXPECT_EQ(folders.size(), found ? 4U : 1U);
        EXPECT_EQ(files.size(), found ? 4U : 1U);
        return found;
    });
}

TEST(MemoryFailures, TraversingLeavesItsOutputAsItWas) {
    tessel::BPathTree tree;
    support::addWhole(tree, {"a", "b", "c"});
    forEachAllocation([&tree](std::size_t n) {
        Components out = support::components({"before"});
        const bool found = succeedsWith(n, [&] {
            tree.traversePath({0, 0, 0}, out);
        });
        EXPECT_EQ(out.size(), found ? 4U : 1U);
        return found;
    });
}

TEST(MemoryFailures, BatchesLeaveTheOutputsAsTheyWere) {
    tessel::BPathTree tree;
    support::addBatch(tree, {"a"}, {"f", "g"});
    support::addBatch(tree, {"a"}, {"h"});
    forEachAllocation([&tree](std::size_t n) {
        std::vector<Components> folders = {{{1}}};
        std::vector<Components> files = {{{2}}, {{3}}};
        const std::vector<tessel::PathTrack> tracks = {{0}, {0, 2}};
        const std::vector<std::vector<std::uint64_t>> offsets = {{1, 2}, {1}};
        const std::vector<std::uint64_t> selected = {0, 1};
        const bool found = succeedsWith(n, [&] {
            tree.getPath(folders, files, selected, tracks, offsets);
        });
        EXPECT_EQ(folders.size(), found ? 3U : 1U);
        EXPECT_EQ(files.size(), found ? 4U : 2U);
        return found;
    });
}

using Entries = std::vector<std::string>;

// A wide root, so that a table serves it, and a file that becomes a folder.
tessel::BPathTree wideTree() {
    tessel::BPathTree tree;
    for (std::size_t i = 0; i < 20; ++i)
        support::addWhole(tree, {support::numbered("d", i), "f"});
    return tree;
}

TEST(MemoryFailures, AWholePathIsAddedOrNothingOfIt) {
    for (const Entries& path :
         {Entries{"d3", "x", std::string(300, 'y'), "z"},
          Entries{"d3", "f", "g", "h"}, Entries{"new", "f"}}) {
        forEachAllocation([&path](std::size_t n) {
            tessel::BPathTree tree = wideTree();
            const Entries before = support::allPaths(tree);
            const Components given = support::components(path);
            Components list = given;
            tessel::PathTrack track = {77};
            const bool added = succeedsWith(
                n, [&] { EXPECT_FALSE(tree.addPath(list, track)); });
            if (!added) {
                EXPECT_EQ(support::allPaths(tree), before);
                EXPECT_EQ(list, given);
                EXPECT_EQ(track, tessel::PathTrack{77});
                EXPECT_FALSE(support::addWhole(tree, path).existed);
            }
            EXPECT_TRUE(support::addWhole(tree, path).existed);
            return added;
        });
    }
}

TEST(MemoryFailures, AFolderAndItsFilesAreAddedOrNothingOfThem) {
    for (const Entries& folder :
         {Entries{"d3", "x", std::string(300, 'y')}, Entries{"d3"},
          Entries{"d3", "f", "g"}, Entries{"new"}, Entries{}}) {
        forEachAllocation([&folder](std::size_t n) {
            tessel::BPathTree tree = wideTree();
            const Entries before = support::allPaths(tree);
            const Components givenFolder = support::components(folder);
            const Components givenFiles(30, tessel::Component(100, 'n'));
            Components folderList = givenFolder;
            Components files = givenFiles;
            tessel::PathTrack track = {77};
            std::uint64_t first = 5;
            const bool added = succeedsWith(
                n, [&] { tree.addPath(folderList, files, track, first); });
            const std::size_t after = support::allPaths(tree).size();
            if (!added) {
                EXPECT_EQ(support::allPaths(tree), before);
                EXPECT_EQ(folderList, givenFolder);
                EXPECT_EQ(files, givenFiles);
                EXPECT_EQ(track, tessel::PathTrack{77});
                EXPECT_EQ(first, 5U);
                support::addBatch(tree, folder, {"g"});
            } else {
                EXPECT_GE(after, before.size() + 29);
            }
            return added;
        });
    }
}

// Each allocation of a pass fails in turn, and each call is repeated.
TEST(MemoryFailures, APassIsRepeatableAfterEachFailure) {
    tessel::BPathTree tree;
    support::addBatch(tree, {"a", "b", "c", "d"}, {"f", "g"});
    support::addBatch(tree, {"a", "b", "e"}, {"h"});
    support::addBatch(tree, {"a"}, {"i"});
    support::addBatch(tree, {"j", "k"}, {"l"});
    const std::vector<std::vector<std::string>> expected = {
        {"a", "b", "c", "d", "f"},
        {"a", "b", "c", "d", "g"},
        {"a", "b", "e", "h"},
        {"a", "i"},
        {"j", "k", "l"}};
    forEachAllocation([&](std::size_t n) {
        tessel::BPathTree pass;
        pass.root = tree.root;
        if (!succeedsWith(n, [&] { pass.reset(); })) {
            EXPECT_FALSE(pass.hasNextPath());
            pass.reset();
        }
        std::vector<std::vector<std::string>> seen;
        bool failed = false;
        while (pass.hasNextPath()) {
            Components path;
            if (!succeedsWith(n, [&] { pass.getNextPath(path); })) {
                failed = true;
                path.clear();
                pass.getNextPath(path);
            }
            seen.push_back(support::textsOf(path));
        }
        EXPECT_EQ(seen, expected);
        return !failed;
    });
}

TEST(MemoryFailures, DecodingLeavesTheTextAsItWas) {
    const CoderPtr coder = support::fourLetterCoder();
    const Bytes bytes = coder->generateCodeFor(std::u16string(500, u'b'));
    forEachAllocation([&](std::size_t n) {
        std::u16string text = u"before";
        const bool decoded =
            succeedsWith(n, [&] { coder->appendPathFrom(bytes, text); });
        EXPECT_EQ(text.size(), decoded ? 506U : 6U);
        return decoded;
    });
}

TEST(MemoryFailures, AFormIsAppendedOrNothingOfIt) {
    const CoderPtr coder = filledCoder();
    for (const bool compress : {false, true}) {
        const Bytes form = support::formOf(*coder, compress);
        forEachAllocation([&](std::size_t n) {
            Bytes out = {1, 2, 3};
            const bool written =
                succeedsWith(n, [&] { coder->serialize(out, compress); });
            Bytes expected = {1, 2, 3};
            if (written)
                expected.insert(expected.end(), form.begin(), form.end());
            EXPECT_EQ(out, expected);
            return written;
        });
        EXPECT_EQ(support::formOf(*coder, compress), form);
    }
}

// The output is as long as the form from the start: it does not grow on the
// way, which would take the form's memory several times.
TEST(MemoryFailures, AFormTakesItsMemoryOnce) {
    const CoderPtr coder = support::fourLetterCoder();
    support::addBatch(*coder, {u"a"}, Texts(20'000, u"abcdabcd"));
    Bytes out;
    const support::AllocationMeter meter;
    coder->serialize(out, false);
    EXPECT_LT(meter.total(), 2 * out.size());
}

// What a compressed form holds is never whole in memory.
TEST(MemoryFailures, AFormIsInflatedAPieceAtATime) {
    const CoderPtr coder = support::fourLetterCoder();
    for (const char16_t letter : std::u16string(u"abcd"))
        support::addBatch(*coder, Texts(1, std::u16string(1, letter)),
                          Texts(800, std::u16string(2'000, u'd')));
    Bytes form = support::formOf(*coder, true);
    const std::size_t payload = support::formOf(*coder, false).size();
    HuffmanPathTree restored;
    const support::AllocationMeter meter;
    restored.deserialize(form, true);
    EXPECT_LT(meter.largest(), payload / 2);
}

// zlib takes its own memory, which no wrapper sees.
TEST(MemoryFailures, ZlibsLackOfMemoryIsNoDamage) {
    const CoderPtr coder = filledCoder();
    Bytes form = support::formOf(*coder, true);
    const Bytes before = support::formOf(*coder, false);
    zlibHasMemory = false;
    Bytes out = {1, 2, 3};
    EXPECT_THROW(coder->serialize(out, true), std::bad_alloc);
    EXPECT_THROW(coder->deserialize(form, true), std::bad_alloc);
    zlibHasMemory = true;
    EXPECT_EQ(out, (Bytes{1, 2, 3}));
    EXPECT_EQ(support::formOf(*coder, false), before);
}

TEST(MemoryFailures, ACopyIsMadeOrTheCoderIsAsItWas) {
    const std::vector<double> frequencies = {4, 3, 2, 1, 1};
    const CoderPtr source = support::coderWith(u"abcd\x4e2d", frequencies);
    support::addBatches(*source, {{u"d"}, {u"c", u"d"}},
                        {{u"a", u"b"}, {u"\x4e2d"}});
    support::addWhole(*source, {u"d", u"a"});
    forEachAllocation([&source](std::size_t n) {
        const CoderPtr coder = filledCoder();
        const Bytes before = support::formOf(*coder, false);
        const std::vector<Texts> paths = support::iterated(*coder);
        const bool copied = succeedsWith(n, [&] { coder->copyTree(*source); });
        EXPECT_EQ(support::formOf(*coder, false),
                  copied ? support::formOf(*source, false) : before);
        EXPECT_EQ(coder->getTreeString(),
                  copied ? source->getTreeString() : u"acbd");
        EXPECT_EQ(coder->nodes.size(), copied ? 9U : 7U);
        EXPECT_EQ(support::iterated(*coder),
                  copied ? support::iterated(*source) : paths);
        EXPECT_EQ(support::brokenInvariant(*coder), "");
        return copied;
    });
}

// Each call of a pass fails at each of its allocations and is repeated.
TEST(MemoryFailures, APassWithRepeatedPathsIsRepeatable) {
    const CoderPtr coder = filledCoder();
    const std::vector<Texts> paths = support::iterated(*coder);
    forEachAllocation([&](std::size_t n) {
        coder->resetPathsToBTree();
        std::vector<Texts> seen;
        bool failed = false;
        while (coder->hasNextPathFromBTree()) {
            Components path;
            if (!succeedsWith(n, [&] { coder->getNextPathFromBTree(path); })) {
                failed = true;
                path.clear();
                coder->getNextPathFromBTree(path);
            }
            seen.push_back(support::decodedBy(*coder, path));
        }
        EXPECT_EQ(seen, paths);
        EXPECT_EQ(coder->nextPathNumber, paths.size());
        return !failed;
    });
}

// What was reserved for a partition is enough to note it.
TEST(MemoryFailures, NotingAPartitionTakesNoMemory) {
    tessel::PathNumbering numbering;
    for (std::uint64_t i = 0; i < 200; ++i) {
        tessel::PathTrack track = {~std::uint64_t{0}, i};
        track.reserve(3);
        numbering.reserveForPartition(2, 1000);
        const AllocationFailure none(0);
        numbering.notePartition(track, i % 2 == 0, ~std::uint64_t{0}, 1);
        EXPECT_FALSE(none.happened());
    }
    EXPECT_EQ(numbering.partitionTracks.size(), 200U);
}

TEST(MemoryFailures, VisitingPathsByNumberTakesNoMemory) {
    struct Counter {
        void beginFolder(std::size_t /*maxFiles*/) { ++folders; }
        void folder(tessel::ComponentView name) { bytes += name.size(); }
        void file(tessel::ComponentView name) { bytes += name.size(); }
        std::size_t folders = 0;
        std::size_t bytes = 0;
    };
    const CoderPtr coder = filledCoder();
    const std::uint64_t numbers[] = {1, 2, 3, 4, 5};
    Counter counter;
    {
        const AllocationFailure none(0);
        tessel::PathRetrieval(*coder->pathTree, coder->numbering())
            .visit(numbers, counter);
        EXPECT_FALSE(none.happened());
    }
    EXPECT_EQ(counter.folders, 3U);
    EXPECT_GT(counter.bytes, 0U);
}

TEST(MemoryFailures, ReleasingTakesNoMemory) {
    CoderPtr coder = filledCoder();
    auto copy = std::make_unique<HuffmanPathTree>();
    copy->copyTree(*coder);
    const AllocationFailure none(0);
    coder.reset();
    copy.reset();
    EXPECT_FALSE(none.happened());
}

}  // namespace
