#include "archive/ListArranger.hpp"

#include <algorithm>
#include <compare>
#include <cstddef>
#include <numeric>

#include "archive/StringSort.hpp"

namespace tessel::archive {

namespace {

// Paths whose folder is neither their predecessor's nor a new one.
std::size_t countJumps(const std::vector<NameRef>& names) {
    std::size_t jumps = 0;
    std::uint32_t seen = 0;
    std::uint32_t current = UINT32_MAX;
    for (const NameRef& name : names) {
        if (name.folder == seen)
            ++seen;
        else if (name.folder != current)
            ++jumps;
        current = name.folder;
    }
    return jumps;
}

// A name while it is sorted: its first eight bytes as a number, and its path.
struct NameKey {
    std::uint64_t key;
    std::uint32_t number;
};

// Sorts a list's paths: by folder with a counting sort, names within each
// folder, then merges folders with those below them.
class PathSorter {
public:
    PathSorter(const SegmentList& list, Workers& workers)
        : list_(list), workers_(workers) {}

    Arrangement sorted() {
        sortFolders();
        gatherKeys();
        sortNames();
        merge();
        return std::move(result_);
    }

private:
    std::string_view folder(std::size_t rank) const {
        return list_.folders()[byRank_[rank]];
    }
    std::string_view nameAt(std::size_t place) const {
        return list_.name(list_.names()[keys_[place].number]);
    }

    void sortFolders();
    void gatherKeys();
    void sortNames();
    void merge();
    bool less(const NameKey& a, const NameKey& b) const;

    // ---- Merging ----

    // A folder whose names are not all emitted yet.
    struct Open {
        std::size_t rank;
        std::size_t next;  // place of its next name
    };
    void emitNamesBefore(Open& open, std::string_view limit);
    void emitRest(Open& open);
    void emit(std::size_t place, std::size_t rank);

    const SegmentList& list_;
    Workers& workers_;
    std::vector<std::uint32_t> byRank_;      // folders in order of their bytes
    std::vector<std::uint32_t> starts_;      // [rank]: its first place in keys_
    std::vector<NameKey> keys_;              // by folder, then by name
    std::vector<std::uint32_t> newNumbers_;  // [rank], or UINT32_MAX
    Arrangement result_;
};

void PathSorter::sortFolders() {
    std::vector<StringItem> items(list_.folders().size());
    for (std::uint32_t f = 0; f < items.size(); ++f)
        items[f] = {list_.folders()[f], 0, f};
    sortStrings(items);
    byRank_.resize(items.size());
    std::ranges::transform(items, byRank_.begin(), &StringItem::number);
}

void PathSorter::gatherKeys() {
    std::vector<std::uint32_t> next(byRank_.size() + 1);
    std::vector<std::uint32_t> rankOf(byRank_.size());
    for (std::uint32_t rank = 0; rank < byRank_.size(); ++rank)
        rankOf[byRank_[rank]] = rank;
    for (const NameRef& name : list_.names()) ++next[rankOf[name.folder] + 1];
    std::partial_sum(next.begin(), next.end(), next.begin());
    starts_ = next;
    keys_.resize(list_.size());
    for (std::uint32_t number = 0; number < list_.size(); ++number) {
        const NameRef& name = list_.names()[number];
        std::uint64_t key = 0;
        for (std::uint32_t i = 0; i < std::min(name.length, 8U); ++i)
            key |= std::uint64_t{static_cast<std::uint8_t>(
                       list_.text()[name.start + i])}
                   << (56 - 8 * i);
        keys_[next[rankOf[name.folder]]++] = {key, number};
    }
}

bool PathSorter::less(const NameKey& a, const NameKey& b) const {
    if (a.key != b.key) return a.key < b.key;
    const auto order = list_.name(list_.names()[a.number]) <=>
                       list_.name(list_.names()[b.number]);
    return std::is_neq(order) ? std::is_lt(order) : a.number < b.number;
}

void PathSorter::sortNames() {
    constexpr std::size_t foldersPerStep = 1024;
    const std::size_t folders = byRank_.size();
    workers_.run((folders + foldersPerStep - 1) / foldersPerStep,
                 [&](std::size_t step, unsigned) {
                     const std::size_t end =
                         std::min(folders, (step + 1) * foldersPerStep);
                     for (std::size_t r = step * foldersPerStep; r < end; ++r)
                         std::sort(keys_.begin() + starts_[r],
                                   keys_.begin() + starts_[r + 1],
                                   [this](const NameKey& a, const NameKey& b) {
                                       return less(a, b);
                                   });
                 });
}

// A walk over the sorted folders with a stack of those that the current one
// is below. Only the innermost can have names between its predecessor's
// paths and its own: what lies between two folders below F is in F.
void PathSorter::merge() {
    result_.names.reserve(list_.size());
    result_.numbers.reserve(list_.size());
    newNumbers_.assign(byRank_.size(), UINT32_MAX);
    std::vector<Open> open;
    for (std::size_t rank = 0; rank < byRank_.size(); ++rank) {
        const std::string_view text = folder(rank);
        while (!open.empty() && !text.starts_with(folder(open.back().rank))) {
            emitRest(open.back());
            open.pop_back();
        }
        if (!open.empty())
            emitNamesBefore(open.back(),
                            text.substr(folder(open.back().rank).size()));
        open.push_back({rank, starts_[rank]});
    }
    for (; !open.empty(); open.pop_back()) emitRest(open.back());
}

void PathSorter::emitNamesBefore(Open& open, std::string_view limit) {
    while (open.next < starts_[open.rank + 1] && nameAt(open.next) < limit)
        emit(open.next++, open.rank);
}

void PathSorter::emitRest(Open& open) {
    while (open.next < starts_[open.rank + 1]) emit(open.next++, open.rank);
}

void PathSorter::emit(std::size_t place, std::size_t rank) {
    std::uint32_t& number = newNumbers_[rank];
    if (number == UINT32_MAX) {
        number = static_cast<std::uint32_t>(result_.listFolders.size());
        result_.listFolders.push_back(byRank_[rank]);
    }
    NameRef name = list_.names()[keys_[place].number];
    name.folder = number;
    result_.names.push_back(name);
    result_.numbers.push_back(keys_[place].number);
}

}  // namespace

Arrangement arrange(const SegmentList& list, Workers& workers) {
    const bool scattered = countJumps(list.names()) > list.size() / 2;
    if (!list.sorted() && scattered) return arrangeSorted(list, workers);
    return {list.sorted() ? ListOrder::Sorted : ListOrder::AsGiven,
            list.names(),
            {},
            {}};
}

Arrangement arrangeSorted(const SegmentList& list, Workers& workers) {
    Arrangement result = PathSorter(list, workers).sorted();
    result.order = ListOrder::Rearranged;
    return result;
}

}  // namespace tessel::archive
