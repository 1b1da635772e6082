// How a component stands in a packed list.

#include <gtest/gtest.h>

#include "pathtree/PackedComponent.hpp"

namespace {

namespace packed = tessel::packed;

TEST(PackedComponent, AHeaderIsReadBack) {
    for (const std::size_t length :
         {0U, 1U, 251U, 252U, 253U, 254U, 255U, 256U, 70000U}) {
        tessel::Component bytes(packed::headerBytes(length) + length, 7);
        std::uint8_t* at = packed::writeHeader(bytes.data(), length);
        EXPECT_EQ(at - bytes.data(),
                  static_cast<std::ptrdiff_t>(packed::headerBytes(length)));
        const tessel::ComponentView read = packed::readComponent(bytes.data());
        EXPECT_EQ(read.data(), at);
        EXPECT_EQ(read.size(), length);
    }
    EXPECT_EQ(packed::headerBytes(252), 1U);
    EXPECT_EQ(packed::headerBytes(253), 9U);
}

}  // namespace
