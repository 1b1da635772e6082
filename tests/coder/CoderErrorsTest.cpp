// What encoding throws: fixed texts, and classes of their own.

#include <gtest/gtest.h>

#include <stdexcept>
#include <type_traits>

#include "coder/CoderErrors.hpp"

namespace {

TEST(CoderErrors, HaveFixedTexts) {
    EXPECT_STREQ(tessel::NoCodeForEmptyString().what(),
                 "No code for an empty string.");
    EXPECT_STREQ(tessel::CodeNotFoundException().what(),
                 "Code for the character not found.");
}

TEST(CoderErrors, AreNothingButExceptions) {
    using tessel::CodeNotFoundException;
    using tessel::NoCodeForEmptyString;
    EXPECT_TRUE((std::is_base_of_v<std::exception, CodeNotFoundException>));
    EXPECT_TRUE((std::is_base_of_v<std::exception, NoCodeForEmptyString>));
    EXPECT_FALSE((std::is_base_of_v<std::logic_error, NoCodeForEmptyString>));
    EXPECT_EQ(sizeof(CodeNotFoundException), sizeof(std::exception));
}

}  // namespace
