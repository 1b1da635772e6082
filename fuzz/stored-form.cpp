// A coder from a hostile stored form: an answer or a documented exception,
// and after an exception the coder is as it was. What was read is written
// again in a form that reads the same.
//
// Input: a byte that says how the rest is meant (0 a plain form, 1 a
// compressed one, 2 a payload that is compressed here), a byte with the number
// of characters of the tree string, the characters, then the bytes.
#include <cstdint>
#include <limits>
#include <stdexcept>
#include <string>
#include <vector>

#include "fuzz/Coders.hpp"

namespace tessel::fuzz {
namespace {

struct Stored {
    std::vector<std::uint8_t> bytes;
    bool compressed = false;
    std::u16string treeString;
};

// Paths asked for at most, however many a form claims to hold.
constexpr std::uint64_t maxAsked = 64;

Stored takeStored(Input& input) {
    Stored stored;
    const unsigned kind = input.byte() % 3;
    stored.compressed = kind != 0;
    stored.treeString = input.text(input.byte());
    std::vector<std::uint8_t> rest = input.remainder();
    if (kind != 2) {
        stored.bytes = std::move(rest);
        return stored;
    }
    sixpacks::makePackerUnpacker(sixpacks::PackedSizeT::Uint64)
        ->packValue(rest.size(), stored.bytes);
    const std::vector<std::uint8_t> stream = sixpacks::compressUint8(rest);
    stored.bytes.insert(stored.bytes.end(), stream.begin(), stream.end());
    return stored;
}

// Runs something that may be refused for what the bytes hold. Any exception
// but the documented ones ends the process.
template <class Operation>
bool formAccepted(Operation operation) {
    try {
        operation();
        return true;
    } catch (const DamagedFormException&) {
    } catch (const InvalidUintConversionException&) {
    } catch (const UnknownNodeTypeException&) {
    } catch (const NoMorePathException&) {
    } catch (const NoTreeToTraverseException&) {
    } catch (const EmptyPathForTraverseException&) {
    } catch (const std::out_of_range&) {
    }
    return false;
}

// A coder with content of every kind, to see that a refused form leaves it.
void fill(HuffmanPathTree& coder) {
    const std::vector<double> weights{2, 1, 1};
    coder.deflateHuffman(weights.data(), u"abc");
    HuffmanPathTree::FolderTexts folders{{u"a", u"b"}, {u"a"}};
    HuffmanPathTree::FolderTexts files{{u"c", u"cc"}, {u"ac"}};
    coder.generateCodeAsyncAndAddPaths(folders, files);
    for (int i = 0; i < 2; ++i) {
        Components path{coder.generateCodeFor(u"cab")};
        coder.addPathToBTree(path);
    }
}

void checkRefusal(const Stored& stored) {
    HuffmanPathTree coder;
    fill(coder);
    const std::vector<std::uint8_t> before = formOf(coder, false);
    std::vector<std::uint8_t> bytes = stored.bytes;
    if (formAccepted([&] { coder.deserialize(bytes, stored.compressed); }))
        return;
    require(formOf(coder, false) == before, "a refused form changes nothing");
    require(coder.pathCount == 5, "a refused form leaves the count");
}

void iterate(HuffmanPathTree& coder) {
    coder.resetPathsToBTree();
    std::uint64_t handedOut = 0;
    for (Components path;
         coder.hasNextPathFromBTree() && ++handedOut < maxAsked; path.clear()) {
        formAccepted([&] { coder.getNextPathFromBTree(path); });
        formAccepted([&] { decode(coder, path); });
    }
}

void fetch(const HuffmanPathTree& coder, const std::vector<double>& numbers) {
    std::vector<Components> folders;
    std::vector<Components> files;
    if (!formAccepted([&] { coder.getPath(folders, files, numbers); }))
        require(folders.empty() && files.empty(),
                "a refused fetch leaves its outputs");
    for (const Components& components : folders)
        formAccepted([&] { decode(coder, components); });
    for (const Components& components : files)
        formAccepted([&] { decode(coder, components); });
}

void fetchByNumber(const HuffmanPathTree& coder) {
    std::vector<double> all;
    for (std::uint64_t n = 1; n <= maxAsked; ++n) {
        all.push_back(static_cast<double>(n));
        fetch(coder, {all.back()});
    }
    fetch(coder, all);
    fetch(coder, {0.0});
    fetch(coder, {-1.0});
    fetch(coder, {9.3e18, 1.9e19});
    fetch(coder, {std::numeric_limits<double>::infinity()});
    fetch(coder, {std::numeric_limits<double>::quiet_NaN(), 1.0});
    fetch(coder, {2.0, 1.0});
}

// `coder` was read; what it writes must read and write as itself. With one
// entry or none the order of duplicates cannot differ. Ends without tracks are
// read, but the writer goes by the tracks.
void checkRewritten(const HuffmanPathTree& coder) {
    if (coder.partitionTracks.empty() && !coder.partitionEnds.empty()) return;
    std::vector<std::uint8_t> form = formOf(coder, false);
    const std::vector<std::uint8_t> written = form;
    HuffmanPathTree again;
    again.deserialize(form, false);
    const std::vector<std::uint8_t> rewritten = formOf(again, false);
    require(rewritten.size() == written.size(), "a form keeps its size");
    if (coder.duplicates.size() < 2)
        require(rewritten == written, "what was read is written");
    require(again.duplicates == coder.duplicates, "duplicates are kept");
    require(again.pathCount == coder.pathCount, "the count is kept");
}

void useForm(Input input) {
    const Stored stored = takeStored(input);
    checkRefusal(stored);

    HuffmanPathTree coder;
    std::vector<std::uint8_t> bytes = stored.bytes;
    if (!formAccepted([&] { coder.deserialize(bytes, stored.compressed); }))
        return;
    checkRewritten(coder);
    formAccepted([&] { coder.inflateHuffman(stored.treeString); });
    iterate(coder);
    fetchByNumber(coder);
}

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::useForm({data, size});
    return 0;
}
