#include <dlfcn.h>
#include <elf.h>
#include <gtest/gtest.h>

#include <cstring>
#include <fstream>
#include <iterator>
#include <set>
#include <string>
#include <vector>

// The plug-in's file: which symbols it gives and takes.
namespace {

// The dynamic symbols of an ELF file of this machine's own kind.
class DynamicSymbols {
public:
    explicit DynamicSymbols(const std::string& file) {
        std::ifstream in(file, std::ios::binary);
        bytes_.assign(std::istreambuf_iterator<char>(in), {});
        const auto header = at<Elf64_Ehdr>(0);
        for (std::size_t i = 0; i < header.e_shnum; ++i) {
            const auto section =
                at<Elf64_Shdr>(header.e_shoff + i * sizeof(Elf64_Shdr));
            if (section.sh_type == SHT_DYNSYM) read(section, header);
        }
    }

    std::set<std::string> defined;
    std::set<std::string> undefined;

private:
    template <class Record>
    Record at(std::size_t offset) const {
        Record record;
        std::memcpy(&record, bytes_.data() + offset, sizeof record);
        return record;
    }

    void read(const Elf64_Shdr& section, const Elf64_Ehdr& header) {
        const auto names = at<Elf64_Shdr>(header.e_shoff +
                                          section.sh_link * sizeof(Elf64_Shdr));
        for (std::size_t offset = sizeof(Elf64_Sym); offset < section.sh_size;
             offset += sizeof(Elf64_Sym)) {
            const auto symbol = at<Elf64_Sym>(section.sh_offset + offset);
            const std::string name =
                bytes_.data() + names.sh_offset + symbol.st_name;
            (symbol.st_shndx == SHN_UNDEF ? undefined : defined).insert(name);
        }
    }

    std::vector<char> bytes_;
};

}  // namespace

TEST(Exports, AreTheTwoEntryPointsAndNothingElse) {
    const DynamicSymbols symbols(QZTESSEL_PLUGIN);
    EXPECT_EQ(symbols.defined,
              (std::set<std::string>{"VXInitialize_libqztessel",
                                     "VXTerminate_libqztessel"}));
}

TEST(Exports, HostInterfaceIsWantedFromTheProcess) {
    EXPECT_EQ(
        DynamicSymbols(QZTESSEL_PLUGIN).undefined.count("VXHostInterface"), 1U);
}

// The plug-in in a process that is no host: this one.

TEST(NoHost, LoaderRefusesThePluginAtOnce) {
    for (const int mode : {RTLD_NOW, RTLD_LAZY, RTLD_NOW | RTLD_GLOBAL}) {
        void* const handle = dlopen(QZTESSEL_PLUGIN, mode);
        EXPECT_EQ(handle, nullptr);
        const char* const error = dlerror();
        const std::string reason = error == nullptr ? "" : error;
        EXPECT_NE(reason.find("undefined symbol: VXHostInterface"),
                  std::string::npos)
            << reason;
    }
}
