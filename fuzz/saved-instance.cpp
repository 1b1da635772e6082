// A saved instance of the host's class from hostile content: custom load
// restores it or leaves it unrestored. What was restored answers through the
// host as a coder read from the same bytes does, and is saved in a form that
// loads as the same.
//
// Input: a byte with the number of characters of the tree string, the
// characters, then the payload of the stored form, which is compressed here.
#include <cmath>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "fuzz/Coders.hpp"
#include "fuzz/HostInput.hpp"
#include "packing/sixpacks.hpp"

namespace tessel::fuzz {
namespace {

using embedded::filesetClassName;
using embedded::Value;
using Bytes = std::vector<std::uint8_t>;

// Paths asked for at most, however many a form claims to hold.
constexpr std::uint64_t maxNumber = 40;

Bytes compressedForm(Bytes payload) {
    Bytes form;
    sixpacks::makePackerUnpacker(sixpacks::PackedSizeT::Uint64)
        ->packValue(payload.size(), form);
    const Bytes stream = sixpacks::compressUint8(payload);
    form.insert(form.end(), stream.begin(), stream.end());
    return form;
}

Value savedFrom(const std::u16string& treeString, const Bytes& form) {
    Value saved = Value::structure();
    saved.setField("StringTree", Value::text(treeString));
    saved.setField("PathTree", Value::byteColumn(form));
    return saved;
}

// The coder that the bytes are, without any host.
bool read(HuffmanPathTree& coder, const std::u16string& treeString,
          Bytes form) {
    try {
        coder.deserialize(form, true);
        coder.inflateHuffman(treeString);
        return true;
    } catch (const std::exception&) {
        return false;
    }
}

Texts textsOf(const Value& cell) {
    Texts texts;
    for (std::size_t i = 0; i < cell.numel(); ++i)
        texts.emplace_back(cell.element(i).charData());
    return texts;
}

// The path of this number through the host: its folder and its file.
std::optional<std::vector<Texts>> fetched(const Value& instance,
                                          double number) {
    std::vector<Texts> lists;
    const bool answered = allowed([&] {
        for (const Value& cell : pluggedHost().call(2, instance, "getPaths",
                                                    Value::column({number})))
            for (std::size_t i = 0; i < cell.numel(); ++i)
                lists.push_back(textsOf(cell.element(i)));
    });
    if (!answered) return std::nullopt;
    return lists;
}

std::optional<std::vector<Texts>> fetched(const HuffmanPathTree& coder,
                                          double number) {
    try {
        std::vector<Components> folders;
        std::vector<Components> files;
        coder.getPath(folders, files, {number});
        std::vector<Texts> lists;
        lists.reserve(folders.size() + files.size());
        for (const Components& names : folders)
            lists.push_back(decode(coder, names));
        for (const Components& names : files)
            lists.push_back(decode(coder, names));
        return lists;
    } catch (const std::exception&) {
        return std::nullopt;
    }
}

void compareNumbers(const Value& instance, const HuffmanPathTree& coder) {
    for (std::uint64_t n = 0; n <= maxNumber; ++n) {
        const auto number = static_cast<double>(n);
        require(fetched(instance, number) == fetched(coder, number),
                "host and coder fetch the same");
        allowed([&] {
            pluggedHost().call(1, instance, "getPaths", Value::column({number}),
                               Value::text(u"/"));
        });
    }
}

std::optional<Texts> next(const Value& instance) {
    std::optional<Texts> path;
    allowed([&] {
        path = textsOf(pluggedHost().call(1, instance, "getNextPath")[0]);
    });
    return path;
}

std::optional<Texts> next(HuffmanPathTree& coder) {
    try {
        Components path;
        coder.getNextPathFromBTree(path);
        return decode(coder, path);
    } catch (const std::exception&) {
        return std::nullopt;
    }
}

// Until one path cannot be decoded: the host then stays before it.
void compareIteration(const Value& instance, HuffmanPathTree& coder) {
    pluggedHost().call(0, instance, "reset");
    coder.resetPathsToBTree();
    for (std::uint64_t n = 0; n < maxNumber; ++n) {
        const bool hasNext =
            pluggedHost().call(1, instance, "hasNextPath")[0].truth(0);
        require(hasNext == coder.hasNextPathFromBTree(),
                "host and coder end together");
        const std::optional<Texts> path = next(instance);
        require(path == next(coder), "host and coder iterate the same");
        if (!path) return;
    }
}

void compareSaved(const Value& instance) {
    embedded::Host& host = pluggedHost();
    const Value saved = host.save(instance);
    const Value again = host.load(filesetClassName, saved);
    require(host.isRestored(again), "what was saved is restored");
    require(host.save(again).field("StringTree") == saved.field("StringTree"),
            "the characters are kept");
}

void useInstance(Input input) {
    const std::u16string treeString = input.text(input.byte());
    const Bytes form = compressedForm(input.remainder());
    const Value instance =
        pluggedHost().load(filesetClassName, savedFrom(treeString, form));
    HuffmanPathTree coder;
    const bool isSound = !treeString.empty() && read(coder, treeString, form);
    require(pluggedHost().isRestored(instance) == isSound,
            "host and coder judge alike");
    if (!isSound) return;
    compareNumbers(instance, coder);
    compareIteration(instance, coder);
    compareSaved(instance);
}

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::useInstance({data, size});
    return 0;
}
