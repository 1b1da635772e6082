#include "bench/PathReader.hpp"

#include <algorithm>
#include <cstdint>
#include <numeric>
#include <random>
#include <span>

namespace bench {

using tessel::HuffmanPathTree;
using tessel::paths::forEachFolder;
using tessel::paths::PathSplitter;

namespace {

std::size_t folderDepth(const PathSplitter& splitter, std::size_t path) {
    std::size_t depth = 1;
    forEachFolder(splitter.list()[path], splitter.split(path),
                  [&](std::string_view) { ++depth; });
    return depth;
}

// The way to the first file of every partition, in one buffer.
class FileTracks {
public:
    FileTracks(const HuffmanPathTree& coder, const PathSplitter& splitter) {
        std::size_t firstPath = 0;
        coder.partitionTracks.forEach([&](const tessel::PathTrack& track) {
            positions_.insert(positions_.end(), track.begin(), track.end());
            // A folder that was new has no position of a file after its own.
            if (track.size() == folderDepth(splitter, firstPath)) {
                positions_.push_back(0);
            }
            firstPath = coder.partitionEnds[ends_.size()];
            ends_.push_back(positions_.size());
        });
    }

    std::span<const std::uint64_t> operator[](std::size_t i) const {
        const std::size_t start = i == 0 ? 0 : ends_[i - 1];
        return {positions_.data() + start, ends_[i] - start};
    }

    // The partitions in the order of their tracks.
    std::vector<std::size_t> order() const {
        std::vector<std::size_t> partitions(ends_.size());
        std::iota(partitions.begin(), partitions.end(), std::size_t{0});
        std::sort(partitions.begin(), partitions.end(),
                  [&](std::size_t a, std::size_t b) {
                      return std::ranges::lexicographical_compare((*this)[a],
                                                                  (*this)[b]);
                  });
        return partitions;
    }

private:
    std::vector<std::uint64_t> positions_;
    std::vector<std::size_t> ends_;
};

}  // namespace

void PathJoiner::keepFolders(std::size_t depth) {
    ends_.resize(std::min(depth, ends_.size()));
}

void PathJoiner::addFolder(tessel::ComponentView name) {
    text_.resize(folderEnd());
    coder_->appendPathFrom(name, text_);
    if (!ends_.empty()) text_ += u'/';
    ends_.push_back(text_.size());
}

const std::u16string& PathJoiner::pathOf(tessel::ComponentView fileName) {
    text_.resize(folderEnd());
    coder_->appendPathFrom(fileName, text_);
    return text_;
}

std::vector<std::size_t> randomNumbers(std::size_t count, std::size_t last) {
    std::mt19937_64 random(20230610);  // NOLINT(cert-msc*): on purpose
    std::vector<std::size_t> numbers(count);
    for (std::size_t& number : numbers) number = 1 + random() % last;
    return numbers;
}

std::vector<std::size_t> iterationOrder(const HuffmanPathTree& coder,
                                        const PathSplitter& splitter) {
    std::vector<std::size_t> paths;
    paths.reserve(coder.pathCount);
    const FileTracks tracks(coder, splitter);
    for (const std::size_t partition : tracks.order()) {
        const std::size_t first =
            partition == 0 ? 0 : coder.partitionEnds[partition - 1];
        for (std::size_t i = first; i < coder.partitionEnds[partition]; ++i) {
            paths.push_back(i);
        }
    }
    return paths;
}

}  // namespace bench
