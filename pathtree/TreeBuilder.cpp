#include "pathtree/TreeBuilder.hpp"

#include <algorithm>
#include <stdexcept>

#include "packing/ByteCursor.hpp"
#include "pathtree/NodeCode.hpp"

namespace tessel {

namespace {

BNode newRoot(BPathTree& target) {
    target.root = target.inserter().makeRoot();
    return *target.root;
}

}  // namespace

TreeBuilder::TreeBuilder(BPathTree& target,
                         std::span<const std::uint8_t> nodeCodes)
    : inserter_(target.inserter()), root_(newRoot(target)), codes_(nodeCodes) {
    entries_.push_back(0);  // the root's name, which is empty
    open_.push_back({0});
}

TreeBuilder::~TreeBuilder() {
    try {
        while (!open_.empty()) close();
    } catch (...) {
        releaseWaiting();
    }
}

void TreeBuilder::add(ComponentView value) {
    if (nextCode_ == codes_.size()) throw DamagedFormException();
    const std::uint8_t code = codes_[nextCode_++];
    const std::size_t at = entries_.size();
    push(value);
    OpenFolder& parent = open_.back();
    if (code > nodecode::maxCode) {
        parent.hasFiles = true;
        throw UnknownNodeTypeException();
    }
    parent.hasLastChild = (code & nodecode::siblingFollows) == 0;
    if ((code & nodecode::hasChildren) != 0) {
        open_.push_back({at});
        return;
    }
    parent.hasFiles = true;
    ++leafCount_;
    while (!open_.empty() && open_.back().hasLastChild) close();
}

// Puts a child on the stack, as a file until more is known.
void TreeBuilder::push(ComponentView value) {
    if (open_.back().count == ChildBlock::maxChildren)
        throw std::length_error("A folder has too many children.");
    const std::size_t at = entries_.size();
    const std::size_t header = packed::headerBytes(value.size());
    entries_.resize(at + header + value.size());
    std::copy(value.begin(), value.end(),
              packed::writeHeader(entries_.data() + at, value.size()));
    ++open_.back().count;
}

// Makes the last open folder's node, or fills the root. A folder without
// children stays a file.
void TreeBuilder::close() {
    const OpenFolder folder = open_.back();
    entries_.reserve(folder.nameAt + ChildBlock::folderEntryBytes);
    const std::uint8_t* const name = entries_.data() + folder.nameAt;
    const ComponentView value = packed::readComponent(name);
    const ChildBatch children{
        {value.data() + value.size(), entries_.data() + entries_.size()},
        folder.count,
        folder.hasFolders,
        folder.hasFiles};
    if (open_.size() == 1) {
        if (folder.count > 0) root_.folder()->append(children);
        entries_.clear();
    } else {
        OpenFolder& parent = open_[open_.size() - 2];
        if (folder.count > 0) replaceByNode(folder.nameAt, children);
        parent.hasFolders |= folder.count > 0;
        parent.hasFiles |= folder.count == 0;
    }
    open_.pop_back();
}

// Puts a node in the place of the folder's name and children. There is room.
void TreeBuilder::replaceByNode(std::size_t nameAt,
                                const ChildBatch& children) {
    FolderNode* const made = inserter_.makeFolder(
        packed::readComponent(entries_.data() + nameAt), children);
    entries_.resize(nameAt + ChildBlock::folderEntryBytes);
    ChildBlock::writeFolder(entries_.data() + nameAt, made);
}

void TreeBuilder::releaseWaiting() noexcept {
    const std::uint8_t* entry = entries_.data();
    const std::uint8_t* const end = entry + entries_.size();
    while (entry != end) {
        const std::size_t size = ChildBlock::sizeOf(entry, false);
        if (*entry == packed::folderMark)
            ChildBlock::folderAt(entry)->release();
        entry += size;
    }
}

}  // namespace tessel
