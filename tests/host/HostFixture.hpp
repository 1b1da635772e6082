#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "hosts/embedded/FilesetClass.hpp"
#include "hosts/embedded/Host.hpp"

// What the tests of the plug-in inside the embedded host share.
namespace tessel::embedded {

using Texts = std::vector<std::u16string>;

// Folders with their files, as addPaths takes them.
struct Listing {
    std::vector<Texts> folders;
    std::vector<Texts> files;

    bool operator==(const Listing&) const = default;
};

// Every path of a listing, in order: the folder's components and the file.
std::vector<Texts> pathsOf(const Listing& listing);

// All characters of a listing, each once, in order of appearance.
std::u16string alphabetOf(const Listing& listing);

// The input 2 of mode "files".
Value foldersAndFiles(const Listing& listing);

// The numbers from 1 to count.
std::vector<double> numbersTo(std::size_t count);

// The texts of a cell of char rows, which must be a column.
Texts textsOf(const Value& cell);
std::vector<Texts> listsOf(const Value& cells);

HostOptions testOptions();

// The file of the plug-in under test.
std::filesystem::path pluginFile();

// The host error that an action raises; fails the test if it raises none.
HostException errorOf(const std::function<void()>& action);

// Its arguments as texts.
std::vector<std::string> argumentsOf(const HostException& error);

inline const std::string componentName = "VELOX:datastoreio:huffmanpaths:";

// A host with the plug-in loaded, and steps on its instances.
class HostTest : public testing::Test {
protected:
    HostTest() { host_.loadModule(pluginFile()); }

    template <class... Inputs>
    Value make(const Inputs&... inputs) {
        return host_.construct(filesetClassName, inputs...);
    }
    Value makeFor(const Listing& listing) {
        return make(Value::text(u"files"), foldersAndFiles(listing));
    }
    // An instance with the code and the paths of a listing.
    Value filled(const Listing& listing) {
        Value instance = makeFor(listing);
        add(instance, listing);
        return instance;
    }

    void add(const Value& instance, const Listing& listing) {
        host_.call(0, instance, "addPaths", Value::textLists(listing.folders),
                   Value::textLists(listing.files));
    }
    // All paths from a reset to the end.
    std::vector<Texts> iterated(const Value& instance);
    // The paths of these numbers.
    Listing fetched(const Value& instance, std::vector<double> numbers);
    Texts joined(const Value& instance, std::vector<double> numbers,
                 const std::u16string& separator);

    std::u16string treeString(const Value& instance) {
        return std::u16string(
            host_.call(1, instance, "serialize")[0].charData());
    }
    std::vector<std::uint8_t> storedForm(const Value& instance) {
        return host_.call(2, instance, "serialize")[1].byteData();
    }
    std::vector<double> frequencies(const Value& instance) {
        return host_.get(instance, "Frequencies").doubleData();
    }

    Host host_{testOptions()};
};

// Two folders with three and two files.
Listing smallListing();

}  // namespace tessel::embedded
