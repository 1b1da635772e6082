// What very large lists take: each step's seconds and the most memory that the
// process held meanwhile. All answers are checked; ends with 1 if one is wrong.
//
// Usage: limits archive FILE [N]   an archive of N generated paths
//                                  (200,000,000); a FILE that is there is read
//        limits folder [N]         N files in one folder (20,000,000)

#include <algorithm>
#include <cstdint>
#include <ctime>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <memory>
#include <random>
#include <span>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "archive/PathArchive.hpp"
#include "bench/GeneratedTree.hpp"
#include "bench/Report.hpp"
#include "bench/Timing.hpp"
#include "coder/HuffmanPathTree.hpp"
#include "coder/PathIteration.hpp"

namespace {

using tessel::Components;
using tessel::HuffmanPathTree;
using tessel::PathArchive;

// From Linux: forgets the peak, and tells it in MiB.
void forgetPeak() { std::ofstream("/proc/self/clear_refs") << "5"; }

double peakMebibytes() {
    std::ifstream status("/proc/self/status");
    for (std::string word; status >> word;) {
        if (word != "VmHWM:") continue;
        double kibibytes = 0;
        status >> kibibytes;
        return kibibytes / 1024;
    }
    return 0;
}

void require(bool holds, const char* what) {
    if (!holds) throw std::logic_error(what);
}

// Runs the steps one after the other and shows what each took: by the clock,
// in processor time of all threads, and in memory.
class Steps {
public:
    template <class Step>
    void run(const std::string& name, Step step) {
        forgetPeak();
        const std::clock_t begin = std::clock();
        const double seconds = bench::secondsOf(step);
        const auto processor = static_cast<double>(std::clock() - begin);
        std::cout << name << ": " << bench::fixed(seconds, 2)
                  << " s, processor "
                  << bench::fixed(processor / CLOCKS_PER_SEC, 2) << " s, peak "
                  << bench::fixed(peakMebibytes(), 0) << " MiB" << std::endl;
    }
};

// ---- An archive ----

class ArchiveLimits {
public:
    ArchiveLimits(std::string file, std::uint64_t paths)
        : file_(std::move(file)), paths_(paths) {}

    void run() {
        Steps steps;
        if (!std::filesystem::exists(file_))
            steps.run("pack", [this] { pack(); });
        steps.run("open", [this] { PathArchive::open(file_); });
        const PathArchive archive = PathArchive::open(file_);
        require(archive.size() == paths_, "paths are missing");
        const Sample sample = drawSample(2'000);
        steps.run("get 2,000 random paths",
                  [&] { getRandom(archive, sample); });
        steps.run("find the numbers of 2,000 paths",
                  [&] { findNumbers(archive, sample); });
        steps.run("find a text", [&] { findText(archive); });
        steps.run("read all, compared", [&] { readAll(archive); });
        steps.run("verify", [&] { archive.verify(); });
    }

private:
    void pack() {
        tessel::ArchiveOptions options;
        options.index = tessel::ArchiveIndex::WhereNeeded;
        tessel::ArchiveWriter writer(file_, options);
        std::uint64_t textBytes = 0;
        double generating = 0;
        while (writer.size() < paths_) {
            const std::vector<std::string>* project = nullptr;
            generating += bench::secondsOf([&] {
                project = &tree_.project(writer.size() /
                                         bench::GeneratedTree::pathsPerProject);
            });
            for (const std::string& path : *project) {
                if (writer.size() == paths_) break;
                textBytes += path.size() + 1;
                writer.add(path);
            }
        }
        const std::uint64_t bytes = writer.finish();
        std::cout << bench::grouped(paths_) << " paths, "
                  << bench::grouped(textBytes) << " bytes of text, "
                  << bench::grouped(bytes) << " bytes in the file; generating: "
                  << bench::fixed(generating, 2) << " s\n";
    }

    // Numbers, and the paths that they must lead to.
    using Sample = std::vector<std::pair<std::uint64_t, std::string>>;

    Sample drawSample(std::size_t count) {
        std::mt19937_64 random(1);
        Sample sample;
        for (std::size_t i = 0; i < count; ++i) {
            const std::uint64_t number = random() % paths_;
            sample.emplace_back(number, tree_.path(number));
        }
        return sample;
    }

    static void getRandom(const PathArchive& archive, const Sample& sample) {
        for (const auto& [number, path] : sample)
            require(archive[number] == path, "a wrong path");
    }

    static void findNumbers(const PathArchive& archive, const Sample& sample) {
        for (const auto& [number, path] : sample)
            require(archive.numberOf(path) == number, "a wrong number");
        require(!archive.numberOf("srv/none"), "a path that is not there");
    }

    void findText(const PathArchive& archive) const {
        const std::uint64_t project =
            (paths_ - 1) / bench::GeneratedTree::pathsPerProject / 2;
        const std::uint64_t first =
            project * bench::GeneratedTree::pathsPerProject;
        const auto found =
            archive.find("/project-" + std::to_string(project) + "/");
        require(!found.empty() && found.front() == first &&
                    found.back() == first + found.size() - 1,
                "a search found something else");
    }

    void readAll(const PathArchive& archive) {
        std::uint64_t next = 0;
        archive.forEach([&](std::uint64_t number, std::string_view path) {
            require(number == next++ && path == tree_.path(number),
                    "a wrong path");
        });
        require(next == paths_, "paths are missing");
    }

    std::string file_;
    std::uint64_t paths_;
    bench::GeneratedTree tree_;
};

// ---- One folder ----

class FolderLimits {
public:
    explicit FolderLimits(std::uint64_t files) : files_(files) {}

    void run() {
        Steps steps;
        steps.run("add", [this] { add(); });
        std::cout << bench::grouped(coder_->memoryUsage().total())
                  << " bytes in memory\n";
        steps.run("get 20,000 random files", [this] { getRandom(); });
        steps.run("iterate", [this] { iterate(); });
        std::vector<std::uint8_t> form;
        steps.run("store", [&] { coder_->serialize(form, false); });
        std::cout << bench::grouped(form.size()) << " bytes stored\n";
        const std::u16string characters = coder_->getTreeString();
        steps.run("release", [this] { coder_.reset(); });
        steps.run("load", [&] {
            coder_ = std::make_unique<HuffmanPathTree>();
            coder_->deserialize(form, false);
            coder_->inflateHuffman(characters);
        });
        steps.run("get 20,000 random files", [this] { getRandom(); });
        steps.run("release", [this] { coder_.reset(); });
    }

private:
    static constexpr std::uint64_t perBatch = 1'000'000;

    static std::u16string nameOf(std::uint64_t number) {
        const std::string digits = std::to_string(number * 7'919);
        return u"frame_" + std::u16string(digits.begin(), digits.end()) +
               u".tif";
    }

    void add() {
        const std::u16string characters = u"0123456789frames_.ti";
        const std::vector<double> frequencies(characters.size(), 1);
        coder_->deflateHuffman(frequencies.data(), characters);
        for (std::uint64_t added = 0; added < files_; added += perBatch) {
            const std::uint64_t end = std::min(files_, added + perBatch);
            HuffmanPathTree::FolderTexts folders = {{u"frames"}};
            HuffmanPathTree::FolderTexts files(1);
            for (std::uint64_t i = added; i < end; ++i)
                files[0].push_back(nameOf(i));
            coder_->generateCodeAsyncAndAddPaths(folders, files);
        }
    }

    void getRandom() {
        for (int i = 0; i < 20'000; ++i) {
            const std::uint64_t number = random_() % files_;
            std::vector<Components> folders;
            std::vector<Components> files;
            coder_->getPath(folders, files, {static_cast<double>(number + 1)});
            require(
                coder_->generatePathFrom(files.at(0).at(0)) == nameOf(number),
                "a wrong file");
        }
    }

    void iterate() {
        coder_->resetPathsToBTree();
        std::uint64_t count = 0;
        Components path;
        for (; coder_->hasNextPathFromBTree(); ++count) {
            path.clear();
            coder_->getNextPathFromBTree(path);
            if (count % 1000 == 0)
                require(coder_->generatePathFrom(path.at(1)) == nameOf(count),
                        "a wrong file");
        }
        require(count == files_, "files are missing");
    }

    std::uint64_t files_;
    std::unique_ptr<HuffmanPathTree> coder_ =
        std::make_unique<HuffmanPathTree>();
    std::mt19937_64 random_{1};
};

bool run(std::span<char* const> words) {
    const std::string mode = words.empty() ? "" : words[0];
    if (mode == "archive" && (words.size() == 2 || words.size() == 3))
        ArchiveLimits(words[1],
                      words.size() == 3 ? std::stoull(words[2]) : 200'000'000)
            .run();
    else if (mode == "folder" && words.size() <= 2)
        FolderLimits(words.size() == 2 ? std::stoull(words[1]) : 20'000'000)
            .run();
    else
        return false;
    return true;
}

}  // namespace

int main(int wordCount, char** words) {
    try {
        if (run({words + 1, words + wordCount})) return 0;
        std::cerr << "Usage: limits archive FILE [N] | limits folder [N]\n";
    } catch (const std::exception& failure) {
        std::cerr << "limits: " << failure.what() << '\n';
    }
    return 1;
}
