#include "binding/PathCells.hpp"

#include "binding/Conversions.hpp"
#include "pathtree/containers.hpp"

namespace tessel::binding {

namespace {

// Names from the tree, in lists of views.
using NameViews = std::span<const ComponentView>;

}  // namespace

// Collects what is visited, as views.
class PathCells::Collector {
public:
    void beginFolder(std::size_t maxFiles) {
        reserveGently(names_, maxFiles);
        entries_.push_back({names_.size(), names_.size()});
    }
    void folder(ComponentView name) {
        names_.push_back(name);
        entries_.back().filesBegin = names_.size();
    }
    void file(ComponentView name) { names_.push_back(name); }

    std::vector<NameViews> folders() const {
        std::vector<NameViews> lists;
        for (const Entry& entry : entries_)
            lists.push_back(between(entry.begin, entry.filesBegin));
        return lists;
    }
    std::vector<NameViews> files() const {
        std::vector<NameViews> lists;
        for (std::size_t i = 0; i < entries_.size(); ++i) {
            const bool isLast = i + 1 == entries_.size();
            lists.push_back(
                between(entries_[i].filesBegin,
                        isLast ? names_.size() : entries_[i + 1].begin));
        }
        return lists;
    }

private:
    // Where a folder's components and its files' names begin.
    struct Entry {
        std::size_t begin;
        std::size_t filesBegin;
    };

    NameViews between(std::size_t begin, std::size_t end) const {
        return NameViews(names_).subspan(begin, end - begin);
    }

    std::vector<ComponentView> names_;
    std::vector<Entry> entries_;
};

// Fills a cell with joined paths. The text before a folder's file names is the
// root, which carries its own separator, then each other folder name followed
// by a separator.
class PathCells::Joiner {
public:
    Joiner(PathCells& cells, const OwnedArray& cell,
           std::u16string_view separator)
        : cells_(cells), cell_(cell), separator_(separator) {}

    void beginFolder(std::size_t /*maxFiles*/) {
        cells_.text_.clear();
        depth_ = 0;
    }
    void folder(ComponentView name) {
        cells_.coder_.appendPathFrom(name, cells_.text_);
        if (depth_++ > 0) cells_.text_ += separator_;
        folderEnd_ = cells_.text_.size();
    }
    void file(ComponentView name) {
        if (depth_ == 0) return;
        cells_.text_.resize(folderEnd_);
        cells_.coder_.appendPathFrom(name, cells_.text_);
        cells_.setText(cell_, next_++);
    }

private:
    PathCells& cells_;
    const OwnedArray& cell_;
    std::u16string_view separator_;
    std::size_t depth_ = 0;
    std::size_t folderEnd_ = 0;
    std::size_t next_ = 0;
};

PathCells::PathCells(const HuffmanPathTree& coder)
    : coder_(coder), host_(host()) {}

OwnedArray PathCells::components(const PathView& path) {
    const std::size_t depth = path.folders.size();
    OwnedArray cell = createCell(depth + 1, 1);
    for (std::size_t i = 0; i < depth; ++i) setName(cell, i, path.folders[i]);
    setName(cell, depth, path.name);
    return cell;
}

PathCells::FoldersAndFiles PathCells::foldersAndFiles(
    const std::vector<double>& numbers) {
    if (hasTracksOnly())
        return {columns(foldersByTrack(numbers)), createCell(0, 1)};
    Collector collector;
    retrieval().visit(PathNumbers(numbers), collector);
    OwnedArray folders = columns(collector.folders());
    return {std::move(folders), columns(collector.files())};
}

OwnedArray PathCells::joined(const std::vector<double>& numbers,
                             std::u16string_view separator) {
    OwnedArray cell = createCell(numbers.size(), 1);
    if (hasTracksOnly()) {
        foldersByTrack(numbers);  // throws if a number is none
        return cell;
    }
    retrieval().visit(PathNumbers(numbers), Joiner(*this, cell, separator));
    return cell;
}

std::vector<Components> PathCells::foldersByTrack(
    const std::vector<double>& numbers) const {
    std::vector<Components> folders;
    std::vector<Components> files;
    coder_.getPath(folders, files, numbers);
    return folders;
}

template <class Names>
OwnedArray PathCells::column(const Names& names) {
    OwnedArray cell = createCell(names.size(), 1);
    for (std::size_t i = 0; i < names.size(); ++i) setName(cell, i, names[i]);
    return cell;
}

template <class Lists>
OwnedArray PathCells::columns(const Lists& lists) {
    OwnedArray cell = createCell(lists.size(), 1);
    for (std::size_t i = 0; i < lists.size(); ++i)
        setCell(cell, i, column(lists[i]));
    return cell;
}

void PathCells::setName(const OwnedArray& cell, std::size_t index,
                        ComponentView name) {
    text_.clear();
    coder_.appendPathFrom(name, text_);
    setText(cell, index);
}

void PathCells::setText(const OwnedArray& cell, std::size_t index) {
    HostArray* const text = host_.hostCreateCharArray(text_);
    if (text == nullptr) throw HostAllocationFailure();
    host_.hostSetCell(cell.get(), index, text);
}

}  // namespace tessel::binding
