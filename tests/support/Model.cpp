#include "tests/support/Model.hpp"

#include <algorithm>
#include <cmath>
#include <functional>

namespace model {

using support::append;
using support::hex;
using support::littleEndian;
using support::u64;

// ---- The tree ----

namespace {

// Position of the first child that equals the value; a new last child if
// there is none.
std::uint64_t childFor(Node& parent, const Bytes& value, bool& existed) {
    for (std::size_t i = 0; i < parent.children.size(); ++i) {
        if (parent.children[i]->value == value) {
            existed = true;
            return i;
        }
    }
    existed = false;
    parent.children.push_back(std::make_shared<Node>(Node{value, {}}));
    return parent.children.size() - 1;
}

// visit(node, its path, has it children, is it the last child)
using Visitor =
    std::function<void(const Node&, const Path&, bool folder, bool last)>;

void walk(const Node& parent, Path& prefix, const Visitor& visit) {
    for (std::size_t i = 0; i < parent.children.size(); ++i) {
        const Node& node = *parent.children[i];
        prefix.push_back(node.value);
        visit(node, prefix, !node.children.empty(),
              i + 1 == parent.children.size());
        walk(node, prefix, visit);
        prefix.pop_back();
    }
}

std::shared_ptr<Node> deepCopyOf(const Node& node) {
    auto copy = std::make_shared<Node>(Node{node.value, {}});
    for (const auto& child : node.children)
        copy->children.push_back(deepCopyOf(*child));
    return copy;
}

}  // namespace

bool Tree::addWhole(const Path& path, Track& track) {
    bool existed = false;
    Node* node = root.get();
    for (const Bytes& component : path) {
        const std::uint64_t position = childFor(*node, component, existed);
        if (existed) track.push_back(position);
        node = node->children[position].get();
    }
    return existed;
}

bool Tree::addBatch(const Path& folder, const Path& files, Track& track,
                    std::uint64_t& firstFile) {
    bool existed = false;
    Node* node = root.get();
    for (const Bytes& component : folder) {
        const std::uint64_t position = childFor(*node, component, existed);
        track.push_back(position);
        node = node->children[position].get();
    }
    firstFile = existed ? node->children.size() : noPosition;
    for (const Bytes& file : files)
        node->children.push_back(std::make_shared<Node>(Node{file, {}}));
    return existed;
}

std::vector<Path> Tree::paths() const {
    std::vector<Path> all;
    Path prefix;
    walk(*root, prefix,
         [&all](const Node&, const Path& path, bool folder, bool) {
             if (!folder) all.push_back(path);
         });
    return all;
}

std::optional<Path> Tree::follow(const Track& track) const {
    Path path;
    const Node* node = root.get();
    for (const std::uint64_t position : track) {
        if (position >= node->children.size()) return {};
        node = node->children[position].get();
        path.push_back(node->value);
    }
    return path;
}

bool Tree::lookUp(const Track& track, const std::vector<std::uint64_t>& offsets,
                  Found& found) const {
    Path folderPath;
    const Node* parent = root.get();
    const Node* end = root.get();
    for (const std::uint64_t position : track) {
        if (position >= end->children.size()) return false;
        parent = end;
        end = end->children[position].get();
        folderPath.push_back(end->value);
    }
    const Node* folder = end;
    std::uint64_t base = 0;
    if (end->children.empty()) {
        if (track.empty()) return false;
        folderPath.pop_back();
        folder = parent;
        base = track.back();
    }
    Path files;
    for (const std::uint64_t offset : offsets) {
        const std::uint64_t position = base - 1 + offset;
        if (position >= folder->children.size()) return false;
        files.push_back(folder->children[position]->value);
    }
    found.folders.push_back(folderPath);
    found.files.push_back(files);
    return true;
}

std::uint64_t Tree::store(Bytes& codes, Path& values) const {
    std::uint64_t most = root->children.size();
    Path prefix;
    walk(*root, prefix,
         [&](const Node& node, const Path&, bool folder, bool last) {
             most = std::max<std::uint64_t>(most, node.children.size());
             values.push_back(node.value);
             codes.push_back(
                 static_cast<std::uint8_t>((folder ? 1 : 0) + (last ? 0 : 2)));
         });
    return most;
}

Tree Tree::deepCopy() const { return {deepCopyOf(*root)}; }

// ---- Encoding and adding ----

Encoded Coder::encodeText(const std::u16string& text) {
    Encoded encoded = encode(code, text);
    maxCodeBytes = std::max<std::uint64_t>(maxCodeBytes, encoded.bytes.size());
    return encoded;
}

std::optional<Refusal> Coder::addBatches(const std::vector<Texts>& folders,
                                         const std::vector<Texts>& files) {
    std::vector<std::pair<Path, Path>> encoded(folders.size());
    for (std::size_t i = 0; i < folders.size(); ++i) {
        for (const std::u16string& text : folders[i]) {
            const Encoded component = encodeText(text);
            if (component.refusal) return component.refusal;
            encoded[i].first.push_back(component.bytes);
        }
        for (const std::u16string& text : files[i]) {
            const Encoded component = encodeText(text);
            if (component.refusal) return component.refusal;
            encoded[i].second.push_back(component.bytes);
        }
    }
    for (const auto& [folder, names] : encoded) addPartition(folder, names);
    return {};
}

void Coder::addPartition(const Path& folder, const Path& files) {
    Track track;
    std::uint64_t firstFile = 0;
    if (tree.addBatch(folder, files, track, firstFile)) {
        track.push_back(firstFile);
        maxPartitionTrackLength =
            std::max<std::uint64_t>(maxPartitionTrackLength, track.size());
    }
    pathCount += files.size();
    partitionEnds.push_back(pathCount);
    partitionTracks.push_back(track);
}

void Coder::addWhole(const Path& path) {
    ++pathCount;
    Track track;
    if (!tree.addWhole(path, track)) return;
    maxDuplicateTrackLength =
        std::max<std::uint64_t>(maxDuplicateTrackLength, track.size());
    maxDuplicatePathNumber = std::max(maxDuplicatePathNumber, pathCount);
    duplicates[pathCount] = track;
}

// ---- Iteration and lookup ----

void Coder::reset() {
    nextPathNumber = 0;
    pass = tree.paths();
    passed = 0;
}

bool Coder::hasNext() const {
    return duplicates.count(nextPathNumber + 1) > 0 || passed < pass.size();
}

std::optional<Path> Coder::next() {
    ++nextPathNumber;
    const auto repeated = duplicates.find(nextPathNumber);
    if (repeated != duplicates.end()) return tree.follow(repeated->second);
    if (passed == pass.size()) return {};
    return pass[passed++];
}

namespace {

// A number as it is compared with partition ends; nothing if it is none.
std::optional<std::uint64_t> wholeNumber(double value) {
    if (std::isnan(value) || value <= -1) return {};
    if (value >= std::ldexp(1.0, 64)) return noPosition;
    return static_cast<std::uint64_t>(value);
}

std::optional<Found> getByTrack(const Coder& coder,
                                const std::vector<double>& numbers) {
    Found found;
    for (const double value : numbers) {
        const double position = std::trunc(value - 1);
        if (!(position >= 0) ||
            position >= static_cast<double>(coder.partitionTracks.size()))
            return {};
        const auto path = coder.tree.follow(
            coder.partitionTracks[static_cast<std::size_t>(position)]);
        if (!path) return {};
        found.folders.push_back(*path);
    }
    return found;
}

}  // namespace

std::optional<Found> Coder::getPath(const std::vector<double>& numbers) const {
    if (partitionEnds.empty()) {
        if (partitionTracks.empty()) return Found{};
        return getByTrack(*this, numbers);
    }
    Found found;
    std::size_t k = 0;
    std::size_t i = 0;
    while (i < numbers.size()) {
        const std::optional<std::uint64_t> first = wholeNumber(numbers[i]);
        if (!first) return {};
        while (k < partitionEnds.size() && partitionEnds[k] < *first) ++k;
        if (k == partitionEnds.size()) break;
        const std::uint64_t base = k > 0 ? partitionEnds[k - 1] : 0;
        std::vector<std::uint64_t> offsets;
        while (i < numbers.size()) {
            const std::optional<std::uint64_t> number = wholeNumber(numbers[i]);
            if (!number) return {};
            if (*number > partitionEnds[k]) break;
            offsets.push_back(*number - base);
            ++i;
        }
        if (!tree.lookUp(partitionTracks[k], offsets, found)) return {};
    }
    return found;
}

// ---- The stored form ----

std::uint8_t widthCode(std::uint64_t n) {
    if (n < 0x100) return 0;
    if (n < 0x10000) return 1;
    return n < 0x100000000 ? 2 : 3;
}

unsigned widthBytes(std::uint64_t n) { return 1U << widthCode(n); }

namespace {

struct TrackWidths {
    std::uint64_t position;  // the largest
    std::uint64_t length;    // the longest
};

void widen(TrackWidths& widths, const Track& track) {
    widths.length = std::max<std::uint64_t>(widths.length, track.size());
    for (const std::uint64_t position : track)
        widths.position = std::max(widths.position, position);
}

Bytes trackBytes(const Track& track, const TrackWidths& widths) {
    Bytes bytes = littleEndian(track.size(), widthBytes(widths.length));
    for (const std::uint64_t position : track)
        append(bytes, littleEndian(position, widthBytes(widths.position)));
    return bytes;
}

void appendTree(const Coder& coder, const Bytes& codes, const Path& values,
                Bytes& payload) {
    const Bytes shape = packBits(coder.code.shape);
    append(payload, u64(shape.size()));
    append(payload, shape);
    append(payload, u64(codes.size()));
    append(payload, codes);
    append(payload, u64(values.size()));
    std::uint64_t longest = coder.maxCodeBytes;
    for (const Bytes& value : values)
        longest = std::max<std::uint64_t>(longest, value.size());
    payload.push_back(widthCode(longest));
    for (const Bytes& value : values) {
        append(payload, littleEndian(value.size(), widthBytes(longest)));
        append(payload, value);
    }
}

void appendPartitions(const Coder& coder, std::uint64_t mostChildren,
                      Bytes& payload) {
    std::uint64_t largestEnd = coder.pathCount;
    for (const std::uint64_t end : coder.partitionEnds)
        largestEnd = std::max(largestEnd, end);
    TrackWidths widths{mostChildren, coder.maxPartitionTrackLength};
    for (const Track& track : coder.partitionTracks) widen(widths, track);

    payload.push_back(1);
    payload.push_back(widthCode(largestEnd));
    payload.push_back(widthCode(coder.partitionEnds.size()));
    append(payload, littleEndian(coder.partitionEnds.size(),
                                 widthBytes(coder.partitionEnds.size())));
    for (const std::uint64_t end : coder.partitionEnds)
        append(payload, littleEndian(end, widthBytes(largestEnd)));
    append(payload, u64(coder.partitionTracks.size()));
    payload.push_back(widthCode(widths.position));
    payload.push_back(widthCode(widths.length));
    for (const Track& track : coder.partitionTracks)
        append(payload, trackBytes(track, widths));
}

}  // namespace

Form Coder::form() const {
    Bytes codes;
    Path values;
    const std::uint64_t mostChildren = tree.store(codes, values);
    Bytes payload;
    appendTree(*this, codes, values, payload);
    if (!partitionTracks.empty())
        appendPartitions(*this, mostChildren, payload);

    Form form;
    if (!duplicates.empty()) {
        TrackWidths widths{mostChildren, maxDuplicateTrackLength};
        for (const auto& [number, track] : duplicates) widen(widths, track);
        payload.push_back(0);
        payload.push_back(widthCode(widths.position));
        payload.push_back(widthCode(widths.length));
        payload.push_back(widthCode(maxDuplicatePathNumber));
        form.numberBytes = widthBytes(maxDuplicatePathNumber);
        for (const auto& [number, track] : duplicates) {
            Bytes& entry = form.entries[number];
            entry = littleEndian(number, form.numberBytes);
            append(entry, trackBytes(track, widths));
        }
    }
    std::uint64_t length = payload.size();
    for (const auto& [number, entry] : form.entries) length += entry.size();
    form.head = u64(length);
    append(form.head, payload);
    return form;
}

Bytes Form::bytes() const {
    Bytes whole = head;
    for (const auto& [number, entry] : entries) append(whole, entry);
    return whole;
}

std::string Form::differenceFrom(const Bytes& bytes) const {
    const std::size_t common = std::min(head.size(), bytes.size());
    for (std::size_t i = 0; i < common; ++i) {
        if (head[i] != bytes[i])
            return "byte " + std::to_string(i) + " differs: expected\n" +
                   hex(head) + "\ngot\n" + hex(bytes);
    }
    if (bytes.size() < head.size())
        return "ends after " + std::to_string(bytes.size()) + " bytes";
    std::map<std::uint64_t, Bytes> awaited = entries;
    std::size_t at = head.size();
    while (at < bytes.size()) {
        std::uint64_t number = 0;
        for (unsigned j = 0; j < numberBytes && at + j < bytes.size(); ++j)
            number |= std::uint64_t{bytes[at + j]} << (8 * j);
        const auto entry = awaited.find(number);
        const std::string place = " at byte " + std::to_string(at);
        if (entry == awaited.end()) return "an unexpected entry" + place;
        if (entry->second.size() > bytes.size() - at ||
            !std::equal(entry->second.begin(), entry->second.end(),
                        bytes.begin() + static_cast<std::ptrdiff_t>(at)))
            return "a wrong entry" + place;
        at += entry->second.size();
        awaited.erase(entry);
    }
    return awaited.empty() ? "" : "an entry is missing";
}

Coder Coder::restored() const {
    Coder back;
    back.code = code;
    back.tree = tree.deepCopy();
    back.duplicates = duplicates;
    back.partitionEnds = partitionEnds;
    back.partitionTracks = partitionTracks;
    Bytes codes;
    Path values;
    tree.store(codes, values);
    for (const Bytes& value : values)
        back.maxCodeBytes =
            std::max<std::uint64_t>(back.maxCodeBytes, value.size());
    for (const Track& track : partitionTracks)
        back.maxPartitionTrackLength =
            std::max<std::uint64_t>(back.maxPartitionTrackLength, track.size());
    for (const auto& [number, track] : duplicates) {
        back.maxDuplicateTrackLength =
            std::max<std::uint64_t>(back.maxDuplicateTrackLength, track.size());
        back.maxDuplicatePathNumber =
            std::max(back.maxDuplicatePathNumber, number);
    }
    back.pathCount =
        partitionEnds.empty() ? tree.leafCount() : partitionEnds.back();
    back.pathCount += duplicates.size();
    return back;
}

}  // namespace model
