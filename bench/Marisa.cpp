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
    explicit Marisa(const PathList& paths) : list(&paths) {}

    std::string name() const override { return "marisa-trie"; }
    std::size_t paths() const override { return list->size(); }

    // From a keyset, which is there before.
    double build() override {
        marisa::Keyset keys;
        for (std::size_t i = 0; i < list->size(); ++i) {
            keys.push_back((*list)[i].data(), (*list)[i].size());
        }
        const double seconds = secondsOf([&] {
            trie = std::make_unique<marisa::Trie>();
            trie->build(keys);
        });
        if (idOf.empty()) {
            idOf.reserve(keys.size());
            for (std::size_t i = 0; i < keys.size(); ++i) {
                idOf.push_back(static_cast<std::uint32_t>(keys[i].id()));
            }
        }
        return seconds;
    }

    double iterate() override {
        marisa::Agent agent;
        return secondsOf([&] {
            for (std::size_t id = 0; id < trie->size(); ++id) {
                lookUp(*trie, id, agent);
            }
        });
    }
    // By the trie's own numbers: the way from the list's to them is free.
    double fetchAll() override { return iterate(); }
    double fetchRandom(const std::vector<double>& numbers) override {
        marisa::Agent agent;
        return secondsOf([&] {
            for (const double number : numbers) {
                lookUp(*trie, idOf[static_cast<std::size_t>(number) - 1],
                       agent);
            }
        });
    }

    double store() override {
        std::ostringstream out;
        const double seconds = secondsOf([&] { marisa::write(out, *trie); });
        form = std::move(out).str();
        return seconds;
    }
    double restore() override {
        std::istringstream in(form);
        return secondsOf([&] {
            restored = std::make_unique<marisa::Trie>();
            marisa::read(in, restored.get());
        });
    }
    double destroyRestored() override {
        return secondsOf([&] { restored.reset(); });
    }
    double destroy() override {
        return secondsOf([&] { trie.reset(); });
    }

    std::size_t storedBytes() const override { return form.size(); }
    std::size_t sideBytes() const override {
        return idOf.capacity() * sizeof(std::uint32_t);
    }
    bool verify() override { return isList(*trie); }
    bool verifyRestored() override { return isList(*restored); }

private:
    static void lookUp(const marisa::Trie& in, std::size_t id,
                       marisa::Agent& agent) {
        agent.set_query(id);
        in.reverse_lookup(agent);
        keep(agent.key());
    }

    bool isList(const marisa::Trie& tested) const {
        marisa::Agent agent;
        for (std::size_t i = 0; i < list->size(); ++i) {
            lookUp(tested, idOf[i], agent);
            if (std::string_view(agent.key().ptr(), agent.key().length()) !=
                (*list)[i]) {
                return false;
            }
        }
        return true;
    }

    const PathList* list;
    std::vector<std::uint32_t> idOf;  // by position in the list
    std::unique_ptr<marisa::Trie> trie;
    std::unique_ptr<marisa::Trie> restored;
    std::string form;
};

}  // namespace

SubjectPtr makeMarisa(const PathList& list) {
    return std::make_unique<Marisa>(list);
}

}  // namespace bench
