// What the tree throws: fixed texts, and classes of their own.

#include <gtest/gtest.h>

#include <stdexcept>
#include <type_traits>

#include "pathtree/PathTreeErrors.hpp"

namespace {

template <class Error>
const char* textOf() {
    static_assert(std::is_base_of_v<std::exception, Error>);
    static_assert(!std::is_base_of_v<std::logic_error, Error>);
    static_assert(!std::is_base_of_v<std::runtime_error, Error>);
    try {
        throw Error();
    } catch (const std::exception& error) {
        return error.what();
    }
}

TEST(PathTreeErrors, HaveFixedTexts) {
    EXPECT_STREQ(textOf<tessel::NoMorePathException>(),
                 "No more paths to provide.");
    EXPECT_STREQ(textOf<tessel::NoTreeToTraverseException>(),
                 "Cannot traverse an empty tree for a path.");
    EXPECT_STREQ(textOf<tessel::EmptyPathForTraverseException>(),
                 "Cannot traverse an tree for an empty path track.");
    EXPECT_STREQ(textOf<tessel::UnknownNodeTypeException>(),
                 "Cannot determine the node type for the given value.");
}

}  // namespace
