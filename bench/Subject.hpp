#pragma once

#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "paths/PathSplitter.hpp"

namespace bench {

// Subject is one way of keeping a list of paths in memory: an instance that
// is built, asked, stored, restored and destroyed. Each operation returns the
// seconds that it took, without its preparations.
//
// Order: build; then iterate, fetchAll, fetchRandom, findNumbers, verify in
//   any order; store; restore; verifyRestored; destroyRestored; destroy; and
//   again.
class Subject {
public:
    Subject() = default;
    Subject(const Subject&) = delete;
    Subject& operator=(const Subject&) = delete;
    virtual ~Subject() = default;

    virtual std::string name() const = 0;
    // How many paths its list has.
    virtual std::size_t paths() const = 0;

    virtual double build() = 0;
    // The full text of every path, in the instance's own order.
    virtual double iterate() = 0;
    // The full text of every path in the order of the list.
    virtual double fetchAll() = 0;
    // The full texts of the paths of these numbers, one by one. The first
    // path has number 1.
    virtual double fetchRandom(const std::vector<std::size_t>& numbers) = 0;
    // The numbers of the paths that have these numbers, one by one. None if
    // the subject cannot be asked for them.
    virtual std::optional<double> findNumbers(
        const std::vector<std::size_t>& /*numbers*/) {
        return std::nullopt;
    }
    virtual double store() = 0;
    virtual double restore() = 0;
    virtual double destroyRestored() = 0;
    virtual double destroy() = 0;

    virtual std::size_t storedBytes() const = 0;
    // What it allocated beside the instance, to verify or to store it.
    virtual std::size_t sideBytes() const { return 0; }
    // True if the instance gives back every path of the list.
    virtual bool verify() = 0;
    virtual bool verifyRestored() = 0;
};

using SubjectPtr = std::unique_ptr<Subject>;

// Each of them refers to the list, or the splitter and its list.
SubjectPtr makeStore(const tessel::paths::PathList& list);
SubjectPtr makeCore(const tessel::paths::PathSplitter& splitter);
SubjectPtr makeTextVector(const tessel::paths::PathList& list);
SubjectPtr makeStringVector(const tessel::paths::PathList& list);
SubjectPtr makeTextBuffer(const tessel::paths::PathList& list);
// An index finds a path by its text in lists that are not sorted.
enum class ArchiveKind { Plain, Indexed };
SubjectPtr makeArchive(const tessel::paths::PathList& list,
                       ArchiveKind kind = ArchiveKind::Plain);
// Null where the program was built without libmarisa.
SubjectPtr makeMarisa(const tessel::paths::PathList& list);

// A general compressor's result on a list's text, which it can give back only
// as a whole.
struct Compressed {
    std::string name;
    std::size_t bytes = 0;
    double storeSeconds = 0;
    double restoreSeconds = 0;
};
// None where the program was built without the libraries.
std::vector<Compressed> compressText(const tessel::paths::PathList& list);

}  // namespace bench
