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
    if (folder >= segment_->head().folders)
        fail("A name is in a folder that is not there.");
    const std::uint32_t block = folder / perBlock_;
    startAt(segment_->folderBlock(block));
    length_ = 0;
    next_ = block * perBlock_;
    blockEnd_ = next_ + perBlock_;
}

unsigned FolderDecoder::takePrefix() {
    const auto [symbol, bits] =
        tables_->operationCode(folderPrefixCode).decode(word());
    bit_ += bits;
    unsigned prefix = symbol;
    if (symbol > maxShortPrefix) {
        if (symbol != operationLongPrefix) fail("A prefix length has no code.");
        prefix = takeLongPrefix();
    }
    if (prefix > length_)
        fail("A folder shares more than its predecessor has.");
    return prefix;
}

void FolderDecoder::decodeNext() {
    const unsigned prefix = takePrefix();
    char* const out = folder_ + prefix;
    const unsigned context =
        prefix == 0 ? unsigned{FolderStart}
                    : folderContexts[static_cast<std::uint8_t>(out[-1])];
    const char* const end = takeTokens(context, folderContexts, out, limit_);
    length_ = static_cast<std::size_t>(end - folder_);
    ++next_;
}

bool FolderDecoder::isAtEnd() const noexcept {
    return bit_ <= end_ && end_ - bit_ < 8;
}

}  // namespace tessel::archive
