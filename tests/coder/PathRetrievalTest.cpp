// Paths by number: the contract's answers, and a merge step by step beside
// them.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <cmath>
#include <functional>
#include <limits>
#include <stdexcept>

#include "coder/PathRetrieval.hpp"
#include "tests/support/Coders.hpp"

namespace {

using support::addBatch;
using support::addWhole;
using support::Bytes;
using support::CoderPtr;
using support::decodedBy;
using support::encodedBy;
using support::found;
using support::fourLetterCoder;
using support::Texts;
using tessel::Components;
using tessel::HuffmanPathTree;
using tessel::PathRetrieval;

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double nan = std::numeric_limits<double>::quiet_NaN();

// ---- Lookup by number ----

// Partition 0: a/{a,b,c}; partition 1: b/{a,d}; partition 2, which joins a:
// a/{aa,bb,cc,dd}. The ends are 3, 5 and 9.
CoderPtr threePartitions() {
    CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"a", u"b", u"c"});
    addBatch(*coder, {u"b"}, {u"a", u"d"});
    addBatch(*coder, {u"a"}, {u"aa", u"bb", u"cc", u"dd"});
    return coder;
}

struct Answer {
    std::vector<Texts> folders;
    std::vector<Texts> files;
    bool operator==(const Answer&) const = default;
};

// What getPath gives, as text.
Answer answerFor(const HuffmanPathTree& coder,
                 const std::vector<double>& numbers) {
    std::vector<Components> folders;
    std::vector<Components> files;
    coder.getPath(folders, files, numbers);
    Answer answer;
    for (const Components& folder : folders)
        answer.folders.push_back(decodedBy(coder, folder));
    for (const Components& names : files)
        answer.files.push_back(decodedBy(coder, names));
    return answer;
}

TEST(PathRetrieval, NumbersAreGroupedIntoPartitions) {
    const CoderPtr coder = threePartitions();
    EXPECT_EQ(coder->partitionEnds, (std::vector<std::uint64_t>{3, 5, 9}));
    EXPECT_EQ(
        answerFor(*coder, {2, 3, 4, 8}),
        (Answer{{{u"a"}, {u"b"}, {u"a"}}, {{u"b", u"c"}, {u"a"}, {u"cc"}}}));
}

TEST(PathRetrieval, BothFilesOfTheSecondPartition) {
    EXPECT_EQ(answerFor(*threePartitions(), {4, 5}),
              (Answer{{{u"b"}}, {{u"a", u"d"}}}));
}

TEST(PathRetrieval, OneFileOfEachOfTwoPartitions) {
    EXPECT_EQ(answerFor(*threePartitions(), {1, 5}),
              (Answer{{{u"a"}, {u"b"}}, {{u"a"}, {u"d"}}}));
}

TEST(PathRetrieval, ANumberAfterTheLastPartitionEndsTheCollection) {
    const CoderPtr coder = threePartitions();
    EXPECT_EQ(answerFor(*coder, {9, 10, 1}), (Answer{{{u"a"}}, {{u"dd"}}}));
    EXPECT_EQ(answerFor(*coder, {10, 1, 2}), Answer{});
    EXPECT_EQ(answerFor(*coder, {5, 1e300}), (Answer{{{u"b"}}, {{u"d"}}}));
    EXPECT_EQ(answerFor(*coder, {5, 18446744073709551615.0}),
              (Answer{{{u"b"}}, {{u"d"}}}));
    EXPECT_EQ(answerFor(*coder, {9223372036854775808.0}), Answer{});
}

TEST(PathRetrieval, InfinityCountsAsAfterTheLastPartition) {
    const CoderPtr coder = threePartitions();
    EXPECT_EQ(answerFor(*coder, {5, infinity}), (Answer{{{u"b"}}, {{u"d"}}}));
    EXPECT_EQ(answerFor(*coder, {infinity, nan, 0}), Answer{});
}

TEST(PathRetrieval, NumbersBeyondSignedOnesAreConvertedAsUnsigned) {
    const double twoToThe63rd = 9223372036854775808.0;
    EXPECT_EQ(tessel::PathRetrieval::pathNumberOf(twoToThe63rd),
              std::uint64_t{1} << 63);
    EXPECT_EQ(tessel::PathRetrieval::pathNumberOf(1.5 * twoToThe63rd),
              std::uint64_t{3} << 62);
    EXPECT_EQ(tessel::PathRetrieval::pathNumberOf(2 * twoToThe63rd),
              ~std::uint64_t{0});
    EXPECT_EQ(tessel::PathRetrieval::pathNumberOf(-0.5), 0U);
}

TEST(PathRetrieval, NumbersAreTruncated) {
    EXPECT_EQ(answerFor(*threePartitions(), {1.9, 4.999999, 5.5}),
              (Answer{{{u"a"}, {u"b"}}, {{u"a"}, {u"a", u"d"}}}));
}

TEST(PathRetrieval, ANumberMayRepeat) {
    EXPECT_EQ(answerFor(*threePartitions(), {2, 2, 2}),
              (Answer{{{u"a"}}, {{u"b", u"b", u"b"}}}));
}

TEST(PathRetrieval, NumbersOutOfOrderWithinAPartitionAreAnsweredInThatOrder) {
    EXPECT_EQ(answerFor(*threePartitions(), {9, 6, 7}),
              (Answer{{{u"a"}}, {{u"dd", u"aa", u"bb"}}}));
    EXPECT_EQ(answerFor(*threePartitions(), {3, 1}),
              (Answer{{{u"a"}}, {{u"c", u"a"}}}));
}

TEST(PathRetrieval, OutputsKeepWhatTheyHeld) {
    const CoderPtr coder = threePartitions();
    std::vector<Components> folders = {{{1}}};
    std::vector<Components> files = {{{2}}, {{3}}};
    coder->getPath(folders, files, {1});
    ASSERT_EQ(folders.size(), 2U);
    ASSERT_EQ(files.size(), 3U);
    EXPECT_EQ(folders[0], (Components{{1}}));
    EXPECT_EQ(files[1], (Components{{3}}));
    EXPECT_EQ(folders[1], encodedBy(*coder, {u"a"}));
}

TEST(PathRetrieval, NoNumbersGiveNoAnswer) {
    EXPECT_EQ(answerFor(*threePartitions(), {}), Answer{});
}

TEST(PathRetrieval, WithoutPartitionsNothingIsAppended) {
    const CoderPtr coder = fourLetterCoder();
    EXPECT_EQ(answerFor(*coder, {1, 2}), Answer{});
    addWhole(*coder, {u"a"});
    EXPECT_EQ(answerFor(*coder, {1, nan}), Answer{});
}

TEST(PathRetrieval, ALookupLeavesThePassAlone) {
    const CoderPtr coder = threePartitions();
    coder->resetPathsToBTree();
    Components path;
    coder->getNextPathFromBTree(path);
    answerFor(*coder, {1, 5, 9});
    coder->getNextPathFromBTree(path);
    EXPECT_EQ(decodedBy(*coder, path), (Texts{u"a", u"b"}));
    EXPECT_EQ(coder->nextPathNumber, 2U);
}

// Asks with outputs that hold something, which a refusal must not change.
void expectRefused(const HuffmanPathTree& coder,
                   const std::vector<double>& numbers) {
    std::vector<Components> folders = {{{1}}};
    std::vector<Components> files = {{{2}}};
    EXPECT_THROW(coder.getPath(folders, files, numbers), std::out_of_range)
        << ::testing::PrintToString(numbers);
    EXPECT_EQ(folders, (std::vector<Components>{{{1}}}));
    EXPECT_EQ(files, (std::vector<Components>{{{2}}}));
}

TEST(PathRetrieval, ANumberThatIsNoneIsOutOfRange) {
    const CoderPtr coder = threePartitions();
    for (const double number :
         {nan, 0.0, -0.0, -1.0, 0.5, 0.999, -1e300, -infinity}) {
        expectRefused(*coder, {number});
        expectRefused(*coder, {1, number});
        expectRefused(*coder, {1, 5, number});
        expectRefused(*coder, {number, infinity});
    }
}

// Such a number counts back from the partition's first file, so it gives a
// file that the folder got earlier, if there is one.
TEST(PathRetrieval, ANumberBeforeThePartitionAtHandCountsBackInItsFolder) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a"}, {u"a", u"b", u"c"});
    support::addBatch(*coder, {u"d"}, {u"a", u"b"});
    support::addBatch(*coder, {u"a"}, {u"aa", u"bb"});
    EXPECT_EQ(answerFor(*coder, {7, 5, 4}),
              (Answer{{{u"a"}}, {{u"bb", u"c", u"b"}}}));
    EXPECT_EQ(answerFor(*coder, {4, 6, 5, 7, 3}),
              (Answer{{{u"d"}, {u"a"}}, {{u"a"}, {u"aa", u"c", u"bb", u"a"}}}));
    expectRefused(*coder, {7, 2});
    expectRefused(*coder, {7, 0});
    expectRefused(*coder, {5, 3});
    expectRefused(*coder, {4, 0.5});
}

TEST(PathRetrieval, BothOutputsMayBeOneList) {
    const CoderPtr coder = threePartitions();
    std::vector<Components> folders;
    std::vector<Components> files;
    coder->getPath(folders, files, {1, 5, 9});
    std::vector<Components> both;
    coder->getPath(both, both, {1, 5, 9});
    ASSERT_EQ(both.size(), folders.size() + files.size());
    for (std::size_t i = 0; i < folders.size(); ++i) {
        EXPECT_EQ(both[2 * i], folders[i]);
        EXPECT_EQ(both[2 * i + 1], files[i]);
    }
    const auto before = both;
    EXPECT_THROW(coder->getPath(both, both, {1, 5, nan}), std::out_of_range);
    EXPECT_EQ(both, before);
}

TEST(PathRetrieval, ANumberThatLeadsOutsideTheTreeIsOutOfRange) {
    const CoderPtr coder = threePartitions();
    coder->partitionEnds = {3, 8, 12};  // more than partition 1 has
    expectRefused(*coder, {6});
    expectRefused(*coder, {1, 8});
    EXPECT_EQ(answerFor(*coder, {5}), (Answer{{{u"b"}}, {{u"d"}}}));
}

TEST(PathRetrieval, ATrackThatLeadsOutsideTheTreeIsOutOfRange) {
    const CoderPtr coder = threePartitions();
    tessel::PathTracks tracks;
    tracks.push_back({0});
    tracks.push_back({2});
    tracks.push_back({0, 1, 0});
    coder->partitionTracks = tracks;
    expectRefused(*coder, {4});
    expectRefused(*coder, {1, 9});
    EXPECT_EQ(answerFor(*coder, {2}), (Answer{{{u"a"}}, {{u"b"}}}));
}

TEST(PathRetrieval, FewerTracksThanEndsAreOutOfRange) {
    const CoderPtr coder = threePartitions();
    tessel::PathTracks tracks;
    tracks.push_back({0});
    coder->partitionTracks = tracks;
    expectRefused(*coder, {4});
    EXPECT_EQ(answerFor(*coder, {2}), (Answer{{{u"a"}}, {{u"b"}}}));
}

// ---- Numbers on both sides of 2^32 ----

constexpr double border = 4294967296.0;

// The paths a/a and b/a, of which the second one's partition claims to end at
// 2^32 - 3; then c/{a,b,c,d,aa} with the numbers 2^32 - 2 to 2^32 + 2, and
// a/{c,d} with the next two.
CoderPtr partitionsAroundTheBorder() {
    CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"a"});
    addBatch(*coder, {u"b"}, {u"a"});
    coder->pathCount = static_cast<std::uint64_t>(border) - 3;
    coder->partitionEnds.back() = coder->pathCount;
    addBatch(*coder, {u"c"}, {u"a", u"b", u"c", u"d", u"aa"});
    addBatch(*coder, {u"a"}, {u"c", u"d"});
    return coder;
}

void expectAnswersAroundTheBorder(const HuffmanPathTree& coder) {
    const Texts inC = {u"a", u"b", u"c", u"d", u"aa"};
    std::vector<double> numbers;
    for (std::size_t i = 0; i < inC.size(); ++i) {
        numbers.push_back(border - 2 + static_cast<double>(i));
        EXPECT_EQ(answerFor(coder, {numbers.back()}),
                  (Answer{{{u"c"}}, {{inC[i]}}}));
    }
    EXPECT_EQ(answerFor(coder, numbers), (Answer{{{u"c"}}, {inC}}));
    EXPECT_EQ(answerFor(coder, {1, 2, border, border + 4}),
              (Answer{{{u"a"}, {u"b"}, {u"c"}, {u"a"}},
                      {{u"a"}, {u"a"}, {u"c"}, {u"d"}}}));
    EXPECT_EQ(answerFor(coder, {border + 5, 2 * border + 1}), Answer());
    expectRefused(coder, {3});
    expectRefused(coder, {border - 3});
}

TEST(PathRetrieval, NumbersBeyond32BitsLeadToTheirPaths) {
    const CoderPtr coder = partitionsAroundTheBorder();
    expectAnswersAroundTheBorder(*coder);
    coder->numbering().checkEnds();
    expectAnswersAroundTheBorder(*coder);
    for (const bool compress : {false, true}) {
        const CoderPtr restored = support::restoredFrom(
            support::formOf(*coder, compress), compress, *coder);
        EXPECT_EQ(restored->pathCount, coder->pathCount);
        EXPECT_EQ(restored->partitionEnds, coder->partitionEnds);
        expectAnswersAroundTheBorder(*restored);
    }
    HuffmanPathTree copy;
    copy.copyTree(*coder);
    expectAnswersAroundTheBorder(copy);
}

TEST(PathRetrieval, RepeatedPathsHaveNumbersBeyond32Bits) {
    const CoderPtr coder = fourLetterCoder();
    addWhole(*coder, {u"a", u"b"});
    coder->pathCount = static_cast<std::uint64_t>(border) - 1;
    addWhole(*coder, {u"a", u"b"});
    addWhole(*coder, {u"a", u"b"});
    const CoderPtr restored =
        support::restoredFrom(support::formOf(*coder, true), true, *coder);
    EXPECT_EQ(restored->duplicates, coder->duplicates);
    EXPECT_EQ(restored->maxDuplicatePathNumber, coder->pathCount);
    for (HuffmanPathTree* each : {coder.get(), restored.get()}) {
        const auto number = static_cast<std::uint64_t>(border);
        EXPECT_TRUE(each->hasDuplicate(number));
        EXPECT_TRUE(each->hasDuplicate(number + 1));
        EXPECT_FALSE(each->hasDuplicate(0));
        EXPECT_FALSE(each->hasDuplicate(1));
        each->resetPathsToBTree();
        each->nextPathNumber = number - 1;
        for (int repeat = 0; repeat < 2; ++repeat) {
            Components path;
            each->getNextPathFromBTree(path);
            EXPECT_EQ(decodedBy(*each, path), (Texts{u"a", u"b"}));
        }
        EXPECT_EQ(each->nextPathNumber, number + 1);
    }
}

// ---- Tracks without ends ----

CoderPtr trackOnly() {
    CoderPtr coder = threePartitions();
    coder->partitionEnds.clear();
    return coder;
}

TEST(PathRetrieval, WithoutEndsNumbersAreThoseOfPartitions) {
    const CoderPtr coder = trackOnly();
    // The third track ends at the first file of its batch.
    EXPECT_EQ(answerFor(*coder, {2, 1, 3}),
              (Answer{{{u"b"}, {u"a"}, {u"a", u"aa"}}, {}}));
}

TEST(PathRetrieval, WithoutEndsNumbersAreTruncatedAfterSubtractingOne) {
    const CoderPtr coder = trackOnly();
    EXPECT_EQ(answerFor(*coder, {1.9, 2.5}), (Answer{{{u"a"}, {u"b"}}, {}}));
    EXPECT_EQ(answerFor(*coder, {0.5}), (Answer{{{u"a"}}, {}}));
}

TEST(PathRetrieval, WithoutEndsANumberThatIsNoPartitionIsOutOfRange) {
    const CoderPtr coder = trackOnly();
    for (const double number : {nan, 0.0, -1.0, 4.0, 1e300, infinity})
        expectRefused(*coder, {1, number});
}

// ---- A merge, step by step ----

// A coder with one folder of many files, and partitions that end anywhere.
struct Crafted {
    model::Coder expected;
    support::CoderPtr coder = std::make_unique<tessel::HuffmanPathTree>();
};

Crafted crafted(const std::vector<std::uint64_t>& ends) {
    Crafted both;
    both.expected.code = model::buildCode(u"ab", {1, 1});
    model::Path files;
    for (unsigned i = 0; i < 60; ++i)
        files.push_back({static_cast<std::uint8_t>(i), 0});
    both.expected.addPartition({{1, 1}}, files);
    for (unsigned i = 0; i < 10; ++i) {
        const auto name = static_cast<std::uint8_t>(i);
        both.expected.addPartition({{1, 1}, {name, 3}}, {{2, 2}});
    }
    both.expected.partitionEnds = ends;
    both.expected.partitionTracks.clear();
    for (std::size_t k = 0; k < ends.size(); ++k) {
        const model::Track tracks[] = {{0}, {0, 60 + k % 10}, {0, k % 60}, {}};
        both.expected.partitionTracks.push_back(tracks[k % 4]);
    }
    Bytes form = both.expected.form().bytes();
    both.coder->deserialize(form, false);
    both.expected = both.expected.restored();
    return both;
}

void compareLookup(const Crafted& both, const std::vector<double>& numbers) {
    const auto expected = both.expected.getPath(numbers);
    const auto answer = support::found(*both.coder, numbers);
    RC_ASSERT(answer.has_value() == expected.has_value());
    if (!expected) return;
    RC_ASSERT(answer->folders == expected->folders);
    RC_ASSERT(answer->files == expected->files);
}

RC_GTEST_PROP(PathRetrieval, EqualsTheMergeWhereverPartitionsEnd, ()) {
    const auto ends =
        *rc::gen::nonEmpty(rc::gen::container<std::vector<std::uint64_t>>(
            rc::gen::inRange<std::uint64_t>(0, 100)));
    const Crafted both = crafted(ends);
    const auto numbers = *rc::gen::container<std::vector<double>>(
        rc::gen::map(rc::gen::inRange(0, 110),
                     [](int n) { return static_cast<double>(n); }));
    compareLookup(both, numbers);
    for (const double number : numbers) compareLookup(both, {number});
    std::vector<double> sorted = numbers;
    std::sort(sorted.begin(), sorted.end());
    compareLookup(both, sorted);
    sorted.erase(std::remove(sorted.begin(), sorted.end(), 0), sorted.end());
    compareLookup(both, sorted);

    // A copy, and the coder after one more batch, keep the ends' order.
    Crafted copied;
    copied.expected = both.expected;
    copied.coder->copyTree(*both.coder);
    compareLookup(copied, sorted);
    Components folder = {{1, 1}};
    Components files = {{5, 5}};
    copied.expected.addPartition(folder, files);
    copied.coder->addPathToBTree(folder, files);
    compareLookup(copied, sorted);
    compareLookup(copied, numbers);
}

// Two forms read one after the other: the ends begin again.
RC_GTEST_PROP(PathRetrieval, EqualsTheMergeAfterASecondForm, ()) {
    const auto ends = rc::gen::map(
        rc::gen::nonEmpty(rc::gen::container<std::vector<std::uint64_t>>(
            rc::gen::inRange<std::uint64_t>(0, 100))),
        [](std::vector<std::uint64_t> list) {
            std::sort(list.begin(), list.end());
            return list;
        });
    Crafted both = crafted(*ends);
    const Crafted second = crafted(*ends);
    Bytes form = second.expected.form().bytes();
    both.coder->deserialize(form, false);
    for (const std::uint64_t end : second.expected.partitionEnds)
        both.expected.partitionEnds.push_back(end);
    for (const model::Track& track : second.expected.partitionTracks)
        both.expected.partitionTracks.push_back(track);
    auto numbers = *rc::gen::container<std::vector<double>>(
        rc::gen::map(rc::gen::inRange(1, 110),
                     [](int n) { return static_cast<double>(n); }));
    compareLookup(both, numbers);
    std::sort(numbers.begin(), numbers.end());
    compareLookup(both, numbers);
}

RC_GTEST_PROP(PathRetrieval, EqualsTheMergeInManyPartitions, ()) {
    const auto sizes = *rc::gen::scale(
        10, rc::gen::nonEmpty(rc::gen::container<std::vector<unsigned>>(
                rc::gen::inRange(0U, 4U))));
    std::vector<std::uint64_t> ends;
    std::uint64_t end = 0;
    for (const unsigned size : sizes) ends.push_back(end += size);
    const Crafted both = crafted(ends);
    auto numbers = *rc::gen::container<std::vector<double>>(
        rc::gen::map(rc::gen::inRange<std::uint64_t>(1, end + 3),
                     [](std::uint64_t n) { return static_cast<double>(n); }));
    compareLookup(both, numbers);
    std::sort(numbers.begin(), numbers.end());
    compareLookup(both, numbers);
    for (const double number : numbers) compareLookup(both, {number});
}

// A load of a form without partitions keeps the ends, and how they lie.
TEST(PathRetrieval, EndsThatFallAreStillSearchedAfterAFormWithoutPartitions) {
    const Crafted both = crafted({1, 2, 3, 4, 20, 5, 6, 30});
    model::Coder withoutPartitions = both.expected;
    withoutPartitions.partitionEnds.clear();
    withoutPartitions.partitionTracks.clear();
    Bytes form = withoutPartitions.form().bytes();
    both.coder->deserialize(form, false);
    ASSERT_EQ(both.coder->partitionEnds.size(), 8U);
    const auto answer = found(*both.coder, {10});
    ASSERT_TRUE(answer);
    EXPECT_EQ(answer->files, both.expected.getPath({10})->files);
}

// ---- Views ----

// What a visitor sees, as getPath would copy it.
struct Visited {
    void beginFolder(std::size_t usualFiles) {
        folders.emplace_back();
        files.emplace_back();
        bounds.push_back(usualFiles);
    }
    void folder(tessel::ComponentView name) {
        folders.back().emplace_back(name.begin(), name.end());
    }
    void file(tessel::ComponentView name) {
        files.back().emplace_back(name.begin(), name.end());
    }

    std::vector<Components> folders;
    std::vector<Components> files;
    std::vector<std::size_t> bounds;
};

PathRetrieval retrievalOf(const HuffmanPathTree& coder) {
    return {*coder.pathTree, coder.numbering()};
}

TEST(PathRetrieval, VisitedViewsAreWhatIsCopied) {
    const CoderPtr coder = threePartitions();
    const std::vector<std::vector<std::uint64_t>> requests = {
        {}, {1}, {5}, {2, 3, 4, 8}, {1, 1, 9}, {4, 10, 5}, {100}, {9, 8}};
    for (const auto& numbers : requests) {
        Visited visited;
        retrievalOf(*coder).visit(numbers, visited);
        const auto answer =
            found(*coder, std::vector<double>(numbers.begin(), numbers.end()));
        ASSERT_TRUE(answer);
        EXPECT_EQ(visited.folders, answer->folders);
        EXPECT_EQ(visited.files, answer->files);
        const bool rise =
            std::adjacent_find(numbers.begin(), numbers.end(),
                               std::greater_equal<>()) == numbers.end();
        for (std::size_t i = 0; i < visited.files.size() && rise; ++i)
            EXPECT_LE(visited.files[i].size(), visited.bounds[i]);
    }
}

TEST(PathRetrieval, AFolderDeeperThanTheTrackReadersArrayIsVisited) {
    for (const std::size_t depth : {31U, 32U, 33U, 100U}) {
        const CoderPtr coder = fourLetterCoder();
        Texts folder;
        for (std::size_t i = 0; i < depth; ++i)
            folder.push_back(std::u16string(i % 3 + 1, u'a'));
        addBatch(*coder, folder, {u"b"});
        addBatch(*coder, folder, {u"c"});
        Visited visited;
        retrievalOf(*coder).visit(std::vector<std::uint64_t>{1, 2}, visited);
        ASSERT_EQ(visited.folders.size(), 2U);
        for (const Components& seen : visited.folders)
            EXPECT_EQ(decodedBy(*coder, seen), folder);
        EXPECT_EQ(decodedBy(*coder, visited.files[1]), Texts{u"c"});
    }
}

}  // namespace
