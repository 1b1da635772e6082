#include "paths/StoreForm.hpp"

#include <zlib.h>

#include <algorithm>
#include <array>
#include <string>

#include "coder/HuffmanPathTree.hpp"
#include "packing/sixpacks.hpp"
#include "paths/PathStore.hpp"

namespace tessel::paths {

namespace {

using sixpacks::ByteCursor;
using sixpacks::PackedSizeT;

constexpr std::array<std::uint8_t, 8> magic = {0x89, 'T', 'E', 'S',
                                               'S',  'E', 'L', '\n'};
constexpr std::uint64_t version = 1;
constexpr std::size_t checksumBytes = 4;

void putUint(std::uint64_t value, PackedSizeT width,
             std::vector<std::uint8_t>& out) {
    for (std::size_t i = 0; i < sixpacks::widthBytes(width); ++i)
        out.push_back(static_cast<std::uint8_t>(value >> (8 * i)));
}

std::uint32_t checksumOf(std::span<const std::uint8_t> bytes) {
    return static_cast<std::uint32_t>(crc32_z(0, bytes.data(), bytes.size()));
}

// Takes the checksum off the end, which must be right.
std::span<const std::uint8_t> checkedBody(std::span<const std::uint8_t> bytes) {
    if (bytes.size() < checksumBytes) throw DamagedFormException();
    const auto body = bytes.first(bytes.size() - checksumBytes);
    if (sixpacks::fromLittleEndian(bytes.last(checksumBytes)) !=
        checksumOf(body))
        throw DamagedFormException();
    return body;
}

void checkVersion(std::span<const std::uint8_t> bytes) {
    ByteCursor cursor(bytes);
    if (!std::ranges::equal(cursor.take(magic.size()), magic))
        throw DamagedFormException();
    const std::uint64_t found = cursor.takeUint(PackedSizeT::Uint32);
    if (found == 0) throw DamagedFormException();
    if (found > version)
        throw UnsupportedStoreVersionException(
            "The saved store has version " + std::to_string(found) +
            "; this library reads up to version " + std::to_string(version) +
            ".");
}

std::u16string takeTreeString(ByteCursor& cursor) {
    const std::uint64_t units = cursor.takeUint(PackedSizeT::Uint32);
    cursor.requireItems(units, sizeof(char16_t));
    std::u16string text;
    text.reserve(units);
    for (std::uint64_t i = 0; i < units; ++i)
        text.push_back(
            static_cast<char16_t>(cursor.takeUint(PackedSizeT::Uint16)));
    return text;
}

// True if every number from 1 to pathCount lies in a partition with a track,
// and there are no more of them than there can be paths.
bool hasSoundNumbers(const HuffmanPathTree& coder, std::uint64_t maxPaths) {
    std::uint64_t last = 0;
    for (const std::uint64_t end : coder.partitionEnds) {
        if (end <= last) return false;
        last = end;
    }
    return coder.partitionTracks.size() == coder.partitionEnds.size() &&
           coder.duplicates.empty() && last == coder.pathCount &&
           last <= maxPaths;
}

// The coder of a stored form, which may be hostile.
std::unique_ptr<HuffmanPathTree> coderFrom(std::vector<std::uint8_t> form,
                                           const std::u16string& treeString) {
    auto coder = std::make_unique<HuffmanPathTree>();
    try {
        coder->deserialize(form, true);
    } catch (const InvalidUintConversionException&) {
        throw DamagedFormException();
    } catch (const UnknownNodeTypeException&) {
        throw DamagedFormException();
    }
    // A code of one character would encode every path to come as nothing.
    if (coder->boolTree.size() == 1) throw DamagedFormException();
    if (!treeString.empty() || !coder->boolTree.empty())
        coder->inflateHuffman(treeString);
    return coder;
}

}  // namespace

std::vector<std::uint8_t> packStore(const HuffmanPathTree& coder) {
    const std::u16string treeString = coder.getTreeString();
    std::vector<std::uint8_t> form;
    coder.serialize(form, true);
    std::vector<std::uint8_t> out(magic.begin(), magic.end());
    putUint(version, PackedSizeT::Uint32, out);
    putUint(treeString.size(), PackedSizeT::Uint32, out);
    for (const char16_t unit : treeString)
        putUint(unit, PackedSizeT::Uint16, out);
    putUint(form.size(), PackedSizeT::Uint64, out);
    out.insert(out.end(), form.begin(), form.end());
    putUint(checksumOf(out), PackedSizeT::Uint32, out);
    return out;
}

std::unique_ptr<HuffmanPathTree> unpackStore(
    std::span<const std::uint8_t> bytes) {
    checkVersion(bytes);
    ByteCursor cursor(checkedBody(bytes));
    cursor.take(magic.size() + 4);
    const std::u16string treeString = takeTreeString(cursor);
    const auto formBytes = cursor.take(cursor.takeUint(PackedSizeT::Uint64));
    if (!cursor.empty()) throw DamagedFormException();

    auto coder = coderFrom({formBytes.begin(), formBytes.end()}, treeString);
    // A path takes at least a byte of the payload, whose length comes first.
    const std::uint64_t maxPaths =
        ByteCursor(formBytes).takeUint(PackedSizeT::Uint64);
    if (!hasSoundNumbers(*coder, maxPaths)) throw DamagedFormException();
    return coder;
}

}  // namespace tessel::paths
