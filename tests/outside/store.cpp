// A program that knows nothing but PathStore and is built with one plain
// compiler line. Keeps a few paths in a file and reads them back.
#include <iostream>
#include <string>
#include <string_view>
#include <vector>

#include "paths/PathStore.hpp"

int main() {
    const std::vector<std::string> paths = {"/usr/bin/env", "/usr/bin/id",
                                            "/etc/fstab"};
    auto store = tessel::PathStore::from(paths);
    store.append("/usr/bin");
    store.saveFile("outside.tessel");
    const auto again = tessel::PathStore::loadFile("outside.tessel");

    std::size_t same = 0;
    for (const std::string_view path : again)
        same += path == (same < paths.size() ? paths[same] : "/usr/bin");
    if (same != 4 || again.size() != 4 || again[1] != "/usr/bin/id") {
        std::cerr << "the paths that came back differ\n";
        return 1;
    }
    std::cout << again.size() << " paths restored\n";
    return 0;
}
