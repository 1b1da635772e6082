// The stand-in for a fuzzing engine: runs the target once on every file of
// the folders named on the command line, in the order of their names.
#include <algorithm>
#include <cstdint>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <vector>

#include "fuzz/Input.hpp"

namespace {

std::vector<std::filesystem::path> filesOf(const char* folder) {
    std::vector<std::filesystem::path> files;
    for (const auto& entry : std::filesystem::directory_iterator(folder))
        if (entry.is_regular_file()) files.push_back(entry.path());
    std::sort(files.begin(), files.end());
    return files;
}

void replay(const std::filesystem::path& file) {
    std::ifstream in(file, std::ios::binary);
    const std::vector<char> text((std::istreambuf_iterator<char>(in)),
                                 std::istreambuf_iterator<char>());
    if (!in.is_open())
        throw std::filesystem::filesystem_error(
            "cannot read", file, std::make_error_code(std::errc::io_error));
    const std::vector<std::uint8_t> bytes(text.begin(), text.end());
    LLVMFuzzerTestOneInput(bytes.data(), bytes.size());
}

}  // namespace

int main(int count, char** arguments) {
    std::size_t replayed = 0;
    try {
        for (int i = 1; i < count; ++i) {
            for (const auto& file : filesOf(arguments[i])) {
                std::cout << file << std::endl;
                replay(file);
                ++replayed;
            }
        }
    } catch (const std::exception& failure) {
        std::cerr << "failed: " << failure.what() << '\n';
        return 1;
    }
    std::cout << replayed << " inputs replayed\n";
    return replayed == 0 ? 1 : 0;
}
