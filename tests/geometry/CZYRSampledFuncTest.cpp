// Sampled functions resampled to 8 bits.
#include <gtest/gtest.h>

#include <vector>

#include "zyr/std/core/CZYRError.h"
#include "zyr/std/geometry/CZYRSampledFunc.h"

using namespace ZYRStd;

namespace {

struct Collect : IEncodedDataCBProc {
    bool encodedSample(int index, float value) override {
        EXPECT_EQ(index, static_cast<int>(values.size()));
        values.push_back(value);
        return true;
    }
    std::vector<float> values;
};

CZYRSampledFunc<float> function(std::vector<CZYRSampledFunc<float>::Point> points,
                                sZYRRangeT<float> domain, sZYRRangeT<float> range) {
    CZYRSampledFunc<float> f(domain, range);
    f.setPoints(points.data(), static_cast<unsigned int>(points.size()));
    return f;
}

} // namespace

TEST(CZYRSampledFuncTest, LinearFunctionMapsOntoEightBits) {
    Collect out;
    const auto range =
        Caculate8BitEncodedSamples(function({{0, 0}, {1, 1}}, {0, 1}, {0, 1}), 3, out);
    EXPECT_EQ(out.values, (std::vector<float>{0.0f, 127.5f, 255.0f}));
    EXPECT_EQ(range.min, 0.0f);
    EXPECT_EQ(range.max, 255.0f);
}

TEST(CZYRSampledFuncTest, OutsideThePointsTheEndValuesHold) {
    // Points cover 0.25..0.75 of a 0..1 domain; y runs 0.2 -> 0.6 -> 0.4.
    Collect out;
    Caculate8BitEncodedSamples(
        function({{0.25f, 0.2f}, {0.5f, 0.6f}, {0.75f, 0.4f}}, {0, 1}, {0, 1}), 5, out);
    ASSERT_EQ(out.values.size(), 5u);
    EXPECT_FLOAT_EQ(out.values[0], 0.2f * 255);
    EXPECT_FLOAT_EQ(out.values[1], 0.2f * 255);
    EXPECT_FLOAT_EQ(out.values[2], 0.6f * 255);
    EXPECT_FLOAT_EQ(out.values[3], 0.4f * 255);
    EXPECT_FLOAT_EQ(out.values[4], 0.4f * 255);

    // Values beyond the range are clamped.
    Collect clamped;
    Caculate8BitEncodedSamples(function({{0, -1}, {1, 2}}, {0, 1}, {0, 1}), 2, clamped);
    EXPECT_EQ(clamped.values, (std::vector<float>{0.0f, 255.0f}));
}

TEST(CZYRSampledFuncTest, ZeroWidthRangeAndVerticalSteps) {
    Collect out;
    Caculate8BitEncodedSamples(function({{0, 0}, {1, 1}}, {0, 1}, {0.5f, 0.5f}), 5, out);
    EXPECT_EQ(out.values, (std::vector<float>{0, 0, 255, 255, 255}));

    // Two points at the same x: left of it the first y, from it on the second.
    Collect step;
    Caculate8BitEncodedSamples(function({{0.5f, 0}, {0.5f, 1}}, {0, 1}, {0, 1}), 3, step);
    EXPECT_EQ(step.values, (std::vector<float>{0, 255, 255}));
}

TEST(CZYRSampledFuncTest, TooFewPointsAndSampleCounts) {
    Collect none;
    try {
        Caculate8BitEncodedSamples(function({{0, 0}}, {0, 1}, {0, 1}), 4, none);
        ADD_FAILURE() << "one point is not a function";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorBadParam);
        EXPECT_STREQ(e.getMessage(), "invalid index");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRMemBuffer");
    }
    EXPECT_TRUE(none.values.empty());

    const auto f = function({{0, 0}, {1, 1}}, {0.25f, 1}, {0, 1});
    const auto range = Caculate8BitEncodedSamples(f, 0, none);
    EXPECT_TRUE(none.values.empty());
    EXPECT_EQ(range.max, 255.0f);
    Caculate8BitEncodedSamples(f, 1, none);
    EXPECT_EQ(none.values, (std::vector<float>{0.25f * 255}));

    // Copies own their points.
    CZYRSampledFunc<float> copy = f;
    EXPECT_NE(copy.getPoints(), f.getPoints());
    EXPECT_EQ(copy.getPointCount(), 2u);
    EXPECT_EQ(copy.getPoint(1).y, 1.0f);
}
