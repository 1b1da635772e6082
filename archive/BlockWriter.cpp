#include "archive/BlockWriter.hpp"

#include <algorithm>
#include <bit>

namespace tessel::archive {

FrontCodes::FrontCodes(const FrontCounts& counts) {
    for (std::size_t i = 0; i < operations.size(); ++i)
        operations[i] = SymbolCode(counts.operations[i], maxOperationCodeBits);
    for (std::size_t i = 0; i < replaced.size(); ++i)
        replaced[i] = SymbolCode(counts.replaced[i], maxReplacedCodeBits);
}

Blocks BlockWriter::writeNames(std::size_t chunk,
                               const std::vector<TokenRef>& steps) {
    step_ = steps.data();
    seen_ = list_.seenBeforeChunk(chunk);
    const std::size_t begin = chunk * FrontCoder::chunkItems;
    const std::size_t end =
        std::min(list_.names(), begin + FrontCoder::chunkItems);
    for (std::size_t place = begin; place < end; ++place) {
        if (place % FrontCoder::namesPerBlock == 0) {
            if (place > begin) endBlock();
            blocks_.newFolders.push_back(0);
        }
        putName(place);
    }
    endBlock();
    blocks_.bytes = bits_.take();
    return std::move(blocks_);
}

void BlockWriter::putName(std::size_t place) {
    putOperation(place);
    const NameCode& code = list_.nameCode(place);
    if (code.prefix > 0)
        codes_.replaced[code.replaced].put(bits_, list_.byteAfterPrefix(place));
    if (list_.hasPiece(place)) putPiece();
}

void BlockWriter::putOperation(std::size_t place) {
    const NameCode& code = list_.nameCode(place);
    const bool first = place % FrontCoder::namesPerBlock == 0;
    if (first) previous_ = operationNextFolder;
    const std::uint8_t context =
        first ? firstInBlock : operationContexts[previous_];
    codes_.operations[context].put(
        bits_, symbolOfOperation(code.operation, previous_));
    previous_ = code.operation;
    if (code.operation == operationNextFolder) {
        ++seen_;
        ++blocks_.newFolders.back();
    } else if (code.operation == operationJump) {
        const std::uint32_t distance = seen_ - list_.nameRef(place).folder;
        const unsigned symbol = jumpSymbol(distance);
        codes_.operations[jumpCode].put(bits_, symbol);
        bits_.put(distance - std::bit_floor(distance), symbol);
    } else if (code.operation == operationLongPrefix) {
        putLongPrefix(code.prefix);
    }
}

// An Elias gamma code (Elias 1975).
void BlockWriter::putLongPrefix(std::uint32_t prefix) {
    const std::uint32_t value = prefix - maxShortPrefix;
    const auto width = static_cast<unsigned>(std::bit_width(value));
    bits_.put(0, width - 1);
    bits_.put(value, width);
}

void BlockWriter::putPiece() {
    do {
        tokens_.put(bits_, *step_);
    } while (!step_++->isLast());
}

void BlockWriter::endBlock() {
    bits_.align();
    blocks_.lengths.push_back(
        static_cast<std::uint32_t>(bits_.bytes() - blockStart_));
    blockStart_ = bits_.bytes();
}

Blocks BlockWriter::writeFolders(std::size_t chunk,
                                 const std::vector<TokenRef>& steps) {
    step_ = steps.data();
    const std::size_t begin = chunk * FrontCoder::chunkItems;
    const std::size_t end =
        std::min(list_.folders(), begin + FrontCoder::chunkItems);
    for (std::size_t number = begin; number < end; ++number) {
        if (number % FrontCoder::foldersPerBlock == 0 && number > begin)
            endBlock();
        const std::uint32_t prefix = list_.folderPrefix(number);
        codes_.operations[folderPrefixCode].put(bits_, prefixSymbol(prefix));
        if (prefix > maxShortPrefix) putLongPrefix(prefix);
        putPiece();
    }
    endBlock();
    blocks_.bytes = bits_.take();
    return std::move(blocks_);
}

}  // namespace tessel::archive
