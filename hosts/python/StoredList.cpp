#include "hosts/python/StoredList.hpp"

#include <algorithm>
#include <utility>

#include "hosts/python/Errors.hpp"

namespace tessel::python {

StoredList::Pointer StoredList::open(const std::string& file) {
    return namingArchive(file, [&] {
        return std::make_shared<const StoredList>(file, PathArchive::open(file),
                                                  nullptr);
    });
}

StoredList::Pointer StoredList::own(std::vector<std::uint8_t> bytes) {
    return namingArchive("", [&] {
        return std::make_shared<const StoredList>(
            "", PathArchive::own(std::move(bytes)), nullptr);
    });
}

StoredList::Pointer StoredList::over(std::span<const std::uint8_t> bytes,
                                     std::shared_ptr<const void> keeper) {
    return namingArchive("", [&] {
        return std::make_shared<const StoredList>("", PathArchive::over(bytes),
                                                  std::move(keeper));
    });
}

bool StoredList::hasIndex() const {
    const ArchiveInfo info = archive_.info();
    const auto index =
        std::ranges::find(info.sections, "index", &ArchiveInfo::Section::name);
    return index != info.sections.end() && index->bytes > 0;
}

}  // namespace tessel::python
