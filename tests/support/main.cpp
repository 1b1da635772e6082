// The tests' main. Properties draw their input from a fixed seed, which is
// printed; set RC_PARAMS ("seed=7 max_success=1000") to replace it.

#include <gtest/gtest.h>

#include <cstdlib>
#include <iostream>
#include <string>

int main(int argc, char** argv) {
    ::testing::InitGoogleTest(&argc, argv);
    const std::string usual =
        "seed=20230610 max_success=" + std::to_string(QZTESSEL_PROPERTY_RUNS);
    setenv("RC_PARAMS", usual.c_str(), 0);
    std::cerr << "RC_PARAMS=\"" << std::getenv("RC_PARAMS") << "\"\n";
    return RUN_ALL_TESTS();
}
