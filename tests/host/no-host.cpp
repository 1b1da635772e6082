#include <dlfcn.h>
#include <gtest/gtest.h>

#include <string>

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
