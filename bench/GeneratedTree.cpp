#include "bench/GeneratedTree.hpp"

#include <array>
#include <cstdio>

namespace bench {

namespace {

constexpr std::array<std::string_view, 24> folderWords = {
    "src",     "include", "lib",     "doc",    "tests",  "data",
    "images",  "scripts", "build",   "config", "assets", "tools",
    "locale",  "modules", "archive", "backup", "public", "templates",
    "results", "raw",     "export",  "cache",  "site",   "fonts"};

constexpr std::array<std::string_view, 20> fileWords = {
    "main",   "util",    "parser", "reader", "writer", "index", "report",
    "table",  "session", "client", "server", "model",  "view",  "error",
    "string", "vector",  "buffer", "thread", "socket", "widget"};

constexpr std::array<std::string_view, 8> teams = {
    "physics", "imaging", "web", "finance", "genome", "video", "maps", "core"};

constexpr std::array<std::string_view, 6> extensions = {
    ".cpp", ".hpp", ".py", ".txt", ".json", ".html"};

}  // namespace

const std::vector<std::string>& GeneratedTree::project(std::uint64_t project) {
    if (project == current_) return paths_;
    current_ = project;
    random_.seed(project);
    paths_.clear();
    path_ = "srv/";
    path_ += teams[project / 64 % teams.size()];
    path_ += "/20" + std::to_string(10 + project / 4096 % 16);
    path_ += "/project-" + std::to_string(project) + '/';
    folders_.assign(1, {path_.size()});
    while (paths_.size() < pathsPerProject) {
        addFiles();
        enterFolder();
    }
    return paths_;
}

// Some levels up, then into a new folder.
void GeneratedTree::enterFolder() {
    std::size_t up = pick(3);
    if (folders_.size() > 8) up += 3;
    for (; up > 0 && folders_.size() > 1; --up) folders_.pop_back();
    Folder& parent = folders_.back();
    const std::size_t child = parent.children++;
    path_.resize(parent.pathBytes);
    path_ += folderWords[child % folderWords.size()];
    if (child >= folderWords.size())
        path_ += std::to_string(child / folderWords.size());
    path_ += '/';
    folders_.push_back({path_.size()});
}

// Many folders hold few files, few hold many.
void GeneratedTree::addFiles() {
    const std::size_t kind = pick(4);
    const std::size_t count = pick(12) == 0 ? pick(400) : pick(14);
    for (std::size_t i = 0; i < count && paths_.size() < pathsPerProject; ++i)
        paths_.push_back(path_ + fileName(kind, i));
}

// Names of one kind and of different indices differ.
std::string GeneratedTree::fileName(std::size_t kind, std::size_t index) {
    std::array<char, 64> text{};
    const auto number = static_cast<unsigned>(index);
    if (kind == 0) {
        std::snprintf(text.data(), text.size(), "IMG_%04u.jpg", number);
    } else if (kind == 1) {
        std::snprintf(text.data(), text.size(), "%016llx%02x",
                      static_cast<unsigned long long>(random_()), number);
    } else if (kind == 2) {
        std::snprintf(text.data(), text.size(), "page-%u-%s.html", number,
                      fileWords[pick(fileWords.size())].data());
    } else {
        std::snprintf(text.data(), text.size(), "%s_%s%u%s",
                      fileWords[index % fileWords.size()].data(),
                      fileWords[pick(fileWords.size())].data(), number,
                      extensions[pick(extensions.size())].data());
    }
    return text.data();
}

}  // namespace bench
