#include "archive/ArchiveInformation.hpp"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>

#include "archive/SumTree.hpp"

namespace tessel::archive {
namespace {

constexpr std::array<const char*, 14> sectionNames = {"token codes",
                                                      "first-token codes",
                                                      "replaced-byte codes",
                                                      "operation codes",
                                                      "token entries",
                                                      "token text",
                                                      "folder heads",
                                                      "name groups",
                                                      "folder groups",
                                                      "wide groups",
                                                      "names",
                                                      "folders",
                                                      "order",
                                                      "index"};

void add(const Segment& segment, ArchiveInfo& info) {
    const SegmentHead& head = segment.head();
    info.folders += head.folders;
    info.sortedSegments += head.order == ListOrder::Sorted ? 1 : 0;
    info.textBytes += head.textBytes;
    info.longestName =
        std::max<std::uint64_t>(info.longestName, head.maxNameBytes);
    info.longestFolder =
        std::max<std::uint64_t>(info.longestFolder, head.maxFolderBytes);
    for (std::size_t i = 0; i < sectionNames.size(); ++i)
        info.sections[i].bytes += head.sectionBytes[i];
}

// Takes the head of one more segment into the sum.
std::uint64_t sumWith(const ArchiveReader& archive, const Segment& segment,
                      std::uint64_t sum) {
    return sumOf(
        archive.data().subspan(segment.entry().offset, segmentHeadBytes), sum);
}

}  // namespace

ArchiveInfo infoOf(const ArchiveReader& archive) {
    ArchiveInfo info;
    info.formatVersion = archive.version();
    info.paths = archive.size();
    info.segments = archive.segmentCount();
    info.fileBytes = archive.bytes();
    for (const char* const name : sectionNames)
        info.sections.push_back({name, 0});
    std::uint64_t checksums = 0;
    std::uint64_t rest = info.fileBytes;
    for (std::size_t i = 0; i < archive.segmentCount(); ++i) {
        add(archive.segment(i), info);
        checksums += archive.segment(i).head().sumTreeBytes();
        info.sum = sumWith(archive, archive.segment(i), info.sum);
    }
    for (const auto& section : info.sections) rest -= section.bytes;
    info.sections.push_back({"checksums", checksums});
    info.sections.push_back({"headers and padding", rest - checksums});
    return info;
}

}  // namespace tessel::archive
