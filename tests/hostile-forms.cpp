// Stored forms that are cut, changed or made up: an answer or one of the
// documented exceptions, no memory taken on a claim, and after an exception
// the coder as it was. Whatever was accepted must then stand any use.

#include <gtest/gtest.h>

#include <algorithm>
#include <stdexcept>

#include "tests/support/AllocationMeter.hpp"
#include "tests/support/Coders.hpp"
#include "tests/support/Sizes.hpp"

namespace {

using support::append;
using support::Bytes;
using support::CoderPtr;
using support::join;
using support::Texts;
using support::u64;
using tessel::Components;
using tessel::DamagedFormException;
using tessel::HuffmanPathTree;

// ---- The forms ----

CoderPtr codeOnly() { return support::coderWith(u"abc", {2, 1, 1}); }

CoderPtr wholePaths() {
    CoderPtr coder = codeOnly();
    for (const Texts& path : {Texts{u"a", u"b"}, Texts{u"c"}, Texts{u"a", u"b"},
                              Texts{u"a", u"c"}, Texts{u"c"}})
        support::addWhole(*coder, path);
    return coder;
}

CoderPtr batches() {
    CoderPtr coder = codeOnly();
    support::addBatch(*coder, {u"a"}, {u"ab", u"abc"});
    support::addBatch(*coder, {u"a", u"b"}, {});
    support::addBatch(*coder, {u"a"}, {u"c", u"cc", u"c"});
    support::addBatch(*coder, {u"b", u"b", u"b"}, {u"cba"});
    return coder;
}

CoderPtr everything() {
    CoderPtr coder = batches();
    support::addWhole(*coder, {u"a", u"c"});
    support::addWhole(*coder, {u"a", u"ab"});
    support::addWhole(*coder, {u"c"});
    return coder;
}

CoderPtr widePositions() {
    CoderPtr coder = codeOnly();
    support::addBatch(*coder, {u"a"}, Texts(256, u"b"));
    support::addBatch(*coder, {u"a"}, {u"c"});
    return coder;
}

CoderPtr tracksAlone() {
    CoderPtr coder = batches();
    coder->partitionEnds.clear();
    return coder;
}

struct Sample {
    const char* name;
    CoderPtr (*make)();
};

void PrintTo(const Sample& sample, std::ostream* out) { *out << sample.name; }

const Sample samples[] = {
    {"CodeOnly", &codeOnly},
    {"WholePaths", &wholePaths},
    {"Batches", &batches},
    {"Everything", &everything},
    {"WidePositions", &widePositions},
    {"TracksAlone", &tracksAlone},
};

// ---- Judging a load ----

// What an object is, as far as its operations show.
struct State {
    Bytes form;
    std::vector<std::uint64_t> counters;
    std::u16string characters;
    std::vector<bool> shape;
    std::vector<Texts> paths;
    bool operator==(const State&) const = default;
};

State stateOf(HuffmanPathTree& coder) {
    return {support::formOf(coder, false),
            {coder.pathCount, coder.maxCodeBytes, coder.maxPartitionTrackLength,
             coder.maxDuplicateTrackLength, coder.maxDuplicatePathNumber,
             coder.partitionEnds.size()},
            coder.getTreeString(),
            coder.getBoolTree(),
            support::iterated(coder)};
}

// Nothing is to be taken that the input cannot account for. Nodes, lists and
// tracks take a few times the bytes that describe them.
constexpr std::size_t mostPerByte = 64;
constexpr std::size_t mostAnyway = 64 << 10;

// zlib can unpack to this many times a stream; only then comes the rest.
constexpr std::size_t mostInflation = 1032;

enum class Outcome { loaded, damaged, unknownNode, unknownWidth };

// Reads the form and checks what it allocates on the way. Any exception but
// the documented three passes through and fails the test.
Outcome load(HuffmanPathTree& coder, Bytes& form, bool compress) {
    const support::AllocationMeter meter;
    Outcome outcome = Outcome::loaded;
    try {
        coder.deserialize(form, compress);
    } catch (const DamagedFormException&) {
        outcome = Outcome::damaged;
    } catch (const tessel::UnknownNodeTypeException&) {
        outcome = Outcome::unknownNode;
    } catch (const tessel::InvalidUintConversionException&) {
        outcome = Outcome::unknownWidth;
    }
    const std::size_t reach = compress ? mostInflation : 1;
    const std::size_t limit = reach * (mostPerByte * form.size() + mostAnyway);
    EXPECT_LE(meter.largest(), limit);
    EXPECT_LE(meter.total(), 8 * limit);
    return outcome;
}

// Runs `use`, which may throw one of these and nothing else.
template <class... Failures>
struct Allowing {
    template <class Use>
    static void run(Use use) {
        try {
            use();
        } catch (const std::exception& failure) {
            const bool allowed =
                (... || (dynamic_cast<const Failures*>(&failure) != nullptr));
            EXPECT_TRUE(allowed) << failure.what();
        }
    }
};

// The tree's own paths always come; only the track of a repeated one may lead
// nowhere, and only a name may be none in this code.
void iterateAll(HuffmanPathTree& coder) {
    coder.resetPathsToBTree();
    for (int i = 0; i < 400 && coder.hasNextPathFromBTree(); ++i) {
        Components path;
        if (coder.hasDuplicate(coder.nextPathNumber + 1))
            Allowing<tessel::NoTreeToTraverseException,
                     tessel::EmptyPathForTraverseException,
                     std::out_of_range>::run([&] {
                coder.getNextPathFromBTree(path);
            });
        else
            EXPECT_NO_THROW(coder.getNextPathFromBTree(path));
        Allowing<DamagedFormException>::run(
            [&] { support::decodedBy(coder, path); });
    }
}

// `found` answers std::out_of_range by nothing. Tracks without ends may be
// empty, or there may be no tree.
void lookUp(const HuffmanPathTree& coder, const std::vector<double>& numbers) {
    const auto look = [&] { support::found(coder, numbers); };
    if (coder.partitionEnds.empty())
        Allowing<tessel::NoTreeToTraverseException,
                 tessel::EmptyPathForTraverseException>::run(look);
    else
        EXPECT_NO_THROW(look());
}

void fetchAll(const HuffmanPathTree& coder) {
    const std::vector<double> rare = {0, 1e18, 1.8446744073709552e19};
    std::vector<double> all;
    for (int n = 1; n < 24; ++n) {
        const std::vector<double> one = {static_cast<double>(n)};
        lookUp(coder, one);
        all.push_back(one[0]);
    }
    lookUp(coder, all);
    lookUp(coder, rare);
    const auto count = static_cast<double>(coder.pathCount);
    lookUp(coder, {count});
    lookUp(coder, {count + 1, 1});
}

// What was accepted is written and read again without a change.
void storeAgain(const HuffmanPathTree& coder) {
    Bytes form = support::formOf(coder, false);
    HuffmanPathTree back;
    back.deserialize(form, false);
    EXPECT_EQ(support::formOf(back, false).size(), form.size());
    EXPECT_EQ(support::storedTree(*back.pathTree),
              support::storedTree(*coder.pathTree));
    EXPECT_EQ(back.duplicates, coder.duplicates);
    EXPECT_EQ(back.partitionTracks, coder.partitionTracks);
    // Without a track there is no partition section.
    if (!coder.partitionTracks.empty()) {
        EXPECT_EQ(back.partitionEnds, coder.partitionEnds);
    }
}

void useThoroughly(HuffmanPathTree& coder) {
    EXPECT_EQ(support::brokenInvariant(coder, true), "");
    Allowing<DamagedFormException>::run([&] { coder.inflateHuffman(u"abc"); });
    iterateAll(coder);
    fetchAll(coder);
    storeAgain(coder);
    HuffmanPathTree copy;
    copy.copyTree(coder);
    EXPECT_GT(coder.memoryUsage().total(), 0U);
    if (coder.nodes.empty()) return;
    support::addBatch(coder, {u"a"}, {u"b", u"c"});
    support::addWhole(coder, {u"a", u"b"});
    iterateAll(copy);
    fetchAll(coder);
    storeAgain(coder);
}

// Loads into a fresh coder and uses it, and into one that holds something
// already, which a refusal must not change.
class Judge {
public:
    explicit Judge(bool isCompressed) : compress_(isCompressed) {
        before_ = stateOf(*held_);
    }

    Outcome judge(Bytes form) {
        HuffmanPathTree fresh;
        const Outcome outcome = load(fresh, form, compress_);
        if (outcome == Outcome::loaded) {
            useThoroughly(fresh);
            return outcome;
        }
        EXPECT_EQ(stateOf(fresh), stateOf(untouched_));
        EXPECT_EQ(load(*held_, form, compress_), outcome);
        EXPECT_EQ(stateOf(*held_), before_);
        return outcome;
    }

private:
    bool compress_;
    HuffmanPathTree untouched_;
    CoderPtr held_ = everything();
    State before_;
};

class HostileForm : public ::testing::TestWithParam<Sample> {
protected:
    Bytes form(bool compress) const {
        return support::formOf(*GetParam().make(), compress);
    }
};

std::string nameOf(const ::testing::TestParamInfo<Sample>& sample) {
    return sample.param.name;
}

INSTANTIATE_TEST_SUITE_P(Samples, HostileForm, ::testing::ValuesIn(samples),
                         &nameOf);

TEST_P(HostileForm, AsItWasWrittenIsLoaded) {
    for (const bool compress : {false, true})
        EXPECT_EQ(Judge(compress).judge(form(compress)), Outcome::loaded);
}

// Between its sections a form without compression may end.
TEST_P(HostileForm, CutAtEveryByte) {
    const Bytes whole = form(false);
    Judge judge(false);
    int loaded = 0;
    for (std::size_t length = 0; length < whole.size(); ++length) {
        const auto end = whole.begin() + static_cast<std::ptrdiff_t>(length);
        const Outcome outcome = judge.judge(Bytes(whole.begin(), end));
        EXPECT_TRUE(outcome == Outcome::loaded || outcome == Outcome::damaged);
        loaded += outcome == Outcome::loaded ? 1 : 0;
    }
    EXPECT_LE(loaded, 8) << "before, between and after sections and entries";
}

TEST_P(HostileForm, CutAtEveryByteOfTheCompressed) {
    const Bytes whole = form(true);
    Judge judge(true);
    for (std::size_t length = 0; length < whole.size(); ++length) {
        const auto end = whole.begin() + static_cast<std::ptrdiff_t>(length);
        EXPECT_EQ(judge.judge(Bytes(whole.begin(), end)), Outcome::damaged);
    }
}

// Values that a byte is changed to: the edges of every field's meaning, and
// its neighbours.
Bytes changesOf(std::uint8_t byte) {
    Bytes values = {0, 1, 2, 3, 4, 5, 7, 8, 0x7F, 0x80, 0xFE, 0xFF};
    for (const unsigned bit : {0U, 1U, 2U, 5U, 7U})
        values.push_back(static_cast<std::uint8_t>(byte ^ (1U << bit)));
    std::sort(values.begin(), values.end());
    values.erase(std::unique(values.begin(), values.end()), values.end());
    values.erase(std::remove(values.begin(), values.end(), byte), values.end());
    return values;
}

// The next byte to change: every one, but of the long middle of a form that
// repeats itself only some.
std::size_t after(std::size_t i, std::size_t size) {
    constexpr std::size_t edge = 160;
    constexpr std::size_t step = 7 * (8 / support::shareOf(8));
    return i < edge || i + edge >= size ? i + 1 : i + step;
}

TEST_P(HostileForm, WithEveryByteChanged) {
    Bytes changed = form(false);
    Judge judge(false);
    for (std::size_t i = 0; i < changed.size(); i = after(i, changed.size())) {
        const std::uint8_t original = changed[i];
        for (const std::uint8_t value : changesOf(original)) {
            changed[i] = value;
            judge.judge(changed);
        }
        changed[i] = original;
        if (HasFailure()) FAIL() << "with byte " << i << " changed";
    }
}

TEST_P(HostileForm, WithEveryByteOfTheCompressedChanged) {
    Bytes changed = form(true);
    Judge judge(true);
    for (std::size_t i = 0; i < changed.size(); ++i) {
        const std::uint8_t original = changed[i];
        for (const std::uint8_t value : changesOf(original)) {
            changed[i] = value;
            const Outcome outcome = judge.judge(changed);
            // Header, data and checksum leave no room for another answer.
            if (i < 8) {
                EXPECT_EQ(outcome, Outcome::damaged);
            }
        }
        changed[i] = original;
        if (HasFailure()) FAIL() << "with byte " << i << " changed";
    }
}

// The same changes where no checksum sees them: before compression.
TEST_P(HostileForm, WithEveryByteBeforeCompressionChanged) {
    const Bytes plain = form(false);
    Bytes payload(plain.begin() + 8, plain.end());
    Judge judge(true);
    for (std::size_t i = 0; i < payload.size(); i = after(i, payload.size())) {
        const std::uint8_t original = payload[i];
        for (const std::uint8_t value :
             {std::uint8_t{0xFF}, std::uint8_t{4},
              static_cast<std::uint8_t>(original ^ 1U)}) {
            payload[i] = value;
            Bytes changed = u64(payload.size());
            append(changed, tessel::sixpacks::compressUint8(payload));
            judge.judge(changed);
        }
        payload[i] = original;
        if (HasFailure()) FAIL() << "with byte " << i << " changed";
    }
}

TEST_P(HostileForm, WithBytesAfterIt) {
    Judge judge(false);
    for (unsigned first = 0; first < 256; ++first) {
        for (const Bytes& rest : {Bytes{}, Bytes{0, 0, 0}, Bytes(40, 0xFF)}) {
            Bytes longer = form(false);
            longer.push_back(static_cast<std::uint8_t>(first));
            append(longer, rest);
            judge.judge(longer);
        }
    }
}

// ---- Claims of huge counts ----

const Bytes shape = {2, 0, 0, 0, 0, 0, 0, 0, 0x06, 0x03};
const Bytes onePath = {
    1,    0,    0, 0, 0, 0, 0, 0, 0x00,  // one node code
    1,    0,    0, 0, 0, 0, 0, 0,        // one value
    0x00,                                // lengths take 1 byte
    1,    0xAB,                          // the value
};

// Every count or length of a form, claiming n.
std::vector<Bytes> payloadsClaiming(std::uint64_t n) {
    const Bytes many = u64(n);
    return {
        join({many, {0x06, 0x03}, onePath}),
        join({shape, many, {0}, u64(1), {0}, {1, 0xAB}}),
        join({shape, u64(1), {0}, many, {0}, {1, 0xAB}}),
        join({shape, u64(1), {0}, u64(1), {3}, many, {0xAB}}),
        join({shape, onePath, {1, 0, 3}, many, {1, 2, 3}}),
        join({shape, onePath, {1, 3, 3}, many, u64(1)}),
        join({shape, onePath, {1, 0, 0, 1, 1}, many, {0, 0}, {1, 0}}),
        join({shape, onePath, {1, 0, 0, 1, 1}, many, {3, 3}, u64(0)}),
        join({shape, onePath, {1, 0, 0, 1, 1}, u64(1), {0, 3}, many, {0}}),
        join({shape, onePath, {0, 0, 3, 0, 2}, many, {0}}),
        join({shape, onePath, {0, 3, 3, 3}, u64(2), many, u64(0)}),
    };
}

TEST(HostileClaims, AreRefusedBeforeMemoryIsTaken) {
    for (const std::uint64_t claim :
         {std::uint64_t{200}, std::uint64_t{1} << 20, std::uint64_t{1} << 31,
          std::uint64_t{1} << 32, std::uint64_t{1} << 40,
          std::uint64_t{1} << 61, std::uint64_t{1} << 63, ~std::uint64_t{0} - 7,
          ~std::uint64_t{0}}) {
        for (const Bytes& payload : payloadsClaiming(claim)) {
            EXPECT_EQ(Judge(false).judge(join({u64(payload.size()), payload})),
                      Outcome::damaged)
                << support::hex(payload);
            Bytes copy = payload;
            EXPECT_EQ(Judge(true).judge(
                          join({u64(payload.size()),
                                tessel::sixpacks::compressUint8(copy)})),
                      Outcome::damaged);
        }
    }
}

TEST(HostileClaims, APayloadThatNoStreamReachesTakesNoMemory) {
    const Bytes form = support::formOf(*everything(), true);
    for (const std::uint64_t claim :
         {std::uint64_t{1033} * form.size(), std::uint64_t{1} << 32,
          std::uint64_t{1} << 40, std::uint64_t{1} << 62, ~std::uint64_t{0}}) {
        Bytes changed = u64(claim);
        changed.insert(changed.end(), form.begin() + 8, form.end());
        HuffmanPathTree coder;
        const support::AllocationMeter meter;
        EXPECT_THROW(coder.deserialize(changed, true), DamagedFormException);
        EXPECT_LE(meter.largest(), 4096U) << claim;
    }
}

TEST(HostileClaims, APayloadInReachTakesNoMoreThanItClaims) {
    const Bytes form = support::formOf(*everything(), true);
    const std::size_t claim = 1000 * (form.size() - 8);
    Bytes changed = u64(claim);
    changed.insert(changed.end(), form.begin() + 8, form.end());
    HuffmanPathTree coder;
    const support::AllocationMeter meter;
    EXPECT_THROW(coder.deserialize(changed, true), DamagedFormException);
    EXPECT_LE(meter.largest(), claim);
}

TEST(HostileClaims, TheMeterSeesWhatIsAllocated) {
    const support::AllocationMeter meter;
    const std::vector<int> list(100000);
    EXPECT_GE(meter.largest(), list.size() * sizeof(int));
    EXPECT_GE(meter.total(), meter.largest());
    const CoderPtr coder = codeOnly();
    support::addBatch(*coder, {u"a"}, Texts(100000, u"b"));
    EXPECT_GE(meter.largest(), 100000U * sizeof(void*));
}

// ---- Hostile components ----

TEST(HostileComponents, AreDecodedOrRefused) {
    const CoderPtr coder = support::coderWith(u"abcde", {5, 1, 2, 1, 3});
    for (unsigned length = 0; length < 4; ++length) {
        for (unsigned fill = 0; fill < 256; ++fill) {
            for (unsigned last = 0; last < 256; ++last) {
                Bytes bytes(length, static_cast<std::uint8_t>(fill));
                if (length > 0) bytes.back() = static_cast<std::uint8_t>(last);
                const bool sound = length > 0 && last < 8;
                bool decoded = true;
                try {
                    const std::u16string text = coder->generatePathFrom(bytes);
                    EXPECT_LE(text.size(), 8 * length);
                } catch (const DamagedFormException&) {
                    decoded = false;
                }
                EXPECT_EQ(decoded, sound);
            }
        }
    }
}

}  // namespace
