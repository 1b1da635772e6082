#include "hosts/console/ArchiveFile.hpp"

#include "hosts/console/Failure.hpp"
#include "hosts/console/InputFile.hpp"

namespace tessel::console {

PathArchive openArchive(const std::string& file, const Interrupts& interrupts) {
    InputFile input(file, interrupts);
    return inFile(input.name(), [&] {
        return input.isRegular() && file != "-"
                   ? PathArchive::open(file)
                   : PathArchive::own(input.readAll());
    });
}

}  // namespace tessel::console
