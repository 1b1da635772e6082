#include "hosts/console/Commands.hpp"

#include <fmt/format.h>

#include <array>

#include "hosts/console/DiffCommand.hpp"
#include "hosts/console/ExportCommand.hpp"
#include "hosts/console/FindCommand.hpp"
#include "hosts/console/GetCommand.hpp"
#include "hosts/console/InfoCommand.hpp"
#include "hosts/console/ListCommand.hpp"
#include "hosts/console/NumberCommand.hpp"
#include "hosts/console/PackCommand.hpp"
#include "hosts/console/VerifyCommand.hpp"

namespace tessel::console {

namespace {

struct Entry {
    std::string_view name;
    std::string_view summary;
    std::unique_ptr<Command> (*make)();
};

template <class SomeCommand>
std::unique_ptr<Command> make() {
    return std::make_unique<SomeCommand>();
}

constexpr std::array<Entry, 9> entries = {{
    {"pack", "Pack a list of paths into an archive", make<PackCommand>},
    {"list", "Write all paths of an archive", make<ListCommand>},
    {"get", "Write paths by number", make<GetCommand>},
    {"find", "Write the paths that contain a text", make<FindCommand>},
    {"number", "Write the numbers of paths", make<NumberCommand>},
    {"info", "Tell what is in an archive", make<InfoCommand>},
    {"verify", "Tell what of an archive is damaged", make<VerifyCommand>},
    {"diff", "Compare two archives", make<DiffCommand>},
    {"export", "Write a store, which can grow", make<ExportCommand>},
}};

}  // namespace

std::unique_ptr<Command> makeCommand(std::string_view name) {
    for (const Entry& entry : entries)
        if (entry.name == name) return entry.make();
    return nullptr;
}

std::string generalHelp() {
    std::string text =
        "tessel keeps very large lists of paths in small files.\n"
        "Usage: tessel COMMAND [OPTIONS] ...\n\n"
        "Commands:\n";
    for (const Entry& entry : entries)
        text += fmt::format("  {:<10}{}\n", entry.name, entry.summary);
    return text +
           "\nOptions:\n"
           "  --help    Explain tessel and exit\n"
           "  --version Write the version and exit\n"
           "\nExamples:\n"
           "  find /usr | tessel pack -o usr.tessel\n"
           "  tessel find usr.tessel python README\n"
           "  tessel get usr.tessel --random 3\n"
           "  tessel pack --help\n"
           "\nExit status: 0 done; 1 nothing found, or a difference; 2 wrong "
           "usage;\n3 bad input; 4 damaged file; 5 the system refused.\n";
}

}  // namespace tessel::console
