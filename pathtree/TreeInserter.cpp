#include "pathtree/TreeInserter.hpp"

#include <array>
#include <stdexcept>
#include <vector>

#include "pathtree/NodeWalk.hpp"
#include "pathtree/containers.hpp"

namespace tessel {

namespace {

ChildBatch batchOf(const ComponentList& files) noexcept {
    return {files.bytes(), files.size()};
}

}  // namespace

// Follows components from the root down as far as they are stored, and notes
// the positions. Unless it is kept, its end takes the positions away again.
class TreeInserter::Descent {
public:
    Descent(ChildIndex& index, BNode root, const ComponentList& components,
            PathTrack& track)
        : track_(track),
          trackLength_(track.size()),
          node_(root),
          next_(components.begin()),
          end_(components.end()) {
        track_.reserve(trackLength_ + components.size());
        try {
            while (next_ != end_ && step(index)) ++next_;
        } catch (...) {
            track_.resize(trackLength_);
            throw;
        }
    }
    Descent(const Descent&) = delete;
    Descent& operator=(const Descent&) = delete;
    ~Descent() {
        if (!kept_) track_.resize(trackLength_);
    }

    // The last node that is stored.
    BNode node() const noexcept { return node_; }
    // The first component that is not stored.
    ComponentList::Iterator next() const noexcept { return next_; }
    bool isAllStored() const noexcept { return next_ == end_; }
    void keep() noexcept { kept_ = true; }

private:
    bool step(ChildIndex& index) {
        FolderNode* const folder = node_.folder();
        if (folder == nullptr) return false;
        const std::size_t position = index.find(*folder, *next_);
        if (position == ChildIndex::notFound) return false;
        node_ = BNode(*folder, position);
        track_.push_back(position);
        return true;
    }

    PathTrack& track_;
    std::size_t trackLength_;
    BNode node_;
    ComponentList::Iterator next_;
    ComponentList::Iterator end_;
    bool kept_ = false;
};

// New components, one below the other, made from the last to the first: what
// is to be attached is always one child.
class TreeInserter::Chain {
public:
    // Files go below the last component. There must be a component.
    Chain(NodePool& pool, ComponentList::Iterator first,
          ComponentList::Iterator end, const ChildBatch& files) {
        std::vector<ComponentList::Iterator> components;
        for (; first != end; ++first) components.push_back(first);
        depth_ = components.size();
        last_ = components.back().packedBytes();
        if (files.count > 0) wrap(pool, *components.back(), files);
        components.pop_back();
        for (; !components.empty(); components.pop_back())
            wrap(pool, *components.back(), top());
    }

    // The first component as a child to be attached; its share stays here
    // until release().
    ChildBatch top() noexcept {
        if (!top_) return {last_, 1};
        ChildBlock::writeFolder(entry_.data(), top_->folder());
        return {entry_, 1, true, false};
    }
    void release() noexcept { top_.release(); }

    // The node of the last component, after the first was attached at this
    // position of a folder.
    BNode last(FolderNode& parent, std::uint64_t position) const noexcept {
        return bottom_ == nullptr ? BNode(parent, position)
               : bottomIsLast_    ? BNode(*bottom_)
                                  : BNode(*bottom_, 0);
    }
    std::size_t depth() const noexcept { return depth_; }

private:
    void wrap(NodePool& pool, ComponentView name, const ChildBatch& children) {
        FolderNode* const made = pool.make(name, children);
        if (bottom_ == nullptr) {
            bottom_ = made;
            bottomIsLast_ = children.entries.data() != last_.data();
        }
        top_.release();
        top_ = BNodePtr::adopt(made);
    }

    std::size_t depth_ = 0;
    ComponentView last_;  // as a packed file
    BNodePtr top_;        // the folder made last
    FolderNode* bottom_ = nullptr;
    bool bottomIsLast_ = false;
    std::array<std::uint8_t, ChildBlock::folderEntryBytes> entry_{};
};

// The index borrows nodes. Those of another tree may be released by now, and
// others may be where they were.
void TreeInserter::indexUnder(BNode root) {
    if (indexedRoot_ && *indexedRoot_ == root) return;
    clearIndex();
    indexedRoot_ = BNodePtr(root);
}

void TreeInserter::clearIndex() noexcept {
    index_.clear();
    indexedRoot_ = {};
}

BNodePtr TreeInserter::makeRoot() {
    clearIndex();
    return BNodePtr::adopt(pool_.make({}, {}));
}

// Takes over the shares of the children unless it throws.
void TreeInserter::attach(BNode parent, const ChildBatch& children) {
    if (parent.place_ == nullptr)
        throw std::logic_error("There is no node to insert under.");
    if (FolderNode* const folder = parent.folder()) {
        if (folder->children().count() > 0) hasGrown_ = true;
        folder->append(children);
        return;
    }
    parent.place_->reservePromotion(parent.position_);
    FolderNode* const made = pool_.make(parent.value(), children);
    parent.place_->promote(parent.position_, made);
}

void TreeInserter::add(BNode parent, ComponentView value) {
    std::vector<std::uint8_t> entry(packed::headerBytes(value.size()));
    packed::writeHeader(entry.data(), value.size());
    entry.insert(entry.end(), value.begin(), value.end());
    attach(parent, {entry, 1});
}

bool TreeInserter::addPath(BNode root, const ComponentList& components,
                           PathTrack& pathTrack) {
    indexUnder(root);
    Descent descent(index_, root, components, pathTrack);
    if (!descent.isAllStored()) {
        Chain chain(pool_, descent.next(), components.end(), {});
        attach(descent.node(), chain.top());
        chain.release();
    }
    descent.keep();
    return descent.isAllStored() && !components.empty();
}

TreeInserter::AddedBatch TreeInserter::addBatch(BNode root, BNode start,
                                                const ComponentList& components,
                                                const ComponentList& fileNames,
                                                PathTrack& pathTrack) {
    indexUnder(root);
    Descent descent(index_, start, components, pathTrack);
    const BNode found = descent.node();
    if (descent.isAllStored()) {
        const std::uint64_t first = addFiles(found, fileNames);
        descent.keep();
        return {found, !components.empty(), first, components.size()};
    }
    const std::size_t depth = components.size();
    Chain chain(pool_, descent.next(), components.end(), batchOf(fileNames));
    const std::uint64_t position = found.children().size();
    attach(found, chain.top());
    chain.release();
    descent.keep();
    pathTrack.push_back(position);  // there is room
    for (std::size_t i = 1; i < chain.depth(); ++i) pathTrack.push_back(0);
    return {chain.last(*found.folder(), position), false, 0,
            depth - chain.depth()};
}

std::uint64_t TreeInserter::addFiles(BNode folder,
                                     const ComponentList& fileNames) {
    const std::uint64_t first = folder.children().size();
    if (!fileNames.empty()) attach(folder, batchOf(fileNames));
    return first;
}

void TreeInserter::releaseIndex(std::size_t maxChildren) noexcept {
    if (index_.indexedChildren() <= maxChildren) clearIndex();
}

void TreeInserter::trim(BNode root) {
    if (!hasGrown_ || root.folder() == nullptr) return;
    root.folder()->trim();
    for (NodeWalk walk(root); walk.next();)
        if (walk.node().folder != nullptr) walk.node().folder->trim();
    hasGrown_ = false;
}

}  // namespace tessel
