#include "archive/PathArchive.hpp"

#include <algorithm>
#include <stdexcept>
#include <utility>

#include "archive/ArchiveInformation.hpp"
#include "archive/ArchiveReader.hpp"
#include "archive/NumberLookup.hpp"
#include "archive/PathSearch.hpp"
#include "archive/Salvage.hpp"
#include "archive/SequentialReader.hpp"
#include "archive/Verification.hpp"

namespace tessel {

using archive::ArchiveBytes;
using archive::ArchiveReader;

namespace {

void requireBelow(std::uint64_t number, std::uint64_t size) {
    if (number >= size)
        throw std::out_of_range("There is no path number " +
                                std::to_string(number) + " in an archive of " +
                                std::to_string(size) + ".");
}

std::span<const std::uint8_t> asUint8(std::span<const std::byte> bytes) {
    return {reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size()};
}

}  // namespace

// ---- Opening ----

PathArchive::PathArchive(std::shared_ptr<const ArchiveReader> reader) noexcept
    : reader_(std::move(reader)) {}

PathArchive PathArchive::open(const std::string& file) {
    return PathArchive(std::make_shared<const ArchiveReader>(
        ArchiveBytes(archive::FileMapping(file))));
}

PathArchive PathArchive::over(std::span<const std::uint8_t> bytes) {
    return PathArchive(
        std::make_shared<const ArchiveReader>(ArchiveBytes(bytes)));
}

PathArchive PathArchive::over(std::span<const std::byte> bytes) {
    return over(asUint8(bytes));
}

PathArchive PathArchive::own(std::vector<std::uint8_t> bytes) {
    return PathArchive(
        std::make_shared<const ArchiveReader>(ArchiveBytes(std::move(bytes))));
}

// ---- Paths by number ----

std::uint64_t PathArchive::size() const noexcept { return reader_->size(); }

std::string PathArchive::operator[](std::uint64_t number) const {
    std::string path;
    read(number, path);
    return path;
}

void PathArchive::read(std::uint64_t number, std::string& into) const {
    requireBelow(number, size());
    reader_->read(number, into);
}

void PathArchive::read(std::span<const std::uint64_t> numbers,
                       PathVisitor visitor) const {
    if (!numbers.empty()) requireBelow(std::ranges::max(numbers), size());
    reader_->read(numbers, visitor);
}

void PathArchive::forEach(std::uint64_t first, std::uint64_t last,
                          PathVisitor visitor) const {
    if (first > last || last > size())
        throw std::out_of_range("There are no paths with the numbers from " +
                                std::to_string(first) + " to " +
                                std::to_string(last) + " in an archive of " +
                                std::to_string(size()) + ".");
    reader_->read(first, last, visitor);
}

PathArchive::Iterator PathArchive::begin() const { return Iterator(reader_); }

// ---- Numbers by path ----

std::optional<std::uint64_t> PathArchive::numberOf(
    std::string_view path) const {
    const auto number = archive::numberOf(*reader_, path);
    reader_->requireIntact();
    return number;
}

bool PathArchive::contains(std::string_view path) const {
    const bool isThere = archive::contains(*reader_, path);
    reader_->requireIntact();
    return isThere;
}

std::vector<NumberRange> PathArchive::folder(std::string_view path) const {
    auto ranges = archive::numbersBelow(*reader_, path);
    reader_->requireIntact();
    return ranges;
}

// ---- Search ----

std::vector<std::uint64_t> PathArchive::find(
    std::span<const std::string_view> texts, const FindOptions& options) const {
    return archive::find(*reader_, texts, options);
}

std::vector<std::uint64_t> PathArchive::find(
    std::initializer_list<std::string_view> texts,
    const FindOptions& options) const {
    return find(std::span(texts.begin(), texts.size()), options);
}

std::vector<std::uint64_t> PathArchive::find(std::string_view text,
                                             const FindOptions& options) const {
    return find(std::span(&text, 1), options);
}

std::vector<std::uint64_t> PathArchive::find(PathPredicate predicate,
                                             const FindOptions& options) const {
    return archive::find(*reader_, predicate, options);
}

void PathArchive::findEach(std::span<const std::string_view> texts,
                           PathVisitor visitor,
                           const FindOptions& options) const {
    archive::findEach(*reader_, texts, visitor, options);
}

void PathArchive::findEach(PathPredicate predicate, PathVisitor visitor,
                           const FindOptions& options) const {
    archive::findEach(*reader_, predicate, visitor, options);
}

// ---- Care ----

void PathArchive::verify(const ScanOptions& options) const {
    const auto damages = findDamage(options);
    if (!damages.empty())
        throw DamagedArchiveException(damages.front().offset,
                                      damages.front().what);
}

std::vector<ArchiveDamage> PathArchive::findDamage(
    const ScanOptions& options) const {
    auto damages = archive::findDamage(*reader_, options);
    if (damages.empty()) reader_->requireIntact();
    return damages;
}

SalvageReport PathArchive::salvage(const std::string& file,
                                   PathVisitor visitor) {
    archive::FileMapping mapping(file);
    mapping.settle();
    return salvage(mapping.bytes(),
                   [&](std::uint64_t number, std::string_view path) {
                       mapping.requireIntact();
                       return visitor(number, path);
                   });
}

SalvageReport PathArchive::salvage(std::span<const std::uint8_t> bytes,
                                   PathVisitor visitor) {
    return archive::salvage(bytes, visitor);
}

ArchiveInfo PathArchive::info() const { return archive::infoOf(*reader_); }

std::span<const std::uint8_t> PathArchive::bytes() const noexcept {
    return reader_->data();
}

void PathArchive::releasePages() const noexcept { reader_->releasePages(); }

// ---- Iterator ----

PathArchive::Iterator::Iterator(std::shared_ptr<const ArchiveReader> reader)
    : reader_(std::move(reader)),
      paths_(std::make_unique<archive::SequentialReader>(*reader_)),
      size_(reader_->size()) {
    if (size_ > 0) path_ = paths_->next();
}

PathArchive::Iterator::Iterator(Iterator&&) noexcept = default;
PathArchive::Iterator& PathArchive::Iterator::operator=(Iterator&&) noexcept =
    default;
PathArchive::Iterator::~Iterator() = default;

PathArchive::Iterator& PathArchive::Iterator::operator++() {
    if (isAtEnd()) return *this;
    path_ = {};
    ++number_;
    if (isAtEnd()) return *this;
    try {
        path_ = paths_->next();
    } catch (...) {
        paths_.reset();
        throw;
    }
    return *this;
}

}  // namespace tessel
