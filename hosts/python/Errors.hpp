#pragma once

#include <pybind11/pybind11.h>

#include <stdexcept>
#include <string>
#include <system_error>
#include <utility>

#include "archive/ArchiveExceptions.hpp"
#include "packing/FunctionRef.hpp"

namespace tessel::python {

// A list's archive is damaged; Python's qztessel.DamagedArchiveError. what()
// is one line that names the archive.
class DamagedListException : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// A file that the system refuses; Python's OSError with errno and file name.
class FileException : public std::system_error {
public:
    FileException(std::error_code code, std::string file)
        : std::system_error(code, file), file_(std::move(file)) {}
    const std::string& file() const noexcept { return file_; }

private:
    std::string file_;
};

// Does work with an archive and names the archive in what the work throws.
//
// file  where the archive is; empty if it is in memory
template <class Work>
decltype(auto) namingArchive(const std::string& file, Work&& work) {
    const auto name = [&] {
        return file.empty() ? "the archive in memory" : "'" + file + "'";
    };
    try {
        return std::forward<Work>(work)();
    } catch (const DamagedArchiveException& damage) {
        throw DamagedListException(
            name() + " is damaged at byte " + std::to_string(damage.offset()) +
            ": " + damage.cause() + " Take another copy of it.");
    } catch (const UnsupportedArchiveVersionException& newer) {
        throw std::invalid_argument(name() + ": " + newer.what() +
                                    " Install a newer qztessel.");
    } catch (const FileException&) {
        throw;
    } catch (const std::system_error& error) {
        throw FileException(error.code(), file);
    }
}

// Adds DamagedArchiveError to the module, and translates what the library
// throws to Python's own kinds.
void registerErrors(pybind11::module_& module);

}  // namespace tessel::python
