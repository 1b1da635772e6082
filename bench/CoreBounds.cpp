#include "bench/CoreBounds.hpp"

#include <zlib.h>

#include <stdexcept>
#include <utility>

#include "bench/Heap.hpp"
#include "bench/PathReader.hpp"
#include "bench/Timing.hpp"
#include "coder/BatchEncoder.hpp"

namespace bench {

using tessel::HuffmanPathTree;
using tessel::paths::Batch;
using tessel::paths::BatchReader;
using tessel::paths::PathSplitter;

namespace {

using Bytes = std::vector<std::uint8_t>;
// Not filled before it is used, unlike a vector.
using RawBytes = std::unique_ptr<Bytef[]>;

constexpr std::size_t lengthBytes = 8;  // in front of a form's body
constexpr int level = 9;

Batch wholeBatch(const PathSplitter& splitter) {
    Batch batch;
    BatchReader(splitter, splitter.list().size()).next(batch);
    return batch;
}

CoderPtr built(Batch& batch) {
    CoderPtr coder =
        coderFor(tessel::paths::countCharacters(batch.folders, batch.files));
    coder->generateCodeAsyncAndAddPaths(batch.folders, batch.files);
    return coder;
}

CoderPtr restoredFrom(Bytes& form, const std::u16string& treeString) {
    auto coder = std::make_unique<HuffmanPathTree>();
    coder->deserialize(form, true);
    coder->inflateHuffman(treeString);
    return coder;
}

void requireZlib(int code) {
    if (code != Z_OK) throw std::runtime_error("zlib failed.");
}

double compressAlone(const Bytes& payload) {
    return secondsOf([&] {
        uLongf size = compressBound(payload.size());
        const auto out = std::make_unique_for_overwrite<Bytef[]>(size);
        requireZlib(
            compress2(out.get(), &size, payload.data(), payload.size(), level));
        keep(size);
    });
}

double uncompressAlone(const Bytes& form, std::size_t payloadBytes) {
    return secondsOf([&] {
        uLongf size = payloadBytes;
        const auto out = std::make_unique_for_overwrite<Bytef[]>(size);
        requireZlib(uncompress(out.get(), &size, form.data() + lengthBytes,
                               form.size() - lengthBytes));
        keep(size);
    });
}

// Memory while one batch is added and while its form is read.
CoderPtr measureMemory(const PathSplitter& splitter, CoreBounds& result) {
    const std::size_t before = heapInUse();
    CoderPtr coder;
    {
        Batch batch = wholeBatch(splitter);
        result.inputBytes = heapInUse() - before;
        const HeapPeak peak;
        coder = built(batch);
        result.addingPeak = peak.bytes();
    }
    result.instanceBytes = heapInUse() - before;
    result.usageBytes = coder->memoryUsage().total();

    Bytes form;
    coder->serialize(form, true);
    form.shrink_to_fit();
    result.formBytes = form.size();
    const std::u16string treeString = coder->getTreeString();
    const std::size_t beforeRestoring = heapInUse();
    const HeapPeak peak;
    const CoderPtr restored = restoredFrom(form, treeString);
    result.restoringPeak = peak.bytes();
    result.restoredBytes = heapInUse() - beforeRestoring;
    return coder;
}

// Storing and restoring beside zlib alone on the same bytes.
void measureZlib(const HuffmanPathTree& coder, int runs, CoreBounds& result) {
    Bytes payload;
    coder.serialize(payload, false);
    payload.erase(payload.begin(), payload.begin() + lengthBytes);
    const std::u16string treeString = coder.getTreeString();
    std::vector<double> serializes;
    std::vector<double> compresses;
    std::vector<double> restores;
    std::vector<double> uncompresses;
    for (int i = 0; i < runs; ++i) {
        Bytes form;
        serializes.push_back(secondsOf([&] { coder.serialize(form, true); }));
        compresses.push_back(compressAlone(payload));
        CoderPtr restored;
        restores.push_back(
            secondsOf([&] { restored = restoredFrom(form, treeString); }));
        uncompresses.push_back(uncompressAlone(form, payload.size()));
    }
    result.serializeToCompress = medianRatio(serializes, compresses);
    result.restoreToUncompress = medianRatio(restores, uncompresses);
}

void measureDestroy(const PathSplitter& splitter, int runs,
                    CoreBounds& result) {
    std::vector<double> builds;
    std::vector<double> destroys;
    for (int i = 0; i < runs; ++i) {
        Batch batch = wholeBatch(splitter);
        CoderPtr coder;
        builds.push_back(secondsOf([&] { coder = built(batch); }));
        destroys.push_back(secondsOf([&] { coder.reset(); }));
    }
    result.destroyToBuild = medianRatio(destroys, builds);
}

// Encoding alone, on one worker and on two.
void measureWorkers(const PathSplitter& splitter, int runs,
                    CoreBounds& result) {
    Batch batch = wholeBatch(splitter);
    const CoderPtr coder =
        coderFor(tessel::paths::countCharacters(batch.folders, batch.files));
    std::vector<double> one;
    std::vector<double> two;
    for (int i = 0; i < runs; ++i) {
        // Encoding uses up the texts, so every run has its own.
        for (const unsigned workers : {1U, 2U}) {
            auto folders = batch.folders;
            auto files = batch.files;
            tessel::AtomicMaximum longest;
            tessel::BatchEncoder encoder(coder->code(), longest, folders,
                                         files);
            (workers == 1 ? one : two).push_back(secondsOf([&] {
                encoder.encode(workers);
            }));
        }
    }
    result.twoWorkers = medianRatio(one, two);
}

}  // namespace

Json CoreBounds::json() const {
    Json all;
    const auto bytes = [&](const char* key, std::size_t value) {
        all.number(key, static_cast<double>(value));
    };
    bytes("textBytes", textBytes);
    bytes("inputBytes", inputBytes);
    bytes("usageBytes", usageBytes);
    bytes("instanceBytes", instanceBytes);
    bytes("restoredBytes", restoredBytes);
    bytes("formBytes", formBytes);
    if (HeapPeak::works()) {
        bytes("addingPeak", addingPeak);
        bytes("restoringPeak", restoringPeak);
    }
    return all.number("serializeToCompress", serializeToCompress)
        .number("restoreToUncompress", restoreToUncompress)
        .number("destroyToBuild", destroyToBuild)
        .number("twoWorkers", twoWorkers);
}

CoreBounds measureCoreBounds(const PathSplitter& splitter, int runs) {
    CoreBounds result;
    result.textBytes = splitter.list().textBytes();
    {
        const CoderPtr coder = measureMemory(splitter, result);
        measureZlib(*coder, runs, result);
    }
    measureDestroy(splitter, runs, result);
    measureWorkers(splitter, runs, result);
    return result;
}

}  // namespace bench
