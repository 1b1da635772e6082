#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

#include "hosts/console/ProgressBar.hpp"
#include "hosts/console/RecordReader.hpp"
#include "hosts/console/Session.hpp"

namespace tessel::console {

// What becomes of empty lines.
enum class EmptyLines { Refused, Skipped };

// How a list is to be read.
struct ListOptions {
    Separator separator = Separator::Newline;
    EmptyLines emptyLines = EmptyLines::Refused;
};

// ListInput reads paths from a list: lines, NUL-separated records, or a saved
// store or an archive, which are recognized by their first bytes.
//
// Ownership: borrows session and bar.
// Errors: ConsoleException names file and line; CancelledException;
//   std::system_error.
class ListInput {
public:
    using Sink = std::function<void(std::string_view path)>;

    ListInput(const ListOptions& options, Session& session, ProgressBar& bar)
        : options_(options), session_(&session), bar_(&bar) {}

    // Gives the sink every path of a list file, or of standard input for "-".
    // std::invalid_argument and std::length_error from the sink become errors
    // that name the line.
    void readList(const std::string& file, const Sink& sink);

    // Gives the sink what is in a folder at any depth.
    void walk(const std::string& folder, bool showFolders, const Sink& sink);

    std::uint64_t skippedLines() const noexcept { return skippedLines_; }

private:
    void readRecords(RecordReader& records, std::uint64_t size,
                     const Sink& sink);
    void readStore(RecordReader& records, const Sink& sink);
    void readArchive(const std::string& file, RecordReader& records,
                     const Sink& sink);
    void addRecord(std::string_view path, const RecordReader& records,
                   const Sink& sink);
    void step(std::uint64_t done);

    ListOptions options_;
    Session* session_;
    ProgressBar* bar_;
    std::uint64_t skippedLines_ = 0;
    std::uint64_t steps_ = 0;
};

}  // namespace tessel::console
