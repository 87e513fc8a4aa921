// Timing: calibration, accumulators, nested stop watches, the named list and the
// measurement lines.
#include <gtest/gtest.h>

#include <chrono>
#include <cstring>
#include <regex>
#include <string>

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

TEST(ZYRTimingTest, CalibrationGivesPlausibleRatesAndConstructTimes) {
    calibrateOnce();
    const long long perSec = ZYRTimingManager::GetClocksPerSec();
    if (ZYRTimingManager::UsesTimeStampCounter()) {
        // Any processor of this century ticks between 100 MHz and 10 GHz.
        EXPECT_GT(perSec, 100000000LL);
        EXPECT_LT(perSec, 10000000000LL);
    } else {
        EXPECT_EQ(perSec, 1000000000LL);
    }
    EXPECT_GE(ZYRTimingManager::GetAvgInnerConstructTime(), 0);
    // A stop watch costs well under a millisecond.
    EXPECT_LT(ZYRTimingManager::GetAvgInnerConstructTime(), perSec / 1000);
    EXPECT_LT(ZYRTimingManager::GetAvgOuterConstructTime(), perSec / 1000);
}

TEST(ZYRTimingTest, FreshAccumulatorIsEmpty) {
    calibrateOnce();
    const ZYRTimeAccumulator acc("fresh", "file.cpp", 12);
    EXPECT_EQ(acc.GetCurrentTotalTime(), 0.0);
    EXPECT_EQ(acc.GetTotalCalls(), 0);
    EXPECT_STREQ(acc.GetTimerName(), "fresh");
    EXPECT_STREQ(acc.GetSourceFile(), "file.cpp");
    EXPECT_EQ(acc.GetSourceLine(), 12);
}

TEST(ZYRTimingTest, StopWatchMeasuresInSeconds) {
    calibrateOnce();
    ZYRTimeAccumulator acc("", __FILE__, __LINE__);
    const auto start = std::chrono::steady_clock::now();
    {
        ZYRStopWatch watch(acc);
        ThreadSleep(30);
    }
    const double outside = secondsSince(start);
    EXPECT_EQ(acc.GetTotalCalls(), 1);
    EXPECT_GE(acc.GetCurrentTotalTime(), 0.029);
    EXPECT_LE(acc.GetCurrentTotalTime(), outside + 0.002);
}

TEST(ZYRTimingTest, SequentialPassesAddUp) {
    calibrateOnce();
    ZYRTimeAccumulator acc("", __FILE__, __LINE__);
    for (int i = 0; i < 2; ++i) {
        ZYRStopWatch watch(acc);
        ThreadSleep(15);
    }
    EXPECT_EQ(acc.GetTotalCalls(), 2);
    EXPECT_GE(acc.GetCurrentTotalTime(), 0.029);
}

TEST(ZYRTimingTest, NestedPassesCountCallsButOnlyTheOutermostTime) {
    calibrateOnce();
    ZYRTimeAccumulator acc("", __FILE__, __LINE__);
    ZYRTimeAccumulator other("", __FILE__, __LINE__);
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
            // Inner passes have ended but nothing is added before the outermost one ends.
            EXPECT_EQ(acc.GetTotalTicks(), 0);
        }
    }
    const double outside = secondsSince(start);
    EXPECT_EQ(acc.GetTotalCalls(), 3);
    // Counted once: 30 ms; counted per pass it would be 60 ms, more than passed outside.
    EXPECT_GE(acc.GetCurrentTotalTime(), 0.029);
    EXPECT_LE(acc.GetCurrentTotalTime(), outside + 0.002);
    // Another accumulator under the same scopes has its own nesting.
    EXPECT_EQ(other.GetTotalCalls(), 1);
    EXPECT_GE(other.GetCurrentTotalTime(), 0.019);

    // The nesting is back to 0: the next pass adds its time again.
    const long long before = acc.GetTotalTicks();
    {
        ZYRStopWatch d(acc);
        ThreadSleep(5);
    }
    EXPECT_GT(acc.GetTotalTicks(), before);
    EXPECT_EQ(acc.GetTotalCalls(), 4);
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
        const ZYRTimeAccumulator first("first", __FILE__, __LINE__);
        const ZYRTimeAccumulator unnamed("", __FILE__, __LINE__);
        const ZYRTimeAccumulator nullName(nullptr, __FILE__, __LINE__);
        const ZYRTimeAccumulator second("second", __FILE__, __LINE__);
        ASSERT_EQ(ZYRTimingManager::GetNamedAccumulatorCount(), base + 2);
        EXPECT_EQ(ZYRTimingManager::GetNamedAccumulator(base), &first);
        EXPECT_EQ(ZYRTimingManager::GetNamedAccumulator(base + 1), &second);
        EXPECT_EQ(ZYRTimingManager::GetNamedAccumulator(base + 2), nullptr);
        EXPECT_EQ(countNamed(&unnamed), 0u);
        EXPECT_EQ(countNamed(&nullName), 0u);
    }
    // A dead accumulator never stays in the list.
    EXPECT_EQ(ZYRTimingManager::GetNamedAccumulatorCount(), base);

    const ZYRTimeAccumulator kept("kept", __FILE__, __LINE__);
    EXPECT_EQ(countNamed(&kept), 1u);
    ZYRTimingManager::Terminate();
    EXPECT_EQ(ZYRTimingManager::GetNamedAccumulatorCount(), 0u);
    // Destroying an accumulator the list no longer holds is harmless.
}

TEST(ZYRTimingTest, MeasurementLinesHaveTheirFormats) {
    calibrateOnce();
    const std::string accuracy = ZYRTimingManager::GetTimerAccuracyLine();
    EXPECT_TRUE(std::regex_match(accuracy,
                                 std::regex("\nTimer Accuracy -- [0-9]+\\.[0-9]{3} percent of the "
                                            "time of memset on 1000 bytes\nClocks Per Second -- "
                                            "[0-9.e+]+\n\\*{14}\n")))
        << accuracy;
    const std::string bus = ZYRTimingManager::GetBusSpeedLine();
    EXPECT_TRUE(std::regex_match(bus, std::regex("\nMeasured Bus Speed \\(using SIMD 'movntps'\\) "
                                                 "-- [1-9][0-9]* million bytes per second")) ||
                bus == "\nMeasured Bus Speed (using SIMD 'movntps') -- unavailable -- 'movntps' "
                       "unimplemented")
        << bus;
    const std::string cache = ZYRTimingManager::GetCacheSpeedLine();
    EXPECT_TRUE(std::regex_match(cache, std::regex("\nMeasured Cache Memory Speed \\(using \"C\" "
                                                   "loop\\) -- [1-9][0-9]* million bytes per "
                                                   "second")))
        << cache;
    // Measured once: later calls give the same text.
    EXPECT_EQ(ZYRTimingManager::GetBusSpeedLine(), ZYRTimingManager::GetBusSpeedLine());
}

TEST(ZYRTimingTest, ClockSleepAndCounter) {
    long long t0 = 0;
    long long t1 = 0;
    ZYRStopWatch::ReadTimeStampCounter32(&t0);
    const int c0 = Clock();
    ThreadSleep(0);
    ThreadSleep(-5);
    const auto start = std::chrono::steady_clock::now();
    ThreadSleep(20);
    EXPECT_GE(secondsSince(start), 0.020);
    const int c1 = Clock();
    ZYRStopWatch::ReadTimeStampCounter32(&t1);
    EXPECT_GE(c1 - c0, 20);
    EXPECT_GT(t1, t0);
    ZYRStopWatch::ReadTimeStampCounter32(nullptr); // no write through null
}

} // namespace
