#include <cstdio>
#include <exception>
#include <string>
#include <string_view>

#include "hosts/embedded/demo/HostJob.hpp"

// Usage: qztessel_host_demo LIST-OR-FOLDER [PLUG-IN]
//
// Loads the plug-in into the embedded host and keeps the list's paths there,
// then reads, stores, restores and compares them. Prints a table of sizes and
// times and, last, that all paths are identical. Exit status 1 if they are not
// or anything fails.

namespace {

using tessel::embedded::Host;
using tessel::embedded::HostJob;
using tessel::embedded::HostOptions;
using tessel::embedded::JobResults;

void printSize(const char* name, std::size_t bytes, std::size_t paths) {
    std::printf("%-28s %14zu B %10.2f B a path\n", name, bytes,
                static_cast<double>(bytes) / static_cast<double>(paths));
}

void printTable(const JobResults& results) {
    std::printf("%-28s %14zu\n", "paths", results.paths);
    std::printf("%-28s %14zu\n", "cut in another place", results.keptApart);
    printSize("text", results.textBytes, results.paths);
    printSize("instance in memory", results.instanceBytes, results.paths);
    printSize("stored", results.storedBytes, results.paths);
    for (const auto& step : results.steps) {
        std::printf("%-28s %14.3f s %10.0f ns a path\n", step.name.c_str(),
                    step.seconds,
                    step.seconds * 1e9 / static_cast<double>(results.paths));
    }
}

void printSkipped(const tessel::paths::WalkReport& walk) {
    if (walk.foldersSkipped == 0) return;
    std::printf("%zu folders could not be read, the first of them %s: %s\n",
                walk.foldersSkipped, walk.firstSkipped.c_str(),
                walk.firstReason.c_str());
}

void run(const std::string& listOrFolder, const std::string& plugin) {
    tessel::paths::WalkReport walk;
    const tessel::paths::PathList list =
        tessel::paths::readPaths(listOrFolder, walk);
    printSkipped(walk);
    HostOptions options;
    options.messages = QZTESSEL_MESSAGES;
    Host host(options);
    host.loadModule(plugin);
    printTable(HostJob(host, list).run());
    std::printf("\nall %zu paths identical\n", list.size());
}

}  // namespace

int main(int argumentCount, char** arguments) {
    if (argumentCount < 2 || argumentCount > 3) {
        std::fputs("Usage: qztessel_host_demo LIST-OR-FOLDER [PLUG-IN]\n",
                   stderr);
        return 1;
    }
    try {
        run(arguments[1], argumentCount == 3 ? arguments[2] : QZTESSEL_PLUGIN);
        return 0;
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "%s\n", failure.what());
        return 1;
    }
}
