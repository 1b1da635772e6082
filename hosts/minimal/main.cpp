#include <dlfcn.h>

#include <array>
#include <cstdio>
#include <exception>
#include <initializer_list>
#include <utility>

#include "hosts/minimal/MinimalHost.hpp"

// Usage: qztessel_minimal_host PLUG-IN
//
// Loads the plug-in, keeps one path in an instance of its class, and prints the
// path.

namespace {

using minimal::Array;
using minimal::Class;

constexpr const char* className =
    "velox.io.datastore.internal.fileset.HuffmanPaths";

// An instance: its native object, and the array that refers to it.
class Instance {
public:
    explicit Instance(Class& definition) : array(1), definition_(definition) {
        array.native = definition.info->createNativeObject();
    }
    Instance(const Instance&) = delete;
    Instance& operator=(const Instance&) = delete;
    ~Instance() { definition_.info->destroyNativeObject(array.native); }

    Array array;

private:
    Class& definition_;
};

// The slots of one call. Owns what the method puts into them.
struct Outputs {
    std::array<tessel::HostArray*, 2> slots{};

    Outputs() = default;
    Outputs(const Outputs&) = delete;
    Outputs& operator=(const Outputs&) = delete;
    ~Outputs() {
        for (tessel::HostArray* const slot : slots)
            delete static_cast<Array*>(slot);
    }
    const Array& operator[](std::size_t i) const {
        return *static_cast<const Array*>(slots[i]);
    }
};

void execute(tessel::HostMethodInfo& method, std::int32_t outputCount,
             tessel::HostArray** slots,
             const std::vector<const tessel::HostArray*>& inputs) {
    tessel::HostFrame frame{outputCount, slots,
                            static_cast<std::int32_t>(inputs.size()),
                            inputs.data()};
    method.execute(frame);
}

// Calls a method of an instance, which is the first input.
void call(Class& definition, const char* method, Outputs& outputs,
          std::int32_t outputCount,
          const std::vector<const tessel::HostArray*>& inputs) {
    execute(*definition.methods.at(method), outputCount, outputs.slots.data(),
            inputs);
}

// Calls the constructor. It finds the new instance in the first output slot,
// and the instance stays the caller's.
void construct(Class& definition, Instance& instance,
               const std::vector<const tessel::HostArray*>& inputs) {
    tessel::HostArray* slot = &instance.array;
    execute(*definition.methods.at("HuffmanPaths"), 1, &slot, inputs);
}

Array text(std::u16string_view characters) {
    Array made(characters.size());
    made.text = characters;
    return made;
}

Array column(std::initializer_list<double> numbers) {
    Array made(numbers.size());
    made.doubles = numbers;
    return made;
}

Array cellOf(Array element) {
    Array made(1);
    made.cells.push_back(std::make_unique<Array>(std::move(element)));
    return made;
}

void keepOnePath(Class& definition) {
    Instance instance(definition);

    const Array mode = text(u"frequencies");
    const Array characters = text(u"/abc");
    const Array frequencies = column({4, 3, 2, 1});
    construct(definition, instance, {&mode, &characters, &frequencies});

    const Array folders = cellOf(cellOf(text(u"/")));
    const Array files = cellOf(cellOf(text(u"ab")));
    Outputs none;
    call(definition, "addPaths", none, 0, {&instance.array, &folders, &files});

    const Array numbers = column({1});
    const Array separator = text(u"/");
    Outputs paths;
    call(definition, "getPaths", paths, 1,
         {&instance.array, &numbers, &separator});
    for (const char16_t character : paths[0].cells.at(0)->text)
        std::putchar(static_cast<int>(character));
    std::putchar('\n');
}

void run(const char* plugin) {
    void* const module = dlopen(plugin, RTLD_NOW | RTLD_LOCAL);
    if (module == nullptr) throw minimal::HostError(dlerror());
    void* const entry = dlsym(module, "VXInitialize_libqztessel");
    if (entry == nullptr) throw minimal::HostError(dlerror());
    reinterpret_cast<tessel::HostModuleEntry>(entry)();

    keepOnePath(minimal::theHost().classOf(className));

    minimal::theHost().removeClasses();  // their code is in the plug-in
    dlclose(module);
}

}  // namespace

int main(int argumentCount, char** arguments) {
    if (argumentCount != 2) {
        std::fputs("Usage: qztessel_minimal_host PLUG-IN\n", stderr);
        return 2;
    }
    try {
        run(arguments[1]);
        return 0;
    } catch (const std::exception& error) {
        // If it is the plug-in's own, its text is in the plug-in, which is
        // still loaded here.
        std::fprintf(stderr, "%s\n", error.what());
        return 1;
    }
}
