#include "paths/PathList.hpp"

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <system_error>
#include <utility>

#include "paths/WholeFile.hpp"

namespace tessel::paths {

namespace {

PathListError cannotRead(const std::string& name, const std::error_code& why) {
    return PathListError("Cannot read " + name + ": " + why.message() + ".");
}

}  // namespace

void PathList::append(std::string_view path) {
    if (path.empty()) throw std::invalid_argument("A path is empty.");
    text_.append(path);
    text_.push_back('\0');
    ends_.push_back(text_.size() - 1);
}

PathList PathList::fromText(std::string text, const std::string& name) {
    const char separator = text.find('\0') == std::string::npos ? '\n' : '\0';
    if (!text.empty() && text.back() != separator) text.push_back(separator);

    PathList list;
    list.ends_.reserve(static_cast<std::size_t>(
        std::count(text.begin(), text.end(), separator)));
    for (std::size_t start = 0; start < text.size();) {
        const std::size_t end = text.find(separator, start);
        if (end == start) {
            throw PathListError(
                name + ", " + (separator == '\n' ? "line " : "entry ") +
                std::to_string(list.size() + 1) + ": an empty path.");
        }
        list.ends_.push_back(end);
        start = end + 1;
    }
    list.text_ = std::move(text);
    return list;
}

PathList readListFile(const std::string& file) {
    std::string text;
    try {
        text = readWholeFile(file);
    } catch (const std::system_error& error) {
        throw cannotRead(file, error.code());
    }
    return PathList::fromText(std::move(text), file);
}

PathList readPaths(const std::string& fileOrFolder, WalkReport& report) {
    struct stat about {};
    if (::stat(fileOrFolder.c_str(), &about) != 0) {
        throw cannotRead(fileOrFolder, {errno, std::generic_category()});
    }
    PathList list = S_ISDIR(about.st_mode) ? listFolder(fileOrFolder, report)
                                           : readListFile(fileOrFolder);
    if (list.empty()) {
        throw PathListError(fileOrFolder + " holds no paths.");
    }
    return list;
}

}  // namespace tessel::paths
