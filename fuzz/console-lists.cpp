// What `tessel` reads from its user: a list file in any of its kinds, and the
// words after a command's name. A list gives the paths that a plain split
// gives, or one line that says why not; a command ends with one of its exit
// statuses.
//
// Input: a byte of options; with one of them a command, a count and words as
// blocks; the rest is the list file.
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/ArchiveWriter.hpp"
#include "fuzz/Input.hpp"
#include "hosts/console/Console.hpp"
#include "hosts/console/ConsoleException.hpp"
#include "hosts/console/ListInput.hpp"

namespace tessel::fuzz {
namespace {

using namespace console;
using Paths = std::vector<std::string>;

// A file in memory, which has a name.
class MemoryFile {
public:
    MemoryFile() : descriptor_(::memfd_create("fuzzed", MFD_CLOEXEC)) {
        require(descriptor_ >= 0, "a file in memory can be made");
    }
    MemoryFile(const MemoryFile&) = delete;
    MemoryFile& operator=(const MemoryFile&) = delete;
    ~MemoryFile() { ::close(descriptor_); }

    void write(std::string_view bytes) const {
        require(::ftruncate(descriptor_, 0) == 0 &&
                    ::pwrite(descriptor_, bytes.data(), bytes.size(), 0) ==
                        static_cast<ssize_t>(bytes.size()),
                "a file in memory can be written");
        ::lseek(descriptor_, 0, SEEK_SET);
    }
    int descriptor() const noexcept { return descriptor_; }
    std::string name() const {
        return "/proc/self/fd/" + std::to_string(descriptor_);
    }

private:
    int descriptor_;
};

// One for the process, as in a program. What it prints goes to a file in
// memory.
Session& session() {
    static Interrupts interrupts;
    static const MemoryFile shown;
    static OutputBuffer output(shown.descriptor(), "standard output");
    static OutputBuffer errors(shown.descriptor(), "standard error");
    static Session one{interrupts, output, errors};
    shown.write("");
    return one;
}

// What the list holds; nothing if it cannot be read as one.
std::optional<Paths> read(const MemoryFile& file, const ListOptions& options) {
    Paths paths;
    ProgressBar bar(ProgressBar::Visibility::Hidden);
    ListInput list(options, session(), bar);
    try {
        list.readList(file.name(),
                      [&](std::string_view path) { paths.emplace_back(path); });
    } catch (const ConsoleException& refusal) {
        require(std::string_view(refusal.what()).find('\n') ==
                    std::string_view::npos,
                "a refusal is one line");
        return std::nullopt;
    } catch (const DamagedArchiveException&) {
        return std::nullopt;
    }
    return paths;
}

std::optional<Paths> split(std::string_view bytes, const ListOptions& options) {
    Paths paths;
    const char separator = static_cast<char>(options.separator);
    while (!bytes.empty()) {
        const std::size_t end = std::min(bytes.find(separator), bytes.size());
        const std::string_view path = bytes.substr(0, end);
        bytes.remove_prefix(std::min(end + 1, bytes.size()));
        if (path.find('\0') != std::string_view::npos) return std::nullopt;
        if (!path.empty())
            paths.emplace_back(path);
        else if (options.emptyLines == EmptyLines::Refused)
            return std::nullopt;
    }
    return paths;
}

// An archive that begins like this is read as one, and a store as one.
bool isOfAnotherKind(std::string_view bytes) {
    return bytes.starts_with("\x89TESSEL\n") ||
           bytes.starts_with("\x89TSL\r\n\x1A\n");
}

// An archive of a few paths, for words to be tried on.
const MemoryFile& someArchive() {
    static const MemoryFile& file = []() -> const MemoryFile& {
        static const MemoryFile made;
        std::vector<std::uint8_t> bytes;
        ArchiveWriter writer(bytes);
        writer.addAll(Paths{"a", "a/b", "a/b/c.txt", "b", "\xFF/d", "zz"});
        writer.finish();
        made.write({reinterpret_cast<const char*>(bytes.data()), bytes.size()});
        return made;
    }();
    return file;
}

void runCommand(Input& input) {
    const bool finds = input.byte() % 2 == 0;
    std::vector<std::string> words{finds ? "find" : "get",
                                   someArchive().name()};
    for (unsigned left = input.byte() % 4; left > 0; --left) {
        const auto bytes = input.block();
        std::string word(bytes.begin(), bytes.end());
        // As the system hands words over; and nobody types an answer here.
        word.resize(std::min(word.find('\0'), word.size()));
        if (word != "-") words.push_back(word);
    }
    const int status = runConsole(words, session());
    require(status >= 0 && status <= static_cast<int>(ExitStatus::System),
            "a command ends with one of its statuses");
}

void readList(Input& input, std::uint8_t choice) {
    ListOptions options;
    if ((choice & 1U) != 0) options.separator = Separator::Nul;
    if ((choice & 2U) != 0) options.emptyLines = EmptyLines::Skipped;
    const auto rest = input.remainder();
    const std::string bytes(rest.begin(), rest.end());
    static const MemoryFile file;
    file.write(bytes);
    const auto paths = read(file, options);
    if (!isOfAnotherKind(bytes))
        require(paths == split(bytes, options),
                "a list gives what a split gives");
}

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::Input input(data, size);
    const std::uint8_t choice = input.byte();
    if ((choice & 4U) != 0) tessel::fuzz::runCommand(input);
    tessel::fuzz::readList(input, choice);
    return 0;
}
