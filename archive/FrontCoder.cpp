#include "archive/FrontCoder.hpp"

#include <algorithm>
#include <functional>
#include <string_view>
#include <utility>

namespace tessel::archive {

namespace {

std::uint32_t sharedBytes(std::string_view a, std::string_view b) {
    const auto ends = std::mismatch(a.begin(), a.end(), b.begin(), b.end());
    return static_cast<std::uint32_t>(ends.first - a.begin());
}

}  // namespace

FrontCounts& FrontCounts::operator+=(const FrontCounts& other) {
    const auto add = [](auto& rows, const auto& others) {
        for (std::size_t r = 0; r < rows.size(); ++r)
            std::ranges::transform(rows[r], others[r], rows[r].begin(),
                                   std::plus<>());
    };
    add(operations, other.operations);
    add(replaced, other.replaced);
    pieceBytes += other.pieceBytes;
    return *this;
}

FrontCoder::FrontCoder(const SegmentList& list, Arrangement arrangement,
                       Workers& workers)
    : list_(list),
      arrangement_(std::move(arrangement)),
      codes_(arrangement_.names.size()),
      folderPrefixes_(list.folders().size()) {
    findSeenFolders();
    std::vector<FrontCounts> counts(workers.count());
    const std::size_t nameChunks = chunksOf(names());
    workers.run(nameChunks + chunksOf(folders()),
                [&](std::size_t chunk, unsigned worker) {
                    if (chunk < nameChunks)
                        codeNames(chunk, counts[worker]);
                    else
                        codeFolders(chunk - nameChunks, counts[worker]);
                });
    for (const FrontCounts& part : counts) counts_ += part;
    findLongest();
}

void FrontCoder::findSeenFolders() {
    std::uint32_t seen = 0;
    for (std::size_t place = 0; place < names(); ++place) {
        if (place % chunkItems == 0) seenBeforeChunk_.push_back(seen);
        seen = std::max(seen, nameRef(place).folder + 1);
    }
}

void FrontCoder::codeNames(std::size_t chunk, FrontCounts& counts) {
    std::uint32_t seen = seenBeforeChunk_[chunk];
    unsigned previous = operationNextFolder;
    const std::size_t end = std::min(names(), (chunk + 1) * chunkItems);
    for (std::size_t place = chunk * chunkItems; place < end; ++place) {
        const bool first = place % namesPerBlock == 0;
        if (first) previous = operationNextFolder;
        const NameCode code = codes_[place] = codeOf(place, seen);
        const std::uint8_t context =
            first ? firstInBlock : operationContexts[previous];
        ++counts
              .operations[context][symbolOfOperation(code.operation, previous)];
        if (code.operation == operationNextFolder) ++seen;
        if (code.operation == operationJump)
            ++counts.operations[jumpCode]
                               [jumpSymbol(seen - nameRef(place).folder)];
        if (code.prefix > 0)
            ++counts.replaced[code.replaced][byteAfterPrefix(place)];
        if (hasPiece(place)) counts.pieceBytes += namePiece(place).length;
        previous = code.operation;
    }
}

NameCode FrontCoder::codeOf(std::size_t place, std::uint32_t seen) const {
    const std::uint32_t folder = nameRef(place).folder;
    if (folder == seen) return {0, operationNextFolder, 0};
    const bool first = place % namesPerBlock == 0;
    const std::uint32_t current = first ? seen - 1 : nameRef(place - 1).folder;
    if (folder != current) return {0, operationJump, 0};
    if (first) return {0, 0, 0};
    return sharedPrefix(place);
}

NameCode FrontCoder::sharedPrefix(std::size_t place) const {
    const std::string_view before = list_.name(nameRef(place - 1));
    const std::uint32_t prefix =
        sharedBytes(before, list_.name(nameRef(place)));
    const std::uint8_t replaced =
        prefix == before.size()
            ? replacedEnd
            : replacedContexts[static_cast<std::uint8_t>(before[prefix])];
    return {prefix, static_cast<std::uint8_t>(prefixSymbol(prefix)), replaced};
}

void FrontCoder::codeFolders(std::size_t chunk, FrontCounts& counts) {
    const std::size_t end = std::min(folders(), (chunk + 1) * chunkItems);
    for (std::size_t number = chunk * chunkItems; number < end; ++number) {
        if (number % foldersPerBlock != 0)
            folderPrefixes_[number] =
                sharedBytes(folder(number - 1), folder(number));
        ++counts.operations[folderPrefixCode]
                           [prefixSymbol(folderPrefixes_[number])];
        counts.pieceBytes += folderPiece(number).length;
    }
}

void FrontCoder::findLongest() {
    for (const NameRef& name : arrangement_.names)
        maxNameBytes_ = std::max(maxNameBytes_, name.length);
    for (std::size_t number = 0; number < folders(); ++number)
        maxFolderBytes_ = std::max(
            maxFolderBytes_, static_cast<std::uint32_t>(folder(number).size()));
}

Piece FrontCoder::namePiece(std::size_t place) const noexcept {
    const NameRef& name = nameRef(place);
    const std::uint32_t prefix = codes_[place].prefix;
    return {list_.text() + name.start + prefix, name.length - prefix + 1,
            prefix > 0 ? firstTokenContext : std::uint8_t{NameStart}, false};
}

Piece FrontCoder::folderPiece(std::size_t number) const noexcept {
    const std::string_view text = folder(number);
    const std::uint32_t prefix = folderPrefixes_[number];
    const std::uint8_t context =
        prefix > 0 ? folderContexts[static_cast<std::uint8_t>(text[prefix - 1])]
                   : std::uint8_t{FolderStart};
    return {text.data() + prefix,
            static_cast<std::uint32_t>(text.size()) - prefix + 1, context,
            true};
}

}  // namespace tessel::archive
