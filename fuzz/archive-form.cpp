// An archive with any content under right checksums. The input is an archive
// whose checksums are mended before it is opened, so that the engine reaches
// the readers that follow. Every operation answers or throws
// DamagedArchiveException, and the operations agree with each other.
#include <algorithm>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/ArchiveWriter.hpp"
#include "archive/Format.hpp"
#include "archive/PathArchive.hpp"
#include "archive/SumTree.hpp"
#include "fuzz/Input.hpp"

namespace {

using namespace tessel;
using Bytes = std::vector<std::uint8_t>;

constexpr std::size_t maxShownPaths = 3000;
constexpr std::uint64_t maxTextShown = std::uint64_t{1} << 22;

// ---- Mending ----

std::uint64_t load64(const Bytes& bytes, std::uint64_t at) {
    std::uint64_t value = 0;
    for (std::size_t i = 0; i < 8; ++i)
        value |= std::uint64_t{bytes[at + i]} << (8 * i);
    return value;
}

void store64(Bytes& bytes, std::uint64_t at, std::uint64_t value) {
    for (std::size_t i = 0; i < 8; ++i)
        bytes[at + i] = static_cast<std::uint8_t>(value >> (8 * i));
}

void mendSum(Bytes& bytes, std::uint64_t begin, std::uint64_t end,
             std::uint64_t seed) {
    store64(bytes, end,
            archive::sumOf(std::span(bytes).subspan(begin, end - begin), seed));
}

// Offsets of fields, as in docs/archive-format.md.
constexpr std::uint64_t fileSizeField = 16;
constexpr std::uint64_t segmentsField = 32;
constexpr std::uint64_t directoryField = 40;
constexpr std::uint64_t headerSum = 56;
constexpr std::uint64_t pieceShiftField = 8;
constexpr std::uint64_t segmentSizeField = 40;
constexpr std::uint64_t sectionSizesField = 48;
constexpr std::uint64_t topSumField = 240;
constexpr std::uint64_t headSum = 248;

// Makes the sums of a segment right, if its sections fill it.
void mendSegment(Bytes& bytes, std::uint64_t begin, std::uint64_t size) {
    if (size < archive::segmentHeadBytes) return;
    const unsigned shift = bytes[begin + pieceShiftField];
    store64(bytes, begin + segmentSizeField, size);
    std::uint64_t body = archive::bodyGuardBytes;
    for (std::uint64_t i = 0; i < archive::sectionCount; ++i) {
        const auto section = load64(bytes, begin + sectionSizesField + 8 * i);
        if (section > size) return;
        body += archive::aligned8(section);
    }
    if (shift >= 9 && shift <= 12) {
        const std::uint64_t stored = archive::SumTree::storedBytes(body, shift);
        if (archive::segmentHeadBytes + stored + body == size) {
            const auto content =
                std::span(bytes).subspan(begin + size - body, body);
            std::vector<std::uint64_t> sums(
                archive::SumTree::piecesIn(body, shift));
            for (std::size_t i = 0; i < sums.size(); ++i)
                sums[i] = archive::SumTree::pieceSum(content, shift, 0, i);
            const auto levels =
                archive::SumTree::levelsAbove(std::move(sums), shift);
            std::copy(levels.stored.begin(), levels.stored.end(),
                      bytes.begin() + static_cast<std::ptrdiff_t>(
                                          begin + archive::segmentHeadBytes));
            store64(bytes, begin + topSumField, levels.top);
        }
    }
    mendSum(bytes, begin, begin + headSum, 0);
}

// Makes the magic, the size and every checksum that can be found right.
void mend(Bytes& bytes) {
    if (bytes.size() < archive::fileHeaderBytes) return;
    std::copy(archive::fileMagic.begin(), archive::fileMagic.end(),
              bytes.begin());
    store64(bytes, fileSizeField, bytes.size());
    const std::uint64_t segments = load64(bytes, segmentsField);
    const std::uint64_t entries = bytes.size() - archive::fileHeaderBytes;
    if (segments <= entries / archive::segmentEntryBytes) {
        const std::uint64_t directory =
            bytes.size() - archive::segmentEntryBytes * segments;
        store64(bytes, directoryField, directory);
        for (std::uint64_t i = 0; i < segments; ++i) {
            const std::uint64_t entry =
                directory + archive::segmentEntryBytes * i;
            const std::uint64_t offset = load64(bytes, entry);
            const std::uint64_t size = load64(bytes, entry + 8);
            if (offset >= archive::fileHeaderBytes && offset <= directory &&
                size <= directory - offset)
                mendSegment(bytes, offset, size);
            mendSum(bytes, entry, entry + 32, i);
        }
    }
    mendSum(bytes, 0, headerSum, 0);
}

// ---- Reading ----

// The paths of the archive, up to a bound; nothing if it is damaged.
std::optional<std::vector<std::string>> firstPaths(const PathArchive& archive) {
    std::vector<std::string> paths;
    std::uint64_t text = 0;
    try {
        archive.forEach([&](std::uint64_t number, std::string_view path) {
            fuzz::require(number == paths.size(), "numbers are ascending");
            paths.emplace_back(path);
            text += path.size();
            return paths.size() < maxShownPaths && text < maxTextShown;
        });
    } catch (const DamagedArchiveException&) {
        return std::nullopt;
    }
    return paths;
}

template <class Operation>
void attempt(Operation operation) {
    try {
        operation();
    } catch (const DamagedArchiveException&) {
    }
}

void compareWithPaths(const PathArchive& archive,
                      const std::vector<std::string>& paths) {
    const std::size_t step = 1 + paths.size() / 40;
    for (std::size_t i = 0; i < paths.size(); i += step) {
        fuzz::require(archive[i] == paths[i], "a path is the same by number");
        attempt([&] { static_cast<void>(archive.numberOf(paths[i])); });
    }
}

// Opening does not check each path, nor the orders that searches rely on. What
// breaks them is damage that a verification finds.
void expectSoundPaths(const PathArchive& archive,
                      const std::vector<std::string>& paths) {
    if (paths.size() != archive.size() || !archive.findDamage().empty()) return;
    for (const std::string& path : paths) {
        const auto first = static_cast<std::uint64_t>(
            std::ranges::find(paths, path) - paths.begin());
        fuzz::require(!path.empty(), "no path is empty");
        fuzz::require(archive.numberOf(path) == first,
                      "the number of a path is its first");
    }
}

void searchEverywhere(const PathArchive& archive) {
    FindOptions options;
    options.threads = 1;
    std::size_t found = 0;
    const auto few = [&](std::uint64_t, std::string_view path) {
        fuzz::require(path.find('a') != std::string_view::npos,
                      "a found path holds it");
        return ++found < maxShownPaths;
    };
    const std::string_view texts[] = {"a"};
    attempt([&] { archive.findEach(texts, few, options); });
    attempt([&] { static_cast<void>(archive.folder("usr")); });
    attempt([&] { static_cast<void>(archive.numberOf("usr/share/x")); });
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    Bytes bytes(data, data + size);
    mend(bytes);
    std::size_t salvaged = 0;
    attempt([&] {
        try {
            PathArchive::salvage(bytes, [&](std::uint64_t, std::string_view) {
                return ++salvaged < maxShownPaths;
            });
        } catch (const UnsupportedArchiveVersionException&) {
        }
    });
    try {
        const PathArchive archive = PathArchive::over(bytes);
        if (const auto paths = firstPaths(archive))
            attempt([&] {
                compareWithPaths(archive, *paths);
                expectSoundPaths(archive, *paths);
            });
        searchEverywhere(archive);
        if (archive.size() <= maxShownPaths) attempt([&] { archive.verify(); });
    } catch (const DamagedArchiveException&) {
    } catch (const UnsupportedArchiveVersionException&) {
    }
    return 0;
}
