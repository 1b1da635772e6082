#pragma once

#include <cstddef>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "binding/HostAccess.hpp"
#include "coder/HuffmanPathTree.hpp"
#include "coder/PathRetrieval.hpp"

namespace tessel::binding {

// PathCells decodes stored names straight from the tree into cells of the host.
//
// Ownership: borrows the coder, which nobody may change meanwhile.
// Threads: the host's calling thread.
// Cost: all texts pass through one buffer, so that a text takes no memory
//   besides the host's array.
class PathCells {
public:
    explicit PathCells(const HuffmanPathTree& coder);

    // An n x 1 cell of the path's components, each as a char row.
    OwnedArray components(const PathView& path);

    struct FoldersAndFiles {
        OwnedArray folders;
        OwnedArray files;
    };
    // One element for each partition met: a column of the folder's components,
    // and one of the names of the files asked for. Numbers and exceptions are
    // those of HuffmanPathTree::getPath.
    FoldersAndFiles foldersAndFiles(const std::vector<double>& numbers);

    // An n x 1 cell for n numbers, filled from its start with joined paths. A
    // folder without components is left out together with its files.
    OwnedArray joined(const std::vector<double>& numbers,
                      std::u16string_view separator);

private:
    class Collector;
    class Joiner;

    // In a coder that was loaded with tracks and no ends, numbers are those of
    // partitions, of which only the folders are answered.
    bool hasTracksOnly() const noexcept { return coder_.partitionEnds.empty(); }
    std::vector<Components> foldersByTrack(
        const std::vector<double>& numbers) const;

    template <class Names>
    OwnedArray column(const Names& names);
    template <class Lists>
    OwnedArray columns(const Lists& lists);
    void setName(const OwnedArray& cell, std::size_t index, ComponentView name);
    // Puts the buffer's text into the cell.
    void setText(const OwnedArray& cell, std::size_t index);

    PathRetrieval retrieval() const noexcept {
        return {*coder_.pathTree, coder_.numbering()};
    }

    const HuffmanPathTree& coder_;
    HostInterface& host_;
    std::u16string text_;
};

}  // namespace tessel::binding
