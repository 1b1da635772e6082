// Buffers written on another thread: their order, waiting and failures.

#include <gtest/gtest.h>

#include <atomic>
#include <stdexcept>
#include <string>
#include <vector>

#include "hosts/console/BackgroundWriter.hpp"

namespace {

using tessel::console::BackgroundWriter;

TEST(BackgroundWriter, WritesBuffersInTheirOrder) {
    std::string written;
    std::string expected;
    BackgroundWriter writer([&](std::string_view bytes) { written += bytes; });
    for (int i = 0; i < 1000; ++i) {
        std::string buffer = std::to_string(i) + ' ';
        expected += buffer;
        writer.write(buffer);
        EXPECT_EQ(buffer, "");
    }
    writer.wait();
    EXPECT_EQ(written, expected);
}

TEST(BackgroundWriter, WritesOnAThreadOfItsOwn) {
    std::thread::id thread;
    BackgroundWriter writer(
        [&](std::string_view) { thread = std::this_thread::get_id(); });
    std::string buffer = "bytes";
    writer.write(buffer);
    writer.wait();
    EXPECT_NE(thread, std::this_thread::get_id());
    EXPECT_NE(thread, std::thread::id());
}

TEST(BackgroundWriter, GivesThePreviousBufferBack) {
    BackgroundWriter writer([](std::string_view) {});
    std::string first(1000, 'a');
    const char* const memory = first.data();
    std::string second(1000, 'b');
    writer.write(first);
    writer.write(second);
    EXPECT_EQ(second.data(), memory);
}

TEST(BackgroundWriter, ThrowsWhatTheFunctionThrew) {
    int calls = 0;
    BackgroundWriter writer([&](std::string_view) {
        ++calls;
        throw std::runtime_error("full");
    });
    std::string buffer = "bytes";
    writer.write(buffer);
    EXPECT_THROW(writer.wait(), std::runtime_error);
    buffer = "more";
    EXPECT_THROW(writer.write(buffer), std::runtime_error);
    EXPECT_THROW(writer.wait(), std::runtime_error);
    EXPECT_EQ(calls, 1);
}

TEST(BackgroundWriter, EndsAfterTheBufferThatIsBeingWritten) {
    std::atomic<int> calls = 0;
    for (int i = 0; i < 100; ++i) {
        BackgroundWriter writer([&](std::string_view) { ++calls; });
        std::string buffer = "bytes";
        writer.write(buffer);
    }
    EXPECT_EQ(calls, 100);
}

TEST(BackgroundWriter, EndsWithoutABuffer) {
    const BackgroundWriter writer([](std::string_view) { FAIL(); });
}

}  // namespace
