#include "hosts/console/ExportCommand.hpp"

#include <cstddef>
#include <iterator>
#include <string_view>

#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/Failure.hpp"
#include "hosts/console/OutputFile.hpp"
#include "paths/PathStore.hpp"

namespace tessel::console {

namespace {

constexpr Command::Description exportDescription = {
    "export", "Write an archive's paths as a store, which can grow",
    "  tessel export files.tessel -o files.store\n"
    "  tessel pack files.store -o files.tessel   the way back"};

// An archive's paths as a range that shows in a bar how far it is.
struct CountedPaths {
    class Iterator {
    public:
        using iterator_concept = std::input_iterator_tag;
        using value_type = std::string_view;
        using difference_type = std::ptrdiff_t;

        explicit Iterator(const CountedPaths& paths)
            : paths_(paths.archive.begin()), bar_(&paths.bar) {}

        std::string_view operator*() const noexcept { return *paths_; }
        Iterator& operator++() {
            if (paths_.number() % 4096 == 0) bar_->update(paths_.number());
            ++paths_;
            return *this;
        }
        void operator++(int) { ++*this; }

        friend bool operator==(const Iterator& it, std::default_sentinel_t) {
            return it.paths_ == std::default_sentinel;
        }

    private:
        PathArchive::Iterator paths_;
        ProgressBar* bar_;
    };

    Iterator begin() const { return Iterator(*this); }
    std::default_sentinel_t end() const noexcept { return {}; }

    const PathArchive& archive;
    ProgressBar& bar;
};

}  // namespace

ExportCommand::ExportCommand() : Command(exportDescription) {
    line().argument("FILE", file_, "The archive, or - for standard input");
    line().value("-o", "STORE", store_, CommandLine::Need::Required,
                 "The store to write, or - for standard output");
    line().flag("-f", force_, "Replace STORE if it exists");
}

ExitStatus ExportCommand::run(Session& session) {
    checkNoTerminal(store_, session);
    checkOverwrite(store_, force_ ? Overwrite::Allowed : Overwrite::Refused);
    const PathArchive archive = openArchive(file_, session.interrupts);
    ProgressBar bar(barVisibility(session, Writes::Nothing));
    bar.begin("reading", ProgressUnit::Paths, archive.size());
    const PathStore store = inFile(file_, [&] {
        return PathStore::from(CountedPaths{archive, bar});
    });
    const auto bytes = store.save();
    session.interrupts.tidyUpFirst();
    replaceFile(store_, bytes, session);
    return ExitStatus::Success;
}

}  // namespace tessel::console
