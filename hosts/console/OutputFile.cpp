#include "hosts/console/OutputFile.hpp"

#include <fmt/format.h>
#include <sys/stat.h>

#include <cerrno>
#include <system_error>

#include "archive/FileTarget.hpp"
#include "hosts/console/ConsoleException.hpp"
#include "hosts/console/Terminal.hpp"

namespace tessel::console {

namespace {

// Whether a call found the file.
bool isFound(int result, const std::string& file) {
    if (result == 0) return true;
    if (errno == ENOENT) return false;
    throw std::system_error(errno, std::generic_category(), file);
}

}  // namespace

bool exists(const std::string& file) {
    struct stat about {};
    return isFound(::stat(file.c_str(), &about), file);
}

void checkOverwrite(const std::string& file, Overwrite overwrite) {
    struct stat about {};
    if (file == "-" || overwrite == Overwrite::Allowed ||
        !isFound(::lstat(file.c_str(), &about), file))
        return;
    throw ConsoleException(
        ExitStatus::BadInput,
        fmt::format("{}: exists already; use -f to replace it", file));
}

void checkNoTerminal(const std::string& file, const Session& session) {
    if (file != "-" || !isTerminal(session.output.descriptor())) return;
    throw ConsoleException(
        ExitStatus::Usage,
        "the result is no text for a terminal; name a file with -o");
}

void replaceFile(const std::string& file, std::span<const std::uint8_t> bytes,
                 Session& session) {
    if (file == "-") {
        session.output.write(
            {reinterpret_cast<const char*>(bytes.data()), bytes.size()});
        return;
    }
    archive::FileTarget target(file);
    target.append(bytes);
    session.interrupts.throwIfStopped();
    target.commit();
}

void replaceFile(const std::string& file, std::string_view bytes,
                 Session& session) {
    replaceFile(file,
                std::span(reinterpret_cast<const std::uint8_t*>(bytes.data()),
                          bytes.size()),
                session);
}

}  // namespace tessel::console
