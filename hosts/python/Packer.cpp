#include "hosts/python/Packer.hpp"

#include <algorithm>
#include <array>
#include <fstream>
#include <stdexcept>
#include <utility>

#include "archive/Format.hpp"
#include "hosts/python/Errors.hpp"
#include "hosts/python/Interruptible.hpp"
#include "hosts/python/PathObjects.hpp"

namespace tessel::python {

namespace py = pybind11;

namespace {

// The path's position, where Python says what is wrong with its type or text.
// Whatever else is raised, such as Ctrl-C in a path's own code, stays as it is.
[[noreturn]] void raiseAt(py::error_already_set& error,
                          std::uint64_t position) {
    const std::string text = "path " + std::to_string(position) + " is no path";
    if (error.matches(PyExc_UnicodeError)) {
        py::raise_from(error, PyExc_ValueError, text.c_str());
        throw py::error_already_set();
    }
    if (!error.matches(PyExc_TypeError)) throw;
    py::raise_from(error, PyExc_TypeError,
                   (text + ": give str, bytes or os.PathLike").c_str());
    throw py::error_already_set();
}

// Whether a file begins as an archive does.
bool isArchive(const std::string& file) {
    std::array<char, archive::fileMagic.size()> start{};
    std::ifstream(file, std::ios::binary).read(start.data(), start.size());
    return std::ranges::equal(start, archive::fileMagic, {}, [](char c) {
        return static_cast<std::uint8_t>(c);
    });
}

// Throws if the file of a list has other contents than the list.
void refuseIfChanged(const StoredList& list) {
    const StoredList::Pointer now = StoredList::open(list.file());
    if (now->bytes().size() == list.bytes().size() &&
        now->archive().info().sum == list.archive().info().sum)
        return;
    throw std::invalid_argument(
        "'" + list.file() +
        "' has changed since this list was opened; open it again and append to "
        "that");
}

PathBytes bytesAt(const py::handle& item, std::uint64_t position) {
    try {
        return PathBytes(py::reinterpret_borrow<py::object>(item));
    } catch (py::error_already_set& error) {
        raiseAt(error, position);
    }
}

}  // namespace

// ---- Opening ----

Packer::Packer(std::string file, ArchiveLevel level, ArchiveIndex index,
               py::object progress)
    : Packer(std::move(file), std::move(progress)) {
    namingArchive(file_, [&] {
        if (file_.empty())
            writer_.emplace(bytes_, options(level, index));
        else
            writer_.emplace(file_, options(level, index));
    });
}

std::unique_ptr<Packer> Packer::appendTo(const StoredList& list,
                                         py::object progress) {
    // NOLINTNEXTLINE(cppcoreguidelines-owning-memory): a private constructor.
    std::unique_ptr<Packer> packer(
        new Packer(list.file(), std::move(progress)));
    namingArchive(list.file(), [&] {
        const ArchiveOptions options = packer->options(
            ArchiveLevel::Normal,
            list.hasIndex() ? ArchiveIndex::WhereNeeded : ArchiveIndex::None);
        if (list.isInMemory()) {
            packer->bytes_.assign(list.bytes().begin(), list.bytes().end());
            packer->writer_ = ArchiveWriter::append(packer->bytes_, options);
        } else {
            refuseIfChanged(list);
            packer->writer_ = ArchiveWriter::append(list.file(), options);
        }
    });
    return packer;
}

ArchiveOptions Packer::options(ArchiveLevel level, ArchiveIndex index) {
    ArchiveOptions options;
    options.level = level;
    options.index = index;
    options.cancel = stop_.get_token();
    options.progress = [this](const ArchiveProgress& now) {
        const auto open =
            static_cast<double>(now.pathsAdded - now.pathsWritten);
        packed_ =
            now.pathsWritten + static_cast<std::uint64_t>(open * now.share);
    };
    return options;
}

// ---- Adding ----

void Packer::run(FunctionRef<void()> work) {
    runInterruptibly(
        stop_, [&] { namingArchive(file_, work); }, [&] { report(); });
}

void Packer::report() {
    if (progress_.is_none()) return;
    progress_(packed_.load(std::memory_order_relaxed),
              added_.load(std::memory_order_relaxed));
}

void Packer::addPath(std::string_view path) {
    if (stop_.stop_requested()) throw CancelledException();
    writer_->add(path);
    added_.store(writer_->size(), std::memory_order_relaxed);
}

void Packer::addBatch(const paths::PathList& batch) {
    run([&] {
        for (std::size_t i = 0; i < batch.size(); ++i) addPath(batch[i]);
    });
}

void Packer::addIterable(const py::iterable& paths) {
    paths::PathList batch;
    std::uint64_t position = writer_->size();
    for (const py::handle item : paths) {
        const PathBytes path = bytesAt(item, position++);
        if (path.view().empty())
            throw std::invalid_argument("path " + std::to_string(position - 1) +
                                        " is empty");
        batch.append(path.view());
        if (batch.size() < pathsPerBatch) continue;
        addBatch(batch);
        batch.clear();
    }
    addBatch(batch);
}

void Packer::addSequence(const PathSequence& paths) {
    run([&] {
        for (std::uint64_t first = 0; first < paths.size();
             first += pathsPerBatch)
            paths.read(first, std::min(first + pathsPerBatch, paths.size()),
                       [&](std::string_view path) { addPath(path); });
    });
}

void Packer::addListFile(const std::string& file) {
    bool isPacked = false;
    run([&] { isPacked = isArchive(file); });
    if (isPacked) return addSequence(PathSequence(StoredList::open(file)));
    run([&] {
        const paths::PathList list = paths::readListFile(file);
        for (std::size_t i = 0; i < list.size(); ++i) addPath(list[i]);
    });
}

paths::WalkReport Packer::addFolder(const std::string& folder) {
    paths::WalkReport report;
    run([&] {
        paths::walkFolder(folder, paths::WalkFolders::Leave, report,
                          [&](std::string_view path) { addPath(path); });
    });
    return report;
}

StoredList::Pointer Packer::finish() {
    run([&] { writer_->finish(); });
    packed_ = added_.load(std::memory_order_relaxed);
    writer_.reset();
    report();
    return file_.empty() ? StoredList::own(std::move(bytes_))
                         : StoredList::open(file_);
}

}  // namespace tessel::python
