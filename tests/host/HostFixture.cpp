#include "tests/host/HostFixture.hpp"

#include <numeric>
#include <utility>

namespace tessel::embedded {

std::vector<Texts> pathsOf(const Listing& listing) {
    std::vector<Texts> paths;
    for (std::size_t i = 0; i < listing.folders.size(); ++i) {
        for (const std::u16string& file : listing.files[i]) {
            paths.push_back(listing.folders[i]);
            paths.back().push_back(file);
        }
    }
    return paths;
}

std::u16string alphabetOf(const Listing& listing) {
    std::u16string alphabet;
    for (const Texts& path : pathsOf(listing)) {
        for (const std::u16string& text : path) {
            for (const char16_t c : text)
                if (alphabet.find(c) == std::u16string::npos) alphabet += c;
        }
    }
    return alphabet;
}

Value foldersAndFiles(const Listing& listing) {
    std::vector<Value> elements;
    for (const Texts& folder : listing.folders)
        elements.push_back(Value::texts(folder));
    for (const Texts& files : listing.files)
        elements.push_back(Value::texts(files));
    return Value::cellColumn(std::move(elements));
}

std::vector<double> numbersTo(std::size_t count) {
    std::vector<double> numbers(count);
    std::iota(numbers.begin(), numbers.end(), 1.0);
    return numbers;
}

Texts textsOf(const Value& cell) {
    EXPECT_EQ(cell.dimensions(), (Dimensions{cell.numel(), 1}));
    Texts texts;
    for (std::size_t i = 0; i < cell.numel(); ++i) {
        const std::u16string_view text = cell.element(i).charData();
        EXPECT_EQ(cell.element(i).dimensions(), (Dimensions{1, text.size()}));
        texts.emplace_back(text);
    }
    return texts;
}

std::vector<Texts> listsOf(const Value& cells) {
    EXPECT_EQ(cells.dimensions(), (Dimensions{cells.numel(), 1}));
    std::vector<Texts> lists;
    for (std::size_t i = 0; i < cells.numel(); ++i)
        lists.push_back(textsOf(cells.element(i)));
    return lists;
}

HostOptions testOptions() {
    HostOptions options;
    options.messages = QZTESSEL_MESSAGES;
    return options;
}

std::filesystem::path pluginFile() { return QZTESSEL_PLUGIN; }

HostException errorOf(const std::function<void()>& action) {
    try {
        action();
    } catch (const HostException& error) {
        return error;
    }
    ADD_FAILURE() << "no host error was raised";
    return {"", {}, ""};
}

std::vector<std::string> argumentsOf(const HostException& error) {
    std::vector<std::string> texts;
    for (const HostMessageArgument& argument : error.arguments())
        texts.push_back(toText(argument));
    return texts;
}

std::vector<Texts> HostTest::iterated(const Value& instance) {
    host_.call(0, instance, "reset");
    std::vector<Texts> paths;
    while (host_.call(1, instance, "hasNextPath")[0].truth(0))
        paths.push_back(textsOf(host_.call(1, instance, "getNextPath")[0]));
    return paths;
}

Listing HostTest::fetched(const Value& instance, std::vector<double> numbers) {
    const std::vector<Value> outputs =
        host_.call(2, instance, "getPaths", Value::column(std::move(numbers)));
    return {listsOf(outputs[0]), listsOf(outputs[1])};
}

Texts HostTest::joined(const Value& instance, std::vector<double> numbers,
                       const std::u16string& separator) {
    return textsOf(host_.call(1, instance, "getPaths",
                              Value::column(std::move(numbers)),
                              Value::text(separator))[0]);
}

Listing smallListing() {
    return {{{u"/", u"usr", u"bin"}, {u"/", u"usr", u"lib", u"gcc"}},
            {{u"env", u"ls", u"cat"}, {u"cc1", u"crt.o"}}};
}

}  // namespace tessel::embedded
