#include "archive/PathSearch.hpp"

#include <algorithm>
#include <cstddef>
#include <string>

#include "archive/NumberLookup.hpp"
#include "archive/OrderedScan.hpp"
#include "archive/PackedNumbers.hpp"
#include "archive/PathCursor.hpp"
#include "archive/ScatteredReader.hpp"
#include "archive/TextFilter.hpp"

namespace tessel::archive {
namespace {

// Whether those who get the found paths want to see them, or only numbers.
enum class Show { Numbers, Paths };

// Places of one segment that one thread searches at a time: work for some
// 300 microseconds, so that handing it over costs nothing in comparison.
constexpr std::uint64_t stretchPlaces = 16384;

struct Stretch {
    const Segment* segment;
    NumberRange places;
    bool isLast;  // of its segment
};

// What was found in a stretch: places, ascending, and the paths if wanted.
class Matches {
public:
    explicit Matches(Show show) : show_(show) {}

    void clear() noexcept {
        places_.clear();
        ends_.clear();
        text_.clear();
    }

    void add(std::uint64_t place, PathCursor& paths) {
        places_.push_back(place);
        if (show_ == Show::Numbers) return;
        text_ += paths.path();
        ends_.push_back(text_.size());
    }

    std::size_t size() const noexcept { return places_.size(); }
    std::uint64_t place(std::size_t i) const noexcept { return places_[i]; }
    std::string_view path(std::size_t i) const noexcept {
        if (show_ == Show::Numbers) return {};
        const std::size_t start = i == 0 ? 0 : ends_[i - 1];
        return std::string_view(text_).substr(start, ends_[i] - start);
    }

private:
    Show show_;
    std::vector<std::uint64_t> places_;
    std::vector<std::size_t> ends_;
    std::string text_;
};

// Lets a predicate pass for a filter.
struct PredicateFilter {
    const ArchiveReader* archive;
    PathPredicate predicate;

    void enterFolder(std::string_view) const noexcept {}
    bool takesWholeFolder() const noexcept { return false; }
    bool takes(std::string_view path) const {
        archive->requireIntact();
        return predicate(path);
    }
};

// Adds what the filter takes of the paths that start with the prefix.
template <class Filter>
void searchStretch(const Stretch& stretch, std::string_view prefix,
                   Filter filter, Matches& matches) {
    PathCursor paths(*stretch.segment);
    std::uint64_t folder = ~std::uint64_t{0};
    bool isBelow = false;
    for (auto place = stretch.places.begin; place < stretch.places.end;
         ++place) {
        paths.seek(place);
        if (paths.folderNumber() != folder) {
            folder = paths.folderNumber();
            isBelow = paths.folder().starts_with(prefix);
            if (isBelow) filter.enterFolder(paths.folder());
        }
        if (isBelow &&
            (filter.takesWholeFolder() || filter.takes(paths.path())))
            matches.add(place, paths);
    }
}

void appendStretches(const Segment& segment, NumberRange places,
                     std::vector<Stretch>& out) {
    for (auto begin = places.begin; begin < places.end;
         begin += stretchPlaces) {
        const auto end = std::min(places.end, begin + stretchPlaces);
        out.push_back({&segment, {begin, end}, end == places.end});
    }
}

// Of a segment in no order, all places may be below a folder.
std::vector<Stretch> stretchesOf(const ArchiveReader& archive,
                                 std::string_view prefix) {
    std::vector<Stretch> stretches;
    for (std::size_t i = 0; i < archive.segmentCount(); ++i) {
        const Segment& segment = archive.segment(i);
        if (segment.head().order == ListOrder::AsGiven)
            appendStretches(segment, {0, segment.size()}, stretches);
        else
            for (const NumberRange places : placesBelow(segment, prefix))
                appendStretches(segment, places, stretches);
    }
    return stretches;
}

// Hands over what was found, in ascending order of numbers.
class Delivery {
public:
    Delivery(const ArchiveReader& archive, Show show,
             PathVisitor visitor) noexcept
        : archive_(archive), show_(show), visitor_(visitor) {}

    // The stretches must come in their order. False if the visitor ended the
    // visit.
    bool take(const Stretch& stretch, const Matches& matches) {
        archive_.requireIntact();
        if (isInPlace(*stretch.segment)) return show(stretch, matches);
        const Segment& segment = *stretch.segment;
        if (found_.empty()) found_.resize(segment.size());
        for (std::size_t i = 0; i < matches.size(); ++i)
            found_[matches.place(i)] = true;
        if (!stretch.isLast) return true;
        const bool goesOn = showByNumber(segment);
        found_.clear();
        return goesOn;
    }

private:
    static constexpr std::size_t batch = 1024;  // paths to read at a time

    bool show(const Stretch& stretch, const Matches& matches) const {
        const std::uint64_t first = stretch.segment->entry().firstNumber;
        for (std::size_t i = 0; i < matches.size(); ++i)
            if (!visitor_(first + matches.place(i), matches.path(i)))
                return false;
        return true;
    }

    bool showByNumber(const Segment& segment) const {
        const PackedNumbers order(segment, Section::Order);
        std::vector<std::uint64_t> numbers;
        for (std::uint64_t i = 0; i < segment.size(); ++i) {
            if (!found_[order.at(i)]) continue;
            numbers.push_back(segment.entry().firstNumber + i);
            if (numbers.size() < batch) continue;
            if (!showNumbers(segment, numbers)) return false;
            numbers.clear();
        }
        return showNumbers(segment, numbers);
    }

    bool showNumbers(const Segment& segment,
                     std::span<const std::uint64_t> numbers) const {
        archive_.requireIntact();
        if (show_ == Show::Paths)
            return ScatteredReader(segment).read(
                numbers, [this](std::uint64_t number, std::string_view path) {
                    archive_.requireIntact();
                    return visitor_(number, path);
                });
        return std::ranges::all_of(
            numbers, [this](auto number) { return visitor_(number, {}); });
    }

    const ArchiveReader& archive_;
    Show show_;
    PathVisitor visitor_;
    std::vector<bool> found_;  // places of a rearranged segment
};

template <class Filter>
void search(const ArchiveReader& archive, const Filter& filter,
            const FindOptions& options, Show show, PathVisitor visitor) {
    const std::string prefix = prefixOf(options.folder.value_or(""));
    const auto stretches = stretchesOf(archive, prefix);
    OrderedScan scan(stretches.size(), options);
    std::vector<Matches> matches(scan.slots(), Matches(show));
    Delivery delivery(archive, show, visitor);
    scan.run(
        [&](std::uint64_t i) {
            Matches& found = matches[i % scan.slots()];
            found.clear();
            searchStretch(stretches[i], prefix, filter, found);
        },
        [&](std::uint64_t i) {
            return delivery.take(stretches[i], matches[i % scan.slots()]);
        });
}

template <class Filter>
std::vector<std::uint64_t> numbersOf(const ArchiveReader& archive,
                                     const Filter& filter,
                                     const FindOptions& options) {
    std::vector<std::uint64_t> numbers;
    auto keep = [&](std::uint64_t number, std::string_view) {
        numbers.push_back(number);
    };
    search(archive, filter, options, Show::Numbers, keep);
    archive.requireIntact();
    return numbers;
}

}  // namespace

std::vector<std::uint64_t> find(const ArchiveReader& archive,
                                std::span<const std::string_view> texts,
                                const FindOptions& options) {
    return numbersOf(archive, TextFilter(texts), options);
}

std::vector<std::uint64_t> find(const ArchiveReader& archive,
                                PathPredicate predicate,
                                const FindOptions& options) {
    return numbersOf(archive, PredicateFilter{&archive, predicate}, options);
}

void findEach(const ArchiveReader& archive,
              std::span<const std::string_view> texts, PathVisitor visitor,
              const FindOptions& options) {
    search(archive, TextFilter(texts), options, Show::Paths, visitor);
}

void findEach(const ArchiveReader& archive, PathPredicate predicate,
              PathVisitor visitor, const FindOptions& options) {
    search(archive, PredicateFilter{&archive, predicate}, options, Show::Paths,
           visitor);
}

}  // namespace tessel::archive
