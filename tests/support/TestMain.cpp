// Test entry point: every suite starts with the C runtime heap behind the front.
#include <gtest/gtest.h>

#include "TestSupport.h"

int main(int argc, char** argv) {
    ::testing::InitGoogleTest(&argc, argv);
    // Death tests fork; "threadsafe" re-executes so that threads started earlier are safe.
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    zyrtest::installFront(0);
    return RUN_ALL_TESTS();
}
