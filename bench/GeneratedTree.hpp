#pragma once

#include <cstddef>
#include <cstdint>
#include <random>
#include <string>
#include <string_view>
#include <vector>

namespace bench {

// GeneratedTree is a list of any number of different paths that looks like the
// walk over a large disk: projects with folders in folders, each of which holds
// sources, numbered pictures, pages or objects named by their hash.
//
// A path depends on its number alone, so that whoever reads a stored list can
// tell whether it is the one that was written.
// Cost: a project's paths are made together.
class GeneratedTree {
public:
    static constexpr std::uint64_t pathsPerProject = 4096;

    // The paths of one project, those with the numbers from
    // project * pathsPerProject on. Valid until the next call.
    const std::vector<std::string>& project(std::uint64_t project);

    // The path with this number. Valid until the next call.
    const std::string& path(std::uint64_t number) {
        return project(number / pathsPerProject)[number % pathsPerProject];
    }

private:
    struct Folder {
        std::size_t pathBytes = 0;  // of the path up to it, with its '/'
        std::size_t children = 0;
    };

    std::size_t pick(std::size_t below) {
        return static_cast<std::size_t>(random_() % below);
    }
    void enterFolder();
    void addFiles();
    std::string fileName(std::size_t kind, std::size_t index);

    std::uint64_t current_ = ~std::uint64_t{0};
    std::mt19937_64 random_;
    std::vector<std::string> paths_;
    std::string path_;             // of the current folder
    std::vector<Folder> folders_;  // from the project down to it
};

}  // namespace bench
