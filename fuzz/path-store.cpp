// A store from hostile bytes: it answers or throws what it says, and what it
// holds stays the same through saving and appending.
//
// Input: a byte that says how the rest is meant. 0: a saved store; 1: one whose
// checksum is mended here; 2: one whose compressed form is made here of a tree
// string and a payload; else paths, each as a length byte and its bytes, which
// are added and compared with a plain list.
#include <zlib.h>

#include <algorithm>
#include <string>
#include <vector>

#include "fuzz/Input.hpp"
#include "fuzz/PathLists.hpp"
#include "packing/sixpacks.hpp"
#include "paths/PathStore.hpp"

namespace tessel::fuzz {
namespace {

using Bytes = std::vector<std::uint8_t>;

// Paths read at most, however many a form claims to hold.
constexpr std::size_t maxRead = 300;

void putUint(std::uint64_t value, std::size_t width, Bytes& out) {
    for (std::size_t i = 0; i < width; ++i)
        out.push_back(static_cast<std::uint8_t>(value >> (8 * i)));
}

void putChecksum(Bytes& bytes) {
    putUint(crc32_z(0, bytes.data(), bytes.size()), 4, bytes);
}

Bytes mended(Bytes bytes) {
    bytes.resize(bytes.size() - std::min<std::size_t>(4, bytes.size()));
    putChecksum(bytes);
    return bytes;
}

// A length byte, so many code units, and the payload.
Bytes enveloped(Input& input) {
    const std::u16string treeString = input.text(input.byte());
    Bytes payload = input.remainder();
    Bytes form;
    putUint(payload.size(), 8, form);
    const Bytes stream = sixpacks::compressUint8(payload);
    form.insert(form.end(), stream.begin(), stream.end());

    Bytes bytes = {0x89, 'T', 'E', 'S', 'S', 'E', 'L', '\n'};
    putUint(1, 4, bytes);
    putUint(treeString.size(), 4, bytes);
    for (const char16_t unit : treeString) putUint(unit, 2, bytes);
    putUint(form.size(), 8, bytes);
    bytes.insert(bytes.end(), form.begin(), form.end());
    putChecksum(bytes);
    return bytes;
}

// Runs something that may be refused for what the bytes hold.
template <class Operation>
bool storeAccepted(Operation operation) {
    try {
        operation();
        return true;
    } catch (const DamagedFormException&) {
    } catch (const UnsupportedStoreVersionException&) {
    }
    return false;
}

// All routes must give the same, as far as they give anything.
void checkRoutes(const PathStore& store) {
    const std::size_t last = std::min(store.size(), maxRead);
    Paths one;
    bool whole = true;
    for (std::size_t i = 0; i < last && whole; ++i) {
        one.emplace_back();
        whole = storeAccepted([&] { store.read(i, one.back()); });
    }
    if (!whole) one.pop_back();
    Paths many;
    const auto keep = [&](std::size_t number, std::string_view path) {
        require(number == many.size(), "numbers come in order");
        many.emplace_back(path);
    };
    require(storeAccepted([&] { store.read(0, last, keep); }) == whole,
            "one by one and together fail alike");
    require(one == many, "one by one and together give the same");
}

void checkHostile(const Bytes& bytes) {
    PathStore store;
    if (!storeAccepted([&] { store = PathStore::load(bytes); })) return;
    checkRoutes(store);
    std::size_t met = 0;
    storeAccepted([&] {
        store.forEachInTreeOrder([&](std::string_view path) {
            require(!path.empty(), "no path is empty");
            ++met;
        });
    });
    store.memoryUsage();
}

void checkPaths(Input& input) {
    Paths paths;
    PathStore store;
    const auto appendRest = [&] {
        const auto added = static_cast<std::ptrdiff_t>(store.size());
        store.append(Paths(paths.begin() + added, paths.end()));
    };
    while (!input.empty()) {
        // A high bit adds the paths so far; the others are added at the end.
        const std::uint8_t length = input.byte();
        if (input.empty()) break;
        std::string& path = paths.emplace_back();
        const std::size_t wanted = 1 + length % 0x7F;
        while (path.size() < wanted && !input.empty())
            path.push_back(static_cast<char>(input.byte()));
        if (length >= 0x80) appendRest();
    }
    appendRest();
    const PathStore loaded = PathStore::load(store.save());
    Paths met;
    for (const std::string_view path : loaded) met.emplace_back(path);
    require(met == paths, "every path comes back");
    checkRoutes(loaded);
    requireInTree(loaded, paths);
}

void useStore(Input input) {
    switch (input.byte()) {
        case 0:
            return checkHostile(input.remainder());
        case 1:
            return checkHostile(mended(input.remainder()));
        case 2:
            return checkHostile(enveloped(input));
        default:
            return checkPaths(input);
    }
}

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::useStore({data, size});
    return 0;
}
