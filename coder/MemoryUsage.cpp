#include "coder/HuffmanPathTree.hpp"

namespace tessel {

namespace {

template <class T>
std::size_t bytesOf(const std::vector<T>& list) {
    return list.capacity() * sizeof(T);
}

// A standard map's bytes without those that its values own: each node has a
// color and three links, and the allocator adds a header and rounds up.
template <class Map>
std::size_t bytesOfMap(const Map& map) {
    constexpr std::size_t nodeBytes =
        sizeof(typename Map::value_type) + 6 * sizeof(void*);
    return map.size() * nodeBytes;
}

}  // namespace

HuffmanPathTree::MemoryUsage HuffmanPathTree::memoryUsage() const {
    const BPathTree::MemoryUsage tree = pathTree->memoryUsage();
    MemoryUsage usage;
    usage.names = tree.names;
    usage.nodes = tree.nodes;
    usage.childLists = tree.childLists;
    usage.partitionTracks =
        partitionTracks.memoryBytes() + bytesOf(partitionEnds);
    usage.duplicates = bytesOfMap(duplicates);
    for (const auto& [number, track] : duplicates)
        usage.duplicates += bytesOf(track) + 2 * sizeof(void*);
    usage.code = boolTree.capacity() / 8 +
                 treeString.capacity() * sizeof(char16_t) +
                 bytesOf(frequencies) + bytesOf(nodes) + bytesOf(parentOf) +
                 codes.memoryBytes() + decodeTable_.memoryBytes();
    usage.other = sizeof(HuffmanPathTree) + sizeof(BPathTree) + tree.finder +
                  tree.iteration;
    return usage;
}

}  // namespace tessel
