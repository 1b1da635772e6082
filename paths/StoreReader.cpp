#include "paths/StoreReader.hpp"

#include <algorithm>
#include <stdexcept>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "paths/Segments.hpp"

namespace tessel::paths {

namespace {

// Paths that one request to the coder asks for.
constexpr std::size_t maxPathsPerRequest = 1024;

// Decodes components to bytes.
class SegmentReader {
public:
    explicit SegmentReader(const HuffmanPathTree& coder) : coder_(&coder) {}

    void append(ComponentView component, std::string& bytes) {
        text_.clear();
        coder_->appendPathFrom(component, text_);
        if (!appendSegment(text_, bytes)) throw DamagedFormException();
    }

    void appendAll(const Components& components, std::string& bytes) {
        for (const Component& component : components) append(component, bytes);
    }

private:
    const HuffmanPathTree* coder_;
    std::u16string text_;
};

// Reads the paths of ascending numbers.
class RequestReader {
public:
    RequestReader(const HuffmanPathTree& coder, NumberedPathVisitor visit)
        : coder_(&coder), segments_(coder), visit_(visit) {}

    // Numbers as the coder counts them.
    void read(const std::vector<double>& numbers) {
        fetch(numbers);
        std::size_t next = 0;
        for (std::size_t k = 0; k < folders_.size(); ++k) {
            path_.clear();
            segments_.appendAll(folders_[k], path_);
            const std::size_t folderEnd = path_.size();
            for (const Component& file : files_[k]) {
                path_.resize(folderEnd);
                segments_.append(file, path_);
                visit_(static_cast<std::size_t>(numbers[next++]) - 1, path_);
            }
        }
        if (next != numbers.size()) throw DamagedFormException();
    }

private:
    void fetch(const std::vector<double>& numbers) {
        folders_.clear();
        files_.clear();
        try {
            coder_->getPath(folders_, files_, numbers);
        } catch (const std::out_of_range&) {
            throw DamagedFormException();
        }
    }

    const HuffmanPathTree* coder_;
    SegmentReader segments_;
    NumberedPathVisitor visit_;
    std::vector<Components> folders_;
    std::vector<Components> files_;
    std::string path_;
};

}  // namespace

void readPath(const HuffmanPathTree& coder, std::size_t i, std::string& text) {
    readPaths(coder, i, i + 1,
              [&](std::size_t, std::string_view path) { text.assign(path); });
}

void readPaths(const HuffmanPathTree& coder, std::size_t first,
               std::size_t last, NumberedPathVisitor visit) {
    RequestReader reader(coder, visit);
    std::vector<double> numbers;
    while (first < last) {
        const std::size_t end = std::min(last, first + maxPathsPerRequest);
        numbers.clear();
        while (first < end) numbers.push_back(static_cast<double>(++first));
        reader.read(numbers);
    }
}

void readPaths(const HuffmanPathTree& coder,
               std::span<const std::size_t> numbers,
               NumberedPathVisitor visit) {
    RequestReader reader(coder, visit);
    std::vector<double> run;
    for (std::size_t i = 0; i < numbers.size();) {
        run.clear();
        do {
            run.push_back(static_cast<double>(numbers[i] + 1));
            ++i;
        } while (i < numbers.size() && numbers[i] >= numbers[i - 1] &&
                 run.size() < maxPathsPerRequest);
        reader.read(run);
    }
}

void readInTreeOrder(HuffmanPathTree& coder, PathVisitor visit) {
    SegmentReader segments(coder);
    Components components;
    std::string path;
    coder.resetPathsToBTree();
    while (coder.hasNextPathFromBTree()) {
        coder.getNextPathFromBTree(components);
        path.clear();
        segments.appendAll(components, path);
        visit(path);
    }
}

}  // namespace tessel::paths
