#include <gtest/gtest.h>

#include "archive/ArchiveExceptions.hpp"

namespace tessel {
namespace {

TEST(ArchiveExceptions, DamageSaysWhereAndWhat) {
    const DamagedArchiveException damage(4096, "The checksum does not fit.");
    EXPECT_EQ(damage.offset(), 4096U);
    EXPECT_STREQ(damage.cause(), "The checksum does not fit.");
    EXPECT_STREQ(damage.what(),
                 "The archive is damaged at byte 4096: The checksum does not "
                 "fit.");
}

TEST(ArchiveExceptions, VersionIsNamed) {
    const UnsupportedArchiveVersionException unsupported(9);
    EXPECT_EQ(unsupported.version(), 9U);
    EXPECT_STREQ(unsupported.what(),
                 "The archive has version 9 of the format, which this library "
                 "cannot read.");
}

TEST(ArchiveExceptions, CancellationHasAText) {
    EXPECT_STREQ(CancelledException().what(), "The operation was cancelled.");
}

}  // namespace
}  // namespace tessel
