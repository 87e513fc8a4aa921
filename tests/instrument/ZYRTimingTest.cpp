#include <gtest/gtest.h>

#include <chrono>
#include <regex>

#include "zyr/std/instrument/ZYRTimingManager.h"

using namespace ZYRStd;

namespace {

void calibrateOnce() {
    static const bool calibrated = ZYRTimingManager::Initialize();
    ASSERT_TRUE(calibrated);
}

double secondsSince(std::chrono::steady_clock::time_point start) {
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

TEST(ZYRTimingTest, CalibrationAndMeasurementLines) {
    calibrateOnce();
    const long long perSec = ZYRTimingManager::GetClocksPerSec();
    EXPECT_TRUE(ZYRTimingManager::UsesTimeStampCounter()
                    ? perSec > 100000000LL && perSec < 10000000000LL
                    : perSec == 1000000000LL)
        << perSec;
    EXPECT_TRUE(ZYRTimingManager::GetAvgInnerConstructTime() >= 0 &&
                ZYRTimingManager::GetAvgInnerConstructTime() < perSec / 1000 &&
                ZYRTimingManager::GetAvgOuterConstructTime() < perSec / 1000);

    const std::pair<std::string, const char*> lines[] = {
        {ZYRTimingManager::GetTimerAccuracyLine(),
         "\nTimer Accuracy -- [0-9]+\\.[0-9]{3} percent of the time of memset on 1000 bytes\n"
         "Clocks Per Second -- [0-9.e+]+\n\\*{14}\n"},
        {ZYRTimingManager::GetBusSpeedLine(),
         "\nMeasured Bus Speed \\(using SIMD 'movntps'\\) -- ([1-9][0-9]* million bytes per "
         "second|unavailable -- 'movntps' unimplemented)"},
        {ZYRTimingManager::GetCacheSpeedLine(),
         "\nMeasured Cache Memory Speed \\(using \"C\" loop\\) -- [1-9][0-9]* million bytes "
         "per second"}};
    for (const auto& [line, pattern] : lines)
        EXPECT_TRUE(std::regex_match(line, std::regex(pattern))) << line;
    EXPECT_EQ(ZYRTimingManager::GetBusSpeedLine(), ZYRTimingManager::GetBusSpeedLine())
        << "measured once";
}

// Nested watches on one accumulator add the outermost pass only, though every pass counts.
TEST(ZYRTimingTest, StopWatchesAddTheOutermostPasses) {
    calibrateOnce();
    ZYRTimeAccumulator acc("", __FILE__, __LINE__), other("", __FILE__, __LINE__);
    EXPECT_TRUE(acc.GetTotalCalls() == 0 && acc.GetCurrentTotalTime() == 0.0);
    const auto start = std::chrono::steady_clock::now();
    {
        ZYRStopWatch a(acc);
        ThreadSleep(10);
        {
            ZYRStopWatch b(acc);
            ZYRStopWatch unrelated(other);
            ThreadSleep(10);
            {
                ZYRStopWatch c(acc);
                ThreadSleep(10);
            }
            EXPECT_EQ(acc.GetTotalTicks(), 0) << "nothing added before the outermost ends";
        }
    }
    const double outside = secondsSince(start);
    EXPECT_TRUE(acc.GetTotalCalls() == 3 && acc.GetCurrentTotalTime() >= 0.029 &&
                acc.GetCurrentTotalTime() <= outside + 0.002)
        << acc.GetCurrentTotalTime() << " of " << outside;
    EXPECT_TRUE(other.GetTotalCalls() == 1 && other.GetCurrentTotalTime() >= 0.019);
    const long long before = acc.GetTotalTicks();
    {
        ZYRStopWatch d(acc);
        ThreadSleep(5);
    }
    EXPECT_GT(acc.GetTotalTicks(), before + 1) << "the nesting is back to 0";
}

unsigned int countNamed(const ZYRTimeAccumulator* wanted) {
    unsigned int count = 0;
    for (unsigned int i = 0; i < ZYRTimingManager::GetNamedAccumulatorCount(); ++i)
        count += ZYRTimingManager::GetNamedAccumulator(i) == wanted;
    return count;
}

TEST(ZYRTimingTest, NamedAccumulatorsAreListedInOrderAndLeaveOnDestruction) {
    const unsigned int base = ZYRTimingManager::GetNamedAccumulatorCount();
    {
        const ZYRTimeAccumulator first("first", __FILE__, __LINE__),
            unnamed("", __FILE__, __LINE__), nullName(nullptr, __FILE__, __LINE__),
            second("second", __FILE__, __LINE__);
        ASSERT_EQ(ZYRTimingManager::GetNamedAccumulatorCount(), base + 2);
        EXPECT_TRUE(ZYRTimingManager::GetNamedAccumulator(base) == &first &&
                    ZYRTimingManager::GetNamedAccumulator(base + 1) == &second &&
                    !ZYRTimingManager::GetNamedAccumulator(base + 2));
        EXPECT_EQ(countNamed(&unnamed) + countNamed(&nullName), 0u);
    }
    EXPECT_EQ(ZYRTimingManager::GetNamedAccumulatorCount(), base) << "no dead accumulator stays";
    const ZYRTimeAccumulator kept("kept", __FILE__, __LINE__);
    ASSERT_EQ(countNamed(&kept), 1u);
    ZYRTimingManager::Terminate();
    EXPECT_EQ(ZYRTimingManager::GetNamedAccumulatorCount(), 0u);
}

TEST(ZYRTimingTest, ClockSleepAndCounter) {
    long long t0 = 0, t1 = 0;
    ZYRStopWatch::ReadTimeStampCounter32(&t0);
    const int c0 = Clock();
    const auto start = std::chrono::steady_clock::now();
    ThreadSleep(0);
    ThreadSleep(-5);
    EXPECT_LT(secondsSince(start), 0.005) << "no sleep for 0 or less";
    ThreadSleep(20);
    ZYRStopWatch::ReadTimeStampCounter32(&t1);
    EXPECT_TRUE(secondsSince(start) >= 0.020 && Clock() - c0 >= 20 && t1 > t0);
    ZYRStopWatch::ReadTimeStampCounter32(nullptr); // no write through null
}

} // namespace
