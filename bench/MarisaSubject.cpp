// marisa-trie as a subject, with its default of three tries.

#include <marisa.h>

#include <cstdint>
#include <sstream>
#include <utility>

#include "bench/Subject.hpp"
#include "bench/Timing.hpp"

namespace bench {

using tessel::paths::PathList;

namespace {

class Marisa : public Subject {
public:
    explicit Marisa(const PathList& paths) : list_(&paths) {}

    std::string name() const override { return "marisa-trie"; }
    std::size_t paths() const override { return list_->size(); }

    // From a keyset, which is there before.
    double build() override {
        marisa::Keyset keys;
        for (std::size_t i = 0; i < list_->size(); ++i) {
            keys.push_back((*list_)[i].data(), (*list_)[i].size());
        }
        const double seconds = secondsOf([&] {
            trie_ = std::make_unique<marisa::Trie>();
            trie_->build(keys);
        });
        if (idOf_.empty()) {
            idOf_.reserve(keys.size());
            for (std::size_t i = 0; i < keys.size(); ++i) {
                idOf_.push_back(static_cast<std::uint32_t>(keys[i].id()));
            }
        }
        return seconds;
    }

    double iterate() override {
        marisa::Agent agent;
        return secondsOf([&] {
            for (std::size_t id = 0; id < trie_->size(); ++id) {
                lookUp(*trie_, id, agent);
            }
        });
    }
    // By the trie's own numbers: the way from the list's to them is free.
    double fetchAll() override { return iterate(); }
    double fetchRandom(const std::vector<std::size_t>& numbers) override {
        marisa::Agent agent;
        return secondsOf([&] {
            for (const std::size_t number : numbers) {
                lookUp(*trie_, idOf_[number - 1], agent);
            }
        });
    }

    std::optional<double> findNumbers(
        const std::vector<std::size_t>& numbers) override {
        marisa::Agent agent;
        return secondsOf([&] {
            for (const std::size_t number : numbers) {
                const std::string_view path = (*list_)[number - 1];
                agent.set_query(path.data(), path.size());
                keep(trie_->lookup(agent));
            }
        });
    }

    double store() override {
        std::ostringstream out;
        const double seconds = secondsOf([&] { marisa::write(out, *trie_); });
        form_ = std::move(out).str();
        return seconds;
    }
    double restore() override {
        std::istringstream in(form_);
        return secondsOf([&] {
            restored_ = std::make_unique<marisa::Trie>();
            marisa::read(in, restored_.get());
        });
    }
    double destroyRestored() override {
        return secondsOf([&] { restored_.reset(); });
    }
    double destroy() override {
        return secondsOf([&] { trie_.reset(); });
    }

    std::size_t storedBytes() const override { return form_.size(); }
    std::size_t sideBytes() const override {
        return idOf_.capacity() * sizeof(std::uint32_t);
    }
    bool verify() override { return isList(*trie_); }
    bool verifyRestored() override { return isList(*restored_); }

private:
    static void lookUp(const marisa::Trie& in, std::size_t id,
                       marisa::Agent& agent) {
        agent.set_query(id);
        in.reverse_lookup(agent);
        keep(agent.key());
    }

    bool isList(const marisa::Trie& tested) const {
        marisa::Agent agent;
        for (std::size_t i = 0; i < list_->size(); ++i) {
            lookUp(tested, idOf_[i], agent);
            if (std::string_view(agent.key().ptr(), agent.key().length()) !=
                (*list_)[i]) {
                return false;
            }
        }
        return true;
    }

    const PathList* list_;
    std::vector<std::uint32_t> idOf_;  // by position in the list
    std::unique_ptr<marisa::Trie> trie_;
    std::unique_ptr<marisa::Trie> restored_;
    std::string form_;
};

}  // namespace

SubjectPtr makeMarisa(const PathList& list) {
    return std::make_unique<Marisa>(list);
}

}  // namespace bench
