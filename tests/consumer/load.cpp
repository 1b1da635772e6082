// Usage: load PLUG-IN
//
// Loads the installed plug-in into a process that is no host: the loader must
// name the symbol that is missing, and nothing else may be wrong.
#include <dlfcn.h>

#include <iostream>
#include <string>

int main(int, char** arguments) {
    if (dlopen(arguments[1], RTLD_NOW) != nullptr) {
        std::cerr << "a process without a host could load the plug-in\n";
        return 1;
    }
    const std::string reason = dlerror();
    std::cout << reason << '\n';
    const bool isExpected =
        reason.find("undefined symbol: VXHostInterface") != std::string::npos;
    return isExpected ? 0 : 1;
}
