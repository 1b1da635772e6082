#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "pathtree/BPathTree.hpp"
#include "pathtree/ComponentArena.hpp"

// Short ways to say what most tests need of a path tree. Components are the
// characters of a text: any bytes will do.
namespace support {

inline tessel::Component component(const std::string& text) {
    return {text.begin(), text.end()};
}

// "name7": distinct names.
inline std::string numbered(const char* prefix, std::size_t number) {
    std::string name = prefix;
    name += std::to_string(number);
    return name;
}

inline tessel::Components components(const std::vector<std::string>& texts) {
    tessel::Components list;
    for (const std::string& text : texts) list.push_back(component(text));
    return list;
}

// The components as a packed list, valid as long as the arena.
inline tessel::ComponentList packedBy(tessel::ComponentArena& arena,
                                      const tessel::Components& list) {
    for (const tessel::Component& value : list) arena.append(value);
    return arena.finish();
}

inline std::string textOf(tessel::ComponentView value) {
    return {value.begin(), value.end()};
}

inline std::vector<std::string> textsOf(const tessel::Components& list) {
    std::vector<std::string> texts;
    for (const tessel::Component& value : list) texts.push_back(textOf(value));
    return texts;
}

// The texts of a node's children.
inline std::vector<std::string> childTexts(const tessel::BNode& node) {
    std::vector<std::string> texts;
    for (std::size_t i = 0; i < node.children().size(); ++i)
        texts.push_back(textOf(node.children()[i].value()));
    return texts;
}

struct WholeAdded {
    bool existed;
    tessel::PathTrack track;
    bool operator==(const WholeAdded&) const = default;
};

inline WholeAdded addWhole(tessel::BPathTree& tree,
                           const std::vector<std::string>& texts) {
    WholeAdded added{};
    tessel::Components path = components(texts);
    added.existed = tree.addPath(path, added.track);
    return added;
}

struct BatchAdded {
    bool existed;
    tessel::PathTrack track;
    std::uint64_t firstFile;
    bool operator==(const BatchAdded&) const = default;
};

inline BatchAdded addBatch(tessel::BPathTree& tree,
                           const std::vector<std::string>& folder,
                           const std::vector<std::string>& files) {
    BatchAdded added{};
    tessel::Components folderComponents = components(folder);
    tessel::Components fileNames = components(files);
    added.existed =
        tree.addPath(folderComponents, fileNames, added.track, added.firstFile);
    return added;
}

// Every path from a reset on, its components joined by slashes.
inline std::vector<std::string> allPaths(tessel::BPathTree& tree) {
    std::vector<std::string> paths;
    tree.reset();
    while (tree.hasNextPath()) {
        tessel::Components path;
        tree.getNextPath(path);
        std::string joined;
        for (std::size_t i = 0; i < path.size(); ++i) {
            if (i > 0) joined += '/';
            joined += textOf(path[i]);
        }
        paths.push_back(joined);
    }
    return paths;
}

}  // namespace support
