#include "pathtree/BPathTree.hpp"

#include <algorithm>
#include <iterator>
#include <stdexcept>
#include <unordered_set>
#include <utility>

#include "pathtree/NodeWalk.hpp"
#include "pathtree/containers.hpp"

namespace tessel {

namespace {

void appendCopy(ComponentView value, Components& out) {
    out.emplace_back(value.begin(), value.end());
}

// A component that became a node has been moved from: it is left empty. One
// in a packed list is only read.
void takeOver(Component& component) { releaseContents(component); }
void takeOver(const ComponentView&) {}

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

const char* NoMorePathException::what() const noexcept {
    return "No more paths to provide.";
}

const char* NoTreeToTraverseException::what() const noexcept {
    return "Cannot traverse an empty tree for a path.";
}

const char* EmptyPathForTraverseException::what() const noexcept {
    return "Cannot traverse an tree for an empty path track.";
}

const char* UnknownNodeTypeException::what() const noexcept {
    return "Cannot determine the node type for the given value.";
}

const BNode& BatchFiles::childAt(const BNode& node, std::uint64_t position) {
    const ChildList children = node.children();
    if (position >= children.size())
        throw std::out_of_range("A position leads outside the path tree.");
    return children[static_cast<std::size_t>(position)];
}

BPathTree::BPathTree() {
    root = BNodePtr::adopt(pool_.make({}, NodePool::Kind::folder));
}

BPathTree::BPathTree(const BPathTree& other)
    : root(other.root),
      pendingNodes(other.pendingNodes),
      parentNodes(other.parentNodes),
      currentPrefix(other.currentPrefix),
      spareFlag(other.spareFlag) {}

BPathTree::~BPathTree() = default;

// ---- Insertion ----

std::uint64_t BPathTree::findNode(const Component& value,
                                  const ChildList& nodes) const {
    const std::size_t count = nodes.size();
    for (std::size_t i = 0; i < count; ++i)
        if (sameComponent(nodes[i].value(), value)) return i;
    return allOnes;
}

// Not through the finder: `nodes` may be those of any tree, and the finder
// must not know nodes that this one does not keep alive.
std::uint64_t BPathTree::addIfExistsAndFind(const ChildList& nodes,
                                            Component& value,
                                            bool& existed) const {
    const std::uint64_t found = findNode(value, nodes);
    existed = found != allOnes;
    if (existed) return found;
    pool_.add(nodes.node(), value, NodePool::Kind::leaf);
    takeOver(value);
    return nodes.size() - 1;
}

ChildFinder::Found BPathTree::findOrAppend(BNode& parent, ComponentView value,
                                           NodePool::Kind kind,
                                           bool& existed) const {
    const ChildFinder::Found found = finder_.find(parent, value);
    existed = found.child != nullptr;
    if (existed) return found;
    BNode& made = pool_.add(parent, value, kind);
    finder_.noteAppended(parent);
    return {&made, parent.children().size() - 1};
}

bool BPathTree::addPath(Components& components, PathTrack& pathTrack) {
    bool existed = false;
    BNode* node = root.get();
    for (std::size_t i = 0; i < components.size(); ++i) {
        const auto kind = i + 1 < components.size() ? NodePool::Kind::folder
                                                    : NodePool::Kind::leaf;
        const auto [child, position] =
            findOrAppend(*node, components[i], kind, existed);
        if (existed)
            pathTrack.push_back(position);
        else
            takeOver(components[i]);
        node = child;
    }
    return existed;
}

template <class Folder>
BNode& BPathTree::findOrAddFolder(Folder& components, PathTrack& pathTrack,
                                  bool& existed) {
    existed = false;
    BNode* folder = root.get();
    for (auto&& component : components) {
        const auto [child, position] =
            findOrAppend(*folder, component, NodePool::Kind::folder, existed);
        if (!existed) takeOver(component);
        pathTrack.push_back(position);
        folder = child;
    }
    return *folder;
}

template <class Files>
std::uint64_t BPathTree::appendFiles(BNode& folder, Files& fileNames) {
    const std::size_t before = folder.children().size();
    if (fileNames.empty()) return before;
    NodePool::reserve(folder, fileNames.size());
    try {
        for (auto&& name : fileNames)
            pool_.add(folder, name, NodePool::Kind::leaf);
    } catch (...) {
        NodePool::truncate(folder, before);
        throw;
    }
    for (auto&& name : fileNames) takeOver(name);
    return before;
}

bool BPathTree::addPath(Components& folderComponents, Components& fileNames,
                        PathTrack& pathTrack, std::uint64_t& firstFileIndex) {
    bool existed = false;
    BNode& folder = findOrAddFolder(folderComponents, pathTrack, existed);
    const std::uint64_t first = appendFiles(folder, fileNames);
    firstFileIndex = existed ? first : allOnes;
    return existed;
}

BNode& BPathTree::addFolder(const PackedComponents& folderComponents,
                            PathTrack& pathTrack, bool& existed) {
    return findOrAddFolder(folderComponents, pathTrack, existed);
}

std::uint64_t BPathTree::addFiles(BNode& folder,
                                  const PackedComponents& fileNames) {
    return appendFiles(folder, fileNames);
}

bool BPathTree::isLeaf(const BNodePtr& node) const noexcept {
    return node->isLeaf();
}

void BPathTree::releaseFinder(std::size_t most) noexcept {
    if (finder_.indexedChildren() <= most) finder_.clear();
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
    finder_.clear();
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

BatchFiles BPathTree::filesOfRoot() const {
    if (root->isLeaf()) throw std::out_of_range("A track leads nowhere.");
    return {*root, 0};
}

void BPathTree::traversePath(const PathTrack& pathTrack,
                             Components& out) const {
    Components found;
    found.reserve(pathTrack.size());
    visitTrack(pathTrack,
               [&found](ComponentView value) { appendCopy(value, found); });
    appendAll(out, found);
}

void BPathTree::getBatch(Components& folder, Components& files,
                         const PathTrack& track,
                         const std::vector<std::uint64_t>& offsets) const {
    folder.reserve(folder.size() + track.size());
    files.reserve(files.size() + offsets.size());
    visitBatch(
        track, offsets,
        [&folder](ComponentView value) { appendCopy(value, folder); },
        [&files](ComponentView value) { appendCopy(value, files); });
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
        getBatch(folders[i], files[i],
                 partitionTracks[static_cast<std::size_t>(partition)],
                 fileOffsets[i]);
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
    std::unordered_set<const void*> slabs;
    const void* latest = nullptr;
    const auto account = [&](const BNode& node) {
        usage.names += node.value().size();
        usage.childLists += NodeMemory::childListBytes(node);
        const auto [slab, bytes] = NodeMemory::slab(node);
        if (slab == latest) return;
        latest = slab;
        if (slabs.insert(slab).second) usage.nodes += bytes;
    };
    account(*root);
    for (NodeWalk walk(*root); walk.next();) account(walk.node());
    usage.nodes -= usage.names;
    usage.finder = finder_.memoryBytes();
    usage.iteration = pendingNodes.memoryBytes() + parentNodes.memoryBytes() +
                      componentBytes(currentPrefix);
    return usage;
}

}  // namespace tessel
