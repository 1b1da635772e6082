// Random histories of a few coders, side by side with a model: after each
// step the two must agree, and so must every answer in between.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <memory>
#include <ostream>
#include <random>

#include "tests/support/Coders.hpp"
#include "tests/support/Generators.hpp"

namespace {

using support::Bytes;
using support::CoderPtr;
using support::Texts;
using tessel::Components;
using tessel::HuffmanPathTree;

// ---- What a history is made of ----

enum class Kind {
    batch,      // folders with files, on some number of threads
    refused,    // the same with a text that has no code
    partition,  // one folder of components that are encoded already
    whole,      // one whole path
    pass,       // reset, then some paths
    next,       // some more paths
    fetch,      // paths by number
    copy,       // a copy that shares the nodes
    self,       // a copy onto itself
    restore,    // a coder from the stored form
    turn,       // from now on use another coder
};

struct Step {
    Kind kind = Kind::batch;
    std::vector<Texts> folders;
    std::vector<Texts> files;
    unsigned number = 0;
    std::vector<std::pair<int, unsigned>> numbers;  // kind of number, value
};

void showValue(const Step& step, std::ostream& out) {
    constexpr const char* names[] = {"batch", "refused", "partition", "whole",
                                     "pass",  "next",    "fetch",     "copy",
                                     "self",  "restore", "turn"};
    out << names[static_cast<int>(step.kind)] << ' ' << step.number
        << " folders ";
    rc::show(step.folders, out);
    out << " files ";
    rc::show(step.files, out);
    out << " numbers ";
    rc::show(step.numbers, out);
}

const std::u16string alphabet{u'a',      u'b',      u'/',    u'\0',
                              u'\xFFFF', u'\xD800', u'\x101'};

// Names collide often; now and then one takes more than 255 bytes.
rc::Gen<std::u16string> anyName() {
    const auto unit = rc::gen::elementOf(alphabet);
    return rc::gen::weightedOneOf<std::u16string>(
        {{20, rc::gen::container<std::u16string>(1, unit)},
         {8, rc::gen::container<std::u16string>(2, unit)},
         {2, support::anyTextOf(unit)},
         {1, rc::gen::map(unit, [](char16_t character) {
              return std::u16string(2500, character);
          })}});
}

rc::Gen<Texts> namesUpTo(int most) {
    return rc::gen::mapcat(rc::gen::inRange(0, most + 1), [](int count) {
        return rc::gen::container<Texts>(static_cast<std::size_t>(count),
                                         anyName());
    });
}

// Mostly short; sometimes so many names that positions take two bytes.
rc::Gen<Texts> anyFiles() {
    return rc::gen::weightedOneOf<Texts>(
        {{40, namesUpTo(4)},
         {1, rc::gen::map(anyName(), [](const std::u16string& name) {
              return Texts(300, name);
          })}});
}

rc::Gen<Kind> anyKind() {
    return rc::gen::weightedElement<Kind>({{8, Kind::batch},
                                           {1, Kind::refused},
                                           {3, Kind::partition},
                                           {5, Kind::whole},
                                           {3, Kind::pass},
                                           {3, Kind::next},
                                           {5, Kind::fetch},
                                           {1, Kind::copy},
                                           {1, Kind::self},
                                           {2, Kind::restore},
                                           {2, Kind::turn}});
}

rc::Gen<Step> anyStep() {
    return rc::gen::mapcat(anyKind(), [](Kind kind) {
        const bool inserts = kind == Kind::batch || kind == Kind::refused ||
                             kind == Kind::partition || kind == Kind::whole;
        const int folders = !inserts                                       ? 0
                            : kind == Kind::batch || kind == Kind::refused ? 6
                                                                           : 1;
        const auto folderCount =
            rc::gen::inRange(kind == Kind::batch ? 0 : folders, folders + 1);
        return rc::gen::mapcat(folderCount, [kind](int count) {
            const auto size = static_cast<std::size_t>(count);
            return rc::gen::build<Step>(
                rc::gen::set(&Step::kind, rc::gen::just(kind)),
                rc::gen::set(
                    &Step::folders,
                    rc::gen::container<std::vector<Texts>>(size, namesUpTo(3))),
                rc::gen::set(
                    &Step::files,
                    rc::gen::container<std::vector<Texts>>(size, anyFiles())),
                rc::gen::set(&Step::number, rc::gen::inRange(0U, 1000U)),
                rc::gen::set(
                    &Step::numbers,
                    rc::gen::container<std::vector<std::pair<int, unsigned>>>(
                        kind == Kind::fetch ? 5 : 0,
                        rc::gen::pair(rc::gen::inRange(0, 40),
                                      rc::gen::inRange(0U, 1000U)))));
        });
    });
}

// ---- Playing it ----

// A coder and what it should be.
struct Pair {
    CoderPtr coder = std::make_unique<HuffmanPathTree>();
    model::Coder expected;
    // How often something was inserted into the nodes that this coder shares
    // with its copies, and that count when its pass began: a pass must not
    // continue after an insertion.
    std::shared_ptr<int> insertions = std::make_shared<int>(0);
    int passBegan = 0;
};

class Play {
public:
    Play(const std::u16string& characters,
         const std::vector<double>& frequencies) {
        Pair pair;
        pair.coder = support::coderWith(characters, frequencies);
        pair.expected.code = model::buildCode(characters, frequencies);
        pairs_.push_back(std::move(pair));
    }

    void step(const Step& step) {
        switch (step.kind) {
            case Kind::batch:
                return addBatches(step, false);
            case Kind::refused:
                return addBatches(step, true);
            case Kind::partition:
                return addPartition(step);
            case Kind::whole:
                return addWhole(step);
            case Kind::pass:
                return pass(step.number % 12);
            case Kind::next:
                return next(step.number % 6);
            case Kind::fetch:
                return fetch(step);
            case Kind::copy:
                return copy();
            case Kind::self:
                return copyOntoItself();
            case Kind::restore:
                return restore(step.number % 4);
            case Kind::turn:
                used_ = step.number % pairs_.size();
                return;
        }
    }

    // Compares every coder with its model, and its form with the model's.
    void compareAll() {
        for (used_ = 0; used_ < pairs_.size(); ++used_) {
            // A copy may have added to the nodes.
            compare();
            const Bytes form = support::formOf(*now().coder, false);
            RC_ASSERT(now().expected.form().differenceFrom(form) == "");
            pass(100000);
            restore(0);
            RC_ASSERT(now().expected.form().differenceFrom(
                          support::formOf(*now().coder, false)) == "");
        }
    }

private:
    Pair& now() { return pairs_[used_]; }

    void compare() {
        RC_ASSERT(support::differenceFrom(now().expected, *now().coder) == "");
        RC_ASSERT(support::brokenInvariant(*now().coder) == "");
    }

    void noteInsertion() { ++*now().insertions; }

    void addBatches(const Step& step, bool spoil) {
        std::vector<Texts> folders = step.folders;
        std::vector<Texts> files = step.files;
        if (spoil && !folders.empty()) {
            Texts& names = files[step.number % files.size()];
            names.push_back(step.number % 2 == 0 ? u"" : u"unknown");
        }
        const auto refusal = now().expected.addBatches(folders, files);
        constexpr unsigned threads[] = {0, 1, 2, 3, 7, 64};
        std::optional<model::Refusal> actual;
        try {
            support::addBatches(*now().coder, folders, files,
                                threads[step.number % 6]);
        } catch (const tessel::NoCodeForEmptyString&) {
            actual = model::Refusal::emptyText;
        } catch (const tessel::CodeNotFoundException&) {
            actual = model::Refusal::unknownCharacter;
        }
        RC_ASSERT(actual == refusal);
        noteInsertion();
        compare();
    }

    // Both sides encode, so that both count the longest component.
    Components encoded(const Texts& texts) {
        Components components;
        for (const std::u16string& text : texts) {
            components.push_back(now().coder->generateCodeFor(text));
            RC_ASSERT(components.back() ==
                      now().expected.encodeText(text).bytes);
        }
        return components;
    }

    void addPartition(const Step& step) {
        Components folder = encoded(step.folders[0]);
        Components files = encoded(step.files[0]);
        now().expected.addPartition(folder, files);
        now().coder->addPathToBTree(folder, files);
        noteInsertion();
        compare();
    }

    void addWhole(const Step& step) {
        Components path = encoded(step.folders[0]);
        now().expected.addWhole(path);
        now().coder->addPathToBTree(path);
        noteInsertion();
        compare();
    }

    void pass(unsigned count) {
        now().coder->resetPathsToBTree();
        now().expected.reset();
        now().passBegan = *now().insertions;
        next(count);
    }

    void next(unsigned count) {
        if (now().passBegan != *now().insertions) return;
        for (unsigned i = 0; i < count; ++i) {
            const bool left = now().expected.hasNext();
            RC_ASSERT(now().coder->hasNextPathFromBTree() == left);
            const auto expected = now().expected.next();
            Components path;
            if (!expected) {
                RC_ASSERT_THROWS_AS(now().coder->getNextPathFromBTree(path),
                                    tessel::NoMorePathException);
                break;
            }
            now().coder->getNextPathFromBTree(path);
            RC_ASSERT(path == *expected);
            if (!left) break;
        }
        compare();
    }

    double numberFor(int kind, unsigned value) {
        const auto count = static_cast<double>(now().expected.pathCount);
        switch (kind) {
            case 0:
                return std::numeric_limits<double>::quiet_NaN();
            case 1:
                return std::numeric_limits<double>::infinity();
            case 2:
                return 0;
            case 3:
                return -static_cast<double>(value);
            case 4:
                return 1e300;
            case 5:
                return value / 7.0;
            default:
                return 1 + std::fmod(static_cast<double>(value), count + 2);
        }
    }

    void fetch(const Step& step) {
        std::vector<double> numbers;
        for (const auto& [kind, value] : step.numbers)
            numbers.push_back(numberFor(kind, value));
        if (step.number % 4 != 0)
            std::sort(numbers.begin(), numbers.end(), [](double a, double b) {
                return a < b || (std::isnan(b) && !std::isnan(a));
            });
        const auto expected = now().expected.getPath(numbers);
        const auto answer = support::found(*now().coder, numbers);
        RC_ASSERT(answer.has_value() == expected.has_value());
        if (!expected) return;
        RC_ASSERT(answer->folders == expected->folders);
        RC_ASSERT(answer->files == expected->files);
    }

    void copy() {
        if (pairs_.size() > 3) return;
        Pair pair;
        pair.coder->copyTree(*now().coder);
        pair.expected = now().expected.copied();
        pair.insertions = now().insertions;
        pair.passBegan = now().passBegan;
        pairs_.push_back(std::move(pair));
        used_ = pairs_.size() - 1;
        compare();
    }

    void copyOntoItself() {
        now().coder->copyTree(*now().coder);
        compare();
    }

    // In place of the coder, or beside it.
    void restore(unsigned how) {
        const bool compress = how % 2 == 1;
        const bool replace = how < 2 || pairs_.size() > 3;
        const Bytes form = support::formOf(*now().coder, compress);
        Pair pair;
        pair.coder = support::restoredFrom(form, compress, *now().coder);
        pair.expected = now().expected.restored();
        pair.expected.reset();
        pair.coder->resetPathsToBTree();
        if (replace) {
            now() = std::move(pair);
        } else {
            pairs_.push_back(std::move(pair));
            used_ = pairs_.size() - 1;
        }
        compare();
    }

    std::vector<Pair> pairs_;
    std::size_t used_ = 0;
};

// ---- The properties ----

RC_GTEST_PROP(Histories, GiveTheModelsAnswers, ()) {
    const auto frequencies = *rc::gen::container<std::vector<double>>(
        alphabet.size(), support::anyFrequency());
    Play play(alphabet, frequencies);
    const auto steps =
        *rc::gen::scale(0.4, rc::gen::container<std::vector<Step>>(anyStep()));
    for (const Step& step : steps) play.step(step);
    play.compareAll();
}

RC_GTEST_PROP(Histories, TheFormDoesNotDependOnTheNumberOfThreads, ()) {
    const auto frequencies = *rc::gen::container<std::vector<double>>(
        alphabet.size(), support::anyFrequency());
    const auto steps =
        *rc::gen::scale(0.2, rc::gen::container<std::vector<Step>>(anyStep()));
    Bytes first;
    for (const unsigned threads : {1U, 2U, 3U, 7U, 64U}) {
        const CoderPtr coder = support::coderWith(alphabet, frequencies);
        for (const Step& step : steps) {
            if (step.folders.empty()) continue;
            std::vector<Texts> folders = step.folders;
            std::vector<Texts> files = step.files;
            if (step.kind == Kind::refused)
                files[step.number % files.size()].push_back(u"unknown");
            try {
                coder->generateCodeAsyncAndAddPaths(folders, files, threads);
            } catch (const tessel::CodeNotFoundException&) {
                RC_ASSERT(step.kind == Kind::refused);
            }
        }
        const Bytes form = support::formOf(*coder, false);
        if (first.empty()) first = form;
        RC_ASSERT(form == first);
    }
}

// One long history: wide folders, many partitions, every width of a field
// that fits in memory.
void playLongHistory() {
    std::mt19937_64 random(20230610);
    const auto below = [&random](std::uint64_t n) { return random() % n; };
    const auto name = [&](std::uint64_t kinds) {
        std::u16string text;
        for (std::uint64_t n = below(kinds) + 1; n > 0; n /= alphabet.size())
            text.push_back(alphabet[n % alphabet.size()]);
        return text;
    };
    const auto names = [&](std::uint64_t count, std::uint64_t kinds) {
        Texts texts;
        while (texts.size() < count) texts.push_back(name(kinds));
        return texts;
    };
    Play play(alphabet, {40, 30, 9, 5, 3, 1, 1});
    for (int round = 0; round < 60; ++round) {
        Step batch;
        for (int i = 0; i < 40; ++i) {
            batch.folders.push_back(names(1 + below(3), 700));
            batch.files.push_back(names(below(12), 100000));
        }
        batch.number = static_cast<unsigned>(below(1000));
        play.step(batch);
        Step fetch;
        fetch.kind = Kind::fetch;
        fetch.number = 1;
        for (int i = 0; i < 200; ++i)
            fetch.numbers.emplace_back(9, below(1000000));
        play.step(fetch);
        Step whole;
        whole.kind = Kind::whole;
        whole.folders.push_back(names(2, 20));
        play.step(whole);
        Step restore;
        restore.kind = Kind::restore;
        restore.number = 1;
        if (round % 20 == 19) play.step(restore);
    }
    play.compareAll();
}

TEST(Histories, OfManyThousandPathsGiveTheModelsAnswers) {
    try {
        playLongHistory();
    } catch (const rc::detail::CaseResult& failure) {
        FAIL() << failure.description;
    }
}

// Writing what was read gives the same bytes again, compressed or not.
RC_GTEST_PROP(Histories, WhatWasReadIsWrittenAgain, ()) {
    const auto frequencies = *rc::gen::container<std::vector<double>>(
        alphabet.size(), support::anyFrequency());
    const CoderPtr coder = support::coderWith(alphabet, frequencies);
    model::Coder expected;
    expected.code = model::buildCode(alphabet, frequencies);
    const auto steps =
        *rc::gen::scale(0.3, rc::gen::container<std::vector<Step>>(anyStep()));
    for (const Step& step : steps) {
        if (step.kind == Kind::batch) {
            support::addBatches(*coder, step.folders, step.files);
            expected.addBatches(step.folders, step.files);
        } else if (step.kind == Kind::whole) {
            support::addWhole(*coder, step.folders[0]);
            model::Path path;
            for (const std::u16string& text : step.folders[0])
                path.push_back(expected.encodeText(text).bytes);
            expected.addWhole(path);
        }
    }
    const model::Form once = expected.restored().form();
    for (const bool compress : {false, true}) {
        const CoderPtr read = support::restoredFrom(
            support::formOf(*coder, compress), compress, *coder);
        RC_ASSERT(once.differenceFrom(support::formOf(*read, false)) == "");
        const CoderPtr again = support::restoredFrom(
            support::formOf(*read, compress), compress, *read);
        RC_ASSERT(expected.restored().restored().form().differenceFrom(
                      support::formOf(*again, false)) == "");
    }
}

// ---- Beside a plain list ----

// paths[n - 1] is path n, as long as no file becomes a folder: folders and
// files have names of their own here.
RC_GTEST_PROP(Histories, NumbersAreThoseOfAPlainList, ()) {
    CoderPtr coder = support::coderWith(alphabet, {7, 6, 5, 4, 3, 2, 1});
    std::vector<Texts> paths;
    const auto below = [](unsigned n) { return *rc::gen::inRange(0U, n); };
    const auto nameOf = [&](bool folder, unsigned kinds) {
        std::u16string name(1 + below(kinds), alphabet[2]);
        name[0] = alphabet[folder ? 0 : 1];
        return name;
    };
    const unsigned rounds = below(12);
    for (unsigned round = 0; round < rounds; ++round) {
        std::vector<Texts> folders;
        std::vector<Texts> files;
        for (unsigned i = below(8); i > 0; --i) {
            Texts& folder = folders.emplace_back();
            for (unsigned depth = 1 + below(3); depth > 0; --depth)
                folder.push_back(nameOf(true, 3));
            Texts& names = files.emplace_back();
            for (unsigned k = below(6); k > 0; --k)
                names.push_back(nameOf(false, 5));
        }
        const bool refused = !folders.empty() && below(4) == 0;
        if (refused) files[below(static_cast<unsigned>(files.size()))] = {u""};
        for (std::size_t i = 0; i < folders.size() && !refused; ++i) {
            for (const std::u16string& name : files[i]) {
                paths.push_back(folders[i]);
                paths.back().push_back(name);
            }
        }
        try {
            support::addBatches(*coder, folders, files, below(4));
            RC_ASSERT(!refused);
        } catch (const tessel::NoCodeForEmptyString&) {
            RC_ASSERT(refused);
        }
        if (below(3) == 0)
            coder = support::restoredFrom(support::formOf(*coder, true), true,
                                          *coder);
    }
    RC_ASSERT(coder->pathCount == paths.size());
    for (std::size_t n = 1; n <= paths.size(); ++n) {
        const auto answer = support::found(*coder, {static_cast<double>(n)});
        RC_ASSERT(answer && answer->files.size() == 1U);
        Texts path = support::decodedBy(*coder, answer->folders[0]);
        path.push_back(support::decodedBy(*coder, answer->files[0])[0]);
        RC_ASSERT(path == paths[n - 1]);
    }
    std::vector<Texts> iterated = support::iterated(*coder);
    std::sort(iterated.begin(), iterated.end());
    std::sort(paths.begin(), paths.end());
    // A folder without files is iterated as a path of its own.
    RC_ASSERT(std::includes(iterated.begin(), iterated.end(), paths.begin(),
                            paths.end()));
}

}  // namespace
