#pragma once

#include <cstdint>
#include <new>
#include <span>
#include <utility>

#include "coder/PathNumbering.hpp"
#include "pathtree/BPathTree.hpp"

namespace tessel {

// A pass over all stored paths: those of the tree, in its order, and at
// their own numbers the whole paths that repeat one of them.
//
// Ownership: borrows the tree and the numbering, which hold the state of the
//   pass.
// Threads: one.
class PathIteration {
public:
    PathIteration(BPathTree& tree, PathNumbering& numbering) noexcept
        : tree_(tree), numbering_(numbering) {}

    // True while a path is left in the pass that reset began.
    bool hasNext() const {
        return numbering_.hasDuplicate(numbering_.nextPathNumber + 1) ||
               tree_.hasNextPath();
    }

    // Calls visit(const PathView&) with the next path and moves on: views of
    // its components, valid during the visit, and how many leading folders
    // are those of the path visited before. Throws NoMorePathException when
    // none is left; the path is counted as handed out even then. If memory
    // runs out, or visit throws, the pass stays before this path.
    template <class Visit>
    void visitNext(Visit&& visit) {
        next(
            [&] {
                // After a repeated path, the visitor's folders are not those
                // that the tree visited last.
                const bool afterRepeated =
                    numbering_.hasDuplicate(numbering_.nextPathNumber);
                tree_.visitNextPath([&](PathView path) {
                    if (afterRepeated) path.unchangedFolders = 0;
                    visit(static_cast<const PathView&>(path));
                });
            },
            [&](const Components& repeated) {
                visit(PathView{std::span(repeated).first(repeated.size() - 1),
                               repeated.back(), 0});
            });
    }

    // See HuffmanPathTree::getNextPathFromBTree.
    void getNext(Components& components) {
        next([&] { tree_.getNextPath(components); },
             [&](const Components& repeated) {
                 components.insert(components.end(), repeated.begin(),
                                   repeated.end());
             });
    }

    void reset() {
        tree_.reset();
        numbering_.nextPathNumber = 0;
    }

private:
    // Calls takeStored() if the next path comes from the tree, else
    // visitRepeated with its components. If that runs out of memory, the pass
    // stays before this path; a number that no path answers is counted.
    template <class TakeStored, class VisitRepeated>
    void next(TakeStored takeStored, VisitRepeated visitRepeated) {
        const std::uint64_t number = numbering_.nextPathNumber + 1;
        if (numbering_.hasDuplicate(number)) {
            visitRepeated(
                componentsOf(number, numbering_.duplicates.at(number)));
        } else {
            try {
                takeStored();
            } catch (const NoMorePathException&) {
                numbering_.nextPathNumber = number;
                throw;
            }
        }
        numbering_.nextPathNumber = number;
    }

    Components componentsOf(std::uint64_t number, const PathTrack& track) {
        Components components;
        try {
            tree_.traversePath(track, components);
        } catch (const std::bad_alloc&) {
            throw;
        } catch (...) {
            numbering_.nextPathNumber = number;  // the track leads nowhere
            throw;
        }
        return components;
    }

    BPathTree& tree_;
    PathNumbering& numbering_;
};

}  // namespace tessel
