#include "archive/SegmentRules.hpp"

#include <algorithm>
#include <functional>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "archive/FolderDecoder.hpp"
#include "archive/FolderHeads.hpp"
#include "archive/PackedNumbers.hpp"
#include "archive/PathBuffer.hpp"

namespace tessel::archive {
namespace {

bool isWithout(std::string_view text, char byte) noexcept {
    return text.find(byte) == std::string_view::npos;
}

}  // namespace

// ---- Names ----

// The block that paths have come to the end of.
void SegmentRules::checkNamesEnd(std::uint32_t block,
                                 const PathCursor& paths) const {
    const Segment::NameBlock ended = segment_.nameBlock(block);
    const auto check = [&](bool holds, const char* what) {
        require(Section::Names, ended.begin, holds, what);
    };
    const bool isLast = block + 1 == segment_.nameBlocks();
    const Segment::NameBlock next =
        isLast ? Segment::NameBlock{{static_cast<std::uint32_t>(
                                         segment_.bytesOf(Section::Names)),
                                     0},
                                    segment_.head().folders}
               : segment_.nameBlock(block + 1);
    check(paths.isAtBlockEnd(), "A block is longer than its names.");
    check(ended.end == next.begin, "There is a gap between two blocks.");
    check(paths.foldersSeen() == next.seen,
          "A block names another number of folders than its group says.");
    check(block > 0 || (ended.begin == 0 && ended.seen == 0),
          "The first block does not start at the start.");
}

void SegmentRules::checkPath(std::string_view path, std::string_view name,
                             std::uint64_t offset) const {
    require(Section::Names, offset, !path.empty(), "A path is empty.");
    require(Section::Names, offset,
            isWithout(path, '\0') && isWithout(name, '/'),
            "A name holds a byte that no name can hold.");
}

std::uint64_t SegmentRules::checkNames(std::uint32_t begin,
                                       std::uint32_t end) const {
    const std::uint64_t perBlock = segment_.head().namesPerBlock;
    const bool isSorted = segment_.head().order != ListOrder::AsGiven;
    PathCursor paths(segment_);
    std::string last;
    if (begin > 0) last = paths.at(begin * perBlock - 1);
    std::uint64_t bytes = 0;
    for (std::uint32_t block = begin; block < end; ++block) {
        const std::uint64_t offset = segment_.nameBlock(block).begin;
        const std::uint64_t after =
            std::min((block + 1) * perBlock, segment_.size());
        for (std::uint64_t place = block * perBlock; place < after; ++place) {
            const std::string_view path = paths.at(place);
            checkPath(path, paths.name(), offset);
            require(Section::Names, offset, !isSorted || last <= path,
                    "A path is less than its predecessor.");
            last = path;
            bytes += path.size();
        }
        checkNamesEnd(block, paths);
    }
    return bytes;
}

// ---- Folders ----

void SegmentRules::checkFolders(std::uint32_t begin, std::uint32_t end) const {
    PathBuffer buffer(segment_.head().maxFolderBytes + FolderDecoder::slack);
    FolderDecoder folders(segment_, buffer.data());
    const std::uint32_t perBlock = segment_.head().foldersPerBlock;
    for (std::uint32_t block = begin; block < end; ++block) {
        const Segment::Block bytes = segment_.folderBlock(block);
        const auto check = [&](bool holds, const char* what) {
            require(Section::Folders, bytes.begin, holds, what);
        };
        const std::uint32_t after =
            std::min((block + 1) * perBlock, segment_.head().folders);
        for (std::uint32_t f = block * perBlock; f < after; ++f) {
            const std::string_view folder = folders.at(f);
            check(folder.empty() || folder.ends_with('/'),
                  "A folder does not end with a separator.");
            check(isWithout(folder, '\0'), "A folder holds the byte 0.");
        }
        check(folders.isAtEnd(), "A block is longer than its folders.");
        check(block > 0 || bytes.begin == 0,
              "The first block does not start at the start.");
        check(bytes.end == (block + 1 == segment_.folderBlocks()
                                ? segment_.bytesOf(Section::Folders)
                                : segment_.folderBlock(block + 1).begin),
              "There is a gap between two blocks.");
    }
}

// Compares hashes, so that the texts need not be kept. Only where two hashes
// are equal, the texts are kept and compared.
void SegmentRules::checkFoldersDiffer() const {
    PathBuffer buffer(segment_.head().maxFolderBytes + FolderDecoder::slack);
    FolderDecoder folders(segment_, buffer.data());
    std::vector<std::pair<std::size_t, std::uint32_t>> hashes;
    for (std::uint32_t f = 0; f < segment_.head().folders; ++f)
        hashes.emplace_back(std::hash<std::string_view>()(folders.at(f)), f);
    std::ranges::sort(hashes);
    std::set<std::string, std::less<>> texts;  // of one hash
    for (std::size_t i = 1; i < hashes.size(); ++i) {
        const auto& [last, lastFolder] = hashes[i - 1];
        const auto& [hash, folder] = hashes[i];
        if (hash != last) {
            texts.clear();
            continue;
        }
        if (texts.empty()) texts.emplace(folders.at(lastFolder));
        const std::uint32_t block = folder / segment_.head().foldersPerBlock;
        require(Section::Folders, segment_.folderBlock(block).begin,
                texts.emplace(folders.at(folder)).second,
                "A folder comes twice.");
    }
}

// Whether the folder is first named in this block.
bool SegmentRules::namesFirst(std::uint32_t nameBlock,
                              std::uint32_t folder) const {
    return segment_.seenBefore(nameBlock) <= folder &&
           (nameBlock + 1 == segment_.nameBlocks() ||
            folder < segment_.seenBefore(nameBlock + 1));
}

void SegmentRules::checkFolderHeads() const {
    if (segment_.head().order == ListOrder::AsGiven) return;
    PathBuffer buffer(segment_.head().maxFolderBytes + FolderDecoder::slack);
    FolderDecoder folders(segment_, buffer.data());
    const FolderHeads heads(segment_);
    for (std::uint32_t i = 0; i < heads.size(); ++i) {
        require(Section::FolderHeads, std::uint64_t{folderHeadBytes} * i,
                heads.folder(i) == folders.at(heads.number(i)) &&
                    namesFirst(heads.nameBlock(i), heads.number(i)),
                "A folder head does not match its folder.");
    }
    require(Section::FolderHeads, 0, heads.fillsSection(),
            "The folder heads do not fill their section.");
}

// ---- Order and padding ----

void SegmentRules::checkOrder() const {
    if (segment_.head().order == ListOrder::Rearranged)
        checkRearranged();
    else if (segment_.bytesOf(Section::Index) > 0)
        checkIndexed();
}

void SegmentRules::checkRearranged() const {
    const PackedNumbers order(segment_, Section::Order);
    const PackedNumbers index(segment_, Section::Index);
    const bool hasIndex = segment_.bytesOf(Section::Index) > 0;
    std::vector<bool> found(segment_.size());
    for (std::uint64_t i = 0; i < segment_.size(); ++i) {
        const std::uint32_t place = order.at(i);
        require(Section::Order, 0, !found[place],
                "The order holds a number twice.");
        require(Section::Index, 0, !hasIndex || index.at(place) == i,
                "The index is not the inverse of the order.");
        found[place] = true;
    }
}

// Equal paths must come in the order of their numbers.
void SegmentRules::checkIndexed() const {
    const PackedNumbers index(segment_, Section::Index);
    PathCursor paths(segment_);
    std::string last;
    std::uint64_t lastNumber = 0;
    for (std::uint64_t i = 0; i < segment_.size(); ++i) {
        const std::uint64_t number = index.at(i);
        const std::string_view path = paths.at(number);
        require(Section::Index, 0,
                i == 0 || last < path || (last == path && lastNumber < number),
                "The index is not in the order of the paths.");
        last = path;
        lastNumber = number;
    }
}

void SegmentRules::checkPadding() const {
    for (std::size_t i = 0; i < sectionCount; ++i) {
        const auto section = static_cast<Section>(i);
        const std::uint64_t bytes = segment_.bytesOf(section);
        const std::uint64_t guard = i + 1 == sectionCount ? bodyGuardBytes : 0;
        const std::uint64_t begin = segment_.offsetOf(section) + bytes;
        const std::uint64_t end =
            segment_.offsetOf(section) + aligned8(bytes) + guard;
        segment_.pieces().require(begin, end);
        const auto padding =
            segment_.pieces().body().subspan(begin, end - begin);
        require(section, bytes,
                std::ranges::all_of(padding, [](auto b) { return b == 0; }),
                "Padding is not zero.");
    }
}

}  // namespace tessel::archive
