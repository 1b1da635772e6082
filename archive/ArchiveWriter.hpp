#pragma once

#include <cstdint>
#include <memory>
#include <ranges>
#include <string>
#include <string_view>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/ArchiveOptions.hpp"

namespace tessel {

namespace archive {
class ArchiveReader;
}

// Writes a list of paths as an archive, to a file or to memory.
//
//     tessel::ArchiveWriter writer("paths.tessel");
//     writer.addAll(paths);
//     writer.add("usr/bin/env");
//     writer.finish();
//
// A path is any bytes but NUL, at least one; repeats and any order are fine.
// Paths are numbered from 0 as they are added.
//
// Invariants: the target is not touched before `finish`, which replaces it as
//   a whole; a writer that is destroyed without it leaves no trace. The bytes
//   depend on the paths and the options, not on threads or machines.
// Ownership: copies what it is given. A vector to write to must outlive it.
// Threads: one thread at a time; the writer starts and ends its own.
// Errors: after an exception while a segment is built or the archive is put in
//   place, the writer can only be destroyed. Whoever goes on with one that
//   has ended, or was moved from, gets std::logic_error.
// Cost: 0.6 to 1.2 microseconds per path on one core, nearly all of it in
//   `finish` or wherever a segment is full. Memory for one segment: its text
//   and 100 bytes per path.
class ArchiveWriter {
public:
    // Will replace the file, or the vector's contents. Throws
    // std::system_error, which names the file, if its folder cannot be
    // written to or it is not a regular file.
    explicit ArchiveWriter(const std::string& file,
                           ArchiveOptions options = {});
    explicit ArchiveWriter(std::vector<std::uint8_t>& out,
                           ArchiveOptions options = {});

    // Will add paths after those of an archive, whose bytes are kept. The new
    // paths get segments of their own: `repack` joins them if there are many.
    // Throws what the constructor throws, and DamagedArchiveException or
    // UnsupportedArchiveVersionException. Of two writers that append to the
    // same file at a time, the paths of one are lost.
    static ArchiveWriter append(const std::string& file,
                                ArchiveOptions options = {});
    static ArchiveWriter append(std::vector<std::uint8_t>& archive,
                                ArchiveOptions options = {});

    // Writes an archive anew, with full segments and the options' level and
    // index. Its paths keep their numbers. Throws what `append` and `finish`
    // throw; the archive is the old one then.
    static void repack(const std::string& file, ArchiveOptions options = {});
    static void repack(std::vector<std::uint8_t>& archive,
                       ArchiveOptions options = {});

    ArchiveWriter(ArchiveWriter&& other) noexcept;
    ArchiveWriter& operator=(ArchiveWriter&& other) noexcept;
    ArchiveWriter(const ArchiveWriter&) = delete;
    ArchiveWriter& operator=(const ArchiveWriter&) = delete;
    ~ArchiveWriter();

    // Adds a path. Throws std::invalid_argument if it is empty or holds a NUL,
    // and std::length_error if its name or its folder is longer than 1 MiB;
    // both say which path it is, and the path is left out. So it is if there is
    // no memory for it (std::bad_alloc), and can be added again. Where a
    // segment is full, it is built first; see `finish` for what that throws.
    void add(std::string_view path);

    // Adds what can be turned into views, in order.
    template <std::ranges::input_range Paths>
    void addAll(Paths&& paths) {
        for (const auto& path : paths) add(path);
    }

    // Paths in the archive so far, those of before included: the number of the
    // next one.
    std::uint64_t size() const noexcept;

    // Builds what is left and puts the archive in place. Afterwards, nothing
    // can be added. Throws CancelledException, std::system_error, and what the
    // progress callback throws. Returns the size of the archive in bytes.
    std::uint64_t finish();

private:
    class Impl;
    Impl& impl() const;
    explicit ArchiveWriter(std::unique_ptr<Impl> impl) noexcept;
    void addAllOf(const archive::ArchiveReader& old);

    std::unique_ptr<Impl> impl_;
};

}  // namespace tessel
