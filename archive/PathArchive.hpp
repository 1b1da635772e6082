#pragma once

#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <iterator>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/ArchiveReports.hpp"
#include "archive/ArchiveWriter.hpp"
#include "archive/FindOptions.hpp"
#include "archive/NumberRange.hpp"
#include "archive/PathVisitor.hpp"
#include "archive/ScanOptions.hpp"

namespace tessel {

namespace archive {
class ArchiveReader;
class SequentialReader;
}  // namespace archive

// PathArchive reads a list of paths from an archive that ArchiveWriter wrote:
//
//     const auto archive = tessel::PathArchive::open("files.tessel");
//     std::string first = archive[0];
//     for (std::string_view path : archive) std::cout << path << '\n';
//     if (auto number = archive.numberOf("usr/bin/env")) ...
//     for (auto number : archive.find("README")) ...
//
// Paths have numbers from 0 in the order in which they were added; the list
// may be in any order and hold the same path more than once. A path is any
// bytes but NUL and never empty. '/' separates folders; nothing else about a
// path is interpreted.
//
// Ownership: an archive maps its file (open), keeps its bytes (own) or borrows
//   them (over). Copies are cheap and share all of that; the last one frees
//   it. A moved-from archive may only be destroyed or assigned to.
// Threads: all members are const and may be called from any number of threads
//   at the same time, on one object or on copies.
// Trust: the bytes may be hostile. Each piece of them is checked against its
//   checksum when it is first touched, so any member may throw
//   DamagedArchiveException; damage never gives a wrong path. A forged
//   archive, which breaks the format's rules under right checksums, causes no
//   crash, hang or large allocation: the member that meets a broken rule
//   throws the same, and `verify` finds them all. Until then, a search in it
//   may miss a path or give a wrong number.
// Changes: a file that is replaced by renaming, as ArchiveWriter does, is read
//   on as it was. If the mapped file is cut, or written anew from its start, or
//   the disk fails, every later member that reads throws
//   DamagedArchiveException; open the file again. For that, `open` and
//   `salvage` set a handler of SIGBUS that passes on all other signals to the
//   handler of before (archive/LostPages.hpp). Not noticed: bytes that somebody
//   writes in the middle of the file. Where that may happen, read the file into
//   memory and use own().
// Memory: where it runs out, any member may throw std::bad_alloc. The archive
//   is as it was and answers again once there is memory.
// Cost: opening reads the tables (some hundred kilobytes per 8 million
//   paths), not the paths, and derives at most 0.3 MB per segment. What each
//   member costs is said there; a "block" is 16 paths.
class PathArchive {
public:
    class Iterator;
    using const_iterator = Iterator;
    using value_type = std::string_view;

    // ---- Opening ----

    // All of them throw DamagedArchiveException if the bytes are not a whole
    // archive with undamaged tables, and UnsupportedArchiveVersionException
    // if a newer library wrote it.

    // Maps the file. Throws std::system_error, which names the file, if it
    // cannot be opened or mapped.
    static PathArchive open(const std::string& file);

    // Reads bytes that must outlive this object and all copies of it, and
    // that nobody changes meanwhile.
    static PathArchive over(std::span<const std::uint8_t> bytes);
    static PathArchive over(std::span<const std::byte> bytes);

    // Keeps the bytes.
    static PathArchive own(std::vector<std::uint8_t> bytes);

    // ---- Paths by number ----

    std::uint64_t size() const noexcept;
    bool empty() const noexcept { return size() == 0; }

    // The path with this number. Throws std::out_of_range. Decodes half a
    // block of names and half a block of folders on average.
    std::string operator[](std::uint64_t number) const;

    // The same into a string that is overwritten, so that no memory is
    // allocated if its capacity suffices. If it throws, `into` holds anything.
    void read(std::uint64_t number, std::string& into) const;

    // Shows the paths of these numbers in the order asked, repeats included.
    // Ascending numbers that lie close together share the decoding of their
    // block, so that all numbers in ascending order cost hardly more than
    // forEach. Throws std::out_of_range before anything is shown.
    void read(std::span<const std::uint64_t> numbers,
              PathVisitor visitor) const;

    // Shows the paths with the numbers from first up to, but without, last, in
    // ascending order. Throws std::out_of_range before anything is shown if
    // not first <= last <= size(). This is the fastest way to read many paths.
    void forEach(std::uint64_t first, std::uint64_t last,
                 PathVisitor visitor) const;
    void forEach(PathVisitor visitor) const { forEach(0, size(), visitor); }

    // An input range over all paths in the order of their numbers. A view is
    // valid until its iterator is advanced or destroyed.
    Iterator begin() const;
    std::default_sentinel_t end() const noexcept { return {}; }

    // ---- Numbers by path ----

    // The lowest number of this path, or nothing if it is not in the list.
    // What it costs per segment depends on how the list was ordered:
    //
    //   | order                     | with index       | without             |
    //   |---------------------------|------------------|---------------------|
    //   | sorted                    |                  | some 50 names       |
    //   | folders scattered         | some 50 names    | and 2 ns per path   |
    //   | folders together, but not | some 20 paths    | all folders, and    |
    //   | sorted                    |                  | names up to the one |
    std::optional<std::uint64_t> numberOf(std::string_view path) const;

    bool contains(std::string_view path) const;

    // The numbers of all paths below a folder at any depth, ascending and
    // disjoint: of those that start with `path` and a '/'. A '/' at the end of
    // `path` is that '/'; "" is the whole list. Nothing if there is no such
    // folder. A sorted list answers with one range. Decodes the folders, not
    // the names, except at the ends of a range.
    std::vector<NumberRange> folder(std::string_view path) const;

    // ---- Search ----

    // Numbers of the paths that hold every one of the texts anywhere, folder
    // part included; ascending. No texts find every path. Folders are matched
    // once for all of their names, and blocks that cannot match are skipped.
    // Throws CancelledException.
    std::vector<std::uint64_t> find(std::span<const std::string_view> texts,
                                    const FindOptions& options = {}) const;
    std::vector<std::uint64_t> find(
        std::initializer_list<std::string_view> texts,
        const FindOptions& options = {}) const;
    std::vector<std::uint64_t> find(std::string_view text,
                                    const FindOptions& options = {}) const;

    // Numbers of the paths for which the predicate returns true, ascending.
    // The predicate is called on several threads unless options.threads is 1.
    // What it throws ends the search and reaches the caller.
    std::vector<std::uint64_t> find(PathPredicate predicate,
                                    const FindOptions& options = {}) const;

    // The same, but shows each found path on the calling thread while the
    // search goes on, in ascending order of numbers. The search ends early if
    // the visitor returns false. Memory stays bounded however many are found,
    // except that a shuffled segment takes one bit per path.
    void findEach(std::span<const std::string_view> texts, PathVisitor visitor,
                  const FindOptions& options = {}) const;
    void findEach(PathPredicate predicate, PathVisitor visitor,
                  const FindOptions& options = {}) const;

    // ---- Care ----

    // Checks every checksum, decodes every path and checks every rule of the
    // format. Throws the first damage, in the order of the bytes, as
    // DamagedArchiveException; CancelledException.
    void verify(const ScanOptions& options = {}) const;

    // The same, but collects all damage. An undamaged archive has none. Throws
    // DamagedArchiveException only if the file was changed meanwhile and no
    // damage was found.
    [[nodiscard]] std::vector<ArchiveDamage> findDamage(
        const ScanOptions& options = {}) const;

    // Shows every path of a damaged archive whose pieces are intact, in
    // ascending order of numbers, each under its own number. Works on files
    // that open() refuses. A damaged piece of at most 4 KiB costs the blocks
    // in it; if it holds folders, the paths in those folders. A damaged table
    // costs its segment. Throws std::system_error, UnsupportedArchive-
    // VersionException, and DamagedArchiveException if nothing can be found
    // because this is no archive at all, or if the file is changed meanwhile.
    // What the disk cannot deliver counts as damaged.
    static SalvageReport salvage(const std::string& file, PathVisitor visitor);
    static SalvageReport salvage(std::span<const std::uint8_t> bytes,
                                 PathVisitor visitor);

    // Counts and sizes. Costs nothing but the answer.
    ArchiveInfo info() const;

    // The archive's bytes as they are stored, unchecked: what a copy of it
    // has to hold. Valid as long as this archive or a copy of it.
    std::span<const std::uint8_t> bytes() const noexcept;

    // Takes the pages of a mapped file out of this process's memory; of an
    // archive in memory, nothing. The system goes on caching them, so that
    // the next reads map them again without reading the disk. For processes
    // that wait for long or are counted by the memory that they have mapped.
    // Cost: measured on a file of 33 MB, 30 microseconds, and 100 to 200 for
    //   mapping all of it again.
    void releasePages() const noexcept;

private:
    explicit PathArchive(
        std::shared_ptr<const archive::ArchiveReader> reader) noexcept;

    std::shared_ptr<const archive::ArchiveReader> reader_;
};

// Reads an archive's paths one by one; made by PathArchive::begin. It keeps
// the archive's bytes alive by itself.
//
// A view is valid until the iterator is advanced or destroyed. Moving the
// iterator keeps it valid; the one that it was moved from is at the end. So is
// one whose advance has thrown DamagedArchiveException or std::bad_alloc;
// number() is then that of the path that was not read. Advancing at the end
// changes nothing.
// Cost: some kilobytes; on a list whose folders are scattered up to 10 MiB,
//   because paths are decoded in batches, in the order in which they are
//   stored. Batches start small.
// Threads: one thread at a time; several iterators are independent.
class PathArchive::Iterator {
public:
    using iterator_concept = std::input_iterator_tag;
    using value_type = std::string_view;
    using difference_type = std::ptrdiff_t;

    Iterator(Iterator&&) noexcept;
    Iterator& operator=(Iterator&&) noexcept;
    Iterator(const Iterator&) = delete;
    Iterator& operator=(const Iterator&) = delete;
    ~Iterator();

    std::string_view operator*() const noexcept { return path_; }
    Iterator& operator++();
    void operator++(int) { ++*this; }

    // The number of the current path; the archive's size at the end.
    std::uint64_t number() const noexcept { return number_; }

    friend bool operator==(const Iterator& it, std::default_sentinel_t) {
        return it.isAtEnd();
    }

private:
    friend class PathArchive;
    explicit Iterator(std::shared_ptr<const archive::ArchiveReader> reader);
    bool isAtEnd() const noexcept {
        return paths_ == nullptr || number_ >= size_;
    }

    std::shared_ptr<const archive::ArchiveReader> reader_;
    // Borrows reader_; null once nothing more can be read.
    std::unique_ptr<archive::SequentialReader> paths_;
    std::string_view path_;
    std::uint64_t number_ = 0;
    std::uint64_t size_ = 0;
};

}  // namespace tessel
