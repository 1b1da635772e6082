// Packs a finished list into a file, and reads, searches, extends and verifies
// it there.
//
//   g++ -std=c++20 pack-and-fetch.cpp
//       $(pkg-config --cflags --libs qztessel-archive)
#include <cstdint>
#include <exception>
#include <iostream>
#include <qztessel/PathArchive.hpp>
#include <string>
#include <string_view>

namespace {

const std::string file = "photos.tessel";

std::string photo(int year, int number) {
    return "photos/" + std::to_string(year) + "/" + std::to_string(number) +
           ".jpg";
}

void pack() {
    tessel::ArchiveWriter writer(file);
    for (int year = 2001; year <= 2025; ++year)
        for (int number = 10000; number < 14000; ++number)
            writer.add(photo(year, number));
    writer.finish();
}

void readByNumber() {
    const auto archive = tessel::PathArchive::open(file);
    std::cout << archive.size() << " paths, the last is "
              << archive[archive.size() - 1] << '\n';

    std::string path;  // its memory is used again and again
    for (const std::uint64_t number : {99'999U, 0U, 50'000U}) {
        archive.read(number, path);
        std::cout << number << ' ' << path << '\n';
    }

    std::uint64_t bytes = 0;
    archive.forEach(
        [&](std::uint64_t, std::string_view each) { bytes += each.size(); });
    std::cout << bytes << " bytes of text\n";
}

void search() {
    const auto archive = tessel::PathArchive::open(file);
    if (const auto number = archive.numberOf("photos/2011/10007.jpg"))
        std::cout << "number " << *number << '\n';
    std::cout << archive.contains("photos/2026/10007.jpg") << '\n';

    for (const std::uint64_t number : archive.find({"2011/", "777."}))
        std::cout << archive[number] << '\n';

    for (const auto& [begin, end] : archive.folder("photos/2025"))
        std::cout << end - begin << " paths from number " << begin << '\n';
}

void append() {
    auto writer = tessel::ArchiveWriter::append(file);
    writer.add("photos/2026/10000.jpg");
    writer.finish();

    const auto archive = tessel::PathArchive::open(file);
    archive.verify();  // throws DamagedArchiveException
    std::cout << archive.size() << " paths, undamaged\n";
}

}  // namespace

int main() {
    try {
        pack();
        readByNumber();
        search();
        append();
        return 0;
    } catch (const std::exception& failure) {
        std::cerr << failure.what() << '\n';
        return 1;
    }
}
