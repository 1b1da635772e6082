#include "pathtree/TreeInserter.hpp"

#include <type_traits>

#include "pathtree/Insertion.hpp"
#include "pathtree/containers.hpp"

namespace tessel {

BNodePtr TreeInserter::makeRoot() {
    index_.clear();
    return BNodePtr::adopt(pool_.make({}, NodePool::Kind::folder));
}

bool TreeInserter::addPath(BNode& root, Components& components,
                           PathTrack& pathTrack) {
    Insertion insertion(root, pool_, index_, pathTrack);
    std::size_t stored = 0;
    for (std::size_t i = 0; i < components.size(); ++i) {
        const auto kind = i + 1 < components.size() ? NodePool::Kind::folder
                                                    : NodePool::Kind::leaf;
        const std::uint64_t position = insertion.enter(components[i], kind);
        if (!insertion.existed()) continue;
        pathTrack.push_back(position);
        ++stored;
    }
    insertion.commit();
    for (std::size_t i = stored; i < components.size(); ++i)
        releaseContents(components[i]);
    return insertion.existed();
}

template <class Folder, class Files>
TreeInserter::AddedBatch TreeInserter::insertBatch(BNode& root,
                                                   Folder& components,
                                                   Files& fileNames,
                                                   PathTrack& pathTrack) {
    Insertion insertion(root, pool_, index_, pathTrack);
    std::size_t stored = 0;
    for (const ComponentView component : components) {
        const std::uint64_t position =
            insertion.enter(component, NodePool::Kind::folder);
        pathTrack.push_back(position);
        if (insertion.existed()) ++stored;
    }
    const std::uint64_t first = appendFiles(insertion.node(), fileNames);
    insertion.commit();
    if constexpr (std::is_same_v<Folder, Components>) {
        for (std::size_t i = stored; i < components.size(); ++i)
            releaseContents(components[i]);
        for (Component& name : fileNames) releaseContents(name);
    }
    return {insertion.node(), insertion.existed(), first};
}

template <class Files>
std::uint64_t TreeInserter::appendFiles(BNode& folder, const Files& fileNames) {
    const std::size_t before = folder.children().size();
    if (fileNames.empty()) return before;
    NodePool::reserve(folder, fileNames.size());
    try {
        for (const ComponentView name : fileNames)
            pool_.add(folder, name, NodePool::Kind::leaf);
    } catch (...) {
        NodePool::truncate(folder, before);
        throw;
    }
    return before;
}

TreeInserter::AddedBatch TreeInserter::addBatch(BNode& root,
                                                Components& folderComponents,
                                                Components& fileNames,
                                                PathTrack& pathTrack) {
    return insertBatch(root, folderComponents, fileNames, pathTrack);
}

TreeInserter::AddedBatch TreeInserter::addBatch(
    BNode& root, const ComponentList& folderComponents,
    const ComponentList& fileNames, PathTrack& pathTrack) {
    return insertBatch(root, folderComponents, fileNames, pathTrack);
}

std::uint64_t TreeInserter::addFiles(BNode& folder,
                                     const ComponentList& fileNames) {
    return appendFiles(folder, fileNames);
}

void TreeInserter::releaseIndex(std::size_t maxChildren) noexcept {
    if (index_.indexedChildren() <= maxChildren) index_.clear();
}

}  // namespace tessel
