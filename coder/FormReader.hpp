#pragma once

#include <memory>
#include <vector>

#include "coder/PathNumbering.hpp"
#include "packing/ByteCursor.hpp"
#include "pathtree/BPathTree.hpp"

namespace tessel {

// Reads the payload of a coder's stored form (HuffmanPathTreeForm.cpp has its
// layout). What it holds is kept apart from any coder until all of it is known
// to be sound.
//
// Input may be hostile: throws DamagedFormException,
// InvalidUintConversionException or UnknownNodeTypeException.
// Ownership: a value. Memory is bounded by the payload, see TreeBuilder; of the
//   payload it keeps a copy of the node codes while it makes the tree.
class FormReader {
public:
    // New partitions are appended to those of `before`.
    explicit FormReader(PathNumbering before);

    // An unknown marker ends the reading; what follows it is ignored.
    void read(sixpacks::ByteCursor& cursor);

    std::vector<bool> shape;
    std::unique_ptr<BPathTree> tree = std::make_unique<BPathTree>();
    PathNumbering numbering;

private:
    void readShape(sixpacks::ByteCursor& cursor);
    void readTree(sixpacks::ByteCursor& cursor);
    void readNumbering(sixpacks::ByteCursor& cursor);
    void readPartitions(sixpacks::ByteCursor& cursor);
    void readDuplicates(sixpacks::ByteCursor& cursor);
};

}  // namespace tessel
