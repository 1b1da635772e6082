// The order in which equal frequencies merge. Encoded bytes are stored and
// compared, so the code must not depend on anybody's idea of a heap: here it
// is compared with one whose every step is written out.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <cmath>

#include "tests/support/Coders.hpp"
#include "tests/support/Generators.hpp"
#include "tests/support/ReferenceHeap.hpp"

namespace {

using support::CoderPtr;
using tessel::HuffmanPathTree;
using Frequencies = std::vector<double>;

bool sameNumber(double a, double b) {
    return a == b || (std::isnan(a) && std::isnan(b));
}

bool sameNumbers(const Frequencies& a, const Frequencies& b) {
    return std::equal(a.begin(), a.end(), b.begin(), b.end(), sameNumber);
}

// What differs between the built code and the reference's, if anything.
std::string nodeDifference(const HuffmanPathTree& coder,
                           const model::Code& expected) {
    if (coder.rootIndex != expected.root) return "rootIndex";
    if (coder.nodes.size() != expected.nodes.size()) return "nodes.size()";
    for (std::size_t i = 0; i < expected.nodes.size(); ++i) {
        const model::CodeNode& a = expected.nodes[i];
        const tessel::HNode& b = coder.nodes[i];
        if (a.index != b.index || a.left != b.left || a.right != b.right ||
            a.character != b.character || !sameNumber(a.frequency, b.frequency))
            return "node " + std::to_string(i);
    }
    return "";
}

std::string codeDifference(const HuffmanPathTree& coder,
                           const model::Code& expected) {
    if (coder.boolTree != expected.shape) return "boolTree";
    if (coder.treeString != expected.leaves) return "treeString";
    if (!sameNumbers(coder.frequencies, expected.frequencies))
        return "frequencies";
    if (coder.codes.size() != expected.codes.size()) return "codes.size()";
    for (const auto& [character, bits] : expected.codes)
        if (coder.codeOf(character) != bits)
            return "code of " + std::to_string(character);
    return "";
}

std::string difference(const std::u16string& characters,
                       const Frequencies& frequencies) {
    const CoderPtr coder = support::coderWith(characters, frequencies);
    const model::Code expected = model::buildCode(characters, frequencies);
    const std::string inNodes = nodeDifference(*coder, expected);
    return inNodes.empty() ? codeDifference(*coder, expected) : inNodes;
}

std::u16string alphabet(std::size_t size) {
    std::u16string characters;
    for (std::size_t i = 0; i < size; ++i)
        characters.push_back(static_cast<char16_t>(u'a' + i));
    return characters;
}

// All patterns of `size` frequencies out of 0, 1, 2 and 3.
void comparePatterns(std::size_t size) {
    const std::u16string characters = alphabet(size);
    Frequencies frequencies(size, 0);
    for (unsigned pattern = 0; pattern < 1U << (2 * size); ++pattern) {
        for (std::size_t i = 0; i < size; ++i)
            frequencies[i] = (pattern >> (2 * i)) & 3U;
        ASSERT_EQ(difference(characters, frequencies), "")
            << ::testing::PrintToString(frequencies);
    }
}

TEST(HeapDiscipline, AllPatternsOfUpToFourCharacters) {
    for (std::size_t size = 0; size <= 4; ++size) comparePatterns(size);
}

TEST(HeapDiscipline, AllPatternsOfFiveCharacters) { comparePatterns(5); }

TEST(HeapDiscipline, AllPatternsOfSixCharacters) { comparePatterns(6); }

TEST(HeapDiscipline, AllPatternsOfSevenCharacters) { comparePatterns(7); }

// The queue that generateTree takes gives up its nodes in the written order.
TEST(HeapDiscipline, TheQueueGivesUpEqualNodesInTheWrittenOrder) {
    for (unsigned pattern = 0; pattern < 1U << 14; ++pattern) {
        HuffmanPathTree::HeapQueue queue;
        model::ReferenceHeap<tessel::HNode> heap;
        for (unsigned i = 0; i < 7; ++i) {
            tessel::HNode node;
            node.frequency = (pattern >> (2 * i)) & 3U;
            node.index = static_cast<std::int32_t>(i);
            queue.push(node);
            heap.push(node);
        }
        while (!queue.empty()) {
            ASSERT_EQ(queue.top().index, heap.top().index) << pattern;
            queue.pop();
            heap.pop();
        }
        ASSERT_EQ(heap.size(), 0U);
    }
}

RC_GTEST_PROP(HeapDiscipline, ManyCharactersOfAnyFrequency, ()) {
    const auto frequencies =
        *rc::gen::container<Frequencies>(support::anyFrequency());
    RC_ASSERT(difference(alphabet(frequencies.size()), frequencies) == "");
}

RC_GTEST_PROP(HeapDiscipline, HundredsOfFewFrequencies, ()) {
    const auto size = *rc::gen::inRange<std::size_t>(100, 1000);
    const auto kinds = *rc::gen::inRange(1, 5);
    const auto frequencies = *rc::gen::container<Frequencies>(
        size, rc::gen::map(rc::gen::inRange(0, kinds),
                           [](int n) { return static_cast<double>(n); }));
    RC_ASSERT(difference(alphabet(size), frequencies) == "");
}

RC_GTEST_PROP(HeapDiscipline, RepeatedCharacters, ()) {
    const auto characters = *rc::gen::container<std::u16string>(
        rc::gen::inRange<char16_t>(u'a', u'f'));
    const auto frequencies = *rc::gen::container<Frequencies>(
        characters.size(), support::anyFrequency());
    RC_ASSERT(difference(characters, frequencies) == "");
}

}  // namespace
