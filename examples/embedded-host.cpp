// The plug-in's class in a program of your own: loads libqztessel.so into the
// embedded host, adds paths, and fetches and restores them there.
//
// Usage: embedded-host PLUG-IN MESSAGES, which are in an installed library
//   $(pkg-config --variable=plugin qztessel) and
//   $(pkg-config --variable=messages qztessel).
//
// Built against it with
//   g++ -std=c++20 embedded-host.cpp $(pkg-config --cflags --libs
//   qztessel-embedded)
#include <exception>
#include <iostream>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "hosts/embedded/FilesetClass.hpp"
#include "hosts/embedded/Host.hpp"

using tessel::embedded::filesetClassName;
using tessel::embedded::Host;
using tessel::embedded::Value;

namespace {

// An instance whose code knows the characters of these folders and files.
Value newInstance(Host& host, const Value& folders, const Value& files) {
    std::vector<Value> lists;
    for (const Value* cell : {&folders, &files})
        for (std::size_t i = 0; i < cell->numel(); ++i)
            lists.push_back(cell->element(i));
    return host.construct(filesetClassName, Value::text(u"files"),
                          Value::cellColumn(lists));
}

// Numbers are counted from 1 and ascend.
void printPaths(Host& host, const Value& instance,
                std::vector<double> numbers) {
    const Value paths =
        host.call(1, instance, "getPaths", Value::column(std::move(numbers)),
                  Value::text(u"/"))[0];
    for (std::size_t i = 0; i < paths.numel(); ++i) {
        const std::u16string_view text = paths.element(i).charData();
        std::cout << std::string(text.begin(), text.end()) << '\n';
    }
}

void run(const std::string& plugin, const std::string& messages) {
    Host host({.messages = messages});
    host.loadModule(plugin);

    // Two folders with their files. A path's first component is its root,
    // which brings its own separator.
    const Value folders =
        Value::textLists({{u"/", u"usr", u"bin"}, {u"/", u"etc"}});
    const Value files = Value::textLists({{u"env", u"id"}, {u"fstab"}});
    const Value instance = newInstance(host, folders, files);
    host.call(0, instance, "addPaths", folders, files);
    printPaths(host, instance, {1, 3});

    const Value saved = host.save(instance);
    host.destroy(instance);
    printPaths(host, host.load(filesetClassName, saved), {2});
}

}  // namespace

int main(int argumentCount, char** arguments) {
    if (argumentCount != 3) {
        std::cerr << "Usage: embedded-host PLUG-IN MESSAGES\n";
        return 2;
    }
    try {
        run(arguments[1], arguments[2]);
        return 0;
    } catch (const std::exception& failure) {
        std::cerr << failure.what() << '\n';
        return 1;
    }
}
