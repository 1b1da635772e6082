#include "archive/FolderDecoder.hpp"

namespace tessel::archive {

std::string_view FolderDecoder::at(std::uint32_t folder) {
    if (folder + 1 == next_) return this->folder();
    if (folder < next_ || folder >= blockEnd_) start(folder);
    while (next_ <= folder) decodeNext();
    return this->folder();
}

// Goes to the start of the folder's block. If it throws, nothing is decoded.
void FolderDecoder::start(std::uint32_t folder) {
    next_ = blockEnd_ = 0;
    if (folder >= head().folders)
        fail(position_, "A name is in a folder that is not there.");
    const std::uint32_t block = folder / perBlock_;
    position_ = startOf(segment().folderBlock(block));
    length_ = 0;
    next_ = block * perBlock_;
    blockEnd_ = next_ + perBlock_;
}

unsigned FolderDecoder::takePrefix(Position& at) const {
    const auto [symbol, bits] =
        tables().operationCode(folderPrefixCode).decode(word(at));
    at.bit += bits;
    unsigned prefix = symbol;
    if (symbol > maxShortPrefix) {
        if (symbol != operationLongPrefix)
            fail(at, "A prefix length has no code.");
        prefix = takeLongPrefix(at);
    }
    if (prefix > length_)
        fail(at, "A folder shares more than its predecessor has.");
    return prefix;
}

void FolderDecoder::decodeNext() {
    Position at = position_;
    const unsigned prefix = takePrefix(at);
    char* const out = folder_ + prefix;
    const unsigned context =
        prefix == 0 ? unsigned{FolderStart}
                    : folderContexts[static_cast<std::uint8_t>(out[-1])];
    const auto codeOf = [this](unsigned c) -> const auto& {
        return tables().folderCode(c);
    };
    const char* const end =
        takeTokens(at, context, codeOf, folderContexts, out, limit_);
    length_ = static_cast<std::size_t>(end - folder_);
    ++next_;
    position_ = at;
}

}  // namespace tessel::archive
