// What is written to a descriptor, in pieces of every size.

#include <gtest/gtest.h>
#include <unistd.h>

#include <csignal>
#include <fstream>
#include <iterator>
#include <string>
#include <system_error>
#include <thread>

#include "hosts/console/ConsoleException.hpp"
#include "hosts/console/OutputBuffer.hpp"

namespace {

using tessel::console::ClosedPipeException;
using tessel::console::OutputBuffer;

// A pipe whose other end is read to its end on a thread.
class ReadPipe {
public:
    ReadPipe() {
        if (::pipe(ends_) != 0) throw std::runtime_error("no pipe");
        reader_ = std::thread([this] { read(); });
    }
    ReadPipe(const ReadPipe&) = delete;
    ReadPipe& operator=(const ReadPipe&) = delete;
    ~ReadPipe() {
        if (reader_.joinable()) finish();
    }

    int descriptor() const { return ends_[1]; }
    std::string finish() {
        ::close(ends_[1]);
        reader_.join();
        ::close(ends_[0]);
        return text_;
    }

private:
    void read() {
        char bytes[5000];
        for (;;) {
            const ssize_t count = ::read(ends_[0], bytes, sizeof bytes);
            if (count <= 0) return;
            text_.append(bytes, static_cast<std::size_t>(count));
        }
    }

    int ends_[2] = {-1, -1};
    std::string text_;
    std::thread reader_;
};

// Writes pieces of this size until there are so many bytes in all.
std::string writtenInPieces(std::size_t size, std::size_t total) {
    std::string expected;
    ReadPipe pipe;
    OutputBuffer output(pipe.descriptor(), "pipe");
    for (int i = 0; expected.size() < total; ++i) {
        std::string piece = std::to_string(i);
        piece.resize(size, 'x');
        output.write(piece);
        expected += piece;
    }
    output.flush();
    EXPECT_EQ(pipe.finish(), expected) << size;
    return expected;
}

TEST(OutputBuffer, WritesPiecesOfEverySize) {
    for (const std::size_t size : {1U, 7U, 4096U, 262143U, 262144U, 262145U})
        writtenInPieces(size, 1500000);
    writtenInPieces(2000000, 6000000);
}

TEST(OutputBuffer, WritesNothingBeforeItIsFullOrFlushed) {
    ReadPipe pipe;
    {
        OutputBuffer output(pipe.descriptor(), "pipe");
        output.write("lost");
    }
    EXPECT_EQ(pipe.finish(), "");
}

TEST(OutputBuffer, GoesOnAfterAFlush) {
    const std::string large(600000, 'a');
    ReadPipe pipe;
    OutputBuffer output(pipe.descriptor(), "pipe");
    output.flush();
    for (int i = 0; i < 3; ++i) {
        output.write(large.substr(0, 200000));
        output.write(large.substr(0, 400000));
        output.flush();
    }
    EXPECT_EQ(pipe.finish(), large + large + large);
}

TEST(OutputBuffer, FindsTheReaderGone) {
    const auto before = std::signal(SIGPIPE, SIG_IGN);
    int ends[2];
    ASSERT_EQ(::pipe(ends), 0);
    ::close(ends[0]);
    OutputBuffer output(ends[1], "pipe");
    const std::string line(1000, 'a');
    EXPECT_THROW(for (int i = 0; i < 2000; ++i) output.write(line);
                 , ClosedPipeException);
    ::close(ends[1]);
    std::signal(SIGPIPE, before);
}

// The first write succeeds, and those in the background fail.
TEST(OutputBuffer, TellsAFailureInTheBackground) {
    const std::string name = testing::TempDir() + "output-buffer-test";
    FILE* const file = std::fopen(name.c_str(), "w+");
    ASSERT_NE(file, nullptr);
    OutputBuffer output(::fileno(file), "the list");
    const std::string piece(200000, 'a');
    output.write(piece);
    output.write(piece);
    ::fclose(file);
    try {
        for (int i = 0; i < 10; ++i) output.write(piece);
        output.flush();
        FAIL();
    } catch (const std::system_error& error) {
        EXPECT_NE(std::string(error.what()).find("the list"),
                  std::string::npos);
    }
    EXPECT_THROW(output.flush(), std::system_error);
    std::remove(name.c_str());
}

}  // namespace
