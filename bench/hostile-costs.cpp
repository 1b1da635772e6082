// What hostile input costs: forms and lists of awkward shapes at n, 2n and 4n,
// each read in every way. Neither processor time nor memory may grow faster
// than the input: prints both for n and how they grew to 4n, and ends with 1 if
// something grew by more than `mostGrowth`, a little time left out.
//
// Usage: hostile-costs [N]    N nodes or paths to begin with (100,000; with
//                            much fewer zlib has not got slow yet)

#include <algorithm>
#include <array>
#include <cstdint>
#include <ctime>
#include <functional>
#include <iostream>
#include <numeric>
#include <string>
#include <vector>

#include "archive/PathArchive.hpp"
#include "bench/Heap.hpp"
#include "bench/Report.hpp"
#include "bench/Timing.hpp"
#include "coder/HuffmanPathTree.hpp"
#include "coder/PathIteration.hpp"
#include "packing/sixpacks.hpp"
#include "paths/PathStore.hpp"

namespace {

using tessel::ArchiveWriter;
using tessel::Components;
using tessel::HuffmanPathTree;
using tessel::PathArchive;
using tessel::PathStore;
namespace sixpacks = tessel::sixpacks;
using Bytes = std::vector<std::uint8_t>;
using Strings = std::vector<std::string>;

// Four times the input may take that many times as much: four, and what caches,
// sorted maps and a machine with other work add. Squares would take 16.
constexpr double mostGrowth = 8;
constexpr std::array<std::size_t, 3> growthFactors{1, 2, 4};
// Less than this is not judged: milliseconds, and bytes.
constexpr double leastTime = 20;
constexpr double leastBytes = 1 << 20;

struct Cost {
    double milliseconds = 0;
    double peakBytes = 0;
};

Cost costOf(const std::function<void()>& operation) {
    const bench::HeapPeak peak;
    const std::clock_t begin = std::clock();
    operation();
    const std::clock_t end = std::clock();
    return {1e3 * static_cast<double>(end - begin) / CLOCKS_PER_SEC,
            static_cast<double>(peak.bytes())};
}

// ---- Stored forms ----

// A payload as docs/format.md describes it, all integers in 8 bytes.
class Payload {
public:
    // The form of a coder whose code has this shape.
    explicit Payload(const std::vector<bool>& shape) {
        Bytes block;
        sixpacks::boolVecToBytes(block, shape);
        sixpacks::packVector(block, bytes_, sixpacks::PackedSizeT::Uint64);
    }
    // Node codes as in docs/format.md; every name has this length.
    Payload& tree(const Bytes& codes, std::size_t nameBytes) {
        number(codes.size());
        put(codes);
        number(codes.size());
        put({3});
        for (std::size_t i = 0; i < codes.size(); ++i) {
            number(nameBytes);
            for (std::size_t j = 0; j < nameBytes; ++j)
                bytes_.push_back(static_cast<std::uint8_t>(i >> (8 * j)));
        }
        return *this;
    }
    Payload& partitions(const std::vector<std::uint64_t>& ends,
                        const std::vector<std::vector<std::uint64_t>>& tracks) {
        put({1, 3, 3});
        numbers(ends);
        number(tracks.size());
        put({3, 3});
        for (const auto& track : tracks) numbers(track);
        return *this;
    }
    // This many repeats of the first path, under every other number.
    Payload& duplicates(std::size_t count) {
        put({0, 3, 3, 3});
        for (std::size_t i = 0; i < count; ++i) {
            number(2 * i + 1);
            numbers({0});
        }
        return *this;
    }
    Payload& put(const Bytes& more) {
        bytes_.insert(bytes_.end(), more.begin(), more.end());
        return *this;
    }
    Bytes form() const {
        Bytes form;
        sixpacks::packUint(bytes_.size(), sixpacks::PackedSizeT::Uint64, form);
        form.insert(form.end(), bytes_.begin(), bytes_.end());
        return form;
    }

private:
    void number(std::uint64_t value) {
        sixpacks::packUint(value, sixpacks::PackedSizeT::Uint64, bytes_);
    }
    void numbers(const std::vector<std::uint64_t>& values) {
        number(values.size());
        for (const std::uint64_t value : values) number(value);
    }
    Bytes bytes_;
};

// ---- Shapes of trees, as node codes ----

Bytes chain(std::size_t n) {
    Bytes codes(n, 1);
    codes.back() = 0;
    return codes;
}
Bytes wide(std::size_t n) {
    Bytes codes(n, 2);
    codes.back() = 0;
    return codes;
}
// Each folder with a file and one more folder.
Bytes comb(std::size_t n) {
    Bytes codes;
    for (std::size_t i = 0; i < n / 2; ++i) {
        codes.push_back(2);
        codes.push_back(1);
    }
    codes.push_back(0);
    return codes;
}
Bytes foldersOfOne(std::size_t n) {
    Bytes codes;
    for (std::size_t i = 0; i < n / 2; ++i) {
        codes.push_back(3);
        codes.push_back(0);
    }
    codes[codes.size() - 2] = 1;
    return codes;
}

// ---- Shapes of forms ----

const std::vector<bool> twoCharacters{false, true, true};

std::vector<std::uint64_t> counting(std::size_t n, std::uint64_t step) {
    std::vector<std::uint64_t> values(n);
    for (std::size_t i = 0; i < n; ++i) values[i] = step * (i + 1);
    return values;
}

// n partitions of a wide tree, each with a track of its own.
Bytes partitionsWith(std::size_t n, const std::vector<std::uint64_t>& ends) {
    std::vector<std::vector<std::uint64_t>> tracks(n);
    for (std::size_t i = 0; i < n; ++i) tracks[i] = {i};
    return Payload(twoCharacters)
        .tree(wide(n), 3)
        .partitions(ends, tracks)
        .form();
}

Bytes longTracks(std::size_t n) {
    std::vector<std::vector<std::uint64_t>> tracks(8);
    for (auto& track : tracks) track.assign(n / 8, 0);
    return Payload(twoCharacters)
        .tree(chain(n / 8 + 1), 0)
        .partitions(counting(8, 1), tracks)
        .form();
}

std::vector<bool> shapeOfLongCodes(std::size_t n) {
    std::vector<bool> shape;
    for (std::size_t i = 1; i < n; ++i) {
        shape.push_back(false);
        shape.push_back(true);
    }
    shape.push_back(true);
    return shape;
}

struct FormShape {
    std::string name;
    std::function<Bytes(std::size_t)> form;
    std::uint64_t numberStep = 1;  // of the paths that are asked for
    bool hasLongCodes = false;
};

std::vector<FormShape> formShapes() {
    const auto treeOf = [](Bytes (*codes)(std::size_t), std::size_t nameBytes) {
        return [=](std::size_t n) {
            return Payload(twoCharacters).tree(codes(n), nameBytes).form();
        };
    };
    constexpr std::uint64_t far = std::uint64_t{1} << 40;
    return {
        {"chain", treeOf(chain, 3)},
        {"chain, empty names", treeOf(chain, 0)},
        {"comb", treeOf(comb, 0)},
        {"wide", treeOf(wide, 3)},
        {"wide, equal names", treeOf(wide, 0)},
        {"folders of one file", treeOf(foldersOfOne, 3)},
        {"partitions",
         [](std::size_t n) { return partitionsWith(n, counting(n, 1)); }},
        {"ends far apart",
         [](std::size_t n) { return partitionsWith(n, counting(n, far)); },
         far},
        {"ends that fall",
         [](std::size_t n) {
             std::vector<std::uint64_t> ends = counting(n, 1);
             std::ranges::reverse(ends);
             return partitionsWith(n, ends);
         }},
        {"long tracks", longTracks},
        {"repeated paths",
         [](std::size_t n) {
             return Payload(twoCharacters)
                 .tree(wide(n), 3)
                 .duplicates(n)
                 .form();
         }},
        {"long codes",
         [](std::size_t n) {
             return Payload(shapeOfLongCodes(n)).tree(wide(1), 3).form();
         },
         1, true},
    };
}

// ---- Measuring ----

// One operation at n, 2n and 4n.
struct Series {
    std::string name;
    std::vector<Cost> costs;
};

// What the three runs of a shape cost, operation by operation.
class Measured {
public:
    void begin() { next_ = 0; }
    void operator()(const std::string& name,
                    const std::function<void()>& operation) {
        if (next_ == series_.size()) series_.push_back({name, {}});
        series_[next_++].costs.push_back(costOf(operation));
    }

    // Adds the rows; false if something grew too much.
    bool addTo(bench::Table& table, const std::string& shape,
               std::size_t bytes) const {
        bool isLinear = true;
        for (const Series& one : series_) {
            const Cost& small = one.costs.front();
            const Cost& large = one.costs.back();
            const double time =
                growth(small.milliseconds, large.milliseconds, leastTime);
            const double memory =
                growth(small.peakBytes, large.peakBytes, leastBytes);
            isLinear = isLinear && time <= mostGrowth && memory <= mostGrowth;
            table.row({shape + ": " + one.name, bench::grouped(bytes),
                       bench::threeDigits(small.milliseconds),
                       bench::fixed(time, 1),
                       bench::threeDigits(large.peakBytes / 4 /
                                          static_cast<double>(bytes)),
                       bench::fixed(memory, 1)});
        }
        return isLinear;
    }

private:
    static double growth(double small, double large, double least) {
        return std::max(large, least) / std::max(small, least);
    }

    std::vector<Series> series_;
    std::size_t next_ = 0;
};

struct Counter {
    void beginFolder(std::size_t /*usualFiles*/) {}
    void folder(tessel::ComponentView name) { bytes += name.size(); }
    void file(tessel::ComponentView name) { bytes += name.size(); }
    std::size_t bytes = 0;
};

void readForm(const FormShape& shape, std::size_t n, const Bytes& form,
              Measured& measured) {
    HuffmanPathTree coder;
    Bytes bytes = form;
    measured("load", [&] { coder.deserialize(bytes, false); });
    measured("build the code", [&] {
        coder.inflateHuffman(std::u16string(shape.hasLongCodes ? n : 2, u'a'));
    });
    measured("iterate", [&] {
        coder.resetPathsToBTree();
        tessel::PathIteration pass(*coder.pathTree, coder.numbering());
        std::size_t components = 0;
        while (pass.hasNext())
            pass.visitNext([&](const tessel::PathView& path) {
                components += path.folders.size() - path.unchangedFolders;
            });
        bench::keep(components);
    });
    std::vector<double> numbers(n);
    for (std::size_t i = 0; i < n; ++i)
        numbers[i] = static_cast<double>(shape.numberStep * i + 1);
    measured("fetch all", [&] {
        std::vector<Components> folders;
        std::vector<Components> files;
        try {
            coder.getPath(folders, files, numbers);
        } catch (const std::out_of_range&) {
        }
    });
    measured("store", [&] {
        Bytes stored;
        coder.serialize(stored, false);
    });
    measured("count memory", [&] { bench::keep(coder.memoryUsage()); });
}

// ---- Lists ----

struct ListShape {
    std::string name;
    std::function<Strings(std::size_t)> paths;
};

std::vector<ListShape> listShapes() {
    const auto each = [](const std::function<std::string(std::size_t)>& path) {
        return [path](std::size_t n) {
            Strings paths;
            for (std::size_t i = 0; i < n; ++i) paths.push_back(path(i));
            return paths;
        };
    };
    // A name has at most 1 MiB, and so has a folder: as many paths as it takes.
    const auto longest = [](const std::string& part) {
        return [part](std::size_t n) {
            constexpr std::size_t mostParts = 100000;
            Strings paths;
            for (std::size_t left = n; left > 0;) {
                const std::size_t taken = std::min(left, mostParts);
                std::string& path = paths.emplace_back();
                for (std::size_t i = 0; i < taken; ++i) path += part;
                path += std::to_string(left);
                left -= taken;
            }
            return paths;
        };
    };
    return {
        {"equal paths", each([](std::size_t) { return "a/b"; })},
        {"names alone", each([](std::size_t i) { return std::to_string(i); })},
        {"a folder each",
         each([](std::size_t i) { return std::to_string(i) + "/x"; })},
        {"chains", longest("a/")},
        {"empty components", longest("/")},
        {"long names", longest("ab")},
        {"two folders in turn", each([](std::size_t i) {
             return (i % 2 == 0 ? "a/" : "b/") + std::to_string(i);
         })},
    };
}

void readArchive(const Strings& paths, Measured& measured) {
    Bytes bytes;
    measured("archive: write", [&] {
        tessel::ArchiveOptions options;
        options.threads = 1;
        ArchiveWriter writer(bytes, options);
        writer.addAll(paths);
        writer.finish();
    });
    const PathArchive archive = PathArchive::over(bytes);
    const auto visit = [](std::uint64_t, std::string_view path) {
        bench::keep(path);
    };
    tessel::FindOptions options;
    options.threads = 1;
    measured("archive: read all", [&] { archive.forEach(visit); });
    measured("archive: find", [&] { archive.find("zz", options); });
    measured("archive: number",
             [&] { bench::keep(archive.numberOf(paths.back())); });
    measured("archive: folder", [&] { bench::keep(archive.folder("a")); });
    measured("archive: verify", [&] { archive.verify(options); });
    measured("archive: salvage", [&] { PathArchive::salvage(bytes, visit); });
}

void readStore(const Strings& paths, Measured& measured) {
    PathStore store;
    measured("store: append", [&] { store.append(paths); });
    Bytes bytes;
    measured("store: save", [&] { bytes = store.save(); });
    measured("store: load", [&] { store = PathStore::load(bytes); });
    measured("store: read all", [&] {
        store.read(0, store.size(), [](std::size_t, std::string_view path) {
            bench::keep(path);
        });
    });
    measured("store: in tree order", [&] {
        store.forEachInTreeOrder(
            [](std::string_view path) { bench::keep(path); });
    });
}

bool measureAll(std::size_t n) {
    bench::Table table({"n = " + bench::grouped(n), "bytes", "ms", "4n / n",
                        "peak per byte", "4n / n"});
    bool isLinear = true;
    for (const FormShape& shape : formShapes()) {
        Measured measured;
        for (const std::size_t factor : growthFactors) {
            measured.begin();
            readForm(shape, factor * n, shape.form(factor * n), measured);
        }
        const std::size_t codeBytes = shape.hasLongCodes ? 2 * n : 0;
        isLinear &=
            measured.addTo(table, shape.name, shape.form(n).size() + codeBytes);
    }
    for (const ListShape& shape : listShapes()) {
        Measured measured;
        for (const std::size_t factor : growthFactors) {
            measured.begin();
            const Strings paths = shape.paths(factor * n);
            readArchive(paths, measured);
            readStore(paths, measured);
        }
        std::size_t bytes = 0;
        for (const std::string& path : shape.paths(n)) bytes += path.size() + 1;
        isLinear &= measured.addTo(table, shape.name, bytes);
    }
    std::cout << table.text();
    return isLinear;
}

}  // namespace

int main(int argc, char** argv) {
    try {
        const std::size_t n = argc > 1 ? std::stoull(argv[1]) : 100000;
        return measureAll(std::max<std::size_t>(n, 16)) ? 0 : 1;
    } catch (const std::exception& failure) {
        std::cerr << "hostile-costs: " << failure.what() << '\n';
        return 2;
    }
}
