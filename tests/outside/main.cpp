// A program that knows the library only by its headers and is built with one
// plain compiler line. Stores a few paths, restores them, and compares.
#include <cstdint>
#include <iostream>
#include <string>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "packing/sixpacks.hpp"
#include "pathtree/BPathTree.hpp"

namespace {

using Texts = std::vector<std::u16string>;

const std::u16string characters = u"/abcdefghijklmnopqrstuvwxyz.";

std::vector<Texts> fetchAll(const tessel::HuffmanPathTree& coder) {
    std::vector<double> numbers;
    for (std::uint64_t n = 1; n <= coder.pathCount; ++n)
        numbers.push_back(static_cast<double>(n));
    std::vector<tessel::Components> folders;
    std::vector<tessel::Components> files;
    coder.getPath(folders, files, numbers);

    std::vector<Texts> paths;
    for (std::size_t i = 0; i < folders.size(); ++i) {
        for (const tessel::Component& file : files[i]) {
            paths.emplace_back();
            for (const tessel::Component& folder : folders[i])
                paths.back().push_back(coder.generatePathFrom(folder));
            paths.back().push_back(coder.generatePathFrom(file));
        }
    }
    return paths;
}

}  // namespace

int main() {
    const std::vector<double> frequencies(characters.size(), 1);
    tessel::HuffmanPathTree coder;
    coder.deflateHuffman(frequencies.data(), characters);

    std::vector<Texts> folders = {{u"/", u"usr", u"bin"}, {u"/", u"etc"}};
    std::vector<Texts> files = {{u"env", u"id"}, {u"fstab"}};
    coder.generateCodeAsyncAndAddPaths(folders, files);

    std::vector<std::uint8_t> form;
    coder.serialize(form, true);
    tessel::HuffmanPathTree restored;
    restored.deserialize(form, true);
    restored.inflateHuffman(coder.getTreeString());

    const std::vector<Texts> expected = {{u"/", u"usr", u"bin", u"env"},
                                         {u"/", u"usr", u"bin", u"id"},
                                         {u"/", u"etc", u"fstab"}};
    if (fetchAll(coder) != expected || fetchAll(restored) != expected) {
        std::cerr << "the paths that came back differ\n";
        return 1;
    }
    std::cout << "3 paths restored from " << form.size() << " bytes\n";
    return 0;
}
