#include "tests/binding/unchecked/UncheckedHostFixture.hpp"

// The module's two entries, in a host that is not there, is of another version,
// or runs in the alternative mode.
namespace unchecked {

TEST(Version, PluginRefusesAHostOfAnotherVersionWithoutTouchingIt) {
    const Plugin plugin;
    // Whoever called an operation through this would crash.
    std::array<unsigned char, 64> poison;
    poison.fill(0xFF);
    Host::gate() = {tessel::hostInterfaceVersion + 1,
                    reinterpret_cast<tessel::HostInterface*>(poison.data())};
    try {
        plugin.initialize();
        ADD_FAILURE() << "the plug-in accepted the host";
    } catch (const std::exception& refusal) {
        EXPECT_STREQ(refusal.what(),
                     "libqztessel needs version 1 of the host interface; this "
                     "host offers version 2.");
    }
    Host::gate() = {tessel::hostInterfaceVersion, nullptr};
}

TEST(Version, PluginRefusesAProcessWhoseHostIsNotThere) {
    const Plugin plugin;
    try {
        plugin.initialize();
        ADD_FAILURE() << "the plug-in accepted no host";
    } catch (const std::exception& refusal) {
        EXPECT_STREQ(refusal.what(), "This process runs no host at present.");
    }
}

TEST_F(UncheckedHostTest, AlternativeModeRegistersOnEveryCallWhatIsMissing) {
    plugin_.initialize();
    EXPECT_EQ(host_.registrations, 1);
    host_.registered.reset();
    plugin_.initialize();
    EXPECT_EQ(host_.registrations, 2);
}

TEST_F(UncheckedHostTest, TerminationDoesNothing) {
    plugin_.call("VXTerminate_libqztessel");
    EXPECT_NE(host_.registered, nullptr);
    EXPECT_EQ(host_.method("reset").name(), std::string("reset"));
}

}  // namespace unchecked
