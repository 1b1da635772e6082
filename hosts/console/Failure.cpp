#include "hosts/console/Failure.hpp"

#include <fmt/format.h>

#include <new>
#include <stdexcept>
#include <system_error>

#include "archive/ArchiveExceptions.hpp"
#include "hosts/console/ConsoleException.hpp"

namespace tessel::console {

namespace {

// A sentence as part of a line: without its full stop.
std::string withoutFullStop(std::string sentence) {
    while (!sentence.empty() &&
           (sentence.back() == '.' || sentence.back() == '\n'))
        sentence.pop_back();
    for (char& c : sentence)
        if (c == '\n') c = ' ';
    return sentence;
}

std::string damageText(const DamagedArchiveException& damage) {
    // Mostly somebody names a list where an archive belongs.
    if (damage.offset() == 0)
        return withoutFullStop(damage.cause()) +
               "; `tessel pack` makes an archive of a list, `tessel list "
               "--salvage` reads what is left of a damaged one";
    return withoutFullStop(damage.what()) +
           "; `tessel verify` lists the damage, `tessel list --salvage` reads "
           "what is left";
}

}  // namespace

Failure describeCurrentException() {
    try {
        throw;
    } catch (const ConsoleException& failure) {
        return {failure.status(), withoutFullStop(failure.what())};
    } catch (const std::system_error& failure) {
        return {ExitStatus::System, withoutFullStop(failure.what())};
    } catch (const std::bad_alloc&) {
        return {ExitStatus::System, outOfMemoryLine};
    } catch (const std::exception& failure) {
        return {ExitStatus::System, withoutFullStop(failure.what())};
    }
}

void rethrowNaming(const std::string& file) {
    try {
        throw;
    } catch (const DamagedArchiveException& damage) {
        throw ConsoleException(ExitStatus::Damaged,
                               fmt::format("{}: {}", file, damageText(damage)));
    } catch (const UnsupportedArchiveVersionException& newer) {
        throw ConsoleException(
            ExitStatus::BadInput,
            fmt::format("{}: version {} of the format is newer than this "
                        "program; install a newer tessel",
                        file, newer.version()));
    }
}

}  // namespace tessel::console
