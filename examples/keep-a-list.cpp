// Keeps a list that grows: adds paths, reads them back, saves and loads them.
//
//   g++ -std=c++20 keep-a-list.cpp $(pkg-config --cflags --libs qztessel-paths)
#include <exception>
#include <iostream>
#include <qztessel/PathStore.hpp>
#include <string>
#include <string_view>
#include <vector>

namespace {

void run() {
    const std::vector<std::string> lines = {"/etc/fstab", "/usr/bin/env",
                                            "/usr/bin/id", "notes/a b.txt"};
    auto store = tessel::PathStore::from(lines);
    store.append(std::vector{"/usr/bin/id", "/usr/bin/naïve"});  // repeats stay

    std::cout << store.size() << " paths, the third is " << store[2] << '\n';

    std::string path;  // its memory is used again and again
    for (std::size_t i = 0; i < store.size(); i += 2) {
        store.read(i, path);
        std::cout << i << ' ' << path << '\n';
    }

    store.saveFile("kept.store");
    const auto again = tessel::PathStore::loadFile("kept.store");
    again.read(4, 6, [](std::size_t number, std::string_view each) {
        std::cout << number << ' ' << each << '\n';
    });

    std::size_t bytes = 0;
    for (std::string_view each : again) bytes += each.size();
    std::cout << bytes << " bytes of text\n";
}

}  // namespace

int main() {
    try {
        run();
        return 0;
    } catch (const std::exception& failure) {
        std::cerr << failure.what() << '\n';
        return 1;
    }
}
