#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "hosts/console/OrderedPaths.hpp"

namespace tessel::console {

// PathSet walks over the different paths of an archive in byte order.
class PathSet {
public:
    // file  the archive's name, for errors
    PathSet(const PathArchive& archive, std::string file, ProgressBar& bar);

    // The current path, or nothing at the end; valid until advance.
    const std::optional<std::string>& path() const noexcept { return path_; }

    // Goes on to the next different path.
    void advance();

    // Paths read so far, repeats included.
    std::uint64_t pathsRead() const noexcept { return pathsRead_; }

private:
    void readNext();

    std::string file_;
    OrderedPaths paths_;
    std::optional<std::string> path_;
    std::uint64_t pathsRead_ = 0;
};

}  // namespace tessel::console
