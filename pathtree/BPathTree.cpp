#include "pathtree/BPathTree.hpp"

#include <algorithm>
#include <iterator>
#include <stdexcept>
#include <unordered_set>
#include <utility>

#include "pathtree/ComponentArena.hpp"
#include "pathtree/NodeSlab.hpp"
#include "pathtree/NodeWalk.hpp"
#include "pathtree/TrackLookup.hpp"
#include "pathtree/TreeInserter.hpp"
#include "pathtree/containers.hpp"

namespace tessel {

namespace {

void appendCopy(ComponentView value, Components& out) {
    out.emplace_back(value.begin(), value.end());
}

void assignCopy(ComponentView value, Component& out) {
    out.assign(value.begin(), value.end());
}

// Appends `more` to `out`, or nothing if memory runs out.
void appendAll(Components& out, Components& more) {
    reserveGently(out, more.size());
    std::move(more.begin(), more.end(), std::back_inserter(out));
}

// The components as a packed list, valid as long as the arena.
ComponentList packedBy(ComponentArena& arena, const Components& components) {
    for (const Component& component : components) arena.append(component);
    return arena.finish();
}

// Empties the components from position `first` on: they are nodes now.
void releaseFrom(Components& components, std::size_t first) noexcept {
    for (std::size_t i = first; i < components.size(); ++i)
        releaseContents(components[i]);
}

std::size_t componentBytes(const Components& components) {
    std::size_t bytes = components.capacity() * sizeof(Component);
    for (const Component& component : components) bytes += component.capacity();
    return bytes;
}

}  // namespace

BPathTree::BPathTree() : inserter_(std::make_unique<TreeInserter>()) {
    root = inserter_->makeRoot();
}

BPathTree::BPathTree(const BPathTree& other)
    : root(other.root),
      pendingNodes(other.pendingNodes),
      parentNodes(other.parentNodes),
      currentPrefix(other.currentPrefix),
      spareFlag(other.spareFlag),
      inserter_(std::make_unique<TreeInserter>()) {}

BPathTree::~BPathTree() = default;

// ---- Insertion ----

std::uint64_t BPathTree::findNode(const Component& value,
                                  const ChildList& nodes) const {
    ChildReader reader = nodes.reader();
    for (std::uint64_t i = 0; !reader.atEnd(); ++i)
        if (sameComponent(reader.next().value(), value)) return i;
    return allOnes;
}

// Not through the index: `nodes` may be those of any tree, and the index must
// not know nodes that this one does not keep alive.
std::uint64_t BPathTree::addIfExistsAndFind(const ChildList& nodes,
                                            Component& value,
                                            bool& existed) const {
    const std::uint64_t found = findNode(value, nodes);
    existed = found != allOnes;
    if (existed) return found;
    inserter_->add(nodes.node(), value);
    releaseContents(value);
    return nodes.size() - 1;
}

bool BPathTree::addPath(Components& components, PathTrack& pathTrack) {
    ComponentArena arena;
    const std::size_t before = pathTrack.size();
    const bool existed =
        inserter_->addPath(*root, packedBy(arena, components), pathTrack);
    releaseFrom(components, pathTrack.size() - before);
    return existed;
}

bool BPathTree::addPath(Components& folderComponents, Components& fileNames,
                        PathTrack& pathTrack, std::uint64_t& firstFileIndex) {
    ComponentArena arena;
    const ComponentList folder = packedBy(arena, folderComponents);
    const ComponentList files = packedBy(arena, fileNames);
    const TreeInserter::AddedBatch added =
        inserter_->addBatch(*root, folder, files, pathTrack);
    releaseFrom(folderComponents, added.storedComponents);
    releaseFrom(fileNames, 0);
    firstFileIndex = added.existed ? added.firstFile : allOnes;
    return added.existed;
}

bool BPathTree::isLeaf(const BNodePtr& node) const noexcept {
    return node->isLeaf();
}

// ---- Iteration ----

void BPathTree::pushAllChildren(const BNodePtr& node, NodeStack& stack) const {
    stack.pushChildren(node);
}

void BPathTree::pushAllChildren(const BNodePtr& node) {
    pushAllChildren(node, pendingNodes);
}

bool BPathTree::isNodeAtEndOfParent(const BNodePtr& node,
                                    const NodeStack& parents) const noexcept {
    if (parents.empty()) return false;
    const FolderNode* const parent = parents.top().folder();
    const std::uint64_t siblings =
        parent == nullptr ? 0 : parent->children().count();
    return siblings > 0 && node->isChildAt(*parent, siblings - 1);
}

bool BPathTree::isNodeAtEndOfParent(const BNodePtr& node) const noexcept {
    return isNodeAtEndOfParent(node, parentNodes);
}

void BPathTree::reset() {
    inserter_->releaseIndex();
    if (root->isLeaf()) return;
    inserter_->trim(*root);
    // Room first, so that it changes nothing if memory runs out.
    pendingNodes.reserve(1);
    parentNodes.reserve(1);
    pendingNodes.clear();
    pushAllChildren(root);
    parentNodes.clear();
    parentNodes.push(root);
    currentPrefix.clear();
    unchangedFolders_ = 0;
}

bool BPathTree::hasNextPath() const noexcept {
    return !root->isLeaf() && !pendingNodes.empty();
}

// Enters folders until a file is on top of the pending nodes; returns its
// name. Each folder is entered as a whole or, if memory runs out, not at all.
ComponentView BPathTree::enterFolders() {
    if (!hasNextPath()) throw NoMorePathException();
    for (;;) {
        const Child top = pendingNodes.topChild();
        if (top.folder == nullptr) return top.name;
        const BNodePtr folder{BNode(*top.folder)};
        pendingNodes.reserve(1);
        parentNodes.reserve(1);
        reserveGently(currentPrefix, 1);
        appendCopy(folder->value(), currentPrefix);
        pendingNodes.pop();
        pushAllChildren(folder);
        parentNodes.push(folder);
    }
}

// Takes the file on top off, and the folders that end with it.
void BPathTree::leavePath() noexcept {
    const FolderNode* const parent =
        parentNodes.empty() ? nullptr : parentNodes.top().folder();
    const bool isLast =
        parent != nullptr && pendingNodes.isTopLastFileOf(*parent);
    pendingNodes.pop();
    if (isLast) closeFinishedFolders();
    unchangedFolders_ = currentPrefix.size();
}

void BPathTree::closeFinishedFolders() noexcept {
    while (!parentNodes.empty()) {
        const BNodePtr folder(parentNodes.top());
        parentNodes.pop();
        if (!currentPrefix.empty()) currentPrefix.pop_back();
        if (!isNodeAtEndOfParent(folder)) return;
    }
}

void BPathTree::getNextPath(Components& out) {
    visitNextPath([&out](const PathView& path) {
        // Assigning in place keeps the memory that out already has.
        out.resize(path.folders.size() + 1);
        std::copy(path.folders.begin(), path.folders.end(), out.begin());
        assignCopy(path.name, out.back());
    });
}

// ---- Lookup ----

void BPathTree::traversePath(const PathTrack& pathTrack,
                             Components& out) const {
    Components found;
    found.reserve(pathTrack.size());
    TrackLookup(*root).visitTrack(
        pathTrack, [&found](ComponentView value) { appendCopy(value, found); });
    appendAll(out, found);
}

void BPathTree::getPath(
    std::vector<Components>& folderPaths, std::vector<Components>& filePaths,
    const std::vector<std::uint64_t>& selectedPartitions,
    const std::vector<PathTrack>& partitionTracks,
    const std::vector<std::vector<std::uint64_t>>& fileOffsets) const {
    const std::size_t count = selectedPartitions.size();
    if (fileOffsets.size() < count)
        throw std::out_of_range("A selected partition has no file offsets.");
    std::vector<Components> folders(count);
    std::vector<Components> files(count);
    for (std::size_t i = 0; i < count; ++i) {
        const std::uint64_t partition = selectedPartitions[i];
        if (partition >= partitionTracks.size())
            throw std::out_of_range("A partition does not exist.");
        TrackLookup(*root).visitBatch(
            partitionTracks[static_cast<std::size_t>(partition)],
            fileOffsets[i],
            [&](ComponentView value) { appendCopy(value, folders[i]); },
            [&](ComponentView value) { appendCopy(value, files[i]); });
    }
    // Room first, so that nothing is appended if memory runs out.
    const bool oneList = &folderPaths == &filePaths;
    reserveGently(folderPaths, oneList ? 2 * count : count);
    if (!oneList) reserveGently(filePaths, count);
    for (std::size_t i = 0; i < count; ++i) {
        folderPaths.push_back(std::move(folders[i]));
        filePaths.push_back(std::move(files[i]));
    }
}

// ---- Memory ----

BPathTree::MemoryUsage BPathTree::memoryUsage() const {
    MemoryUsage usage;
    std::unordered_set<NodeSlab*> slabs;
    NodeSlab* latest = nullptr;
    const auto account = [&](const FolderNode& node) {
        std::size_t fileNames = 0;
        for (ChildReader files(node.children()); !files.atEnd();)
            fileNames += files.next().name.size();
        const std::size_t ownBlock = node.ownChildBytes();
        usage.names += node.value().size() + fileNames;
        usage.nodes += node.ownValueBytes() - node.value().size();
        usage.nodes -= ownBlock > 0 ? 0 : fileNames;
        usage.childLists += ownBlock > 0 ? ownBlock - fileNames : 0;
        NodeSlab* slab = NodeSlab::of(&node);
        if (slab == latest) return;
        latest = slab;
        if (slabs.insert(slab).second) usage.nodes += slab->memoryBytes();
    };
    if (root->folder() != nullptr) account(*root->folder());
    for (NodeWalk walk(*root); walk.next();)
        if (walk.node().folder != nullptr) account(*walk.node().folder);
    usage.childIndex = inserter_->indexBytes();
    usage.iteration = pendingNodes.memoryBytes() + parentNodes.memoryBytes() +
                      componentBytes(currentPrefix);
    return usage;
}

}  // namespace tessel
