#include "archive/SegmentWriter.hpp"

#include <algorithm>
#include <cstddef>
#include <span>
#include <string_view>
#include <utility>

#include "archive/BitWriter.hpp"
#include "archive/BlockWriter.hpp"
#include "archive/CodeTables.hpp"
#include "archive/Format.hpp"
#include "archive/FrontCoder.hpp"
#include "archive/GroupTables.hpp"
#include "archive/ListArranger.hpp"
#include "archive/ListParser.hpp"
#include "archive/SegmentBody.hpp"
#include "archive/TokenCoder.hpp"
#include "archive/TokenTraining.hpp"

namespace tessel::archive {

namespace {

using ByteVector = std::vector<std::uint8_t>;

ByteVector packTables(std::span<const SymbolCode> codes) {
    ByteVector out;
    for (const SymbolCode& code : codes) code.table().pack(out);
    return out;
}

// Numbers of this many bits each.
ByteVector packNumbers(const std::vector<std::uint32_t>& numbers,
                       unsigned bits) {
    BitWriter out;
    for (const std::uint32_t number : numbers) out.put(number, bits);
    return out.take();
}

std::vector<std::uint32_t> inverseOf(
    const std::vector<std::uint32_t>& numbers) {
    std::vector<std::uint32_t> inverse(numbers.size());
    for (std::uint32_t i = 0; i < numbers.size(); ++i) inverse[numbers[i]] = i;
    return inverse;
}

// Builds one segment, step by step.
class SegmentBuilder {
public:
    SegmentBuilder(const SegmentList& list, const SegmentOptions& options,
                   Workers& workers)
        : list_(list), options_(options), workers_(workers) {}

    ByteVector build();

private:
    void report(double share) const {
        workers_.throwIfCancelled();
        if (options_.progress) options_.progress(share);
    }

    void writeBlocks(const FrontCoder& coder, const FrontCodes& codes,
                     const TokenCoder& tokens, const ParsedList& parsed);
    void addOrder(const FrontCoder& coder);
    ByteVector folderHeads(const FrontCoder& coder,
                           const std::vector<Blocks>& names) const;

    const SegmentList& list_;
    const SegmentOptions& options_;
    Workers& workers_;
    SegmentHead head_;
    SegmentBody body_;
};

ByteVector SegmentBuilder::build() {
    const FrontCoder coder(list_, arrange(list_, workers_), workers_);
    head_.order = coder.arrangement().order;
    head_.namesPerBlock = FrontCoder::namesPerBlock;
    head_.foldersPerBlock = FrontCoder::foldersPerBlock;
    head_.folders = static_cast<std::uint32_t>(coder.folders());
    head_.paths = coder.names();
    head_.textBytes = list_.textBytes();
    head_.maxNameBytes = coder.maxNameBytes();
    head_.maxFolderBytes = coder.maxFolderBytes();
    report(0.1);
    {
        const TrainedParse trained =
            trainAndParse(coder, options_.level, workers_,
                          [this](double share) { report(0.1 + 0.75 * share); });
        const TokenCoder tokens(trained.model, trained.parsed.uses);
        const FrontCodes codes(coder.counts());
        body_.add(Section::TokenCodes, tokens.tokenCodes());
        body_.add(Section::FirstTokenCodes, tokens.firstTokenCodes());
        body_.add(Section::ReplacedCodes, packTables(codes.replaced));
        body_.add(Section::OperationCodes, packTables(codes.operations));
        body_.add(Section::TokenEntries, tokens.entries());
        body_.add(Section::TokenText,
                  ByteVector(tokens.text().begin(), tokens.text().end()));
        report(0.87);
        writeBlocks(coder, codes, tokens, trained.parsed);
    }
    addOrder(coder);
    report(0.97);
    return body_.finish(head_, workers_);
}

void SegmentBuilder::writeBlocks(const FrontCoder& coder,
                                 const FrontCodes& codes,
                                 const TokenCoder& tokens,
                                 const ParsedList& parsed) {
    std::vector<Blocks> names(FrontCoder::chunksOf(coder.names()));
    std::vector<Blocks> folders(FrontCoder::chunksOf(coder.folders()));
    workers_.run(parsed.chunks.size(), [&](std::size_t chunk, unsigned) {
        BlockWriter writer(coder, codes, tokens);
        if (chunk < names.size())
            names[chunk] = writer.writeNames(chunk, parsed.chunks[chunk]);
        else
            folders[chunk - names.size()] =
                writer.writeFolders(chunk - names.size(), parsed.chunks[chunk]);
    });
    GroupTables groups = packGroups(names, folders);
    if (head_.order != ListOrder::AsGiven)
        body_.add(Section::FolderHeads, folderHeads(coder, names));
    body_.add(Section::NameGroups, std::move(groups.names));
    body_.add(Section::FolderGroups, std::move(groups.folders));
    body_.add(Section::WideGroups, std::move(groups.wide));
    for (Blocks& blocks : names)
        body_.add(Section::Names, std::move(blocks.bytes));
    for (Blocks& blocks : folders)
        body_.add(Section::Folders, std::move(blocks.bytes));
}

void SegmentBuilder::addOrder(const FrontCoder& coder) {
    const unsigned bits = head_.numberBits();
    if (head_.order == ListOrder::Rearranged)
        body_.add(Section::Order,
                  packNumbers(inverseOf(coder.arrangement().numbers), bits));
    if (options_.index == ArchiveIndex::None) return;
    if (head_.order == ListOrder::Rearranged)
        body_.add(Section::Index,
                  packNumbers(coder.arrangement().numbers, bits));
    if (head_.order == ListOrder::AsGiven)
        body_.add(Section::Index,
                  packNumbers(arrangeSorted(list_, workers_).numbers, bits));
}

ByteVector SegmentBuilder::folderHeads(const FrontCoder& coder,
                                       const std::vector<Blocks>& names) const {
    const std::uint32_t step =
        std::uint32_t{head_.foldersPerBlock} * head_.folderBlocksPerHead;
    ByteVector table;
    ByteVector text;
    std::uint32_t head = 0;  // the folder of the next head
    std::uint32_t seen = 0;
    std::uint32_t block = 0;
    const auto addEntry = [&] {
        packUint32(static_cast<std::uint32_t>(text.size()), table);
        packUint32(block, table);
    };
    for (const Blocks& chunk : names)
        for (const std::uint8_t added : chunk.newFolders) {
            for (seen += added; head < seen; head += step) {
                addEntry();
                const std::string_view folder = coder.folder(head);
                text.insert(text.end(), folder.begin(), folder.end());
            }
            ++block;
        }
    addEntry();
    table.insert(table.end(), text.begin(), text.end());
    return table;
}

}  // namespace

std::vector<std::uint8_t> buildSegment(const SegmentList& list,
                                       const SegmentOptions& options,
                                       Workers& workers) {
    return SegmentBuilder(list, options, workers).build();
}

}  // namespace tessel::archive
