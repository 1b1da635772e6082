#include "pathtree/BPathTree.hpp"

#include <algorithm>
#include <iterator>
#include <stdexcept>
#include <type_traits>
#include <unordered_set>
#include <utility>

#include "pathtree/NodeWalk.hpp"
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
    releaseContents(value);
    return nodes.size() - 1;
}

// One insertion on its way down from the root. Unless it is committed, it
// takes the nodes that it made away again, and the track's new positions.
class BPathTree::Insertion {
public:
    Insertion(BPathTree& target, PathTrack& pathTrack) noexcept
        : tree_(target),
          track_(pathTrack),
          trackLength_(pathTrack.size()),
          node_(target.root.get()) {}
    Insertion(const Insertion&) = delete;
    Insertion& operator=(const Insertion&) = delete;
    ~Insertion() {
        if (!committed_) takeBack();
    }

    // Goes to the child of this value; makes it if there is none. Returns
    // its position.
    std::uint64_t enter(ComponentView value, NodePool::Kind kind) {
        const ChildFinder::Found found = tree_.finder_.find(*node_, value);
        existed_ = found.child != nullptr;
        if (existed_) {
            node_ = found.child;
            return found.position;
        }
        if (firstChanged_ == nullptr) {
            firstChanged_ = node_;
            childrenBefore_ = node_->children().size();
        }
        BNode& made = tree_.pool_.add(*node_, value, kind);
        tree_.finder_.noteAppended(*node_);
        const std::size_t position = node_->children().size() - 1;
        node_ = &made;
        return position;
    }

    BNode& node() const noexcept { return *node_; }
    // Whether the last component entered was there.
    bool existed() const noexcept { return existed_; }
    void commit() noexcept { committed_ = true; }

private:
    // All new nodes are below the first one that was made.
    void takeBack() noexcept {
        tree_.finder_.clear();  // it may know nodes that go
        if (firstChanged_ != nullptr)
            NodePool::truncate(*firstChanged_, childrenBefore_);
        track_.resize(trackLength_);
    }

    BPathTree& tree_;
    PathTrack& track_;
    std::size_t trackLength_;
    BNode* node_;
    bool existed_ = false;
    bool committed_ = false;
    BNode* firstChanged_ = nullptr;  // the parent of the first new node
    std::size_t childrenBefore_ = 0;
};

bool BPathTree::addPath(Components& components, PathTrack& pathTrack) {
    Insertion insertion(*this, pathTrack);
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
BPathTree::AddedBatch BPathTree::insertBatch(Folder& components,
                                             Files& fileNames,
                                             PathTrack& pathTrack) {
    Insertion insertion(*this, pathTrack);
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
std::uint64_t BPathTree::appendFiles(BNode& folder, const Files& fileNames) {
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

bool BPathTree::addPath(Components& folderComponents, Components& fileNames,
                        PathTrack& pathTrack, std::uint64_t& firstFileIndex) {
    const AddedBatch added =
        insertBatch(folderComponents, fileNames, pathTrack);
    firstFileIndex = added.existed ? added.firstFile : allOnes;
    return added.existed;
}

BPathTree::AddedBatch BPathTree::addBatch(
    const PackedComponents& folderComponents, const PackedComponents& fileNames,
    PathTrack& pathTrack) {
    return insertBatch(folderComponents, fileNames, pathTrack);
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
