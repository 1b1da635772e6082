#include "paths/PathStore.hpp"

#include <algorithm>
#include <bitset>
#include <utility>

#include "coder/HuffmanPathTree.hpp"
#include "paths/CharacterCounter.hpp"
#include "paths/PathList.hpp"
#include "paths/Segments.hpp"
#include "paths/StoreAppender.hpp"
#include "paths/StoreForm.hpp"
#include "paths/StoreReader.hpp"
#include "paths/WholeFile.hpp"

namespace tessel {

using paths::CharacterCounter;
using paths::CharacterCounts;
using paths::StoreAppender;

namespace {

void requireBelow(std::size_t i, std::size_t size) {
    if (i >= size)
        throw std::out_of_range("The store has no path " + std::to_string(i) +
                                ": it has " + std::to_string(size) + ".");
}

void requireNotEmpty(std::string_view path, std::size_t position) {
    if (path.empty())
        throw std::invalid_argument("The path at position " +
                                    std::to_string(position) + " is empty.");
}

}  // namespace

// Counts the characters of paths, a folder's once per run of its files.
class PathStore::Survey {
public:
    // Counts one of the paths to be added, which must not be empty.
    void check(std::string_view path) {
        requireNotEmpty(path, checkedPaths_++);
        count(path);
    }

    void count(std::string_view path) {
        if (lastFolders_.empty() || !paths::hasFolders(path, lastFolders_)) {
            lastFolders_.assign(path.substr(0, paths::fileStartOf(path)));
            countSegment(lastFolders_);
        }
        countSegment(path.substr(lastFolders_.size()));
    }

    std::size_t checkedPaths() const noexcept { return checkedPaths_; }
    CharacterCounts counts() const { return counter_.result(); }

private:
    void countSegment(std::string_view bytes) {
        if (bytes.empty())
            counter_.add(paths::noName);
        else
            counter_.addBytes(bytes);
    }

    CharacterCounter counter_;
    std::string lastFolders_;
    std::size_t checkedPaths_ = 0;
};

// The coder of a store that is not empty, and what it can encode.
class PathStore::Contents {
public:
    explicit Contents(CharacterCounts counts)
        : Contents(paths::coderFor(std::move(counts))) {}
    explicit Contents(std::unique_ptr<HuffmanPathTree> coder)
        : coder_(std::move(coder)) {
        for (const char16_t unit : coder_->getTreeString()) known_.set(unit);
    }

    HuffmanPathTree& coder() const noexcept { return *coder_; }

    bool encodes(const std::u16string& characters) const {
        return std::ranges::all_of(
            characters, [&](char16_t unit) { return known_.test(unit); });
    }

    // Adds paths and returns their number. If it throws, the coder may hold
    // some of them, which then are its last ones.
    std::size_t add(Source source) {
        StoreAppender appender(*coder_);
        const auto add = [&](std::string_view path) { appender.add(path); };
        try {
            source(add);
            appender.finish();
        } catch (...) {
            sound_ = sound_ && !appender.hasStarted();
            throw;
        }
        return appender.pathCount();
    }

    // False if the coder holds part of an addition that failed.
    bool isSound() const noexcept { return sound_; }

private:
    std::unique_ptr<HuffmanPathTree> coder_;
    std::bitset<std::size_t{1} << 16U> known_;
    bool sound_ = true;
};

// ---- Life ----

PathStore::PathStore() noexcept = default;

PathStore::PathStore(PathStore&& other) noexcept
    : contents_(std::move(other.contents_)),
      size_(std::exchange(other.size_, 0)) {}

PathStore& PathStore::operator=(PathStore&& other) noexcept {
    if (this == &other) return *this;
    contents_ = std::move(other.contents_);
    size_ = std::exchange(other.size_, 0);
    return *this;
}

PathStore::~PathStore() = default;

// ---- Adding ----

void PathStore::append(std::string_view path) {
    append(std::span<const std::string_view>(&path, 1));
}

void PathStore::appendFrom(Source source) {
    Survey survey;
    const auto check = [&](std::string_view path) { survey.check(path); };
    source(check);
    if (survey.checkedPaths() == 0) return;
    if (contents_ != nullptr && contents_->isSound() &&
        contents_->encodes(survey.counts().characters))
        addInPlace(source);
    else
        recode(survey, source);
}

// A range that can be read only once is kept as text.
void PathStore::appendOnce(Source source) {
    paths::PathList list;
    const auto keep = [&](std::string_view path) {
        requireNotEmpty(path, list.size());
        list.append(path);
    };
    source(keep);
    appendFrom([&](Sink sink) {
        for (std::size_t i = 0; i < list.size(); ++i) sink(list[i]);
    });
}

void PathStore::addInPlace(Source source) {
    try {
        size_ += contents_->add(source);
    } catch (...) {
        restoreSoundness();
        throw;
    }
}

// Makes the code anew, for the paths that are there and those to come, and
// adds both to a new coder.
void PathStore::recode(Survey& survey, Source source) {
    const auto count = [&](std::size_t, std::string_view path) {
        survey.count(path);
    };
    read(0, size_, count);
    auto recoded = std::make_unique<Contents>(survey.counts());
    std::size_t added = recoded->add([&](Sink sink) {
        read(0, size_, [&](std::size_t, std::string_view path) { sink(path); });
    });
    added += recoded->add(source);
    contents_ = std::move(recoded);
    size_ = added;
}

// Takes away what a failed addition left. If there is no memory for it, the
// next call that needs a sound coder tries again.
void PathStore::restoreSoundness() noexcept {
    if (contents_->isSound()) return;
    try {
        Survey survey;
        recode(survey, [](Sink) {});
    } catch (...) {  // NOLINT(bugprone-empty-catch)
    }
}

// ---- Reading ----

std::string PathStore::operator[](std::size_t i) const {
    std::string text;
    read(i, text);
    return text;
}

void PathStore::read(std::size_t i, std::string& text) const {
    requireBelow(i, size_);
    paths::readPath(contents_->coder(), i, text);
}

void PathStore::read(std::size_t first, std::size_t last, Visitor visit) const {
    if (first > last)
        throw std::out_of_range("A range of paths ends before it begins.");
    if (last == first && first <= size_) return;
    requireBelow(last - 1, size_);
    paths::readPaths(contents_->coder(), first, last, visit);
}

void PathStore::read(std::span<const std::size_t> numbers,
                     Visitor visit) const {
    for (const std::size_t number : numbers) requireBelow(number, size_);
    if (numbers.empty()) return;
    paths::readPaths(contents_->coder(), numbers, visit);
}

PathStore::Iterator PathStore::begin() const { return Iterator(*this); }

void PathStore::forEachInTreeOrder(
    FunctionRef<void(std::string_view)> visit) const {
    withSoundCoder(
        [&](HuffmanPathTree& coder) { paths::readInTreeOrder(coder, visit); });
}

// ---- Saving ----

std::vector<std::uint8_t> PathStore::save() const {
    std::vector<std::uint8_t> bytes;
    withSoundCoder(
        [&](HuffmanPathTree& coder) { bytes = paths::packStore(coder); });
    return bytes;
}

PathStore PathStore::load(std::span<const std::uint8_t> bytes) {
    PathStore store;
    auto coder = paths::unpackStore(bytes);
    if (coder->pathCount == 0) return store;
    store.size_ = coder->pathCount;
    store.contents_ = std::make_unique<Contents>(std::move(coder));
    return store;
}

void PathStore::saveFile(const std::string& file) const {
    paths::replaceFile(file, save());
}

PathStore PathStore::loadFile(const std::string& file) {
    const std::string bytes = paths::readWholeFile(file);
    return load(
        {reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size()});
}

// ---- Inspection ----

PathStore::MemoryUsage PathStore::memoryUsage() const {
    MemoryUsage usage;
    usage.other = sizeof(PathStore);
    if (contents_ == nullptr) return usage;
    const HuffmanPathTree::MemoryUsage coder = contents_->coder().memoryUsage();
    usage.names = coder.names;
    usage.tree = coder.nodes + coder.childLists;
    usage.numbers = coder.partitionTracks + coder.duplicates;
    usage.encoding = coder.code;
    usage.other += sizeof(Contents) + coder.other;
    return usage;
}

const HuffmanPathTree& PathStore::coder() const {
    if (contents_ != nullptr) return contents_->coder();
    static const HuffmanPathTree none;
    return none;
}

// Calls use with a coder of exactly this store's paths.
void PathStore::withSoundCoder(FunctionRef<void(HuffmanPathTree&)> use) const {
    if (contents_ != nullptr && contents_->isSound())
        return use(contents_->coder());
    if (contents_ == nullptr) {
        HuffmanPathTree none;
        return use(none);
    }
    PathStore copy;
    copy.appendFrom([&](Sink sink) {
        read(0, size_, [&](std::size_t, std::string_view path) { sink(path); });
    });
    use(copy.contents_->coder());
}

// ---- Iteration ----

// Some paths of the store, decoded together.
class PathStore::Iterator::Window {
public:
    explicit Window(const PathStore& store) : store_(&store) { refill(); }

    bool empty() const noexcept { return ends_.empty(); }

    std::string_view front() const noexcept {
        const std::size_t begin = at_ == 0 ? 0 : ends_[at_ - 1];
        return std::string_view(text_).substr(begin, ends_[at_] - begin);
    }

    void pop() {
        if (++at_ == ends_.size()) refill();
    }

private:
    // A loop that ends early should not have decoded much, a long one should
    // decode folders seldom.
    static constexpr std::size_t minPaths = 16;
    static constexpr std::size_t maxPaths = 1024;

    void refill() {
        text_.clear();
        ends_.clear();
        at_ = 0;
        const std::size_t last =
            std::min(store_->size(), std::max(next_, next_ + wanted_));
        store_->read(next_, std::max(next_, last),
                     [&](std::size_t, std::string_view path) {
                         text_.append(path);
                         ends_.push_back(text_.size());
                     });
        next_ += ends_.size();
        wanted_ = std::min(maxPaths, 2 * wanted_);
    }

    const PathStore* store_;
    std::string text_;
    std::vector<std::size_t> ends_;
    std::size_t at_ = 0;
    std::size_t next_ = 0;
    std::size_t wanted_ = minPaths;
};

PathStore::Iterator::Iterator(const PathStore& store)
    : window_(std::make_unique<Window>(store)) {}
PathStore::Iterator::Iterator(Iterator&& other) noexcept = default;
PathStore::Iterator& PathStore::Iterator::operator=(Iterator&& other) noexcept =
    default;
PathStore::Iterator::~Iterator() = default;

std::string_view PathStore::Iterator::operator*() const {
    return window_->front();
}

PathStore::Iterator& PathStore::Iterator::operator++() {
    window_->pop();
    return *this;
}

bool PathStore::Iterator::atEnd() const noexcept { return window_->empty(); }

}  // namespace tessel
