#include "paths/ChunkEncoder.hpp"

#include <algorithm>
#include <exception>
#include <iterator>
#include <string>
#include <string_view>
#include <system_error>
#include <thread>
#include <utility>

#include "coder/ArenaEncoder.hpp"
#include "coder/HuffmanCode.hpp"
#include "paths/PathText.hpp"
#include "paths/Segments.hpp"

namespace tessel::paths {

namespace {

// Fewer paths are not worth a thread: they are encoded in the time that it
// takes to start one, 20 to 50 microseconds.
constexpr std::size_t minPathsPerThread = 1000;

std::string_view foldersOf(std::string_view path) noexcept {
    return path.substr(0, fileStartOf(path));
}

// Encodes some paths, one after the other.
class PartEncoder {
public:
    explicit PartEncoder(const HuffmanCode& code) : encoder_(code) {}

    void encode(const PathList& paths, std::size_t begin, std::size_t end) {
        for (std::size_t i = begin; i < end;) i = encodeFolder(paths, i, end);
        part_.buffers = arena_.takeBuffers();
    }

    EncodedChunk takePart() noexcept { return std::move(part_); }

private:
    // Encodes the run of paths of one folder that begins at `first`, and
    // returns its end.
    std::size_t encodeFolder(const PathList& paths, std::size_t first,
                             std::size_t end) {
        const std::string_view folders = foldersOf(paths[first]);
        if (folders.empty()) put({});
        forEachSegment(folders,
                       [&](std::string_view segment) { put(segment); });
        part_.folders.push_back(arena_.finish());
        std::size_t i = first;
        do {
            put(paths[i].substr(folders.size()));
            ++i;
        } while (i < end && hasFolders(paths[i], folders));
        part_.files.push_back(arena_.finish());
        return i;
    }

    void put(std::string_view segment) {
        std::size_t length = encoder_.appendAscii(segment, arena_);
        if (length == 0) length = putText(segment);
        part_.maxComponentBytes = std::max(part_.maxComponentBytes, length);
    }

    std::size_t putText(std::string_view segment) {
        text_.clear();
        if (segment.empty())
            text_.push_back(noName);
        else
            appendText(segment, text_);
        return encoder_.append(text_, arena_);
    }

    ArenaEncoder encoder_;
    ComponentArena arena_;
    std::u16string text_;
    EncodedChunk part_;
};

// Where to cut the paths for that many threads: only between folders, so that
// all of them together make the entries that one would make.
std::vector<std::size_t> cutsOf(const PathList& paths, std::size_t threads) {
    std::vector<std::size_t> cuts = {0};
    for (std::size_t t = 1; t < threads; ++t) {
        std::size_t cut = std::max(cuts.back(), paths.size() / threads * t);
        while (cut > 0 && cut < paths.size() &&
               hasFolders(paths[cut], foldersOf(paths[cut - 1])))
            ++cut;
        cuts.push_back(cut);
    }
    cuts.push_back(paths.size());
    return cuts;
}

// A part, its thread, and how that ended.
struct Worker {
    explicit Worker(const HuffmanCode& code) : encoder(code) {}

    void run(const PathList& paths, std::size_t begin,
             std::size_t end) noexcept {
        try {
            encoder.encode(paths, begin, end);
        } catch (...) {
            failure = std::current_exception();
        }
    }

    PartEncoder encoder;
    std::exception_ptr failure;
    std::jthread thread;
};

template <class T>
void moveToEnd(std::vector<T>& from, std::vector<T>& to) {
    to.insert(to.end(), std::make_move_iterator(from.begin()),
              std::make_move_iterator(from.end()));
}

EncodedChunk joined(std::vector<Worker>& workers) {
    for (const Worker& worker : workers)
        if (worker.failure) std::rethrow_exception(worker.failure);
    EncodedChunk all = workers.front().encoder.takePart();
    for (std::size_t w = 1; w < workers.size(); ++w) {
        EncodedChunk part = workers[w].encoder.takePart();
        moveToEnd(part.folders, all.folders);
        moveToEnd(part.files, all.files);
        moveToEnd(part.buffers, all.buffers);
        all.maxComponentBytes =
            std::max(all.maxComponentBytes, part.maxComponentBytes);
    }
    return all;
}

}  // namespace

EncodedChunk encodeChunk(const HuffmanCode& code, const PathList& paths,
                         unsigned threads) {
    const std::size_t workerCount = std::clamp<std::size_t>(
        paths.size() / minPathsPerThread, 1, threads == 0 ? 2 : threads);
    const std::vector<std::size_t> cuts = cutsOf(paths, workerCount);
    std::vector<Worker> workers;
    workers.reserve(workerCount);
    for (std::size_t w = 0; w < workerCount; ++w) workers.emplace_back(code);
    for (std::size_t w = 1; w < workerCount; ++w) {
        const auto run = [&paths, &worker = workers[w], begin = cuts[w],
                          end = cuts[w + 1]] { worker.run(paths, begin, end); };
        try {
            workers[w].thread = std::jthread(run);
        } catch (const std::system_error&) {
            run();  // without a thread of its own
        }
    }
    workers.front().run(paths, cuts[0], cuts[1]);
    for (Worker& worker : workers)
        if (worker.thread.joinable()) worker.thread.join();
    EncodedChunk all = joined(workers);
    all.pathCount = paths.size();
    return all;
}

}  // namespace tessel::paths
