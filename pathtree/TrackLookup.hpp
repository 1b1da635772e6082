#pragma once

#include <cstdint>
#include <span>

#include "pathtree/BNode.hpp"
#include "pathtree/BatchFiles.hpp"
#include "pathtree/PathTreeErrors.hpp"

namespace tessel {

// Follows tracks through a path tree. Positions that lead outside the tree
// throw std::out_of_range; components may have been visited by then. A root
// that is a file or no node is that of a tree without paths.
//
// Ownership: borrows the root. The views that it hands out are valid until
//   paths are added or a pass begins.
// Threads: any number of readers.
class TrackLookup {
public:
    using Track = std::span<const std::uint64_t>;

    explicit TrackLookup(BNode root) noexcept : root_(root.folder()) {}

    // Calls visit(ComponentView) with each component along the track. Throws
    // NoTreeToTraverseException on a tree without paths, otherwise
    // EmptyPathForTraverseException on an empty track.
    template <class Visit>
    void visitTrack(Track track, Visit&& visit) const {
        if (root_ == nullptr || root_->children().count() == 0)
            throw NoTreeToTraverseException();
        if (track.empty()) throw EmptyPathForTraverseException();
        const FolderNode* folder = root_;
        for (const std::uint64_t position : track) {
            const Child child = BatchFiles::childAt(folder, position);
            visit(child.value());
            folder = child.folder;
        }
    }

    // Calls visitFolder(ComponentView) with each folder component of the
    // batch to which the track belongs, then returns its files.
    //
    // The track ends at | the folder is   | the first file's position is
    // ------------------+-----------------+------------------------------
    // a node with files | that node       | 0: the batch made the folder
    // a leaf            | the leaf's      | the leaf's: the batch joined an
    //                   | parent          | existing folder
    //
    // So a batch that made its folder and brought no file is answered as if
    // the folder were a file.
    template <class VisitFolder>
    BatchFiles openBatch(Track track, VisitFolder&& visitFolder) const {
        if (track.empty()) return BatchFiles::ofRoot(root_);
        const FolderNode* folder = root_;
        for (const std::uint64_t position : track.first(track.size() - 1)) {
            const Child child = BatchFiles::childAt(folder, position);
            visitFolder(child.value());
            folder = child.folder;
        }
        return openLast(folder, track.back(), visitFolder);
    }

    // The same for a track that is known but for its last position.
    template <class VisitFolder>
    static BatchFiles openLast(const FolderNode* folder, std::uint64_t last,
                               VisitFolder&& visitFolder) {
        const Child end = BatchFiles::childAt(folder, last);
        if (end.folder == nullptr) return {*folder, last};
        visitFolder(end.value());
        return {*end.folder, 0};
    }

    // The same, and then visitFile(ComponentView) with the files at these
    // offsets (1-based within the batch), in the order given.
    template <class VisitFolder, class VisitFile>
    void visitBatch(Track track, std::span<const std::uint64_t> offsets,
                    VisitFolder&& visitFolder, VisitFile&& visitFile) const {
        BatchFiles files = openBatch(track, visitFolder);
        for (const std::uint64_t offset : offsets) visitFile(files[offset]);
    }

private:
    const FolderNode* root_;
};

}  // namespace tessel
