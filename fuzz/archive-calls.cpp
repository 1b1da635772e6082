// Archives and their writers under wrong callers: any operation in any order,
// after an end, after a move, with numbers outside, and with visitors that stop
// or throw. Each call answers or throws a documented exception. A mapped file
// answers as the same bytes in memory do.
//
// Input: calls, each a byte that names it and the bytes that it takes.
#include <unistd.h>

#include <array>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "archive/PathArchive.hpp"
#include "fuzz/CallInput.hpp"

namespace tessel::fuzz {
namespace {

using Bytes = std::vector<std::uint8_t>;

constexpr std::size_t maxShownPaths = 300;

// What a visitor of the caller throws.
class VisitorFailure : public std::exception {};

template <class Call>
bool attempted(Call call) {
    try {
        call();
        return true;
    } catch (const std::logic_error&) {
    } catch (const DamagedArchiveException&) {
    } catch (const UnsupportedArchiveVersionException&) {
    } catch (const CancelledException&) {
    } catch (const std::system_error&) {
    } catch (const VisitorFailure&) {
    }
    return false;
}

class ArchiveCalls {
public:
    explicit ArchiveCalls(Input input) : input_(input) {}

    void run() {
        for (std::size_t i = 0; i < maxCalls && !input_.empty(); ++i)
            attempted([&] { call(); });
        // Writers refer to the lists of bytes, so they go first.
        for (auto& writer : writers_) writer.reset();
    }

private:
    using Call = void (ArchiveCalls::*)();

    void call() {
        static constexpr std::array calls{
            &ArchiveCalls::startWriter, &ArchiveCalls::add,
            &ArchiveCalls::addMany,     &ArchiveCalls::finish,
            &ArchiveCalls::moveWriter,  &ArchiveCalls::repack,
            &ArchiveCalls::editBytes,   &ArchiveCalls::open,
            &ArchiveCalls::copy,        &ArchiveCalls::readByNumber,
            &ArchiveCalls::readRange,   &ArchiveCalls::startIterator,
            &ArchiveCalls::advance,     &ArchiveCalls::lookUp,
            &ArchiveCalls::find,        &ArchiveCalls::check,
            &ArchiveCalls::openMapped};
        const Call chosen = calls[input_.byte() % calls.size()];
        (this->*chosen)();
    }

    Bytes& bytes() { return bytes_[input_.byte() % bytes_.size()]; }
    std::optional<ArchiveWriter>& writer() {
        return writers_[input_.byte() % writers_.size()];
    }
    const PathArchive& archive() {
        auto& chosen = archives_[input_.byte() % archives_.size()];
        if (!chosen) throw std::logic_error("there is no archive yet");
        return *chosen;
    }

    std::string path() {
        constexpr std::string_view letters = "/ab/c\0x";
        std::string text;
        for (unsigned left = input_.byte() % 12; left > 0; --left)
            text.push_back(letters[input_.byte() % letters.size()]);
        return text;
    }

    // Stops, throws, or goes on.
    auto visitor() {
        return [this, shown = std::size_t{0}](std::uint64_t,
                                              std::string_view text) mutable {
            require(!text.empty(), "no path is empty");
            const std::uint8_t choice = input_.byte();
            if (choice == 0xFF) throw VisitorFailure();
            return choice != 0xFE && ++shown < maxShownPaths;
        };
    }

    // ---- Writing ----

    // Every path may become a segment, which takes milliseconds to build.
    void spend(unsigned paths) {
        if (paths > left_) throw std::logic_error("enough was written");
        left_ -= paths;
    }

    ArchiveOptions options() {
        ArchiveOptions chosen;
        chosen.level = static_cast<ArchiveLevel>(input_.byte() % 3);
        chosen.index = static_cast<ArchiveIndex>(input_.byte() % 2);
        chosen.threads = input_.byte() % 3;
        chosen.pathsPerSegment = wildNumber(input_);
        chosen.textPerSegment = wildNumber(input_);
        const std::uint8_t choice = input_.byte();
        if (choice % 8 == 0)
            chosen.progress = [](const ArchiveProgress&) {
                throw VisitorFailure();
            };
        if (choice % 8 == 1)
            chosen.progress = [this](const ArchiveProgress&) {
                if (writers_[0]) writers_[0]->add("from the callback");
            };
        return chosen;
    }

    void startWriter() {
        auto& place = writer();
        Bytes& to = bytes();
        place.reset();
        if (input_.byte() % 2 == 0)
            place.emplace(to, options());
        else
            place.emplace(ArchiveWriter::append(to, options()));
    }

    ArchiveWriter& startedWriter() {
        auto& chosen = writer();
        if (!chosen) throw std::logic_error("there is no writer yet");
        return *chosen;
    }

    void add() {
        spend(1);
        startedWriter().add(path());
    }

    void addMany() {
        ArchiveWriter& to = startedWriter();
        const std::string folder = path();
        const unsigned count = input_.byte() % 40;
        spend(count);
        for (unsigned left = count; left > 0; --left)
            to.add(folder + std::to_string(left));
    }

    void finish() {
        ArchiveWriter& ended = startedWriter();
        const std::uint64_t count = ended.size();
        ended.finish();
        require(ended.size() == count, "finishing keeps the count");
    }

    void moveWriter() {
        auto& from = writer();
        auto& to = writer();
        if (!from || !to) return;
        *to = std::move(*from);
    }

    void repack() {
        spend(maxWritten / 4);
        ArchiveWriter::repack(bytes(), options());
    }

    void editBytes() {
        Bytes& edited = bytes();
        if (edited.empty()) return;
        if (input_.byte() % 8 == 0)
            edited.resize(input_.number() % edited.size());
        else
            edited[input_.number() % edited.size()] = input_.byte();
    }

    // ---- Reading ----

    void open() {
        archives_[input_.byte() % archives_.size()] = PathArchive::own(bytes());
    }

    void copy() {
        archives_[input_.byte() % archives_.size()] = PathArchive(archive());
    }

    std::uint64_t numberIn(const PathArchive& from) {
        const std::uint64_t number = wildNumber(input_);
        const bool anywhere = from.empty() || input_.byte() % 4 == 0;
        return anywhere ? number : number % from.size();
    }

    void readByNumber() {
        const PathArchive& from = archive();
        std::string text;
        attempted([&] { from.read(numberIn(from), text); });
        std::vector<std::uint64_t> numbers;
        for (unsigned left = input_.byte() % 8; left > 0; --left)
            numbers.push_back(numberIn(from));
        from.read(numbers, visitor());
    }

    void readRange() {
        const PathArchive& from = archive();
        if (input_.byte() % 2 == 0) return from.forEach(visitor());
        const std::uint64_t first = numberIn(from);
        from.forEach(first, numberIn(from), visitor());
    }

    void startIterator() {
        iterators_[input_.byte() % iterators_.size()] = archive().begin();
    }

    void advance() {
        auto& iterator = iterators_[input_.byte() % iterators_.size()];
        if (!iterator) return;
        for (unsigned left = input_.byte() % 8; left > 0; --left) {
            const bool atEnd = *iterator == std::default_sentinel;
            if (!atEnd) require(!(**iterator).empty(), "no path is empty");
            attempted([&] { ++*iterator; });
            if (atEnd)
                require(*iterator == std::default_sentinel,
                        "the end stays the end");
        }
        auto& other = iterators_[input_.byte() % iterators_.size()];
        if (other && input_.byte() % 4 == 0) *other = std::move(*iterator);
    }

    void lookUp() {
        const PathArchive& in = archive();
        const std::string text = path();
        attempted([&] {
            if (const auto number = in.numberOf(text))
                require(in[*number] == text, "a number is that of the path");
        });
        std::uint64_t last = 0;
        for (const NumberRange range : in.folder(text)) {
            require(range.begin < range.end && range.begin >= last &&
                        range.end <= in.size(),
                    "ranges ascend");
            last = range.end;
        }
    }

    FindOptions findOptions() {
        FindOptions chosen;
        chosen.threads = 1 + input_.byte() % 2;
        const std::uint8_t choice = input_.byte();
        if (choice % 4 == 0) chosen.folder = path();
        if (choice % 16 == 1)
            chosen.progress = [](std::uint64_t, std::uint64_t) {
                throw VisitorFailure();
            };
        if (choice % 16 == 2) {
            std::stop_source stop;
            stop.request_stop();
            chosen.cancel = stop.get_token();
        }
        return chosen;
    }

    void find() {
        const PathArchive& in = archive();
        const std::string text = path();
        const std::array<std::string_view, 2> texts{text, "a"};
        const FindOptions chosen = findOptions();
        const auto predicate = [&](std::string_view found) {
            if (found.size() == 7) throw VisitorFailure();
            return found.size() > 3;
        };
        switch (input_.byte() % 4) {
            case 0:
                in.find(text, chosen);
                return;
            case 1:
                return in.findEach(texts, visitor(), chosen);
            case 2:
                in.find(predicate, chosen);
                return;
            default:
                return in.findEach(predicate, visitor(), chosen);
        }
    }

    void check() {
        const PathArchive& checked = archive();
        require(checked.info().paths == checked.size(), "the counts agree");
        checked.releasePages();
        const Bytes& damaged = bytes();
        attempted([&] { PathArchive::salvage(damaged, visitor()); });
        const bool sound = checked.findDamage(findOptions()).empty();
        require(attempted([&] { checked.verify(); }) == sound,
                "both checks agree");
    }

    // The same bytes from a file and from memory.
    void openMapped() {
        const Bytes& stored = bytes();
        const std::filesystem::path file =
            std::filesystem::temp_directory_path() /
            ("fuzz-archive-" + std::to_string(::getpid()));
        std::ofstream(file, std::ios::binary)
            .write(reinterpret_cast<const char*>(stored.data()),
                   static_cast<std::streamsize>(stored.size()));
        std::optional<PathArchive> mapped;
        const bool opened =
            attempted([&] { mapped = PathArchive::open(file.string()); });
        std::filesystem::remove(file);
        std::optional<PathArchive> inMemory;
        require(
            opened == attempted([&] { inMemory = PathArchive::over(stored); }),
            "a file and its bytes open alike");
        if (!opened) return;
        require(pathsOf(*mapped) == pathsOf(*inMemory),
                "a file and its bytes hold the same");
    }

    static std::vector<std::string> pathsOf(const PathArchive& from) {
        std::vector<std::string> paths;
        attempted([&] {
            from.forEach([&](std::uint64_t, std::string_view text) {
                paths.emplace_back(text);
                return paths.size() < maxShownPaths;
            });
        });
        return paths;
    }

    static constexpr unsigned maxWritten = 80;

    Input input_;
    unsigned left_ = maxWritten;
    std::array<Bytes, 3> bytes_;
    std::array<std::optional<ArchiveWriter>, 2> writers_;
    std::array<std::optional<PathArchive>, 2> archives_;
    std::array<std::optional<PathArchive::Iterator>, 2> iterators_;
};

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::ArchiveCalls({data, size}).run();
    return 0;
}
