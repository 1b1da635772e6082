#pragma once

#include <cstddef>
#include <span>
#include <string>
#include <string_view>

#include "packing/FunctionRef.hpp"

namespace tessel {

class HuffmanPathTree;

}  // namespace tessel

namespace tessel::paths {

using NumberedPathVisitor = FunctionRef<void(std::size_t, std::string_view)>;
using PathVisitor = FunctionRef<void(std::string_view)>;

// Reads the paths of a store's coder as bytes. Numbers count from 0 and must
// be below the coder's number of paths. All of them throw
// DamagedFormException where a coder that was loaded from hostile bytes holds
// no path.
//
// Threads: any number, except of readInTreeOrder.

// Replaces `text` by path i; if it throws, `text` is unchanged.
void readPath(const HuffmanPathTree& coder, std::size_t i, std::string& text);

// Calls visit with paths first to last - 1.
void readPaths(const HuffmanPathTree& coder, std::size_t first,
               std::size_t last, NumberedPathVisitor visit);

// Calls visit with the paths of these numbers, in the order given.
void readPaths(const HuffmanPathTree& coder,
               std::span<const std::size_t> numbers, NumberedPathVisitor visit);

// Calls visit with every path in the order of the coder's tree, by a pass of
// the coder's own.
void readInTreeOrder(HuffmanPathTree& coder, PathVisitor visit);

}  // namespace tessel::paths
