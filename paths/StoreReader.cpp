#include "paths/StoreReader.hpp"

#include <algorithm>
#include <array>
#include <cstdint>
#include <stdexcept>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "coder/PathIteration.hpp"
#include "coder/PathRetrieval.hpp"
#include "paths/IndexedRange.hpp"
#include "paths/Segments.hpp"

namespace tessel::paths {

namespace {

// Decodes one path after the other into one buffer.
//
// Folders that a path shares with the one before are not decoded again: their
// bytes are still there. Whether they are shared is seen by where in the tree
// their names are.
class PathDecoder {
public:
    // Turns to another coder, of which nothing is decoded.
    void startOn(const HuffmanPathTree& coder) noexcept {
        coder_ = &coder;
        levels_.clear();
    }

    // Turns to another path, whose folders are to follow from the top.
    void beginFolder() noexcept { depth_ = 0; }

    // Adds a folder whose name stays where it is for as long as this decoder
    // works on the coder.
    void addFolder(ComponentView name) {
        const bool isShared = depth_ < levels_.size() &&
                              levels_[depth_].name.data() == name.data() &&
                              levels_[depth_].name.size() == name.size();
        if (!isShared) decodeFolder(name);
        ++depth_;
    }

    // Turns to another path. So many of its folders are those of the path
    // before; names may have moved.
    void replaceFolders(std::span<const Component> folders,
                        std::size_t unchanged) {
        depth_ = std::min(unchanged, levels_.size());
        for (const Component& name : folders.subspan(depth_)) {
            decodeFolder(name);
            ++depth_;
        }
    }

    // The path of this file below the current folders. The view lives until
    // the decoder is used again.
    std::string_view pathOf(ComponentView fileName) {
        levels_.resize(depth_);
        path_.resize(endOf(depth_));
        append(fileName);
        if (path_.empty()) throw DamagedFormException();
        return path_;
    }

private:
    struct Level {
        ComponentView name;
        std::size_t end = 0;  // of the folders down to here, in path_
    };

    std::size_t endOf(std::size_t depth) const noexcept {
        return depth == 0 ? 0 : levels_[depth - 1].end;
    }

    void decodeFolder(ComponentView name) {
        levels_.resize(depth_);
        path_.resize(endOf(depth_));
        append(name);
        levels_.push_back({name, path_.size()});
    }

    void append(ComponentView name) {
        text_.clear();
        coder_->appendPathFrom(name, text_);
        if (!appendSegment(text_, path_)) throw DamagedFormException();
    }

    const HuffmanPathTree* coder_ = nullptr;
    std::vector<Level> levels_;
    std::size_t depth_ = 0;  // folders of the current path so far
    std::string path_;
    std::u16string text_;
};

// Hands each path that the coder visits to a visitor of text.
template <class Visit>
class TextVisitor {
public:
    TextVisitor(PathDecoder& decoder, Visit visit)
        : decoder_(decoder), visit_(visit) {}

    void beginFolder(std::uint64_t /*maxFiles*/) noexcept {
        decoder_.beginFolder();
    }
    void folder(ComponentView name) { decoder_.addFolder(name); }
    void file(ComponentView name) {
        const std::string_view path = decoder_.pathOf(name);
        isVisiting_ = true;
        visit_(path);
        isVisiting_ = false;
        ++visited_;
    }

    // True if what was thrown is the visitor's own.
    bool isVisiting() const noexcept { return isVisiting_; }
    std::size_t visited() const noexcept { return visited_; }

private:
    PathDecoder& decoder_;
    Visit visit_;
    std::size_t visited_ = 0;
    bool isVisiting_ = false;
};

// Visits the paths of ascending numbers, `count` of them, which the coder
// counts from 1.
template <class Numbers, class Visit>
void visitTexts(const HuffmanPathTree& coder, PathDecoder& decoder,
                const Numbers& numbers, std::size_t count, Visit visit) {
    TextVisitor<Visit> visitor(decoder, visit);
    try {
        PathRetrieval(*coder.pathTree, coder.numbering())
            .visit(numbers, visitor);
    } catch (const std::out_of_range&) {
        if (visitor.isVisiting()) throw;
        throw DamagedFormException();
    }
    if (visitor.visited() != count) throw DamagedFormException();
}

// The end of the run of ascending numbers from `begin` on.
std::size_t endOfRun(std::span<const std::size_t> numbers, std::size_t begin) {
    const auto rest = numbers.subspan(begin);
    return begin + static_cast<std::size_t>(std::ranges::is_sorted_until(rest) -
                                            rest.begin());
}

}  // namespace

void readPath(const HuffmanPathTree& coder, std::size_t i, std::string& text) {
    // Its buffers grow to the longest path and are then used again.
    thread_local PathDecoder decoder;
    decoder.startOn(coder);
    const auto keep = [&](std::string_view path) { text.assign(path); };
    visitTexts(coder, decoder, std::array<std::size_t, 1>{i + 1}, 1, keep);
}

void readPaths(const HuffmanPathTree& coder, std::size_t first,
               std::size_t last, NumberedPathVisitor visit) {
    PathDecoder decoder;
    decoder.startOn(coder);
    std::size_t number = first;
    visitTexts(coder, decoder,
               IndexedRange(first, last, [](std::size_t i) { return i + 1; }),
               last - first,
               [&](std::string_view path) { visit(number++, path); });
}

void readPaths(const HuffmanPathTree& coder,
               std::span<const std::size_t> numbers,
               NumberedPathVisitor visit) {
    PathDecoder decoder;
    decoder.startOn(coder);
    std::size_t next = 0;
    while (next < numbers.size()) {
        const std::size_t end = endOfRun(numbers, next);
        visitTexts(coder, decoder,
                   IndexedRange(next, end,
                                [&](std::size_t i) { return numbers[i] + 1; }),
                   end - next, [&](std::string_view path) {
                       visit(numbers[next++], path);
                   });
    }
}

void readInTreeOrder(HuffmanPathTree& coder, PathVisitor visit) {
    PathDecoder decoder;
    decoder.startOn(coder);
    coder.resetPathsToBTree();
    PathIteration pass(*coder.pathTree, coder.numbering());
    while (pass.hasNext())
        pass.visitNext([&](const PathView& path) {
            decoder.replaceFolders(path.folders, path.unchangedFolders);
            visit(decoder.pathOf(path.name));
        });
}

}  // namespace tessel::paths
