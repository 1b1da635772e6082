// The archive as a subject: a finished list, read where it is.

#include <ranges>
#include <utility>

#include "archive/PathArchive.hpp"
#include "bench/Subject.hpp"
#include "bench/Timing.hpp"

namespace bench {

using tessel::ArchiveIndex;
using tessel::ArchiveOptions;
using tessel::ArchiveWriter;
using tessel::PathArchive;
using tessel::paths::PathList;

namespace {

class ArchiveSubject : public Subject {
public:
    ArchiveSubject(const PathList& paths, ArchiveKind kind)
        : list_(&paths), kind_(kind) {}

    std::string name() const override {
        return kind_ == ArchiveKind::Plain ? "archive" : "archive with index";
    }
    std::size_t paths() const override { return list_->size(); }

    // On one core.
    double build() override {
        return secondsOf([&] {
            ArchiveOptions options;
            options.threads = 1;
            if (kind_ == ArchiveKind::Indexed) {
                options.index = ArchiveIndex::WhereNeeded;
            }
            auto bytes = std::make_unique<std::vector<std::uint8_t>>();
            ArchiveWriter writer(*bytes, options);
            for (std::size_t i = 0; i < list_->size(); ++i) {
                writer.add((*list_)[i]);
            }
            writer.finish();
            bytes->shrink_to_fit();
            bytes_ = std::move(bytes);
            archive_ = std::make_unique<PathArchive>(PathArchive::over(view()));
        });
    }

    double iterate() override {
        return secondsOf([&] {
            for (const std::string_view path : *archive_) keep(path);
        });
    }
    double fetchAll() override {
        std::vector<std::uint64_t> numbers(list_->size());
        for (std::size_t i = 0; i < numbers.size(); ++i) numbers[i] = i;
        return secondsOf([&] {
            archive_->read(numbers, [](std::uint64_t, std::string_view path) {
                keep(path);
            });
        });
    }
    double fetchRandom(const std::vector<std::size_t>& numbers) override {
        std::string path;
        return secondsOf([&] {
            for (const std::size_t number : numbers) {
                archive_->read(number - 1, path);
                keep(path);
            }
        });
    }
    // Not of lists that every search would have to scan.
    std::optional<double> findNumbers(
        const std::vector<std::size_t>& numbers) override {
        constexpr std::size_t tried = 8;
        constexpr double tooLong = tried * 50e-6;
        if (numbers.size() < tried) return std::nullopt;
        const std::vector<std::size_t> first(numbers.begin(),
                                             numbers.begin() + tried);
        if (find(first) > tooLong && find(first) > tooLong) return std::nullopt;
        return find(numbers);
    }

    // The bytes are there already.
    double store() override { return 0; }
    // Opening checks the tables; pieces are checked when they are touched.
    double restore() override {
        return secondsOf([&] {
            restored_ =
                std::make_unique<PathArchive>(PathArchive::over(view()));
        });
    }
    double destroyRestored() override {
        return secondsOf([&] { restored_.reset(); });
    }
    double destroy() override {
        return secondsOf([&] {
            archive_.reset();
            bytes_.reset();
        });
    }

    std::size_t storedBytes() const override { return stored_; }
    bool verify() override {
        stored_ = bytes_->size();
        return isList(*archive_);
    }
    bool verifyRestored() override { return isList(*restored_); }

private:
    std::span<const std::uint8_t> view() const { return *bytes_; }

    double find(const std::vector<std::size_t>& numbers) const {
        return secondsOf([&] {
            for (const std::size_t number : numbers) {
                keep(archive_->numberOf((*list_)[number - 1]));
            }
        });
    }

    bool isList(const PathArchive& tested) const {
        if (tested.size() != list_->size()) return false;
        bool same = true;
        tested.forEach([&](std::uint64_t number, std::string_view path) {
            same = same && path == (*list_)[number];
        });
        return same;
    }

    const PathList* list_;
    ArchiveKind kind_;
    std::unique_ptr<std::vector<std::uint8_t>> bytes_;
    std::unique_ptr<PathArchive> archive_;
    std::unique_ptr<PathArchive> restored_;
    std::size_t stored_ = 0;
};

}  // namespace

SubjectPtr makeArchive(const PathList& list, ArchiveKind kind) {
    return std::make_unique<ArchiveSubject>(list, kind);
}

}  // namespace bench
