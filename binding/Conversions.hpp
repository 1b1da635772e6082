#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include "binding/HostAccess.hpp"
#include "coder/HuffmanPathTree.hpp"

// Between host arrays and the coder's own strings and vectors.
namespace tessel {

inline constexpr const char* huffmanPathsName = "HuffmanPaths";
inline constexpr const char* huffmanPathsFullName =
    "velox.io.datastore.internal.fileset.HuffmanPaths";

// Folders or file lists, one entry for each: as texts, and encoded.
using TextLists = HuffmanPathTree::FolderTexts;
using ComponentLists = std::vector<Components>;

// The coder of an instance; the instance keeps it.
HuffmanPathTree& coderOf(const HostArray* instance);

// The texts of a cell of cells of char arrays. Raises folderElementEmpty or
// fileElementEmpty (see checkElement) at the first empty element.
TextLists textLists(const HostArray* outerCell, bool inFolders);

std::vector<double> doubles(const HostArray* numeric);
std::vector<std::uint8_t> bytes(const HostArray* numeric);

// n x 1 arrays of the given values.
OwnedArray column(std::span<const double> values);
OwnedArray column(std::span<const std::uint8_t> values);

// An n x 1 cell of the decoded components, each as a char row.
OwnedArray decodedColumn(const HuffmanPathTree& coder,
                         const Components& components);

// An n x 1 cell with one decodedColumn for each list.
OwnedArray decodedColumns(const HuffmanPathTree& coder,
                          const ComponentLists& lists);

// Moves an element into a cell, at a 0-based index.
void setCell(const OwnedArray& cell, std::size_t index, OwnedArray element);

}  // namespace tessel
