#include "packing/LinkTarget.hpp"

namespace tessel {

std::filesystem::path linkTarget(std::filesystem::path path,
                                 std::error_code& error) {
    constexpr int maxLinks = 40;  // as Linux has it
    for (int links = 0;; ++links) {
        const auto status = std::filesystem::symlink_status(path, error);
        if (status.type() == std::filesystem::file_type::none) return path;
        error.clear();  // a path that is not there is no error
        if (!std::filesystem::is_symlink(status)) return path;
        if (links == maxLinks) {
            error =
                std::make_error_code(std::errc::too_many_symbolic_link_levels);
            return path;
        }
        const auto target = std::filesystem::read_symlink(path, error);
        if (error) return path;
        path = path.parent_path() / target;
    }
}

}  // namespace tessel
