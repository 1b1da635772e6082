#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <string>
#include <utility>
#include <vector>

#include "archive/ArchiveBytes.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

const Bytes fileSample = {1, 0, 255, 7};

Bytes copyOf(const ArchiveBytes& bytes) {
    return {bytes.bytes().begin(), bytes.bytes().end()};
}

TEST(ArchiveBytes, KeepsOwnedBytes) {
    Bytes given = fileSample;
    const ArchiveBytes first{std::move(given)};
    EXPECT_EQ(copyOf(first), fileSample);
}

TEST(ArchiveBytes, StaysValidWhenMoved) {
    ArchiveBytes first{Bytes(fileSample)};
    const ArchiveBytes second(std::move(first));
    EXPECT_EQ(copyOf(second), fileSample);
}

TEST(ArchiveBytes, BorrowsWithoutACopy) {
    const ArchiveBytes bytes{std::span(fileSample)};
    EXPECT_EQ(bytes.bytes().data(), fileSample.data());
    EXPECT_EQ(bytes.bytes().size(), fileSample.size());
}

TEST(ArchiveBytes, ShowsAMappedFile) {
    const auto file = std::filesystem::temp_directory_path() /
                      ("archive-bytes-" + std::to_string(::getpid()));
    std::ofstream(file, std::ios::binary) << "mapped";
    const ArchiveBytes bytes{FileMapping(file.string())};
    std::filesystem::remove(file);
    EXPECT_EQ(std::string(bytes.bytes().begin(), bytes.bytes().end()),
              "mapped");
}

}  // namespace
}  // namespace tessel::archive
