// One archive, many processes: each maps the file, so the paths are in memory
// once, however many workers read them. A list in each worker's heap would be
// there once per worker.
//
//   g++ -std=c++20 share-between-processes.cpp
//       $(pkg-config --cflags --libs qztessel-archive)
#include <sys/wait.h>
#include <unistd.h>

#include <cstdint>
#include <exception>
#include <iostream>
#include <qztessel/PathArchive.hpp>
#include <string>
#include <string_view>
#include <vector>

namespace {

const std::string file = "shared.tessel";
constexpr std::uint64_t pathCount = 200'000;
constexpr std::uint64_t workers = 4;

void pack() {
    tessel::ArchiveWriter writer(file);
    for (std::uint64_t i = 0; i < pathCount; ++i)
        writer.add("samples/" + std::to_string(i / 500) + "/" +
                   std::to_string(i) + ".wav");
    writer.finish();
}

// Reads its own share of the paths. Opening takes less than a millisecond, so
// each process opens the archive for itself.
void work(std::uint64_t worker) {
    const auto archive = tessel::PathArchive::open(file);
    const std::uint64_t first = archive.size() * worker / workers;
    const std::uint64_t last = archive.size() * (worker + 1) / workers;
    std::uint64_t bytes = 0;
    archive.forEach(first, last, [&](std::uint64_t, std::string_view path) {
        bytes += path.size();
    });
    std::cout << "worker " + std::to_string(worker) + " has read " +
                     std::to_string(bytes) + " bytes\n";
}

// Starts a process that works and ends.
pid_t start(std::uint64_t worker) {
    const pid_t child = fork();
    if (child != 0) return child;
    try {
        work(worker);
        std::cout.flush();
        _exit(0);
    } catch (const std::exception& failure) {
        std::cerr << failure.what() << std::endl;
        _exit(1);
    }
}

// Whether the process was started and has succeeded.
bool finish(pid_t child) {
    int status = 1;
    return child > 0 && waitpid(child, &status, 0) == child && status == 0;
}

bool run() {
    pack();
    std::vector<pid_t> children;
    for (std::uint64_t worker = 0; worker < workers; ++worker)
        children.push_back(start(worker));
    bool allWell = true;
    for (const pid_t child : children) allWell = finish(child) && allWell;
    return allWell;
}

}  // namespace

int main() {
    try {
        if (!run()) return 1;
        std::cout << workers << " workers have read " << pathCount
                  << " paths\n";
        return 0;
    } catch (const std::exception& failure) {
        std::cerr << failure.what() << '\n';
        return 1;
    }
}
