// The saved form of a store, byte for byte, and bytes that are none.

#include <gtest/gtest.h>
#include <zlib.h>

#include <string>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "paths/PathStore.hpp"
#include "paths/StoreForm.hpp"

namespace {

using tessel::DamagedFormException;
using tessel::HuffmanPathTree;
using tessel::PathStore;
using tessel::UnsupportedStoreVersionException;
using Bytes = std::vector<std::uint8_t>;
using Strings = std::vector<std::string>;

constexpr std::size_t versionAt = 8;
constexpr std::size_t unitCountAt = 12;
constexpr std::size_t treeStringAt = 16;

PathStore sampleStore() {
    return PathStore::from(Strings{"/a/b", "/a/c", "d", "/a/\xFF/", "/a/b"});
}

void putUint(Bytes& bytes, std::size_t at, std::uint64_t value,
             std::size_t width) {
    for (std::size_t i = 0; i < width; ++i)
        bytes[at + i] = static_cast<std::uint8_t>(value >> (8 * i));
}

std::uint64_t uintAt(const Bytes& bytes, std::size_t at, std::size_t width) {
    std::uint64_t value = 0;
    for (std::size_t i = width; i-- > 0;) value = value << 8U | bytes[at + i];
    return value;
}

// Makes the checksum right.
Bytes mended(Bytes bytes) {
    const std::size_t body = bytes.size() - 4;
    putUint(bytes, body, crc32_z(0, bytes.data(), body), 4);
    return bytes;
}

// The envelope of a tree string and a form.
Bytes enveloped(const std::u16string& treeString, const Bytes& form) {
    Bytes bytes = {0x89, 'T', 'E', 'S', 'S', 'E', 'L', '\n', 1, 0, 0, 0};
    bytes.resize(treeStringAt + 2 * treeString.size() + 8);
    putUint(bytes, unitCountAt, treeString.size(), 4);
    for (std::size_t i = 0; i < treeString.size(); ++i)
        putUint(bytes, treeStringAt + 2 * i, treeString[i], 2);
    putUint(bytes, bytes.size() - 8, form.size(), 8);
    bytes.insert(bytes.end(), form.begin(), form.end());
    bytes.resize(bytes.size() + 4);
    return mended(bytes);
}

// Reads whatever the bytes hold; the documented exceptions are fine.
void readWhatIsThere(const Bytes& bytes) {
    try {
        const PathStore store = PathStore::load(bytes);
        std::size_t visited = 0;
        for (const std::string_view path : store) {
            visited += path.size();
            if (visited > 1'000'000) break;
        }
        store.forEachInTreeOrder([](std::string_view) {});
    } catch (const DamagedFormException&) {
    } catch (const UnsupportedStoreVersionException&) {
    }
}

TEST(StoreForm, IsAnEnvelopeAroundTheCodersForm) {
    const PathStore store = sampleStore();
    Bytes form;
    store.coder().serialize(form, true);
    EXPECT_EQ(store.save(), enveloped(store.coder().getTreeString(), form));
}

// The example of docs/format.md.
TEST(StoreForm, TheExampleIsWrittenAsDocumented) {
    const Bytes expected = {
        0x89, 0x54, 0x45, 0x53, 0x53, 0x45, 0x4C, 0x0A,  // magic
        1,    0,    0,    0,                             // version
        4,    0,    0,    0,                             // code units
        0x62, 0,    0x61, 0,    0x2F, 0,    0x00, 0xDC,  // tree string
        0x36, 0,    0,    0,    0,    0,    0,    0,     // form length
        0x43, 0,    0,    0,    0,    0,    0,    0,     // payload length
        0x78, 0xDA, 0x63, 0x62, 0x80, 0x80, 0x2C, 0x76,  // zlib stream
        0x56, 0x28, 0x8B, 0x99, 0x89, 0x81, 0x91, 0x01,  //
        0xC6, 0x61, 0x60, 0xE2, 0x65, 0x05, 0xF2, 0x99,  //
        0x98, 0x98, 0x99, 0xD8, 0x41, 0x12, 0x8C, 0x40,  //
        0x11, 0x20, 0x1B, 0x26, 0x0B, 0x54, 0xC9, 0xC8,  //
        0x08, 0x00, 0x23, 0xC1, 0x00, 0xBE,              //
        0x31, 0x71, 0x55, 0x6A,                          // checksum
    };
    const Strings paths = {"a/b", "a/ba", "b"};
    EXPECT_EQ(PathStore::from(paths).save(), expected);
    Strings read;
    for (const std::string_view path : PathStore::load(expected))
        read.emplace_back(path);
    EXPECT_EQ(read, paths);
}

TEST(StoreForm, OfAnEmptyStoreHasNoTreeString) {
    Bytes form;
    HuffmanPathTree().serialize(form, true);
    EXPECT_EQ(PathStore().save(), enveloped(u"", form));
}

TEST(StoreForm, EveryCutIsRefused) {
    const Bytes bytes = sampleStore().save();
    for (std::size_t size = 0; size < bytes.size(); ++size)
        EXPECT_THROW(PathStore::load(std::span(bytes).first(size)),
                     DamagedFormException)
            << size;
    Bytes longer = bytes;
    longer.push_back(0);
    EXPECT_THROW(PathStore::load(longer), DamagedFormException);
    EXPECT_THROW(PathStore::load(mended(longer)), DamagedFormException);
}

TEST(StoreForm, EveryFlippedBitIsRefused) {
    const Bytes bytes = sampleStore().save();
    for (std::size_t bit = 0; bit < 8 * bytes.size(); ++bit) {
        Bytes flipped = bytes;
        flipped[bit / 8] ^= static_cast<std::uint8_t>(1U << bit % 8);
        const bool inVersion = bit / 8 >= versionAt && bit / 8 < unitCountAt &&
                               bit != 8 * versionAt;
        if (inVersion)
            EXPECT_THROW(PathStore::load(flipped),
                         UnsupportedStoreVersionException);
        else
            EXPECT_THROW(PathStore::load(flipped), DamagedFormException) << bit;
    }
}

TEST(StoreForm, EveryByteChangedWithARightChecksumIsSafe) {
    const Bytes bytes = sampleStore().save();
    for (std::size_t at = 0; at + 4 < bytes.size(); ++at)
        for (const unsigned value : {0U, 1U, 0x7FU, 0x80U, 0xFFU}) {
            Bytes changed = bytes;
            changed[at] = static_cast<std::uint8_t>(value);
            readWhatIsThere(mended(changed));
        }
}

TEST(StoreForm, EveryByteOfThePayloadChangedIsSafe) {
    const PathStore store = sampleStore();
    Bytes form;
    store.coder().serialize(form, false);
    const Bytes payload(form.begin() + 8, form.end());
    for (std::size_t at = 0; at < payload.size(); ++at)
        for (const unsigned value : {0U, 1U, 2U, 0x7FU, 0x80U, 0xFFU}) {
            Bytes changed = payload;
            changed[at] = static_cast<std::uint8_t>(value);
            Bytes compressed(8);
            putUint(compressed, 0, changed.size(), 8);
            const Bytes stream = tessel::sixpacks::compressUint8(changed);
            compressed.insert(compressed.end(), stream.begin(), stream.end());
            readWhatIsThere(
                enveloped(store.coder().getTreeString(), compressed));
        }
}

TEST(StoreForm, ALaterVersionIsRefusedByName) {
    Bytes bytes = sampleStore().save();
    putUint(bytes, versionAt, 7, 4);
    try {
        PathStore::load(mended(bytes));
        FAIL() << "nothing was thrown";
    } catch (const UnsupportedStoreVersionException& error) {
        EXPECT_STREQ(error.what(),
                     "The saved store has version 7; this library reads up to "
                     "version 1.");
    }
    putUint(bytes, versionAt, 0, 4);
    EXPECT_THROW(PathStore::load(mended(bytes)), DamagedFormException);
}

TEST(StoreForm, LengthsBeyondTheEndAreRefused) {
    const Bytes bytes = sampleStore().save();
    for (const std::uint64_t units : {0xFFFFFFFFU, 0x7FFFFFFFU, 1'000U}) {
        Bytes changed = bytes;
        putUint(changed, unitCountAt, units, 4);
        EXPECT_THROW(PathStore::load(mended(changed)), DamagedFormException);
    }
    const std::size_t lengthAt =
        treeStringAt + 2 * uintAt(bytes, unitCountAt, 4);
    for (const std::uint64_t length : {~std::uint64_t{0}, std::uint64_t{1}}) {
        Bytes changed = bytes;
        putUint(changed, lengthAt, length, 8);
        EXPECT_THROW(PathStore::load(mended(changed)), DamagedFormException);
    }
}

TEST(StoreForm, ATreeStringOfAnotherCodeIsRefused) {
    const PathStore store = sampleStore();
    Bytes form;
    store.coder().serialize(form, true);
    const std::u16string treeString = store.coder().getTreeString();
    EXPECT_THROW(PathStore::load(enveloped(treeString + u'x', form)),
                 DamagedFormException);
    EXPECT_THROW(PathStore::load(enveloped(treeString.substr(1), form)),
                 DamagedFormException);
    EXPECT_THROW(PathStore::load(enveloped(u"", form)), DamagedFormException);
}

// The form of a coder with the given content.
template <class Fill>
Bytes formOf(Fill fill) {
    HuffmanPathTree coder;
    const std::vector<double> weights = {2, 1, 1};
    coder.deflateHuffman(weights.data(), u"abc");
    fill(coder);
    Bytes form;
    coder.serialize(form, true);
    return enveloped(coder.getTreeString(), form);
}

TEST(StoreForm, NumbersThatLieInNoPartitionAreRefused) {
    const auto whole = [](HuffmanPathTree& coder) {
        for (int i = 0; i < 2; ++i) {
            tessel::Components path{coder.generateCodeFor(u"ab")};
            coder.addPathToBTree(path);
        }
    };
    EXPECT_THROW(PathStore::load(formOf(whole)), DamagedFormException);
    const auto emptyBatch = [](HuffmanPathTree& coder) {
        HuffmanPathTree::FolderTexts folders = {{u"a"}};
        HuffmanPathTree::FolderTexts files = {{}};
        coder.generateCodeAsyncAndAddPaths(folders, files);
    };
    EXPECT_THROW(PathStore::load(formOf(emptyBatch)), DamagedFormException);
}

// Whoever adds to such a store would count past the last number.
TEST(StoreForm, MorePathsThanTheFormHasBytesAreRefused) {
    const auto withEnd = [](std::uint64_t end) {
        return formOf([end](HuffmanPathTree& coder) {
            HuffmanPathTree::FolderTexts folders = {{u"a"}};
            HuffmanPathTree::FolderTexts files = {{u"b"}};
            coder.generateCodeAsyncAndAddPaths(folders, files);
            coder.partitionEnds.back() = coder.pathCount = end;
        });
    };
    EXPECT_EQ(PathStore::load(withEnd(1)).size(), 1U);
    EXPECT_THROW(PathStore::load(withEnd(1000)), DamagedFormException);
    EXPECT_THROW(PathStore::load(withEnd(~std::uint64_t{0})),
                 DamagedFormException);
}

// Such a code encodes all texts of its character alike: paths that were added
// to the store would not come back.
TEST(StoreForm, ACodeOfOneCharacterIsRefused) {
    HuffmanPathTree coder;
    coder.boolTree = {true};
    Bytes form;
    coder.serialize(form, true);
    EXPECT_THROW(PathStore::load(enveloped(u"a", form)), DamagedFormException);
}

TEST(StoreForm, NamesThatAreNoPathsAreRefusedWhenRead) {
    HuffmanPathTree coder;
    const std::vector<double> weights = {2, 1};
    coder.deflateHuffman(weights.data(), std::u16string{u'a', 0xD800});
    HuffmanPathTree::FolderTexts folders = {{u"a"}};
    HuffmanPathTree::FolderTexts files = {{u"a", std::u16string(1, 0xD800)}};
    coder.generateCodeAsyncAndAddPaths(folders, files);
    Bytes form;
    coder.serialize(form, true);
    const PathStore store =
        PathStore::load(enveloped(coder.getTreeString(), form));
    EXPECT_EQ(store[0], "aa");
    std::string text = "kept";
    EXPECT_THROW(store.read(1, text), DamagedFormException);
    EXPECT_EQ(text, "kept");
    EXPECT_THROW(store.forEachInTreeOrder([](std::string_view) {}),
                 DamagedFormException);
}

}  // namespace
