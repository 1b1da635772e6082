// A program on the path tree and its stored form alone, without the coder.

#include "pathtree/BPathTree.hpp"

int main() {
    tessel::Components folder = {{'a'}};
    tessel::Components files = {{'f'}, {'g'}};
    tessel::PathTrack track;
    std::uint64_t first = 0;
    tessel::BPathTree tree;
    tree.addPath(folder, files, track, first);

    std::vector<std::uint8_t> structure;
    tessel::Components values;
    tree.serialize(structure, values);
    tessel::BPathTree again;
    const bool whole = again.deserialize(structure, values) == 2;
    again.reset();
    tessel::Components path;
    again.getNextPath(path);
    return whole && path == tessel::Components{{'a'}, {'f'}} ? 0 : 1;
}
