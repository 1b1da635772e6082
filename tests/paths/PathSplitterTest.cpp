// Where paths are cut, and that lists of all kinds come back from the coder.

#include <gtest/gtest.h>
#include <rapidcheck.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <map>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "paths/Batches.hpp"
#include "paths/PathSplitter.hpp"
#include "paths/PathText.hpp"
#include "tests/paths/Lists.hpp"

namespace {

using support::listOf;
using namespace tessel::paths;
using tessel::Component;
using tessel::Components;
using tessel::HuffmanPathTree;
using Strings = std::vector<std::string>;

// The components of each path of the list, file last, with '|' between them
// and '.' for the root of a path that has none.
Strings cutsOf(const Strings& paths) {
    const PathList list = listOf(paths);
    const PathSplitter splitter(list);
    Strings cuts;
    for (std::size_t i = 0; i < list.size(); ++i) {
        const PathSplit split = splitter.split(i);
        std::string cut;
        for (const std::u16string& text : folderTexts(list[i], split)) {
            if (text == std::u16string(1, noRoot)) {
                cut += '.';
            } else if (!appendBytes(text, cut)) {
                cut += '?';
            }
            cut += '|';
        }
        cuts.push_back(cut.append(list[i].substr(split.fileStart)));
    }
    return cuts;
}

std::string cutOf(const std::string& path) { return cutsOf({path}).front(); }

TEST(PathSplitter, AnAbsolutePathHasTheSlashAsItsRoot) {
    EXPECT_EQ(cutOf("/usr/bin/env"), "/|usr|bin|env");
    EXPECT_EQ(cutOf("/env"), "/|env");
    EXPECT_EQ(cutOf("/e"), "/|e");
}

TEST(PathSplitter, ARelativePathHasItsFirstNameAsItsRoot) {
    EXPECT_EQ(cutOf("usr/share/x"), "usr/|share|x");
    EXPECT_EQ(cutOf("usr/x"), "usr/|x");
    EXPECT_EQ(cutOf("./x"), "./|x");
    EXPECT_EQ(cutOf("../../x"), "../|..|x");
    EXPECT_EQ(cutOf("a/b"), "a/|b");
}

TEST(PathSplitter, ExtraSlashesBelongToTheNameBefore) {
    EXPECT_EQ(cutOf("a//b//c"), "a//|b/|c");
    EXPECT_EQ(cutOf("//a/b"), "//|a|b");
    EXPECT_EQ(cutOf("/a///b"), "/|a//|b");
}

TEST(PathSplitter, SlashesAtTheEndBelongToTheFile) {
    EXPECT_EQ(cutOf("/usr/share/"), "/|usr|share/");
    EXPECT_EQ(cutOf("/usr/share///"), "/|usr|share///");
    EXPECT_EQ(cutOf("/usr/"), "/|usr/");
    EXPECT_EQ(cutOf("a/b/"), "a/|b/");
}

TEST(PathSplitter, APathWithoutFoldersIsCutInItself) {
    EXPECT_EQ(cutOf("name"), "n|ame");
    EXPECT_EQ(cutOf(".."), ".|.");
    EXPECT_EQ(cutOf("usr/"), "usr|/");
    EXPECT_EQ(cutOf("usr//"), "usr/|/");
    EXPECT_EQ(cutOf("//"), "/|/");
    EXPECT_EQ(cutOf("\xC3\xA9t\xC3\xA9"), "\xC3\xA9|t\xC3\xA9")
        << "not within a character";
}

TEST(PathSplitter, APathOfOneCharacterHasNoRoot) {
    EXPECT_EQ(cutOf("a"), ".|a");
    EXPECT_EQ(cutOf("/"), ".|/");
    EXPECT_EQ(cutOf("."), ".|.");
    EXPECT_EQ(cutOf("\xF0\x9F\x98\x80"), ".|\xF0\x9F\x98\x80");
    EXPECT_EQ(cutOf("\xFF"), ".|\xFF");
}

TEST(PathSplitter, AFolderOfAnotherPathIsCutOneLevelHigher) {
    EXPECT_EQ(cutsOf({"/a/x/b", "/a/x/b/c"}),
              (Strings{"/|a|x/b", "/|a|x|b|c"}));
    EXPECT_EQ(cutsOf({"/a/x/b/c", "/a/x/b"}), (Strings{"/|a|x|b|c", "/|a|x/b"}))
        << "in either order";
    EXPECT_EQ(cutsOf({"usr/share/doc", "usr/share/doc/a/b"}),
              (Strings{"usr/|share/doc", "usr/|share|doc|a|b"}));
    EXPECT_EQ(cutsOf({"/a/x/b/", "/a/x/b//c"}),
              (Strings{"/|a|x/b/", "/|a|x|b/|c"}));
    EXPECT_EQ(cutsOf({"/a/b/c", "/a/b/c/d", "/a/b/c/d/e"}),
              (Strings{"/|a|b/c", "/|a|b|c/d", "/|a|b|c|d|e"}));
}

TEST(PathSplitter, ANameThatOnlyBeginsAFolderStaysWhereItIs) {
    EXPECT_EQ(cutsOf({"/a/x/b", "/a/x/bc/d", "/a/x/b-/d"}),
              (Strings{"/|a|x|b", "/|a|x|bc|d", "/|a|x|b-|d"}));
    EXPECT_EQ(cutsOf({"/a/x/b", "/a/x/b//d"}),
              (Strings{"/|a|x|b", "/|a|x|b/|d"}));
    EXPECT_EQ(cutsOf({"/a/x/b/", "/a/x/b/d"}),
              (Strings{"/|a|x|b/", "/|a|x|b|d"}));
}

TEST(PathSplitter, AFolderDirectlyBelowTheRootGetsALongerRoot) {
    EXPECT_EQ(cutsOf({"/usr", "/usr/x"}), (Strings{"/u|sr", "/|usr|x"}));
    EXPECT_EQ(cutsOf({"usr/bin", "usr/bin/x"}),
              (Strings{"usr/b|in", "usr/|bin|x"}));
    EXPECT_EQ(cutsOf({"usr", "usr/x"}), (Strings{"u|sr", "usr/|x"}))
        << "has another root anyway";
}

TEST(PathSplitter, OrAShorterOneIfItsNameIsOneCharacter) {
    EXPECT_EQ(cutsOf({"./a", "./a/x"}), (Strings{".|/a", "./|a|x"}));
    EXPECT_EQ(cutsOf({"//a", "//a/x"}), (Strings{"/|/a", "//|a|x"}));
    EXPECT_EQ(cutsOf({"usr//\xC3\xA9", "usr//\xC3\xA9/x"}),
              (Strings{"usr/|/\xC3\xA9", "usr//|\xC3\xA9|x"}));
}

TEST(PathSplitter, OrTheOthersGetALongerRootIfNothingElseIsLeft) {
    EXPECT_EQ(
        cutsOf({"/a", "/a/x", "/a/x/y", "/a/yz/1", "/ab/x", "/b"}),
        (Strings{"/|a", "/a|/x", "/a/|x|y", "/a/|yz|1", "/|ab|x", "/|b"}));
    EXPECT_EQ(cutsOf({"/a", "/a/xyz", "/a/xyz/1"}),
              (Strings{"/|a", "/a/x|yz", "/a/|xyz|1"}));
    EXPECT_EQ(cutsOf({"/a", "/a/b", "/a//b", "/a/"}),
              (Strings{"/|a", "/a/|b", "/|a/|b", "/a|/"}));
    EXPECT_EQ(cutsOf({"/\xC3\xA9/x", "/\xC3\xA9"}),
              (Strings{"/\xC3\xA9/|x", "/|\xC3\xA9"}));
}

// The tables of the class's comment.
TEST(PathSplitter, CutsAsItsTablesSay) {
    const std::vector<std::pair<std::string, std::string>> alone = {
        {"/a/b/c", "/|a|b|c"},   {"//a/b", "//|a|b"}, {"a/b/c", "a/|b|c"},
        {"a//b//c", "a//|b/|c"}, {"/a/b/", "/|a|b/"}, {"a/", "a|/"},
        {"//", "/|/"},           {"name", "n|ame"},   {"a", ".|a"}};
    for (const auto& [path, cut] : alone) EXPECT_EQ(cutOf(path), cut);
    EXPECT_EQ(cutsOf({"/x/y/z", "/x/y/z/a"}),
              (Strings{"/|x|y/z", "/|x|y|z|a"}));
    EXPECT_EQ(cutsOf({"/xyz", "/xyz/a"}), (Strings{"/x|yz", "/|xyz|a"}));
    EXPECT_EQ(cutsOf({"x/y", "x/y/a"}), (Strings{"x|/y", "x/|y|a"}));
    EXPECT_EQ(cutsOf({"/a", "/a/b"}), (Strings{"/|a", "/a/|b"}));
}

TEST(PathSplitter, CountsWhatItKeepsApart) {
    const PathList list = listOf({"/a/b", "/a/b/c", "/a/b", "/z"});
    const PathSplitter splitter(list);
    EXPECT_EQ(splitter.keptApartCount(), 2U);
    EXPECT_TRUE(splitter.isKeptApart(0));
    EXPECT_FALSE(splitter.isKeptApart(1));
    EXPECT_TRUE(splitter.isKeptApart(2));
    EXPECT_FALSE(splitter.isKeptApart(3));
}

// ---- Through the coder ----

std::unique_ptr<HuffmanPathTree> coderOf(const PathSplitter& splitter,
                                         std::size_t batchPaths) {
    auto coder = std::make_unique<HuffmanPathTree>();
    CharacterCounts counts = countCharacters(splitter);
    // A code needs two characters at least.
    for (char16_t filler = u'0'; counts.characters.size() < 2; ++filler) {
        if (counts.characters.find(filler) != std::u16string::npos) continue;
        counts.characters.push_back(filler);
        counts.frequencies.push_back(1);
    }
    coder->deflateHuffman(counts.frequencies.data(), counts.characters);
    BatchReader reader(splitter, batchPaths);
    for (Batch batch; reader.next(batch);) {
        coder->generateCodeAsyncAndAddPaths(batch.folders, batch.files, 2);
    }
    return coder;
}

std::string pathOf(const HuffmanPathTree& coder, Components folder,
                   const Component& file) {
    std::vector<std::u16string> texts;
    for (const Component& component : folder) {
        texts.push_back(coder.generatePathFrom(component));
    }
    std::u16string joined;
    appendFolder(texts, joined);
    joined += coder.generatePathFrom(file);
    std::string path;
    return textToPath(joined, path) ? path : "no path";
}

Strings byNumber(const HuffmanPathTree& coder, std::size_t count) {
    std::vector<double> numbers;
    for (std::size_t i = 1; i <= count; ++i) {
        numbers.push_back(static_cast<double>(i));
    }
    std::vector<Components> folders;
    std::vector<Components> files;
    coder.getPath(folders, files, numbers);
    Strings paths;
    for (std::size_t i = 0; i < folders.size(); ++i) {
        for (const Component& file : files[i]) {
            paths.push_back(pathOf(coder, folders[i], file));
        }
    }
    return paths;
}

Strings iterated(HuffmanPathTree& coder) {
    Strings paths;
    coder.resetPathsToBTree();
    for (Components components; coder.hasNextPathFromBTree();) {
        coder.getNextPathFromBTree(components);
        const Component file = components.back();
        components.pop_back();
        paths.push_back(pathOf(coder, components, file));
    }
    return paths;
}

// A tree's iteration by a naive model: folders are found by text, files are
// always new, children come in the order of their first mention.
class ModelTree {
public:
    void add(const Strings& folder, std::size_t file) {
        Node* node = &top_;
        for (const std::string& name : folder) {
            auto [found, isNew] =
                node->byName.emplace(name, node->children.size());
            if (isNew) node->children.push_back(std::make_unique<Node>());
            node = node->children[found->second].get();
        }
        node->children.push_back(std::make_unique<Node>());
        node->children.back()->file = file;
    }
    std::vector<std::size_t> order() const {
        std::vector<std::size_t> files;
        collect(top_, files);
        return files;
    }

private:
    static constexpr std::size_t none = ~std::size_t{0};
    struct Node {
        std::size_t file = none;
        std::map<std::string, std::size_t> byName;
        std::vector<std::unique_ptr<Node>> children;
    };
    static void collect(const Node& node, std::vector<std::size_t>& files) {
        if (node.file != none) files.push_back(node.file);
        for (const auto& child : node.children) collect(*child, files);
    }
    Node top_;
};

// The list in the order in which the coder iterates it.
Strings inTreeOrder(const PathSplitter& splitter) {
    const PathList& list = splitter.list();
    ModelTree tree;
    for (std::size_t i = 0; i < list.size(); ++i) {
        const PathSplit split = splitter.split(i);
        Strings folder = {std::string(list[i].substr(0, split.rootEnd))};
        forEachFolder(list[i], split, [&](std::string_view name) {
            folder.emplace_back(name);
        });
        tree.add(folder, i);
    }
    Strings paths;
    for (const std::size_t i : tree.order()) paths.emplace_back(list[i]);
    return paths;
}

// True if some path's whole cut is a folder of another path's cut.
bool sharesNodes(const PathSplitter& splitter) {
    std::set<Strings> folders;
    std::vector<Strings> cuts;
    const PathList& list = splitter.list();
    for (std::size_t i = 0; i < list.size(); ++i) {
        const PathSplit split = splitter.split(i);
        Strings cut = {std::string(list[i].substr(0, split.rootEnd))};
        folders.insert(cut);
        forEachFolder(list[i], split, [&](std::string_view name) {
            cut.emplace_back(name);
            folders.insert(cut);
        });
        cut.emplace_back(list[i].substr(split.fileStart));
        cuts.push_back(cut);
    }
    return std::any_of(cuts.begin(), cuts.end(), [&](const Strings& cut) {
        return folders.count(cut) != 0;
    });
}

// The first answer of the coder that is not the list's, or "".
std::string firstDifference(const Strings& paths, std::size_t batchPaths) {
    const PathList list = listOf(paths);
    const PathSplitter splitter(list);
    if (sharesNodes(splitter)) return "a file and a folder share a node";
    const auto coder = coderOf(splitter, batchPaths);
    if (byNumber(*coder, paths.size()) != paths) return "by number";
    if (iterated(*coder) != inTreeOrder(splitter)) return "iterated";

    std::vector<std::uint8_t> form;
    coder->serialize(form, true);
    HuffmanPathTree restored;
    restored.deserialize(form, true);
    restored.inflateHuffman(coder->getTreeString());
    if (byNumber(restored, paths.size()) != paths) return "restored by number";
    if (iterated(restored) != inTreeOrder(splitter)) return "restored iterated";
    return "";
}

// Short paths of few characters, so that many are folders of others, some
// occur several times, and every place of a slash occurs.
rc::Gen<Strings> crowdedLists() {
    return rc::gen::nonEmpty(rc::gen::container<Strings>(rc::gen::resize(
        12, rc::gen::nonEmpty(rc::gen::container<std::string>(rc::gen::element(
                '/', '/', '/', 'a', 'b', '.', '\xC3', '\xA9'))))));
}

RC_GTEST_PROP(PathSplitter, CrowdedListsComeBackFromTheCoder, ()) {
    const Strings paths = *crowdedLists();
    const auto batchPaths = *rc::gen::inRange<std::size_t>(1, 20);
    RC_ASSERT(firstDifference(paths, batchPaths).empty());
}

TEST(PathSplitter, EveryPairOfShortPathsComesBack) {
    Strings all;
    const std::string letters = "/ab";
    for (std::size_t length = 1; length <= 4; ++length) {
        std::size_t count = 1;
        for (std::size_t i = 0; i < length; ++i) count *= letters.size();
        for (std::size_t n = 0; n < count; ++n) {
            std::string path;
            for (std::size_t i = 0, rest = n; i < length; ++i) {
                path += letters[rest % letters.size()];
                rest /= letters.size();
            }
            all.push_back(path);
        }
    }
    for (const std::string& a : all) {
        for (const std::string& b : all) {
            const PathList list = listOf({a, b, a + '/' + b});
            const PathSplitter splitter(list);
            ASSERT_FALSE(sharesNodes(splitter)) << a << " " << b;
        }
    }
    EXPECT_EQ(firstDifference(all, 7), "") << "all of them in one list";
    std::reverse(all.begin(), all.end());
    EXPECT_EQ(firstDifference(all, 7), "");
}

// A tree of folders as `find` lists it: every folder is a path, too.
Strings foldersAndFiles(const std::string& top) {
    Strings paths = {top};
    const std::string prefix = top == "/" ? top : top + '/';
    for (const std::string a : {"a", "b", "usr", "var"}) {
        paths.push_back(prefix + a);
        for (int b = 0; b < 40; ++b) {
            const std::string folder = prefix + a + '/' + std::to_string(b);
            paths.push_back(folder);
            for (int c = 0; c < 15; ++c) {
                paths.push_back(folder + "/f" + std::to_string(c));
            }
        }
    }
    return paths;
}

TEST(PathSplitter, ListsWithThousandsOfFoldersAsPathsComeBack) {
    Strings everything;
    for (const std::string top : {"/", ".", "rel", "//"}) {
        const Strings paths = foldersAndFiles(top);
        const PathList list = listOf(paths);
        EXPECT_GT(PathSplitter(list).keptApartCount(), 150U) << top;
        EXPECT_EQ(firstDifference(paths, 100), "") << top;
        everything.insert(everything.end(), paths.begin(), paths.end());
    }
    // Chains, in which every path but the last is a folder.
    for (int i = 0; i < 300; ++i) {
        std::string path = "/chain";
        path += std::to_string(i);
        for (int depth = 0; depth < 10; ++depth) {
            path += '/';
            path += std::to_string(depth);
            everything.push_back(path);
        }
    }
    EXPECT_GT(PathSplitter(listOf(everything)).keptApartCount(), 3000U);
    EXPECT_EQ(firstDifference(everything, 5000), "");
    std::shuffle(everything.begin(), everything.end(), std::mt19937(4));
    EXPECT_EQ(firstDifference(everything, 5000), "") << "shuffled";
}

}  // namespace
