// The host's class under wrong callers: methods and properties in any order,
// with values of any class and shape, with instances that were destroyed, and
// with saved forms of anything. Each call answers or raises a host error.
//
// Input: calls, each a byte that names it and the bytes that it takes.
#include <array>
#include <cstdint>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include "fuzz/CallInput.hpp"
#include "fuzz/HostInput.hpp"

namespace tessel::fuzz {
namespace {

using embedded::filesetClassName;
using embedded::Value;
using Lists = std::vector<std::vector<std::u16string>>;

class HostCalls {
public:
    explicit HostCalls(Input input) : input_(input), host_(pluggedHost()) {
        for (Value& value : values_) value = host_.construct(filesetClassName);
    }

    void run() {
        for (std::size_t i = 0; i < maxCalls && !input_.empty(); ++i)
            allowed([&] { call(); });
    }

private:
    using Call = void (HostCalls::*)();

    void call() {
        static constexpr std::array calls{
            &HostCalls::makeValue, &HostCalls::changeValue,
            &HostCalls::construct, &HostCalls::callMethod,
            &HostCalls::addPaths,  &HostCalls::getPaths,
            &HostCalls::iterate,   &HostCalls::useProperty,
            &HostCalls::copy,      &HostCalls::save,
            &HostCalls::load,      &HostCalls::destroy};
        const Call chosen = calls[input_.byte() % calls.size()];
        (this->*chosen)();
    }

    Value& value() { return values_[input_.byte() % values_.size()]; }

    std::u16string text() {
        std::u16string units;
        for (unsigned left = input_.byte() % 5; left > 0; --left)
            units.push_back(static_cast<char16_t>('a' + input_.byte() % 4));
        return units;
    }
    Lists lists() {
        Lists made(input_.byte() % 4);
        for (auto& list : made)
            for (unsigned left = input_.byte() % 4; left > 0; --left)
                list.push_back(text());
        return made;
    }
    double number() {
        constexpr std::array<double, 6> odd{
            std::numeric_limits<double>::quiet_NaN(),
            std::numeric_limits<double>::infinity(),
            -1.0,
            -0.5,
            1e300,
            9.3e18};
        const std::uint8_t choice = input_.byte();
        return choice < 0xF0 ? choice % 16 : odd[choice % odd.size()];
    }
    std::vector<double> numbers() {
        std::vector<double> made;
        for (unsigned left = input_.byte() % 8; left > 0; --left)
            made.push_back(number());
        return made;
    }

    void makeValue() {
        Value& made = value();
        switch (input_.byte() % 10) {
            case 0:
                made = Value::text(text());
                return;
            case 1:
                made = Value::scalar(number());
                return;
            case 2:
                made = Value::logical(input_.byte() % 2 == 0);
                return;
            case 3:
                made = Value::column(numbers());
                return;
            case 4:
                made = Value::byteColumn(input_.block());
                return;
            case 5:
                made = Value::textLists(lists());
                return;
            case 6:
                made = Value::cell(input_.byte() % 5, input_.byte() % 5);
                return;
            case 7:
                made = Value::structure({input_.byte() % std::size_t{3}, 1});
                return;
            case 8:
                made = Value::complexDoubles({2, 1}, {1, 2, number(), 4});
                return;
            default:
                made = Value();
        }
    }

    void changeValue() {
        constexpr std::array fields{"StringTree", "PathTree", "Frequencies",
                                    "other"};
        const char* const field = fields[input_.byte() % fields.size()];
        const Value part = value();
        Value& changed = value();
        if (input_.byte() % 2 == 0)
            changed.setField(field, part, input_.byte() % 3);
        else
            changed.setElement(input_.byte() % 8, part);
    }

    std::vector<const Value*> inputs() {
        std::vector<const Value*> chosen;
        for (unsigned left = input_.byte() % 6; left > 0; --left)
            chosen.push_back(&value());
        return chosen;
    }

    void construct() {
        constexpr std::array<const char16_t*, 5> modes{
            u"tree", u"frequencies", u"copy", u"files", u"none"};
        const Value mode = Value::text(modes[input_.byte() % modes.size()]);
        std::vector<const Value*> given = inputs();
        if (input_.byte() % 4 != 0) given.insert(given.begin(), &mode);
        const Value made =
            host_.constructWith(filesetClassName, given, input_.byte() % 3);
        value() = made;
    }

    void callMethod() {
        constexpr std::array methods{"addPaths",     "getPaths", "getNextPath",
                                     "hasNextPath",  "reset",    "serialize",
                                     "HuffmanPaths", "none"};
        const char* const method = methods[input_.byte() % methods.size()];
        const Value instance = value();
        const std::int32_t requested = input_.byte() % 5 - 1;
        const std::vector<const Value*> given = inputs();
        for (Value& output : host_.callWith(requested, instance, method, given))
            value() = std::move(output);
        host_.callStatic(requested, filesetClassName, method, given);
    }

    void addPaths() {
        const Value instance = value();
        const Value folders = Value::textLists(lists());
        host_.call(0, instance, "addPaths", folders, Value::textLists(lists()));
    }

    void getPaths() {
        const Value instance = value();
        const Value wanted = Value::column(numbers());
        allowed([&] { host_.call(2, instance, "getPaths", wanted); });
        host_.call(1, instance, "getPaths", wanted, Value::text(text()));
    }

    void iterate() {
        const Value instance = value();
        if (input_.byte() % 2 == 0) host_.call(0, instance, "reset");
        for (unsigned left = input_.byte() % 8; left > 0; --left)
            host_.call(1, instance, "getNextPath");
    }

    void useProperty() {
        constexpr std::array properties{"StringTree", "Frequencies", "none"};
        const char* const property =
            properties[input_.byte() % properties.size()];
        const Value instance = value();
        switch (input_.byte() % 4) {
            case 0:
                value() = host_.get(instance, property);
                return;
            case 1:
                return host_.set(instance, property, value());
            case 2:
                // A listener that takes the instance away.
                return host_.listen(
                    instance, property, embedded::ListenerKind::Get,
                    [&host = host_, weak = instance] { host.destroy(weak); });
            default:
                host_.inspect(instance);
        }
    }

    void copy() {
        const Value made = host_.copy(value());
        value() = made;
    }

    void save() {
        const Value made = host_.save(value());
        value() = made;
    }

    void load() {
        const Value made = host_.load(filesetClassName, value());
        host_.isRestored(made);
        value() = made;
    }

    void destroy() {
        const Value instance = value();
        host_.destroy(instance);
        require(!host_.isValid(instance), "a destroyed instance is invalid");
    }

    Input input_;
    embedded::Host& host_;
    std::array<Value, 6> values_;
};

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::HostCalls({data, size}).run();
    return 0;
}
