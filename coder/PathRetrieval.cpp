#include "coder/PathRetrieval.hpp"

#include <cmath>
#include <limits>
#include <utility>

namespace tessel {

namespace {

// Copies what is visited to two lists, one entry per folder each. Both lists
// may be the same one: folder, files, folder, files.
class Copier {
public:
    Copier(std::vector<Components>& folderPaths,
           std::vector<Components>& filePaths) noexcept
        : folderPaths_(folderPaths), filePaths_(filePaths) {}

    void beginFolder(std::size_t usualFiles) {
        finish();
        started_ = true;
        folder_.reserve(usualDepth);
        files_.reserve(usualFiles);
    }
    void folder(ComponentView name) {
        folder_.emplace_back(name.begin(), name.end());
    }
    void file(ComponentView name) {
        files_.emplace_back(name.begin(), name.end());
    }
    // Appends the current folder and its files. Few of many may have been
    // asked for: the room for the others is not kept.
    void finish() {
        if (!started_) return;
        if (files_.size() < files_.capacity() / 2) files_.shrink_to_fit();
        folderPaths_.push_back(std::exchange(folder_, {}));
        filePaths_.push_back(std::exchange(files_, {}));
    }

private:
    // Saves growing the list of a folder of up to this depth.
    static constexpr std::size_t usualDepth = 6;

    std::vector<Components>& folderPaths_;
    std::vector<Components>& filePaths_;
    bool started_ = false;
    Components folder_;
    Components files_;
};

}  // namespace

std::uint64_t PathRetrieval::pathNumberOf(double value) {
    if (std::isnan(value) || value <= -1)
        throw std::out_of_range("A path number is negative or not a number.");
    constexpr double beyondAll = 18446744073709551616.0;  // 2 to the 64th
    return value >= beyondAll ? std::numeric_limits<std::uint64_t>::max()
                              : static_cast<std::uint64_t>(value);
}

void PathRetrieval::getPath(std::vector<Components>& folderPaths,
                            std::vector<Components>& filePaths,
                            const std::vector<double>& numbers) const {
    if (numbering_.partitionEnds.empty()) {
        getByTrack(folderPaths, numbers);
        return;
    }
    const std::size_t foldersBefore = folderPaths.size();
    const std::size_t filesBefore = filePaths.size();
    try {
        getByNumber(folderPaths, filePaths, numbers);
    } catch (...) {
        folderPaths.resize(foldersBefore);
        filePaths.resize(filesBefore);
        throw;
    }
}

void PathRetrieval::getByNumber(std::vector<Components>& folderPaths,
                                std::vector<Components>& filePaths,
                                const std::vector<double>& numbers) const {
    Copier copier(folderPaths, filePaths);
    visit(PathNumbers(numbers), copier);
    copier.finish();
}

void PathRetrieval::getByTrack(std::vector<Components>& folderPaths,
                               const std::vector<double>& numbers) const {
    const PathTracks& tracks = numbering_.partitionTracks;
    if (tracks.empty()) return;
    std::vector<Components> found;
    for (const double value : numbers) {
        const double position = value - 1;
        if (!(position > -1) || position >= static_cast<double>(tracks.size()))
            throw std::out_of_range("There is no partition of this number.");
        tree_.traversePath(tracks[static_cast<std::size_t>(position)],
                           found.emplace_back());
    }
    folderPaths.reserve(folderPaths.size() + found.size());
    std::move(found.begin(), found.end(), std::back_inserter(folderPaths));
}

}  // namespace tessel
