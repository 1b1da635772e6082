#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/FolderDecoder.hpp"
#include "archive/PathBuffer.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/archive/ChangedSegment.hpp"

namespace tessel::archive {
namespace {

using archives::OpenArchive;
using archives::Paths;

// The folders of 30 paths, each in its own; one of them is long.
Paths someFolders() {
    Paths folders;
    for (char c = 'a'; c < 'a' + 28; ++c)
        folders.push_back(std::string("usr/") + c + "/lib" + c + '/');
    folders[20] = "usr/" + std::string(300, 'u') + '/';
    folders[21] = folders[20] + "below/";
    folders[5] = "";
    return folders;
}

Paths pathsIn(Paths folders) {
    for (std::string& folder : folders) folder += 'x';
    return folders;
}

class FolderReader {
public:
    explicit FolderReader(const Segment& segment)
        : buffer_(segment.head().maxFolderBytes + FolderDecoder::slack),
          folders_(segment, buffer_.data()) {}

    FolderDecoder& operator*() { return folders_; }
    FolderDecoder* operator->() { return &folders_; }

private:
    PathBuffer buffer_;
    FolderDecoder folders_;
};

TEST(FolderDecoder, DecodesFoldersInAnyOrder) {
    const Paths expected = someFolders();
    const OpenArchive archive(pathsIn(expected));
    ASSERT_EQ(archive.segment().head().folders, expected.size());
    FolderReader folders(archive.segment());
    for (const std::uint32_t step : {1U, 3U, 27U})
        for (std::uint32_t i = 0; i < expected.size(); ++i) {
            const std::uint32_t f = i * step % 28;
            ASSERT_EQ(folders->at(f), expected[f]);
            ASSERT_EQ(folders->folder(), expected[f]);
            ASSERT_EQ(folders->at(f), expected[f]) << "again";
        }
}

TEST(FolderDecoder, KnowsTheEndOfABlock) {
    const OpenArchive archive(pathsIn(someFolders()));
    FolderReader folders(archive.segment());
    for (std::uint32_t f = 0; f < 28; ++f) {
        folders->at(f);
        EXPECT_EQ(folders->isAtEnd(), f % 8 == 7 || f == 27) << f;
    }
}

TEST(FolderDecoder, RefusesAFolderThatIsNotThere) {
    const OpenArchive archive(pathsIn(someFolders()));
    FolderReader folders(archive.segment());
    EXPECT_THROW(folders->at(28), DamagedArchiveException);
    EXPECT_THROW(folders->at(0xFFFFFFFE), DamagedArchiveException);
    EXPECT_EQ(folders->at(1), someFolders()[1]);
}

// Whatever the bits are: a folder within the longest length, or damage.
TEST(FolderDecoder, StaysWithinItsBoundsOnAnyBits) {
    const archives::Bytes archive = archives::archiveOf(pathsIn(someFolders()));
    const OpenArchive sound(pathsIn(someFolders()));
    const std::uint64_t bytes = sound.segment().bytesOf(Section::Folders);
    unsigned refused = 0;
    for (std::uint64_t at = 0; at < bytes; at += 3) {
        const archives::ChangedSegment changed(
            archive, archives::flip(Section::Folders, at, 0xFF));
        const Segment segment(changed.bytes(), changed.entry());
        FolderReader folders(segment);
        for (std::uint32_t f = 0; f < 28; ++f) try {
                EXPECT_LE(folders->at(f).size(), segment.head().maxFolderBytes);
            } catch (const DamagedArchiveException&) {
                ++refused;
            }
    }
    EXPECT_GT(refused, 0U);
}

}  // namespace
}  // namespace tessel::archive
