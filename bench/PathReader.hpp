#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "coder/PathIteration.hpp"
#include "coder/PathRetrieval.hpp"
#include "paths/Batches.hpp"
#include "paths/IndexedRange.hpp"

// Reading the core itself, as UTF-16 texts, without the store around it.
namespace bench {

using CoderPtr = std::unique_ptr<tessel::HuffmanPathTree>;
using tessel::paths::coderFor;

// Joins the components of one path after the other. Folders that a path shares
// with the one before are decoded once.
class PathJoiner {
public:
    explicit PathJoiner(const tessel::HuffmanPathTree& coder)
        : coder_(&coder) {}

    // Keeps this many leading folders and forgets the others.
    void keepFolders(std::size_t depth);
    void addFolder(tessel::ComponentView name);
    const std::u16string& pathOf(tessel::ComponentView fileName);

private:
    std::size_t folderEnd() const { return ends_.empty() ? 0 : ends_.back(); }

    const tessel::HuffmanPathTree* coder_;
    std::u16string text_;
    std::vector<std::size_t> ends_;  // of each folder
};

// Starts a pass and calls visit(const std::u16string&) with every path's
// text.
template <class Visit>
void iterate(tessel::HuffmanPathTree& coder, Visit visit) {
    PathJoiner joiner(coder);
    coder.resetPathsToBTree();
    tessel::PathIteration pass(*coder.pathTree, coder.numbering());
    while (pass.hasNext()) {
        pass.visitNext([&](const tessel::PathView& path) {
            joiner.keepFolders(path.unchangedFolders);
            for (const auto& name :
                 path.folders.subspan(path.unchangedFolders)) {
                joiner.addFolder(name);
            }
            visit(joiner.pathOf(path.name));
        });
    }
}

// Fetches the paths of these ascending numbers, a range, at once and calls
// visit(const std::u16string&) with their texts.
template <class Numbers, class Visit>
void fetch(const tessel::HuffmanPathTree& coder, const Numbers& numbers,
           Visit visit) {
    struct Joining {
        PathJoiner joiner;
        Visit visit;
        void beginFolder(std::uint64_t /*maxFiles*/) { joiner.keepFolders(0); }
        void folder(tessel::ComponentView name) { joiner.addFolder(name); }
        void file(tessel::ComponentView name) { visit(joiner.pathOf(name)); }
    };
    tessel::PathRetrieval(*coder.pathTree, coder.numbering())
        .visit(numbers, Joining{PathJoiner(coder), std::move(visit)});
}

// The numbers first to last.
inline auto numbersFrom(std::size_t first, std::size_t last) {
    return tessel::paths::IndexedRange(first, last + 1,
                                       [](std::size_t i) { return i; });
}

// `count` random numbers from 1 to `last`, the same ones every time.
std::vector<std::size_t> randomNumbers(std::size_t count, std::size_t last);

// The position in the list of each path in the order in which the coder
// iterates them: that of their partitions' tracks. The coder's paths must
// have been added from the splitter's list, whole and in order.
std::vector<std::size_t> iterationOrder(
    const tessel::HuffmanPathTree& coder,
    const tessel::paths::PathSplitter& splitter);

}  // namespace bench
