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

const Bytes sample = {1, 0, 255, 7};

Bytes copyOf(const ArchiveBytes& bytes) {
    return {bytes.bytes().begin(), bytes.bytes().end()};
}

TEST(ArchiveBytes, KeepsOwnedBytes) {
    Bytes given = sample;
    const ArchiveBytes first{std::move(given)};
    EXPECT_EQ(copyOf(first), sample);
}

TEST(ArchiveBytes, StaysValidWhenMoved) {
    ArchiveBytes first{Bytes(sample)};
    const ArchiveBytes second(std::move(first));
    EXPECT_EQ(copyOf(second), sample);
}

TEST(ArchiveBytes, BorrowsWithoutACopy) {
    const ArchiveBytes bytes{std::span(sample)};
    EXPECT_EQ(bytes.bytes().data(), sample.data());
    EXPECT_EQ(bytes.bytes().size(), sample.size());
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
