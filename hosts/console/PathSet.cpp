#include "hosts/console/PathSet.hpp"

#include <utility>

#include "hosts/console/Failure.hpp"

namespace tessel::console {

PathSet::PathSet(const PathArchive& archive, std::string file, ProgressBar& bar)
    : file_(std::move(file)),
      paths_(inFile(file_, [&] { return OrderedPaths(archive, bar); })) {
    advance();
}

void PathSet::advance() {
    inFile(file_, [this] { readNext(); });
}

void PathSet::readNext() {
    for (;;) {
        const auto next = paths_.next();
        if (!next) return path_.reset();
        ++pathsRead_;
        if (path_ && *path_ == *next) continue;
        if (!path_) path_.emplace();
        path_->assign(*next);
        return;
    }
}

}  // namespace tessel::console
