#pragma once

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "paths/Batches.hpp"
#include "pathtree/containers.hpp"

// What every benchmark does with the coder.
namespace bench {

using CoderPtr = std::unique_ptr<tessel::HuffmanPathTree>;

using tessel::paths::coderFor;

// Replaces `text` by the components' joined text, the file's name last.
void joinPath(const tessel::HuffmanPathTree& coder,
              const tessel::Components& components, std::u16string& text);

// The same of a folder's components alone.
void joinFolder(const tessel::HuffmanPathTree& coder,
                const tessel::Components& components, std::u16string& text);

// Starts a pass and calls visit(const std::u16string&) with every path's
// text.
template <class Visit>
void iterate(tessel::HuffmanPathTree& coder, Visit visit) {
    tessel::Components components;
    std::u16string text;
    coder.resetPathsToBTree();
    while (coder.hasNextPathFromBTree()) {
        coder.getNextPathFromBTree(components);
        joinPath(coder, components, text);
        visit(static_cast<const std::u16string&>(text));
    }
}

// Fetches the paths of these ascending numbers at once and calls
// visit(const std::u16string&) with their texts. Each folder met is decoded
// once, and released with its names while they are still warm.
template <class Visit>
void fetch(const tessel::HuffmanPathTree& coder,
           const std::vector<double>& numbers, Visit visit) {
    std::vector<tessel::Components> folders;
    std::vector<tessel::Components> files;
    coder.getPath(folders, files, numbers);
    std::u16string text;
    for (std::size_t i = 0; i < folders.size(); ++i) {
        joinFolder(coder, folders[i], text);
        const std::size_t folderEnd = text.size();
        for (const tessel::Component& file : files[i]) {
            text.resize(folderEnd);
            coder.appendPathFrom(file, text);
            visit(static_cast<const std::u16string&>(text));
        }
        tessel::releaseContents(folders[i]);
        tessel::releaseContents(files[i]);
    }
}

// The numbers first to last.
std::vector<double> numbersFrom(std::size_t first, std::size_t last);

// `count` random numbers from 1 to `last`, the same ones every time.
std::vector<double> randomNumbers(std::size_t count, std::size_t last);

// The position in the list of each path in the order in which the coder
// iterates them: that of their partitions' tracks. The coder's paths must
// have been added from the splitter's list, whole and in order.
std::vector<std::size_t> iterationOrder(
    const tessel::HuffmanPathTree& coder,
    const tessel::paths::PathSplitter& splitter);

}  // namespace bench
