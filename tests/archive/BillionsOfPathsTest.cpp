// Archives whose numbers and offsets go beyond 32 bits. Nearly all of their
// segments are one and the same, mapped again and again: it claims eight
// million names, of which nobody asks for any.
#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <stdexcept>
#include <string>
#include <vector>

#include "archive/PathArchive.hpp"
#include "archive/SegmentDirectory.hpp"
#include "tests/archive/ChangedSegment.hpp"

namespace {

using archives::Bytes;
using archives::ChangedSegment;
using archives::Paths;
using tessel::NumberRange;
using tessel::PathArchive;
using tessel::archive::Section;
using tessel::archive::SegmentHead;

constexpr std::uint64_t border = std::uint64_t{1} << 32;
constexpr std::size_t pageBytes = 4096;

// Gives a section that many bytes; the new ones are zero.
void resize(SegmentHead& head, Bytes& body, Section section,
            std::uint64_t bytes) {
    const std::uint64_t before = head.bytesOf(section);
    const auto end = static_cast<std::ptrdiff_t>(
        head.offsetOf(section) + tessel::archive::aligned8(before));
    const std::uint64_t more =
        tessel::archive::aligned8(bytes) - tessel::archive::aligned8(before);
    body.insert(body.begin() + end, more, 0);
    head.sectionBytes[static_cast<std::size_t>(section)] = bytes;
}

// A segment of whole pages that claims so many paths in the folder "unread/",
// which comes after all that is asked for: no search reads more of it than the
// first blocks, which are there. The names claim so much room that some hundred
// segments go beyond 4 GiB.
Bytes filler(std::uint64_t paths) {
    constexpr std::uint64_t nameBytes = std::uint64_t{8} << 20;
    const auto enlarge = [paths](SegmentHead& head, Bytes& body) {
        EXPECT_EQ(head.order, tessel::archive::ListOrder::Sorted);
        const std::uint64_t perGroup =
            tessel::archive::blocksPerGroup * head.namesPerBlock;
        head.paths = paths;
        resize(head, body, Section::NameGroups,
               (paths + perGroup - 1) / perGroup *
                   tessel::archive::nameGroupBytes);
        resize(head, body, Section::Names, nameBytes);
        while (head.segmentBytes() % pageBytes != 0)
            resize(head, body, Section::Names,
                   head.bytesOf(Section::Names) + 8);
    };
    Paths begin;
    for (int i = 100; i < 200; ++i)
        begin.push_back("unread/" + std::to_string(i));
    return ChangedSegment(begin, enlarge).bytes();
}

// Memory of which only what is touched is there.
class Reserved {
public:
    explicit Reserved(std::size_t bytes)
        : bytes_(bytes),
          memory_(static_cast<std::uint8_t*>(
              ::mmap(nullptr, bytes, PROT_READ | PROT_WRITE,
                     MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0))) {
        if (memory_ == MAP_FAILED) throw std::bad_alloc();
    }
    Reserved(const Reserved&) = delete;
    Reserved& operator=(const Reserved&) = delete;
    ~Reserved() { ::munmap(memory_, bytes_); }

    std::uint8_t* at(std::size_t offset) const { return memory_ + offset; }

    // Whole pages with these bytes at each of the offsets, there once.
    void showAt(const std::vector<std::size_t>& offsets, const Bytes& bytes) {
        const int file = ::memfd_create("pages", 0);
        ASSERT_EQ(::write(file, bytes.data(), bytes.size()),
                  static_cast<ssize_t>(bytes.size()));
        for (const std::size_t offset : offsets)
            ASSERT_NE(::mmap(at(offset), bytes.size(), PROT_READ,
                             MAP_SHARED | MAP_FIXED, file, 0),
                      MAP_FAILED);
        ::close(file);
    }

private:
    std::size_t bytes_;
    std::uint8_t* memory_;
};

// An archive of fillers, then of one segment of these paths, numbered from
// `first` on.
class HugeArchive {
public:
    HugeArchive(const Paths& paths, const tessel::ArchiveOptions& options,
                std::uint64_t first)
        : memory_(std::size_t{8} << 30) {
        constexpr std::uint64_t most = tessel::archive::maxPathsPerSegment;
        // The first segment begins with a page.
        begin_ = pageBytes - tessel::archive::fileHeaderBytes;
        const Bytes full = filler(most);
        std::vector<std::size_t> places;
        for (; directory_.paths() + most <= first;
             directory_.add(full.size(), most))
            places.push_back(begin_ + directory_.end());
        memory_.showAt(places, full);
        const Bytes rest = filler(first - directory_.paths());
        add(rest, first - directory_.paths());
        lastOffset_ = directory_.end();
        const ChangedSegment last(paths, options, [](auto&, auto&) {});
        add(last.bytes(), paths.size());
        finish();
    }

    PathArchive open() const {
        return PathArchive::over({memory_.at(begin_), bytes_});
    }
    std::uint64_t lastOffset() const { return lastOffset_; }
    // The byte of the archive at this offset.
    std::uint8_t& byte(std::uint64_t offset) {
        return *memory_.at(begin_ + offset);
    }

private:
    void add(const Bytes& segment, std::uint64_t paths) {
        std::memcpy(memory_.at(begin_ + directory_.end()), segment.data(),
                    segment.size());
        directory_.add(segment.size(), paths);
    }
    void finish() {
        Bytes end;
        Bytes header;
        directory_.pack(end).pack(header);
        std::memcpy(memory_.at(begin_), header.data(), header.size());
        std::memcpy(memory_.at(begin_ + directory_.end()), end.data(),
                    end.size());
        bytes_ = directory_.end() + end.size();
    }

    Reserved memory_;
    tessel::archive::SegmentDirectory directory_;
    std::size_t begin_ = 0;
    std::size_t bytes_ = 0;
    std::uint64_t lastOffset_ = 0;
};

// Stored in each of the orders, with paths that repeat.
struct Kind {
    const char* name;
    Paths paths;
    tessel::ArchiveIndex index;
};

std::vector<Kind> kinds() {
    Paths sorted;
    for (int i = 10; i < 50; ++i)
        sorted.push_back("real/" + std::to_string(i / 5) + "/f" +
                         std::to_string(i));
    sorted.push_back(sorted.back());
    Paths asGiven = sorted;
    std::rotate(asGiven.begin(), asGiven.begin() + 17, asGiven.end());
    return {{"sorted", sorted, tessel::ArchiveIndex::None},
            {"as given", asGiven, tessel::ArchiveIndex::None},
            {"rearranged", archives::shuffled(sorted),
             tessel::ArchiveIndex::WhereNeeded},
            {"without an index", archives::shuffled(sorted),
             tessel::ArchiveIndex::None}};
}

tessel::ArchiveOptions optionsOf(const Kind& kind) {
    tessel::ArchiveOptions options;
    options.index = kind.index;
    return options;
}

// A segment that the border is in, and one beyond it.
constexpr std::uint64_t firstNumbers[] = {border - 5, border + 1000};

void expectPathsByNumber(const PathArchive& archive, const Paths& paths) {
    const std::uint64_t first = archive.size() - paths.size();
    std::vector<std::uint64_t> numbers;
    for (std::uint64_t i = paths.size(); i > 0; --i) {
        ASSERT_EQ(archive[first + i - 1], paths[i - 1]) << i;
        numbers.push_back(first + i - 1);
    }
    std::size_t at = 0;
    archive.read(numbers, [&](std::uint64_t number, std::string_view path) {
        ASSERT_EQ(number, numbers[at++]);
        ASSERT_EQ(path, paths[number - first]);
    });
    ASSERT_EQ(at, numbers.size());
    for (std::uint64_t from = first; from <= archive.size(); ++from) {
        std::uint64_t next = from;
        archive.forEach(from, archive.size(),
                        [&](std::uint64_t number, std::string_view path) {
                            ASSERT_EQ(number, next++);
                            ASSERT_EQ(path, paths[number - first]);
                        });
        ASSERT_EQ(next, archive.size());
    }
    EXPECT_THROW(archive[archive.size()], std::out_of_range);
}

void expectSearches(const PathArchive& archive, const Paths& paths) {
    const std::uint64_t first = archive.size() - paths.size();
    std::vector<std::uint64_t> all;
    std::vector<std::uint64_t> some;
    for (std::size_t i = 0; i < paths.size(); ++i) {
        const auto found = std::find(paths.begin(), paths.end(), paths[i]);
        ASSERT_EQ(archive.numberOf(paths[i]),
                  first + static_cast<std::uint64_t>(found - paths.begin()));
        all.push_back(first + i);
        if (paths[i].find('3') != std::string::npos) some.push_back(first + i);
    }
    EXPECT_EQ(archive.numberOf("real/2/f9"), std::nullopt);
    EXPECT_EQ(archive.folder("real"),
              (std::vector<NumberRange>{{first, first + paths.size()}}));
    tessel::FindOptions below;
    below.folder = "real";
    EXPECT_EQ(archive.find("3", below), some);
    EXPECT_EQ(archive.find([](std::string_view) { return true; }, below), all);
}

TEST(BillionsOfPaths, NumbersBeyond32BitsLeadToTheirPaths) {
    for (const std::uint64_t first : firstNumbers)
        for (const Kind& kind : kinds()) {
            SCOPED_TRACE(kind.name);
            const HugeArchive huge(kind.paths, optionsOf(kind), first);
            EXPECT_GT(huge.lastOffset(), border);
            const PathArchive archive = huge.open();
            EXPECT_EQ(archive.size(), first + kind.paths.size());
            EXPECT_EQ(archive.info().paths, archive.size());
            expectPathsByNumber(archive, kind.paths);
            expectSearches(archive, kind.paths);
        }
}

// The first byte of the last segment's names.
TEST(BillionsOfPaths, DamageBeyond4GibibytesIsNamed) {
    const Kind kind = kinds().front();
    HugeArchive huge(kind.paths, optionsOf(kind), border - 5);
    const SegmentHead head = SegmentHead::unpack(
        {&huge.byte(huge.lastOffset()), tessel::archive::segmentHeadBytes});
    const std::uint64_t offset = huge.lastOffset() + head.segmentBytes() -
                                 head.bodyBytes() +
                                 head.offsetOf(Section::Names);
    huge.byte(offset) ^= 1U;
    try {
        static_cast<void>(huge.open()[border]);
        ADD_FAILURE() << "damage went unnoticed";
    } catch (const tessel::DamagedArchiveException& damage) {
        EXPECT_GT(damage.offset(), border);
        EXPECT_LE(damage.offset(), offset);
        EXPECT_LT(offset - damage.offset(), pageBytes);
    }
}

}  // namespace
