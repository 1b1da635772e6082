#include <dlfcn.h>
#include <unistd.h>

#include <fstream>

#include "tests/host/HostFixture.hpp"

// Loading, entering and unloading modules.
namespace tessel::embedded {

namespace {

class ModulesTest : public testing::Test {
protected:
    // The key of the error, and its arguments, the file left out.
    std::pair<std::string, std::vector<std::string>> refusal(
        const std::filesystem::path& file) {
        const HostException error = errorOf([&] { host_.loadModule(file); });
        std::vector<std::string> arguments = argumentsOf(error);
        EXPECT_EQ(arguments.front(), file.string());
        arguments.erase(arguments.begin());
        return {error.identifier(), arguments};
    }

    static std::string uniqueName(const std::string& name) {
        return testing::TempDir() + std::to_string(getpid()) + name;
    }

    static bool isMapped(const std::filesystem::path& file) {
        void* const handle =
            dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL | RTLD_NOLOAD);
        if (handle != nullptr) dlclose(handle);
        return handle != nullptr;
    }

    Host host_{testOptions()};
};

}  // namespace

TEST_F(ModulesTest, MissingFileIsReported) {
    const auto [key, arguments] = refusal("/nowhere/libqztessel.so");
    EXPECT_EQ(key, "VELOX:embedded:moduleMissing");
}

TEST_F(ModulesTest, FolderIsReportedAsMissingFile) {
    EXPECT_EQ(refusal(pluginFile().parent_path()).first,
              "VELOX:embedded:moduleMissing");
}

TEST_F(ModulesTest, FileThatIsNoModuleIsReported) {
    const std::string file = uniqueName("libscribble.so");
    std::ofstream(file) << "This is no module.";
    EXPECT_EQ(refusal(file).first, "VELOX:embedded:moduleUnreadable");
    std::filesystem::remove(file);
}

TEST_F(ModulesTest, MissingEntryIsReportedAndModuleUnloaded) {
    const auto [key, arguments] = refusal(QZTESSEL_NO_ENTRY);
    EXPECT_EQ(key, "VELOX:embedded:entryMissing");
    EXPECT_EQ(arguments,
              (std::vector<std::string>{"VXInitialize_libno_entry"}));
    EXPECT_FALSE(isMapped(QZTESSEL_NO_ENTRY));
}

TEST_F(ModulesTest, MissingInterfaceIsReported) {
    const auto [key, arguments] = refusal(QZTESSEL_OTHER_INTERFACE);
    EXPECT_EQ(key, "VELOX:embedded:interfaceMissing");
    EXPECT_NE(arguments.front().find("notOfferedByAnyHost"), std::string::npos);
}

TEST_F(ModulesTest, FailingEntryIsReportedAndLeavesNothing) {
    const auto [key, arguments] = refusal(QZTESSEL_FAILING_ENTRY);
    EXPECT_EQ(key, "VELOX:embedded:entryFailed");
    EXPECT_EQ(arguments,
              (std::vector<std::string>{"This module never starts."}));
    EXPECT_TRUE(host_.classNames().empty());
    EXPECT_FALSE(isMapped(QZTESSEL_FAILING_ENTRY));
}

TEST_F(ModulesTest, LoadingAfterUnloadingWorksAgainAndAgain) {
    for (int round = 0; round < 3; ++round) {
        host_.loadModule(pluginFile());
        EXPECT_TRUE(host_.hasClass(filesetClassName));
        Value instance =
            host_.construct(filesetClassName, Value::text(u"files"),
                            foldersAndFiles(smallListing()));
        instance = Value();
        host_.unloadModule(pluginFile());
        EXPECT_FALSE(host_.hasClass(filesetClassName));
        EXPECT_FALSE(isMapped(pluginFile()));
    }
}

TEST_F(ModulesTest, UnloadingIsRefusedWhileInstancesLive) {
    host_.loadModule(pluginFile());
    Value instance = host_.construct(filesetClassName);
    const Value other = host_.construct(filesetClassName);
    const HostException error =
        errorOf([&] { host_.unloadModule(pluginFile()); });
    EXPECT_EQ(error.identifier(), "VELOX:embedded:moduleInUse");
    EXPECT_EQ(argumentsOf(error).back(), "2");
    EXPECT_EQ(errorOf([&] { host_.removeClasses(pluginFile()); }).identifier(),
              "VELOX:embedded:moduleInUse");
    host_.call(0, instance, "reset");
    instance = Value();
    host_.destroy(other);
    host_.unloadModule(pluginFile());
    EXPECT_FALSE(isMapped(pluginFile()));
}

TEST_F(ModulesTest, UnloadingWhatIsNotLoadedIsReported) {
    EXPECT_EQ(errorOf([&] { host_.unloadModule(pluginFile()); }).identifier(),
              "VELOX:embedded:moduleNotLoaded");
}

TEST_F(ModulesTest, ModuleIsKnownUnderEveryNameOfItsFile) {
    const std::filesystem::path link = uniqueName("plugin-link.so");
    std::filesystem::create_symlink(pluginFile(), link);
    host_.loadModule(link);
    host_.loadModule(pluginFile());
    host_.unloadModule(link);
    EXPECT_FALSE(isMapped(pluginFile()));
    std::filesystem::remove(link);
}

TEST(AlternativeMode, EveryEntryCallRegistersWhatIsMissing) {
    HostOptions options = testOptions();
    options.alternativeMode = true;
    Host host(options);
    host.loadModule(pluginFile());
    host.removeClasses(pluginFile());
    EXPECT_FALSE(host.hasClass(filesetClassName));
    host.loadModule(pluginFile());
    host.loadModule(pluginFile());
    EXPECT_EQ(host.classNames(), (std::vector<std::string>{filesetClassName}));
    EXPECT_TRUE(host.isValid(host.construct(filesetClassName)));
}

TEST(MissingPackage, PluginIsRefusedUntilThePackageIsThere) {
    HostOptions options = testOptions();
    options.packages = {"velox.io.datastore"};
    Host host(options);
    const HostException error = errorOf([&] { host.loadModule(pluginFile()); });
    EXPECT_EQ(error.identifier(), "VELOX:embedded:entryFailed");
    EXPECT_EQ(argumentsOf(error).back(), "The host has no package 'internal'.");
    EXPECT_TRUE(host.classNames().empty());
}

}  // namespace tessel::embedded
