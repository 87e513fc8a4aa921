#include <gtest/gtest.h>

#include "TestSupport.h"
#include "zyr/std/values/CZYRCommonUniStrings.h"

int main(int argc, char** argv) {
    ::testing::InitGoogleTest(&argc, argv);
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    zyrtest::installFront(0);
    ZYRStd::InitCommonUniStrings();
    ZYRStd::InitDynamicUniStringCache();
    const int result = RUN_ALL_TESTS();
    ZYRStd::ReleaseDynamicUniStringCache();
    ZYRStd::ReleaseCommonUniStrings();
    return result;
}
