#include <gtest/gtest.h>
// After its own framework, on which it builds.
#include <rapidcheck.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <map>
#include <utility>

#include "tests/host/HostFixture.hpp"

// Random lists of paths through every pair of ways from one instance to
// another.
namespace tessel::embedded {

namespace {

// A name: a first letter that keeps folders and files apart, and any code
// units, among them lone surrogates, NUL and the largest.
rc::Gen<std::u16string> nameStartingWith(char16_t first) {
    const auto unit = rc::gen::weightedOneOf<std::uint16_t>(
        {{6, rc::gen::inRange<std::uint16_t>(u'a', u'f')},
         {1, rc::gen::element<std::uint16_t>(0, 0xD800, 0xDBFF, 0xDC00, 0xDFFF,
                                             0xFFFF, 0x20AC, u'/')},
         {1, rc::gen::arbitrary<std::uint16_t>()}});
    return rc::gen::map(rc::gen::container<std::vector<std::uint16_t>>(unit),
                        [first](const std::vector<std::uint16_t>& units) {
                            std::u16string name(1, first);
                            for (const std::uint16_t each : units)
                                name += static_cast<char16_t>(each);
                            return name;
                        });
}

// Few names, so that folders share components; some folders are 20 deep.
rc::Gen<Texts> folders(const Texts& names) {
    return rc::gen::mapcat(rc::gen::weightedOneOf<std::size_t>(
                               {{5, rc::gen::inRange<std::size_t>(1, 5)},
                                {1, rc::gen::just<std::size_t>(20)}}),
                           [names](std::size_t depth) {
                               return rc::gen::container<Texts>(
                                   depth, rc::gen::elementOf(names));
                           });
}

Listing randomListing() {
    const Texts names = *rc::gen::nonEmpty(
        rc::gen::resize(6, rc::gen::container<Texts>(nameStartingWith(u'd'))));
    const auto files =
        rc::gen::nonEmpty(rc::gen::container<Texts>(nameStartingWith(u'f')));
    Listing listing;
    const auto count = *rc::gen::inRange<std::size_t>(1, 12);
    for (std::size_t i = 0; i < count; ++i) {
        listing.folders.push_back(*folders(names));
        listing.files.push_back(*rc::gen::resize(8, files));
    }
    return listing;
}

// The joined text of each path.
Texts joinedTexts(const std::vector<Texts>& paths,
                  const std::u16string& separator) {
    Texts joined;
    for (const Texts& path : paths) {
        std::u16string text = path.front();
        for (std::size_t i = 1; i < path.size(); ++i) {
            text += path[i];
            if (i + 1 < path.size()) text += separator;
        }
        joined.push_back(text);
    }
    return joined;
}

class RoundTrips : public HostTest {
protected:
    // A way from one instance to another that has the same paths. Exact
    // ones keep the code and the stored form, too.
    struct Route {
        const char* name;
        bool isExact;
        std::function<Value(const Value&)> go;
    };

    // All that can be read out of an instance, whatever its code.
    struct Content {
        std::vector<Texts> iterated;
        Listing fetched;
        std::map<char16_t, double> frequencies;
        bool operator==(const Content&) const = default;
    };
    Content contentOf(const Value& instance, std::size_t count) {
        Content content{
            iterated(instance), fetched(instance, numbersTo(count)), {}};
        const std::u16string characters = treeString(instance);
        const std::vector<double> values = frequencies(instance);
        for (std::size_t i = 0; i < characters.size(); ++i)
            content.frequencies[characters[i]] = values.at(i);
        return content;
    }

    Value throughTree(const Value& instance) {
        const std::vector<Value> outputs = host_.call(2, instance, "serialize");
        return make(Value::text(u"tree"), outputs[0], outputs[1],
                    host_.get(instance, "Frequencies"));
    }
    Value throughProperties(const Value& instance) {
        return make(Value::text(u"tree"), host_.get(instance, "StringTree"),
                    host_.save(instance).field("PathTree"),
                    host_.get(instance, "Frequencies"));
    }
    Value throughFrequencies(const Value& instance, std::size_t count) {
        const Value made =
            make(Value::text(u"frequencies"), host_.get(instance, "StringTree"),
                 host_.get(instance, "Frequencies"));
        add(made, fetched(instance, numbersTo(count)));
        return made;
    }
    Value throughFiles(const Value& instance, std::size_t count) {
        const Listing listing = fetched(instance, numbersTo(count));
        const Value made = makeFor(listing);
        add(made, listing);
        return made;
    }

    std::vector<Route> routes(std::size_t count) {
        return {
            {"constructor, mode copy", true,
             [this](const Value& from) {
                 return make(Value::text(u"copy"), from);
             }},
            {"copy of the instance", true,
             [this](const Value& from) { return host_.copy(from); }},
            {"constructor, mode tree", true,
             [this](const Value& from) { return throughTree(from); }},
            {"properties", true,
             [this](const Value& from) { return throughProperties(from); }},
            {"save and load", true,
             [this](const Value& from) {
                 return host_.load(filesetClassName, host_.save(from));
             }},
            {"constructor, mode frequencies", false,
             [this, count](const Value& from) {
                 return throughFrequencies(from, count);
             }},
            {"constructor, mode files", false,
             [this, count](const Value& from) {
                 return throughFiles(from, count);
             }},
        };
    }
};

}  // namespace

RC_GTEST_FIXTURE_PROP(RoundTrips, InstanceGivesBackWhatWasAdded, ()) {
    const Listing listing = randomListing();
    const std::vector<Texts> paths = pathsOf(listing);
    const Value instance = filled(listing);
    std::vector<Texts> iteratedPaths = iterated(instance);
    std::vector<Texts> sortedPaths = paths;
    std::sort(iteratedPaths.begin(), iteratedPaths.end());
    std::sort(sortedPaths.begin(), sortedPaths.end());
    RC_ASSERT(iteratedPaths == sortedPaths);
    const std::vector<double> numbers = numbersTo(paths.size());
    RC_ASSERT(pathsOf(fetched(instance, numbers)) == paths);
    RC_ASSERT(joined(instance, numbers, u"/") == joinedTexts(paths, u"/"));
    const auto number = *rc::gen::inRange<std::size_t>(0, paths.size());
    RC_ASSERT(joined(instance, {static_cast<double>(number + 1)}, u"") ==
              joinedTexts({paths[number]}, u""));
}

RC_GTEST_FIXTURE_PROP(RoundTrips, EveryPairOfRoutesKeepsTheContent, ()) {
    const Listing listing = randomListing();
    const std::size_t count = pathsOf(listing).size();
    const Value source = filled(listing);
    const Content content = contentOf(source, count);
    const Value saved = host_.save(source);
    const std::vector<Route> ways = routes(count);
    for (const Route& first : ways) {
        const Route& second = *rc::gen::elementOf(ways);
        RC_LOG(std::string(first.name) + ", then " + second.name + "\n");
        const Value target = second.go(first.go(source));
        RC_ASSERT(contentOf(target, count) == content);
        if (first.isExact && second.isExact)
            RC_ASSERT(host_.save(target) == saved);
    }
}

RC_GTEST_FIXTURE_PROP(RoundTrips, RestoredInstanceTakesFurtherPaths, ()) {
    const Listing listing = randomListing();
    const Value source = filled(listing);
    Value restored;
    if (*rc::gen::arbitrary<bool>())
        restored = throughTree(source);
    else
        restored = host_.load(filesetClassName, host_.save(source));
    add(restored, listing);
    const std::vector<Texts> paths = pathsOf(listing);
    std::vector<Texts> twice = paths;
    twice.insert(twice.end(), paths.begin(), paths.end());
    RC_ASSERT(pathsOf(fetched(restored, numbersTo(twice.size()))) == twice);
    RC_ASSERT(iterated(source).size() == paths.size());
}

RC_GTEST_FIXTURE_PROP(RoundTrips, RefusedAdditionChangesNothing, ()) {
    const Listing listing = randomListing();
    const Value instance = filled(listing);
    const Value before = host_.save(instance);
    Listing spoiled = randomListing();
    const auto folder = *rc::gen::inRange<std::size_t>(0, spoiled.files.size());
    const bool inFolders = *rc::gen::arbitrary<bool>();
    Texts& texts = inFolders ? spoiled.folders[folder] : spoiled.files[folder];
    const auto place = *rc::gen::inRange<std::size_t>(0, texts.size());
    texts[place].clear();
    const HostException error = errorOf([&] { add(instance, spoiled); });
    RC_ASSERT(error.identifier() ==
              componentName +
                  (inFolders ? "folderElementEmpty" : "fileElementEmpty"));
    RC_ASSERT(argumentsOf(error) ==
              (std::vector<std::string>{std::to_string(folder + 1) + ", " +
                                        std::to_string(place + 1)}));
    RC_ASSERT(host_.save(instance) == before);
}

}  // namespace tessel::embedded
