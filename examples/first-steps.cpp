// The program of the README: a list that grows becomes one that is finished.
//
//   g++ -std=c++20 first-steps.cpp
//       $(pkg-config --cflags --libs qztessel-paths qztessel-archive)
#include <exception>
#include <iostream>
#include <qztessel/PathArchive.hpp>
#include <qztessel/PathStore.hpp>
#include <string>
#include <vector>

namespace {

void run() {
    const std::vector<std::string> lines = {"/usr/bin/env", "/usr/lib/libz.so"};
    const std::vector<std::string> more = {"/usr/lib/libc.so", "/usr/bin/id"};

    auto store = tessel::PathStore::from(lines);  // grows, in memory
    store.append(more);
    std::cout << store.size() << " paths, then " << store[2] << '\n';

    tessel::ArchiveWriter writer("paths.tessel");  // finished, in a file
    writer.addAll(store);
    writer.finish();

    const auto archive = tessel::PathArchive::open("paths.tessel");
    for (auto number : archive.find("lib"))
        std::cout << archive[number] << '\n';
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
