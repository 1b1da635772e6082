// A path tree from hostile node codes and values: an answer or one of the two
// documented exceptions, and what was read is written again as it was read.
//
// Input: a block of codes, then blocks of one value each.
#include <cstdint>
#include <vector>

#include "fuzz/Input.hpp"
#include "packing/sixpacks.hpp"
#include "pathtree/BPathTree.hpp"

namespace tessel::fuzz {
namespace {

std::size_t countLeaves(BPathTree& tree) {
    std::size_t leaves = 0;
    tree.reset();
    for (Components path; tree.hasNextPath(); ++leaves) {
        tree.getNextPath(path);
        require(!path.empty(), "a path has a component");
    }
    return leaves;
}

// True when `shorter` is how `longer` begins.
template <class List>
bool begins(const List& shorter, const List& longer) {
    return shorter.size() <= longer.size() &&
           std::equal(shorter.begin(), shorter.end(), longer.begin());
}

void checkWhatWasRead(BPathTree& tree, std::size_t leaves,
                      const std::vector<std::uint8_t>& codesRead,
                      const Components& valuesRead) {
    require(countLeaves(tree) == leaves, "every leaf is a path");
    std::vector<std::uint8_t> codes;
    Components values;
    tree.serialize(codes, values);
    require(begins(codes, codesRead), "codes are written as read");
    require(begins(values, valuesRead), "values are written as read");
    require(codes.size() == values.size(), "a value for each code");

    BPathTree again;
    require(again.deserialize(codes, values) == leaves,
            "what is written can be read");
}

void useTree(Input input) {
    std::vector<std::uint8_t> codes = input.block();
    Components values;
    while (!input.empty()) values.push_back(input.block());
    const std::vector<std::uint8_t> codesRead = codes;
    const Components valuesRead = values;

    BPathTree tree;
    try {
        const std::size_t leaves = tree.deserialize(codes, values);
        checkWhatWasRead(tree, leaves, codesRead, valuesRead);
    } catch (const DamagedFormException&) {
        countLeaves(tree);
    } catch (const UnknownNodeTypeException&) {
        countLeaves(tree);
    }
}

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::useTree({data, size});
    return 0;
}
