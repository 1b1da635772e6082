// The table from hash to position, and names that were made to collide.

#include <gtest/gtest.h>

#include "pathtree/HashIndex.hpp"

#define XXH_INLINE_ALL
#include <xxhash.h>

#include <array>
#include <bit>
#include <cstdio>
#include <filesystem>
#include <functional>
#include <iostream>
#include <map>
#include <set>
#include <string>
#include <string_view>

#include "tests/support/Bytes.hpp"

namespace {

using support::littleEndian;
using tessel::HashIndex;
using ByteName = support::Bytes;
using ByteNames = std::vector<ByteName>;

std::size_t findName(const HashIndex& index, const ByteNames& names,
                     const ByteName& name) {
    return index.find(HashIndex::hashOf(name), [&](std::size_t position) {
        return tessel::sameComponent(names[position], name);
    });
}

TEST(HashIndex, FindsWhatWasInsertedAndNothingElse) {
    ByteNames names;
    HashIndex index;
    EXPECT_EQ(findName(index, names, {1}), HashIndex::notFound);
    for (std::size_t i = 0; i < 1000; ++i) {
        names.push_back(littleEndian(i * 7, 4));
        EXPECT_EQ(findName(index, names, names.back()), HashIndex::notFound);
        index.insert(HashIndex::hashOf(names.back()), i);
        for (std::size_t k = 0; k <= i; k += 1 + i / 7)
            ASSERT_EQ(findName(index, names, names[k]), k);
    }
    EXPECT_EQ(findName(index, names, {}), HashIndex::notFound);
}

TEST(HashIndex, EqualHashesAreToldApartByTheThings) {
    HashIndex index;
    for (std::size_t i = 0; i < 50; ++i) index.insert(7, i);
    for (std::size_t i = 0; i < 50; ++i)
        EXPECT_EQ(index.find(7, [i](std::size_t at) { return at == i; }), i);
    EXPECT_EQ(index.find(7, [](std::size_t) { return false; }),
              HashIndex::notFound);
    EXPECT_EQ(index.probes(7), 51U);
    EXPECT_NE(index.homeSlot(7), HashIndex::notFound);
    EXPECT_EQ(index.homeSlot(8), HashIndex::notFound);
}

TEST(HashIndex, ThreeQuartersFullIsTheFullestItGets) {
    HashIndex index;
    for (std::size_t count = 1; count <= 5000; ++count) {
        index.insert(static_cast<std::uint32_t>(count * 2654435761U), count);
        const std::size_t entries = index.memoryBytes() / 8;
        ASSERT_TRUE(std::has_single_bit(entries));
        ASSERT_LE(count * 4, entries * 3);
    }
}

TEST(HashIndex, RoomThatWasReservedIsUsed) {
    HashIndex index;
    EXPECT_EQ(index.memoryBytes(), 0U);
    index.reserve(1000);
    const std::size_t bytes = index.memoryBytes();
    for (std::uint32_t i = 0; i < 1000; ++i) index.insert(i, i);
    EXPECT_EQ(index.memoryBytes(), bytes);
    index.reserve(10);
    EXPECT_EQ(index.memoryBytes(), bytes);
}

TEST(HashIndex, AHashIsTheSameWithinAProcess) {
    std::set<std::uint32_t> hashes;
    for (std::size_t length = 0; length < 600; ++length) {
        const ByteName name(length, 0x5A);
        const ByteName copy(length, 0x5A);
        EXPECT_EQ(HashIndex::hashOf(name), HashIndex::hashOf(copy));
        hashes.insert(HashIndex::hashOf(name));
    }
    EXPECT_GE(hashes.size(), 598U);
    std::cout << "hash=" << *hashes.begin() << '\n';  // for the next test
}

// A hash that a process of its own computes.
std::string hashOfAnotherProcess() {
    std::string command = "env -u GTEST_TOTAL_SHARDS -u GTEST_SHARD_INDEX ";
    command += std::filesystem::read_symlink("/proc/self/exe").string();
    command +=
        " --gtest_color=no"
        " --gtest_filter=HashIndex.AHashIsTheSameWithinAProcess 2>/dev/null";
    FILE* output = ::popen(command.c_str(), "r");
    std::string text;
    for (int c = std::fgetc(output); c != EOF; c = std::fgetc(output))
        text.push_back(static_cast<char>(c));
    ::pclose(output);
    const std::size_t at = text.find("hash=");
    return at == std::string::npos ? ""
                                   : text.substr(at, text.find('\n', at) - at);
}

TEST(HashIndex, AnotherProcessHashesOtherwise) {
    const std::string first = hashOfAnotherProcess();
    EXPECT_FALSE(first.empty());
    // Two of 2^32 values may be equal by chance, three hardly ever.
    const bool differ =
        hashOfAnotherProcess() != first || hashOfAnotherProcess() != first;
    EXPECT_TRUE(differ) << first;
}

// ---- Names that collide ----
// Each family has equal hashes, in the 32 bits that are kept, under one
// hash whose key everybody knows.

std::uint64_t inverseOf(std::uint64_t odd) {  // modulo 2^64, by Newton
    std::uint64_t inverse = odd;
    for (int i = 0; i < 6; ++i) inverse *= 2 - odd * inverse;
    return inverse;
}

std::uint64_t undoShiftXor(std::uint64_t value, unsigned shift) {
    std::uint64_t undone = value;
    for (unsigned i = 0; i < 64 / shift; ++i) undone = value ^ undone >> shift;
    return undone;
}

// The standard library's hash is MurmurHash64A with a fixed seed, whose steps
// can be undone: the second word of a name takes back the first.
ByteName collidingByMurmur(std::uint64_t number) {
    constexpr std::uint64_t factor = 0xC6A4A7935BD1E995;
    constexpr std::uint64_t start = 0xC70F6907 ^ (16 * factor);
    std::uint64_t mixed = number * factor;
    mixed = (mixed ^ mixed >> 47) * factor;
    const std::uint64_t state = (start ^ mixed) * factor;
    const std::uint64_t second =
        undoShiftXor(state * inverseOf(factor), 47) * inverseOf(factor);
    return support::join({littleEndian(number, 8), littleEndian(second, 8)});
}

// XXH3 without a seed, for names of eight bytes: what mixes them can be
// undone, too, and starts from a hash whose low half is always 0.
ByteName collidingByXxh3(std::uint64_t number) {
    constexpr std::uint64_t factor = 0x9FB21C651E98DF25;
    constexpr std::uint64_t secret = 0x1CAD21F72C81017C ^ 0xDB979083E96DD4DE;
    std::uint64_t hash = undoShiftXor(number << 32, 28) * inverseOf(factor);
    // The step added 8 to what it shifted.
    hash ^= (hash >> 35) + 8;
    hash *= inverseOf(factor);
    // x ^ rotl(x, 49) ^ rotl(x, 24) gives x again after 64 times.
    for (int i = 0; i < 63; ++i)
        hash ^= std::rotl(hash, 49) ^ std::rotl(hash, 24);
    return littleEndian(std::rotl(hash ^ secret, 32), 8);
}

std::uint32_t fnv(std::uint32_t state, std::uint64_t word) {
    for (unsigned i = 0; i < 4; ++i)
        state = (state ^ static_cast<std::uint8_t>(word >> 8 * i)) * 0x1B3;
    return state;
}

// FNV-1a, 64 bits, keeps its low half to itself. Blocks of four bytes that
// collide two by two, one pair after the other (Joux 2004): the bits of the
// number choose one of each pair.
class FnvFamily {
public:
    FnvFamily() {
        auto state = static_cast<std::uint32_t>(0xCBF29CE484222325);
        for (auto& pair : pairs_) {
            std::map<std::uint32_t, std::uint64_t> seen;
            for (std::uint64_t word = 0;; ++word) {
                const std::uint64_t spread = word * 0x9E3779B1 & 0xFFFFFFFF;
                const std::uint32_t next = fnv(state, spread);
                const auto [known, isNew] = seen.emplace(next, spread);
                if (isNew) continue;
                pair = {known->second, spread};
                state = next;
                break;
            }
        }
    }
    ByteName operator()(std::uint64_t number) const {
        ByteName name;
        for (const auto& pair : pairs_) {
            const ByteName block =
                littleEndian(number % 2 == 0 ? pair.first : pair.second, 4);
            name.insert(name.end(), block.begin(), block.end());
            number /= 2;
        }
        return name;
    }

private:
    std::array<std::pair<std::uint64_t, std::uint64_t>, 17> pairs_;
};

// A random name for comparison.
ByteName randomName(std::uint64_t number) {
    return littleEndian((number + 1) * 0x9E3779B97F4A7C15, 8);
}

// Entries that searches for all these names look at, in a table of them.
template <class Family>
std::size_t totalProbes(const Family& nameOf, std::size_t count) {
    HashIndex index;
    std::vector<std::uint32_t> hashes;
    for (std::size_t i = 0; i < count; ++i)
        hashes.push_back(HashIndex::hashOf(nameOf(i)));
    index.reserve(count);
    for (std::size_t i = 0; i < count; ++i) index.insert(hashes[i], i);
    std::size_t total = 0;
    for (const std::uint32_t hash : hashes) total += index.probes(hash);
    return total;
}

// Under the keyed hash names that collide cost what random ones do, and
// both cost little. (A search among n names of one hash looks at n entries.)
template <class Family>
void expectHarmless(const Family& nameOf) {
    for (const std::size_t count : {16000U, 128000U}) {
        const std::size_t probes = totalProbes(nameOf, count);
        EXPECT_LE(probes, 3 * totalProbes(randomName, count));
        EXPECT_LE(probes, 8 * count);
    }
}

TEST(HashIndex, NamesThatCollideUnderTheStandardLibrarysHash) {
    std::set<std::size_t> hashes;
    std::set<std::string> names;
    for (std::uint64_t i = 0; i < 1000; ++i) {
        const ByteName name = collidingByMurmur(i);
        hashes.insert(std::hash<std::string_view>{}(
            {reinterpret_cast<const char*>(name.data()), name.size()}));
        names.insert(std::string(name.begin(), name.end()));
    }
    EXPECT_EQ(hashes.size(), 1U);
    EXPECT_EQ(names.size(), 1000U);
    expectHarmless(collidingByMurmur);
}

TEST(HashIndex, NamesThatCollideUnderFnv) {
    const FnvFamily nameOf;
    std::set<std::uint32_t> hashes;
    std::set<std::string> names;
    for (std::uint64_t i = 0; i < 1000; ++i) {
        const ByteName name = nameOf(i * 131);
        std::uint64_t hash = 0xCBF29CE484222325;
        for (const std::uint8_t byte : name)
            hash = (hash ^ byte) * 0x100000001B3;
        hashes.insert(static_cast<std::uint32_t>(hash));
        names.insert(std::string(name.begin(), name.end()));
    }
    EXPECT_EQ(hashes.size(), 1U);
    EXPECT_EQ(names.size(), 1000U);
    expectHarmless(nameOf);
}

TEST(HashIndex, NamesThatCollideUnderXxh3WithoutASeed) {
    std::set<std::uint32_t> hashes;
    std::set<std::string> names;
    for (std::uint64_t i = 0; i < 1000; ++i) {
        const ByteName name = collidingByXxh3(i);
        hashes.insert(
            static_cast<std::uint32_t>(XXH3_64bits(name.data(), name.size())));
        names.insert(std::string(name.begin(), name.end()));
    }
    EXPECT_EQ(hashes.size(), 1U);
    EXPECT_EQ(names.size(), 1000U);
    expectHarmless(collidingByXxh3);
}

}  // namespace
