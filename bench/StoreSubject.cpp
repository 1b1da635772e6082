// The store of paths as a subject: the library as a C++ program uses it.

#include <utility>

#include "bench/Subject.hpp"
#include "bench/Timing.hpp"
#include "paths/IndexedRange.hpp"
#include "paths/PathStore.hpp"

namespace bench {

using tessel::PathStore;
using tessel::paths::PathList;

namespace {

class StoreSubject : public Subject {
    // A range of the list's paths.
    auto views() const {
        return tessel::paths::IndexedRange(
            0, list_->size(), [this](std::size_t i) { return (*list_)[i]; });
    }

public:
    explicit StoreSubject(const PathList& paths) : list_(&paths) {}

    std::string name() const override { return "PathStore"; }
    std::size_t paths() const override { return list_->size(); }

    double build() override {
        return secondsOf([&] { store_ = PathStore::from(views()); });
    }

    double iterate() override {
        return secondsOf([&] {
            for (const std::string_view path : store_) keep(path);
        });
    }
    double fetchAll() override {
        return secondsOf([&] {
            store_.read(0, store_.size(),
                        [](std::size_t, std::string_view path) { keep(path); });
        });
    }
    double fetchRandom(const std::vector<std::size_t>& numbers) override {
        std::string path;
        return secondsOf([&] {
            for (const std::size_t number : numbers) {
                store_.read(number - 1, path);
                keep(path);
            }
        });
    }

    double store() override {
        saved_.clear();
        saved_.shrink_to_fit();
        return secondsOf([&] { saved_ = store_.save(); });
    }
    double restore() override {
        return secondsOf([&] { restored_ = PathStore::load(saved_); });
    }
    double destroyRestored() override {
        return secondsOf([&] { restored_ = PathStore(); });
    }
    double destroy() override {
        return secondsOf([&] { store_ = PathStore(); });
    }

    std::size_t storedBytes() const override { return saved_.size(); }
    bool verify() override { return isList(store_); }
    bool verifyRestored() override { return isList(restored_); }

private:
    bool isList(const PathStore& tested) const {
        if (tested.size() != list_->size()) return false;
        bool same = true;
        tested.read(0, tested.size(),
                    [&](std::size_t number, std::string_view path) {
                        same = same && path == (*list_)[number];
                    });
        std::size_t met = 0;
        for (const std::string_view path : tested) {
            same = same && path == (*list_)[met++];
        }
        return same && met == list_->size();
    }

    const PathList* list_;
    PathStore store_;
    PathStore restored_;
    std::vector<std::uint8_t> saved_;
};

}  // namespace

SubjectPtr makeStore(const PathList& list) {
    return std::make_unique<StoreSubject>(list);
}

}  // namespace bench
