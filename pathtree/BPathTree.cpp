#include "pathtree/BPathTree.hpp"

#include <algorithm>
#include <iterator>
#include <stdexcept>
#include <unordered_set>
#include <utility>

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
    const std::size_t count = nodes.size();
    for (std::size_t i = 0; i < count; ++i)
        if (sameComponent(nodes[i].value(), value)) return i;
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
    inserter_->add(nodes.node(), value, NodePool::Kind::leaf);
    releaseContents(value);
    return nodes.size() - 1;
}

bool BPathTree::addPath(Components& components, PathTrack& pathTrack) {
    return inserter_->addPath(*root, components, pathTrack);
}

bool BPathTree::addPath(Components& folderComponents, Components& fileNames,
                        PathTrack& pathTrack, std::uint64_t& firstFileIndex) {
    const TreeInserter::AddedBatch added =
        inserter_->addBatch(*root, folderComponents, fileNames, pathTrack);
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
    const ChildList siblings = parents.top().children();
    return !siblings.empty() && &siblings.back() == node.get();
}

bool BPathTree::isNodeAtEndOfParent(const BNodePtr& node) const noexcept {
    return isNodeAtEndOfParent(node, parentNodes);
}

void BPathTree::reset() {
    inserter_->releaseIndex();
    if (root->isLeaf()) return;
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

// Enters folders until a leaf is on top of the pending nodes; returns it.
// Each folder is entered as a whole or, if memory runs out, not at all.
const BNode& BPathTree::enterFolders() {
    if (!hasNextPath()) throw NoMorePathException();
    while (!pendingNodes.top().isLeaf()) {
        const BNodePtr folder(&pendingNodes.top());
        pendingNodes.reserve(1);
        parentNodes.reserve(1);
        reserveGently(currentPrefix, 1);
        appendCopy(folder->value(), currentPrefix);
        pendingNodes.pop();
        pushAllChildren(folder);
        parentNodes.push(folder);
    }
    return pendingNodes.top();
}

// Takes the leaf on top off, and the folders that end with it.
void BPathTree::leavePath() noexcept {
    const BNodePtr leaf(&pendingNodes.top());
    pendingNodes.pop();
    if (isNodeAtEndOfParent(leaf)) closeFinishedFolders();
    unchangedFolders_ = currentPrefix.size();
}

void BPathTree::closeFinishedFolders() noexcept {
    while (!parentNodes.empty()) {
        const BNodePtr folder(&parentNodes.top());
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
    const auto account = [&](const BNode& node) {
        usage.names += node.value().size();
        usage.nodes += node.ownValueBytes();
        usage.childLists += node.childListBytes();
        NodeSlab* slab = NodeSlab::of(&node);
        if (slab == latest) return;
        latest = slab;
        if (slabs.insert(slab).second) usage.nodes += slab->memoryBytes();
    };
    account(*root);
    for (NodeWalk walk(*root); walk.next();) account(walk.node());
    usage.nodes -= usage.names;
    usage.childIndex = inserter_->indexBytes();
    usage.iteration = pendingNodes.memoryBytes() + parentNodes.memoryBytes() +
                      componentBytes(currentPrefix);
    return usage;
}

}  // namespace tessel
