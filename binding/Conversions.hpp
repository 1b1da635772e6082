#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include "binding/Errors.hpp"
#include "binding/HostAccess.hpp"
#include "coder/HuffmanPathTree.hpp"

// Between host arrays and the coder's own strings and vectors.
namespace tessel::binding {

inline constexpr const char* huffmanPathsName = "HuffmanPaths";
inline constexpr const char* huffmanPathsFullName =
    "velox.io.datastore.internal.fileset.HuffmanPaths";

// Folders or file lists as texts, one entry per folder.
using TextLists = HuffmanPathTree::FolderTexts;

// The coder of an instance; the instance keeps it.
HuffmanPathTree& coderOf(const HostArray* instance);

// The texts of a cell of cells of char arrays. Raises folderElementEmpty or
// fileElementEmpty at the first empty element.
TextLists textLists(const HostArray* outerCell, Element element);

std::vector<double> doubles(const HostArray* numeric);
std::vector<std::uint8_t> bytes(const HostArray* numeric);

// n x 1 arrays of the given values.
OwnedArray column(std::span<const double> values);
OwnedArray column(std::span<const std::uint8_t> values);

// Moves an element into a cell, at a 0-based index.
void setCell(const OwnedArray& cell, std::size_t index, OwnedArray element);

}  // namespace tessel::binding
