// The program behind the library's numbers: see README.md.

#include <exception>
#include <iostream>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "bench/ArchiveCosts.hpp"
#include "bench/Comparison.hpp"
#include "bench/HostRoute.hpp"
#include "bench/MainJob.hpp"

namespace {

constexpr std::string_view usage =
    R"(Usage: path-bench LIST
       path-bench --rivals [OPTIONS] LIST
       path-bench --growth [OPTIONS] LIST
       path-bench --order [OPTIONS] SORTED-LIST SHUFFLED-LIST
       path-bench --shapes [OPTIONS]
       path-bench --archive [OPTIONS] LIST

LIST is a file of paths, separated by NUL if it has a NUL and otherwise by
newline, or a folder, of which everything below that is no folder is listed.

  (none)     the main job: reads the list, stores it, restores it, iterates
             it, and compares every path
  --rivals   the library beside other ways to keep the list
  --growth   the same operations on ever longer parts of the list
  --order    the same on a sorted and a shuffled list
  --shapes   lists that are made to be awkward: wide, flat and deep ones
  --archive  what opening an archive costs, and what a second core gains

  --runs N          measure N times and take the medians (5)
  --no-compressors  leave out zstd and xz, which take most of the time
  --json FILE       also write the results to FILE
)";

struct WrongUsage {
    std::string what;
};

struct Arguments {
    std::string mode;
    bench::Options options;
    std::vector<std::string> lists;
};

int positiveNumber(const std::string& text) {
    if (text.empty() || text.size() > 4 ||
        text.find_first_not_of("0123456789") != std::string::npos ||
        std::stoi(text) == 0) {
        throw WrongUsage{"not a number of runs: " + text};
    }
    return std::stoi(text);
}

Arguments parse(std::span<char*> words) {
    Arguments arguments;
    arguments.options.host = bench::makeHostRoute;
    for (std::size_t i = 1; i < words.size(); ++i) {
        const std::string word = words[i];
        const auto value = [&]() -> std::string {
            if (++i == words.size()) throw WrongUsage{word + " needs a value"};
            return words[i];
        };
        if (word == "--json") {
            arguments.options.jsonFile = value();
        } else if (word == "--runs") {
            arguments.options.runs = positiveNumber(value());
        } else if (word == "--no-compressors") {
            arguments.options.compressors = false;
        } else if (word == "--rivals" || word == "--growth" ||
                   word == "--order" || word == "--shapes" ||
                   word == "--archive") {
            if (!arguments.mode.empty()) throw WrongUsage{"two modes"};
            arguments.mode = word;
        } else if (word.starts_with("--")) {
            throw WrongUsage{"unknown option " + word};
        } else {
            arguments.lists.push_back(word);
        }
    }
    return arguments;
}

std::size_t listsWanted(const std::string& mode) {
    if (mode == "--shapes") return 0;
    return mode == "--order" ? 2 : 1;
}

// Returns false if the library failed to give its paths back.
bool run(const Arguments& arguments) {
    const auto& lists = arguments.lists;
    if (lists.size() != listsWanted(arguments.mode)) {
        throw WrongUsage{lists.empty() ? "no list" : "too many lists or few"};
    }
    if (arguments.mode.empty()) return bench::runMainJob(lists[0]);
    if (arguments.mode == "--rivals") {
        bench::compareRivals(lists[0], arguments.options);
    } else if (arguments.mode == "--growth") {
        bench::measureGrowth(lists[0], arguments.options);
    } else if (arguments.mode == "--order") {
        bench::compareOrder(lists[0], lists[1], arguments.options);
    } else if (arguments.mode == "--archive") {
        bench::measureArchive(lists[0], arguments.options);
    } else {
        bench::measureShapes(arguments.options);
    }
    return true;
}

}  // namespace

int main(int argc, char** argv) {
    try {
        const Arguments arguments =
            parse({argv, static_cast<std::size_t>(argc)});
        return run(arguments) ? 0 : 1;
    } catch (const WrongUsage& wrong) {
        std::cerr << "path-bench: " << wrong.what << "\n\n" << usage;
        return 2;
    } catch (const std::exception& error) {
        std::cerr << "path-bench: " << error.what() << '\n';
        return 1;
    }
}
