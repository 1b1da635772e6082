#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/SegmentDirectory.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

// A file whose segments hold nothing sensible.
Bytes fileOf(const SegmentDirectory& directory) {
    Bytes end;
    const FileHeader header = directory.pack(end);
    Bytes file;
    header.pack(file);
    file.resize(directory.end());
    file.insert(file.end(), end.begin(), end.end());
    return file;
}

SegmentDirectory twoSegments() {
    SegmentDirectory directory;
    directory.add(1000, 7);
    directory.add(2000, 8);
    return directory;
}

TEST(SegmentDirectoryTest, SegmentsFollowEachOther) {
    EXPECT_EQ(SegmentDirectory().end(), fileHeaderBytes);
    EXPECT_EQ(SegmentDirectory().paths(), 0U);
    EXPECT_EQ(twoSegments().end(), fileHeaderBytes + 3000);
    EXPECT_EQ(twoSegments().paths(), 15U);
}

TEST(SegmentDirectoryTest, ComesBack) {
    for (const auto& directory : {SegmentDirectory(), twoSegments()}) {
        const Bytes file = fileOf(directory);
        const auto back = SegmentDirectory::unpack(file);
        EXPECT_EQ(back.end(), directory.end());
        EXPECT_EQ(back.paths(), directory.paths());
        EXPECT_EQ(fileOf(back), file);
    }
}

TEST(SegmentDirectoryTest, EveryCutAndEveryChangeIsDamage) {
    const Bytes file = fileOf(twoSegments());
    for (std::size_t size = 0; size < file.size(); ++size)
        EXPECT_THROW(SegmentDirectory::unpack(std::span(file).first(size)),
                     DamagedArchiveException);
    Bytes longer = file;
    longer.push_back(0);
    EXPECT_THROW(SegmentDirectory::unpack(longer), DamagedArchiveException);
    const std::size_t directoryAt = file.size() - 2 * segmentEntryBytes;
    for (std::size_t at = 0; at < file.size(); ++at) {
        if (at == fileHeaderBytes) at = directoryAt;
        Bytes changed = file;
        changed[at] ^= 0x10;
        EXPECT_THROW(SegmentDirectory::unpack(changed), DamagedArchiveException)
            << at;
    }
}

// What is said of two segments after `change` was made to the header and to the
// entries, with the right checksums.
template <class Change>
std::string saidAfter(Change change) {
    const Bytes file = fileOf(twoSegments());
    FileHeader header = FileHeader::unpack(file);
    const auto directory = std::span(file).subspan(header.directoryOffset);
    std::array entries = {
        SegmentEntry::unpack(directory, 0),
        SegmentEntry::unpack(directory.subspan(segmentEntryBytes), 1)};
    change(header, entries);
    Bytes changed;
    header.pack(changed);
    changed.resize(fileHeaderBytes + 3000);
    for (std::size_t i = 0; i < entries.size(); ++i)
        entries[i].pack(changed, i);
    try {
        SegmentDirectory::unpack(changed);
    } catch (const DamagedArchiveException& damage) {
        return damage.cause();
    }
    return "";
}

TEST(SegmentDirectoryTest, ContradictionsAreDamage) {
    using Entries = std::array<SegmentEntry, 2>;
    EXPECT_EQ(saidAfter([](FileHeader&, Entries&) {}), "");
    for (void (*change)(Entries&) :
         {+[](Entries& entries) { ++entries[0].offset; },
          +[](Entries& entries) { --entries[1].offset; },
          +[](Entries& entries) { ++entries[1].offset; },
          +[](Entries& entries) { --entries[0].bytes; },
          +[](Entries& entries) { ++entries[1].bytes; },
          +[](Entries& entries) { entries[1].bytes = ~std::uint64_t{0}; },
          +[](Entries& entries) { ++entries[0].firstNumber; },
          +[](Entries& entries) { --entries[1].firstNumber; },
          +[](Entries& entries) { entries[1].paths = 0; },
          +[](Entries& entries) { entries[1].paths = maxPathsPerSegment + 1; }})
        EXPECT_EQ(
            saidAfter([&](FileHeader&, Entries& entries) { change(entries); }),
            "The segment directory contradicts itself.");
    EXPECT_EQ(
        saidAfter([](FileHeader&, Entries& entries) { --entries[1].bytes; }),
        "The segment directory does not match the header.");
    EXPECT_EQ(saidAfter([](FileHeader& header, Entries&) { ++header.paths; }),
              "The segment directory does not match the header.");
}

TEST(SegmentDirectoryTest, ANewerVersionIsNamed) {
    Bytes end;
    FileHeader header = twoSegments().pack(end);
    header.version = 2;
    Bytes file;
    header.pack(file);
    try {
        SegmentDirectory::unpack(file);
        FAIL();
    } catch (const UnsupportedArchiveVersionException& error) {
        EXPECT_EQ(error.version(), 2U);
    }
}

}  // namespace
}  // namespace tessel::archive
