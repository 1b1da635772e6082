#include "hosts/console/ListInput.hpp"

#include <fmt/format.h>

#include <algorithm>
#include <cstddef>
#include <span>
#include <stdexcept>

#include "archive/Format.hpp"
#include "archive/PathArchive.hpp"
#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/ConsoleException.hpp"
#include "hosts/console/Failure.hpp"
#include "paths/PathList.hpp"
#include "paths/PathStore.hpp"

namespace tessel::console {

namespace {

constexpr std::size_t magicSize = 8;

// The first bytes of a saved store; docs/format.md has them.
constexpr std::string_view storeMagic = "\x89TESSEL\n";

bool isArchive(std::string_view start) {
    return std::ranges::equal(start, archive::fileMagic, {}, [](char c) {
        return static_cast<std::uint8_t>(c);
    });
}

std::span<const std::uint8_t> bytesOf(const std::string& text) noexcept {
    return {reinterpret_cast<const std::uint8_t*>(text.data()), text.size()};
}

// Tells the user what the list's `record` is and what to do about it.
[[noreturn]] void failAt(const RecordReader& records, std::string_view problem,
                         std::string_view advice) {
    throw ConsoleException(ExitStatus::BadInput,
                           fmt::format("{}: {} (line {}); {}", records.name(),
                                       problem, records.line(), advice));
}

}  // namespace

void ListInput::readList(const std::string& file, const Sink& sink) {
    InputFile input(file, session_->interrupts);
    RecordReader records(input, options_.separator);
    const std::string start(records.peek(magicSize));
    if (start == storeMagic)
        readStore(records, sink);
    else if (isArchive(start))
        readArchive(file, records, sink);
    else
        readRecords(records, input.size(), sink);
}

void ListInput::readRecords(RecordReader& records, std::uint64_t size,
                            const Sink& sink) {
    bar_->begin("reading", ProgressUnit::Bytes, size);
    while (const auto path = records.next()) {
        step(records.bytesRead());
        addRecord(*path, records, sink);
    }
}

void ListInput::addRecord(std::string_view path, const RecordReader& records,
                          const Sink& sink) {
    if (path.empty()) {
        if (options_.emptyLines == EmptyLines::Refused)
            failAt(records, "an empty line is no path",
                   "remove it or use --skip-empty");
        ++skippedLines_;
        return;
    }
    if (path.find('\0') != std::string_view::npos)
        failAt(records, "no path can hold NUL",
               "a NUL-separated list needs -0");
    try {
        sink(path);
    } catch (const std::logic_error& refusal) {
        failAt(records, refusal.what(), "remove it");
    }
}

void ListInput::readStore(RecordReader& records, const Sink& sink) {
    const std::string bytes = records.takeRest();
    try {
        const auto store = PathStore::load(bytesOf(bytes));
        bar_->begin("reading", ProgressUnit::Paths, store.size());
        store.read(0, store.size(), [&](std::size_t i, std::string_view path) {
            step(i);
            sink(path);
        });
    } catch (const DamagedFormException&) {
        throw ConsoleException(
            ExitStatus::Damaged,
            fmt::format("{}: the store is damaged; take another copy",
                        records.name()));
    } catch (const UnsupportedStoreVersionException& newer) {
        throw ConsoleException(ExitStatus::BadInput,
                               fmt::format("{}: {}; install a newer tessel",
                                           records.name(), newer.what()));
    } catch (const std::logic_error& refusal) {
        // A store can hold paths that no archive can.
        throw ConsoleException(
            ExitStatus::BadInput,
            fmt::format("{}: {}", records.name(), refusal.what()));
    }
}

void ListInput::readArchive(const std::string& file, RecordReader& records,
                            const Sink& sink) {
    inFile(records.name(), [&] {
        const std::string bytes = file == "-" ? records.takeRest() : "";
        const PathArchive archive =
            file == "-" ? PathArchive::over(bytesOf(bytes))
                        : openArchive(file, session_->interrupts);
        bar_->begin("reading", ProgressUnit::Paths, archive.size());
        archive.forEach([&](std::uint64_t number, std::string_view path) {
            step(number);
            sink(path);
        });
    });
}

void ListInput::walk(const std::string& folder, bool showFolders,
                     const Sink& sink) {
    bar_->begin("walking", ProgressUnit::Paths, 0);
    paths::WalkReport report;
    std::uint64_t done = 0;
    try {
        paths::walkFolder(
            folder,
            showFolders ? paths::WalkFolders::Show : paths::WalkFolders::Leave,
            report, [&](std::string_view path) {
                step(++done);
                sink(path);
            });
    } catch (const paths::PathListError& failure) {
        throw ConsoleException(ExitStatus::System, failure.what());
    }
    if (report.foldersSkipped == 0) return;
    bar_->finish();
    session_->errors.write(fmt::format(
        "tessel: {}: {} (and {} more folders left out)\n", report.firstSkipped,
        report.firstReason, report.foldersSkipped - 1));
    session_->errors.flush();
}

// Looks now and then whether to stop, and shows how far it is.
void ListInput::step(std::uint64_t done) {
    if (++steps_ % 4096 != 0) return;
    session_->interrupts.throwIfStopped();
    bar_->update(done);
}

}  // namespace tessel::console
