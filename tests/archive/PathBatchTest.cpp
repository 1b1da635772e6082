#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/PathBatch.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

using archives::OpenArchive;
using archives::Paths;
using Places = std::vector<std::uint32_t>;

// Every place once, with steps that go back and forth.
Places scattered(std::uint32_t count, std::uint32_t step) {
    Places places;
    for (std::uint32_t i = 0; i < count; ++i)
        places.push_back(
            static_cast<std::uint32_t>(std::uint64_t{i} * step % count));
    return places;
}

// Reads all places and compares the paths; returns how many came per batch.
std::vector<std::size_t> sizesOfBatches(PathBatch& batch, const Paths& list,
                                        std::span<const std::uint32_t> places) {
    std::vector<std::size_t> sizes;
    while (!places.empty()) {
        batch.fill(places.first(std::min(batch.room(), places.size())));
        for (std::size_t i = 0; i < batch.size(); ++i)
            EXPECT_EQ(batch[i], list[places[i]]);
        sizes.push_back(batch.size());
        places = places.subspan(batch.size());
    }
    return sizes;
}

TEST(PathBatch, ReadsPlacesInTheOrderAsked) {
    const Paths list = archives::sortedPaths(300);
    const OpenArchive archive(list);
    PathBatch batch(archive.segment());
    sizesOfBatches(batch, list, scattered(300, 77));
    sizesOfBatches(batch, list, scattered(300, 299));
    sizesOfBatches(batch, list, {Places(20, 7)});
}

TEST(PathBatch, StartsSmallAndGrows) {
    const Paths list = archives::sortedPaths(300);
    const OpenArchive archive(list);
    PathBatch batch(archive.segment());
    EXPECT_EQ(sizesOfBatches(batch, list, scattered(300, 77)),
              (std::vector<std::size_t>{16, 64, 220}));
}

// More places than digits, so that they are sorted by these.
TEST(PathBatch, SortsManyPlaces) {
    const Paths list = archives::sortedPaths(300);
    const OpenArchive archive(list);
    PathBatch batch(archive.segment());
    Places places;
    for (std::uint32_t i = 0; i < 30'000; ++i) places.push_back(i * 7919 % 300);
    const auto sizes = sizesOfBatches(batch, list, places);
    EXPECT_GT(std::ranges::max(sizes), 4096U);
}

TEST(PathBatch, TakesFewerPathsIfTheyAreLong) {
    const std::string folder = std::string(600'000, 'f') + '/';
    Paths list;
    for (char name = 'a'; name < 'a' + 20; ++name)
        list.push_back(folder + name);
    const OpenArchive archive(list);
    PathBatch batch(archive.segment());
    EXPECT_EQ(sizesOfBatches(batch, list, scattered(20, 13)),
              (std::vector<std::size_t>{8, 8, 4}));
}

// Damages the piece in the middle of the names, which holds nothing else.
archives::Bytes damagedInTheMiddle(archives::Bytes bytes) {
    const ArchiveReader sound(ArchiveBytes{bytes});
    const Segment& segment = sound.segment(0);
    const std::uint64_t names = segment.offsetOf(Section::Names);
    const std::uint64_t size = segment.bytesOf(Section::Names);
    EXPECT_GT(size, 2U << segment.head().pieceShift);
    bytes[segment.pieces().inArchive(names + size / 2)] ^= 1;
    return bytes;
}

TEST(PathBatch, ShowsWhatComesBeforeDamage) {
    const Paths list = archives::sortedPaths(3000);
    const ArchiveReader archive(
        ArchiveBytes{damagedInTheMiddle(archives::archiveOf(list))});
    PathBatch batch(archive.segment(0));
    const Places places = {3, 1, 1500, 2};
    EXPECT_EQ(sizesOfBatches(batch, list, std::span(places).first(2)),
              (std::vector<std::size_t>{2}));
    batch.fill(places);
    ASSERT_EQ(batch.size(), 1U);
    EXPECT_EQ(batch[0], list[3]);
    EXPECT_THROW(batch.fill(std::span(places).subspan(2)),
                 DamagedArchiveException);
    batch.fill(std::span(places).subspan(3));
    EXPECT_EQ(batch[0], list[2]);
}

}  // namespace
}  // namespace tessel::archive
