#include "archive/ArchiveWriter.hpp"

#include <algorithm>
#include <cstddef>
#include <span>
#include <stdexcept>
#include <system_error>
#include <utility>

#include "archive/ArchiveBytes.hpp"
#include "archive/ArchiveReader.hpp"
#include "archive/ArchiveTarget.hpp"
#include "archive/FileMapping.hpp"
#include "archive/FileTarget.hpp"
#include "archive/Format.hpp"
#include "archive/SegmentDirectory.hpp"
#include "archive/SegmentList.hpp"
#include "archive/SegmentWriter.hpp"
#include "archive/Workers.hpp"

namespace tessel {

using namespace archive;

namespace {

// Waking a thread pays from some ten thousand paths on.
constexpr std::size_t pathsPerThread = 10'000;

unsigned threadsFor(std::size_t paths, unsigned wanted) {
    if (wanted == 0) wanted = std::max(1U, std::thread::hardware_concurrency());
    const std::size_t useful = 1 + paths / pathsPerThread;
    return static_cast<unsigned>(std::min<std::size_t>(wanted, useful));
}

std::string nameOfPath(std::uint64_t number) {
    return "path " + std::to_string(number);
}

void requirePath(std::string_view path, std::uint64_t number) {
    if (path.empty())
        throw std::invalid_argument(nameOfPath(number) + " is empty");
    if (path.find('\0') != std::string_view::npos)
        throw std::invalid_argument(nameOfPath(number) + " holds a NUL");
}

void requireLengths(const SplitPath& path, std::uint64_t number) {
    if (path.folder.size() > maxComponentBytes)
        throw std::length_error("the folder of " + nameOfPath(number) +
                                " is longer than 1 MiB");
    if (path.name.size() > maxComponentBytes)
        throw std::length_error("the name of " + nameOfPath(number) +
                                " is longer than 1 MiB");
}

}  // namespace

class ArchiveWriter::Impl {
public:
    Impl(std::unique_ptr<ArchiveTarget> target, ArchiveOptions options)
        : target_(std::move(target)), options_(std::move(options)) {
        options_.pathsPerSegment = std::clamp<std::uint64_t>(
            options_.pathsPerSegment, 1, maxPathsPerSegment);
        options_.textPerSegment = std::clamp<std::uint64_t>(
            options_.textPerSegment, 1, maxTextPerSegment);
    }

    // Starts with nothing, or with the segments of an archive.
    void start() {
        target_->append(std::vector<std::uint8_t>(fileHeaderBytes));
    }
    void startWith(std::span<const std::uint8_t> archive) {
        directory_ = SegmentDirectory::unpack(archive);
        target_->append(archive.first(directory_.end()));
    }

    void add(std::string_view path);
    std::uint64_t size() const noexcept {
        return directory_.paths() + list_.size();
    }
    std::uint64_t finish();

private:
    void requireUsable() const {
        if (unusable_) throw std::logic_error("this writer has ended");
    }
    bool isFullFor(std::string_view path) const {
        return list_.size() == options_.pathsPerSegment ||
               list_.textBytes() + path.size() > options_.textPerSegment;
    }
    void writeSegment();
    void report(double share) const;

    std::unique_ptr<ArchiveTarget> target_;
    ArchiveOptions options_;
    SegmentDirectory directory_;
    SegmentList list_;
    bool unusable_ = false;  // finished, or failed half-way
};

void ArchiveWriter::Impl::add(std::string_view path) {
    requireUsable();
    requirePath(path, size());
    const SplitPath split = SplitPath::of(path);
    requireLengths(split, size());
    if (list_.size() > 0 && isFullFor(path)) writeSegment();
    list_.add(split);
}

void ArchiveWriter::Impl::writeSegment() {
    unusable_ = true;
    SegmentOptions options{options_.level, options_.index, {}};
    if (options_.progress)
        options.progress = [this](double share) { report(share); };
    Workers workers(threadsFor(list_.size(), options_.threads),
                    options_.cancel);
    workers.throwIfCancelled();
    const auto segment = buildSegment(list_, options, workers);
    target_->append(segment);
    directory_.add(segment.size(), list_.size());
    list_.clear();
    report(1);
    unusable_ = false;
}

void ArchiveWriter::Impl::report(double share) const {
    if (options_.progress)
        options_.progress({directory_.paths(), size(), share});
}

std::uint64_t ArchiveWriter::Impl::finish() {
    requireUsable();
    if (list_.size() > 0) writeSegment();
    unusable_ = true;
    if (options_.cancel.stop_requested()) throw CancelledException();
    std::vector<std::uint8_t> end;
    const FileHeader header = directory_.pack(end);
    target_->append(end);
    std::vector<std::uint8_t> start;
    header.pack(start);
    target_->rewriteStart(start);
    target_->commit();
    return header.fileBytes;
}

// ---- ArchiveWriter ----

ArchiveWriter::ArchiveWriter(std::unique_ptr<Impl> impl) noexcept
    : impl_(std::move(impl)) {}

ArchiveWriter::ArchiveWriter(const std::string& file, ArchiveOptions options)
    : impl_(std::make_unique<Impl>(std::make_unique<FileTarget>(file),
                                   std::move(options))) {
    impl_->start();
}

ArchiveWriter::ArchiveWriter(std::vector<std::uint8_t>& out,
                             ArchiveOptions options)
    : impl_(std::make_unique<Impl>(std::make_unique<MemoryTarget>(out),
                                   std::move(options))) {
    impl_->start();
}

ArchiveWriter::ArchiveWriter(ArchiveWriter&& other) noexcept = default;
ArchiveWriter& ArchiveWriter::operator=(ArchiveWriter&& other) noexcept =
    default;
ArchiveWriter::~ArchiveWriter() = default;

ArchiveWriter ArchiveWriter::append(const std::string& file,
                                    ArchiveOptions options) {
    const FileMapping old(file);
    auto impl = std::make_unique<Impl>(std::make_unique<FileTarget>(file),
                                       std::move(options));
    try {
        impl->startWith(old.bytes());
    } catch (const std::system_error&) {
        old.requireIntact();  // bytes that are gone cannot be written
        throw;
    }
    old.requireIntact();
    return ArchiveWriter(std::move(impl));
}

ArchiveWriter ArchiveWriter::append(std::vector<std::uint8_t>& archive,
                                    ArchiveOptions options) {
    auto impl = std::make_unique<Impl>(std::make_unique<MemoryTarget>(archive),
                                       std::move(options));
    impl->startWith(archive);
    return ArchiveWriter(std::move(impl));
}

// The old archive is replaced at the end only, so it can be read meanwhile.
void ArchiveWriter::repack(const std::string& file, ArchiveOptions options) {
    const ArchiveReader old{ArchiveBytes(FileMapping(file))};
    ArchiveWriter writer(file, std::move(options));
    writer.addAllOf(old);
    writer.finish();
}

void ArchiveWriter::repack(std::vector<std::uint8_t>& archive,
                           ArchiveOptions options) {
    const ArchiveReader old{ArchiveBytes(std::span(std::as_const(archive)))};
    ArchiveWriter writer(archive, std::move(options));
    writer.addAllOf(old);
    writer.finish();
}

void ArchiveWriter::addAllOf(const ArchiveReader& old) {
    old.read(0, old.size(),
             [this](std::uint64_t, std::string_view path) { add(path); });
}

ArchiveWriter::Impl& ArchiveWriter::impl() const {
    if (impl_ == nullptr) throw std::logic_error("this writer was moved from");
    return *impl_;
}

void ArchiveWriter::add(std::string_view path) { impl().add(path); }

std::uint64_t ArchiveWriter::size() const noexcept {
    return impl_ == nullptr ? 0 : impl_->size();
}

std::uint64_t ArchiveWriter::finish() { return impl().finish(); }

}  // namespace tessel
