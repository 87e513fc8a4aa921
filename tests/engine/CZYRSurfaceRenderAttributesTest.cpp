// Surface render attributes, raster device attributes, colorant order and stroke parameters.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "EngineFakes.h"
#include "zyr/std/engine/CZYRStrokeParams.h"
#include "zyr/std/engine/CZYRSurfaceRenderAttributes.h"

using namespace ZYRStd;
using namespace zyrtest;

namespace {

CZYRColorantOrderArray colorants(int n) {
    CZYRColorantOrderArray order;
    const char* names[] = {"Cyan", "Magenta", "Yellow", "Black"};
    for (int i = 0; i < n; ++i)
        order.add(names[i], i);
    return order;
}

CZYRRasterDeviceAttributes device(unsigned int components, const CZYRColorantOrderArray& order,
                                  bool thirdFlag = false, CZYRRect rect = {0, 0, 10, 20},
                                  double xRes = 72.0, double yRes = 144.0) {
    return CZYRRasterDeviceAttributes(components, 8, xRes, yRes, rect, 1, {2, 1, 512, 0}, false,
                                      order, 1, 1, false, thirdFlag, CZYRArray());
}

template <class I> void registerItem(CZYRInterfaceRegistry& registry, int id, I* value) {
    registry.registerInterface(new CZYRCRegisterItem<I*>(id, value),
                               ZYRRegisterInterfaceDefaultDeleteProc, true);
}

} // namespace

TEST(CZYRSurfaceRenderAttributesTest, DeviceExtents) {
    const CZYRSurfaceRenderAttributes defaults;
    EXPECT_EQ(defaults.getWidth(), 183600);
    EXPECT_EQ(defaults.getHeight(), 237600);

    const auto narrow = device(0, colorants(0), false, CZYRRect(0, 0, 1.001, 2.0), 1.0, 1.0);
    // Only the surface constructor takes a device; go through it with a full chain.
    auto job = makeJob(CZYRDict());
    CZYRInterfaceRegistry registry;
    auto raster = make<FakeOEM<ZYRPublic::I_OEMRasterInterface>>();
    auto progress = make<FakeProgress>();
    registerItem<ZYRPublic::I_OEMRasterInterface>(registry, kZYRRasterInterfaceID, raster.get());
    registerItem<ZYRPublic::I_OEMProgressInterface>(registry, kZYRProgressInterfaceID,
                                                    progress.get());
    const CZYRSurfaceRenderAttributes one(narrow, makeSurface(9, job), 0, 0, registry, 5);
    EXPECT_EQ(one.getWidth(), 2) << "1.001 pixels round up";
    EXPECT_EQ(one.getHeight(), 2);

    const auto huge = device(0, colorants(0), false, CZYRRect(0, 0, 10, 10), 1e300, std::nan(""));
    const CZYRSurfaceRenderAttributes big(huge, makeSurface(9, job), 0, 0, registry, 5);
    EXPECT_EQ(big.getWidth(), std::numeric_limits<int>::max());
    EXPECT_EQ(big.getHeight(), 0);
}

TEST(CZYRSurfaceRenderAttributesTest, DeviceValidationAndComparison) {
    EXPECT_NO_THROW(device(4, colorants(4)));
    try {
        device(4, colorants(3));
        FAIL() << "4 components, 3 colorants";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorBadParam);
        EXPECT_STREQ(e.getMessage(), "invalid num components in colorant array");
        EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRRasterDeviceAttributes");
        EXPECT_EQ(e.getSrcLineNumber(), 113);
    }
    EXPECT_NO_THROW(device(4, colorants(3), true)) << "the third flag allows it";

    const auto base = device(3, colorants(3));
    EXPECT_TRUE(base == device(3, colorants(3)));
    EXPECT_FALSE(base == device(3, colorants(3), false, CZYRRect(0, 0, 10, 21)));
    CZYRColorantOrderArray renamed = colorants(2);
    renamed.add("Other", 2);
    EXPECT_FALSE(base == device(3, renamed));
    CZYRColorantOrderArray extra = colorants(3);
    extra.setValue(1);
    EXPECT_FALSE(base == device(3, extra));
    EXPECT_FALSE(device(4, colorants(3), true) == device(3, colorants(3), true))
        << "component counts differ";
    CZYRArray longer;
    longer.set(0, 1u);
    EXPECT_FALSE(base == CZYRRasterDeviceAttributes(3, 8, 72.0, 144.0, {0, 0, 10, 20}, 1,
                                                    {2, 1, 512, 0}, false, colorants(3), 1, 1,
                                                    false, false, longer));
    EXPECT_FALSE(base == CZYRRasterDeviceAttributes(3, 8, 72.0, 144.0, {0, 0, 10, 20}, 1,
                                                    {2, 1, 513, 0}, false, colorants(3), 1, 1,
                                                    false, false, CZYRArray()));
    EXPECT_THROW(base.getColorantOrder().getEntry(3), CZYRError);
    EXPECT_STREQ(base.getColorantOrder().getEntry(1).name.c_str(), "Magenta");
}

TEST(CZYRSurfaceRenderAttributesTest, SurfaceConstructorWalksAndLooksUp) {
    FakeProgress* jobHost = nullptr;
    auto job = makeJob(CZYRDict(), &jobHost);
    auto raster = make<FakeOEM<ZYRPublic::I_OEMRasterInterface>>();
    auto progress = make<FakeProgress>();
    CZYRInterfaceRegistry registry;
    registerItem<ZYRPublic::I_OEMRasterInterface>(registry, kZYRRasterInterfaceID, raster.get());

    auto expectError = [](auto&& build, const char* message, int line) {
        try {
            build();
            ADD_FAILURE() << message;
        } catch (const CZYRError& e) {
            EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorInvalidData);
            EXPECT_STREQ(e.getMessage(), message);
            EXPECT_STREQ(e.getSrcFileName(), "source/zyr/std/CZYRSurfaceRenderAttributes");
            EXPECT_EQ(e.getSrcLineNumber(), line);
        }
    };
    const auto dev = device(1, colorants(1));
    expectError([&] { CZYRSurfaceRenderAttributes(dev, makeSurface(3, job), 0, 0, registry, 1); },
                "missing interface", 65);
    registerItem<ZYRPublic::I_OEMProgressInterface>(registry, kZYRProgressInterfaceID,
                                                    progress.get());
    expectError(
        [&] {
            CZYRSurfaceRenderAttributes(dev, makeSurface(3, C_SmartPtr<ZYRPublic::I_Job>()), 0, 0,
                                        registry, 1);
        },
        "miss job", 46);
    expectError(
        [&] {
            CZYRSurfaceRenderAttributes(dev, C_SmartPtr<ZYRPublic::I_Surface>(), 0, 0, registry, 1);
        },
        "miss job", 46);
    CZYRInterfaceRegistry noRaster;
    expectError([&] { CZYRSurfaceRenderAttributes(dev, makeSurface(3, job), 0, 0, noRaster, 1); },
                "missing interface", 57);

    const auto surface = makeSurface(77, job);
    CZYRSurfaceRenderAttributes attrs(dev, surface, kZYRFirstSurface | kZYRFrontSurface,
                                      kZYRTrapInEmulatedColorSpace, registry, 12);
    EXPECT_EQ(attrs.getJob().get(), job.get());
    EXPECT_EQ(attrs.getJobID(), 12u);
    EXPECT_EQ(attrs.getSurfaceID(), 77u);
    EXPECT_EQ(attrs.getOEMRasterInterface().get(), raster.get());
    EXPECT_EQ(attrs.getOEMProgessInterface().get(), progress.get());
    EXPECT_TRUE(attrs.isFirstSurface());
    EXPECT_TRUE(attrs.isFrontSurface());
    EXPECT_FALSE(attrs.isLastSurface());
    EXPECT_FALSE(attrs.useDocumentTransfers());
    EXPECT_TRUE(attrs.trapInEmulatedColorSpace());
    EXPECT_EQ(attrs.getResourceHolder().getNumInterfaces(), 0);
    EXPECT_EQ(attrs.getRasterDeviceAttributes(), dev);

    // Copies compare equal and hold their own references; the resource holder is ignored.
    CZYRSurfaceRenderAttributes copy(attrs);
    EXPECT_TRUE(copy == attrs);
    registerItem<ZYRPublic::I_OEMRasterInterface>(copy.getResourceHolder(), 5, raster.get());
    EXPECT_TRUE(copy == attrs);
    const unsigned int before = raster->debugGetRefCount();
    {
        CZYRSurfaceRenderAttributes third = attrs;
        EXPECT_EQ(raster->debugGetRefCount(), before + 1);
    }
    EXPECT_EQ(raster->debugGetRefCount(), before);
    const CZYRSurfaceRenderAttributes other(dev, surface, kZYRFirstSurface, 0, registry, 12);
    EXPECT_FALSE(other == attrs);
    EXPECT_FALSE(CZYRSurfaceRenderAttributes(dev, makeSurface(77, job), kZYRFirstSurface, 0,
                                             registry, 12) == other)
        << "another surface object";
}

TEST(CZYRSurfaceRenderAttributesTest, EndOfJob) {
    auto job = make<FakeJob>();
    job->id = 4242;
    auto progress = make<FakeProgress>();
    C_Error err;
    err.setError(ZYRPublic::kZYRErrorUnknown, "why", "here", 3);
    const CZYRSurfaceRenderAttributes end(C_SmartPtr<ZYRPublic::I_Job>(job),
                                          C_SmartPtr<ZYRPublic::I_OEMProgressInterface>(progress),
                                          err);
    EXPECT_TRUE(end.endOfJob());
    EXPECT_TRUE(end.isLastSurface());
    EXPECT_FALSE(end.isFirstSurface());
    EXPECT_EQ(end.getJobID(), 4242u);
    EXPECT_EQ(end.getSurfaceID(), 4242u);
    EXPECT_FALSE(end.getOEMRasterInterface());
    EXPECT_EQ(end.getOEMProgessInterface().get(), progress.get());
    EXPECT_STREQ(end.getError().getMessage(), "why");
    EXPECT_EQ(end.getWidth(), 183600);
}

TEST(CZYRSurfaceRenderAttributesTest, StrokeParams) {
    CZYRStrokeParams p;
    const sStrokeParams& s = p.getStrokeParams();
    EXPECT_EQ(s.lineWidth, 1.0f);
    EXPECT_EQ(s.miterLimit, 10.0f);
    EXPECT_EQ(s.dashArray, nullptr);
    EXPECT_EQ(s.lineCap, 2);
    EXPECT_EQ(s.lineJoin, 0);
    p.setLineWidth(-1);
    EXPECT_EQ(s.lineWidth, 0.0f);
    p.setLineWidth(std::nanf(""));
    EXPECT_EQ(s.lineWidth, 0.0f);
    p.setLineWidth(2.5f);
    EXPECT_EQ(s.lineWidth, 2.5f);
    p.setMiterLimit(0.5f);
    EXPECT_EQ(s.miterLimit, 1.0f);
    p.setMiterLimit(4);
    EXPECT_EQ(s.miterLimit, 4.0f);

    const float dashes[] = {3, 1, 2};
    p.setDashedArray(dashes, 3);
    ASSERT_NE(s.dashArray, dashes);
    EXPECT_EQ(s.dashArray[2], 2.0f);
    float* const storage = s.dashArray;
    p.setDashedArray(dashes + 1, 1);
    EXPECT_EQ(s.dashArray, storage) << "the storage never shrinks";
    p.setDashedArray(s.dashArray, 1);
    EXPECT_EQ(s.dashArray[0], 1.0f);
    p.setDashedArray(nullptr, 0);
    EXPECT_EQ(s.dashCount, 0);
    EXPECT_EQ(s.dashArray, storage);
    EXPECT_THROW(p.setDashedArray(dashes, -1), CZYRError);
    EXPECT_THROW(p.setDashedArray(nullptr, 2), CZYRError);

    // Same values in different storage are equal; so are counts of 0.
    CZYRStrokeParams a, b;
    a.setDashedArray(dashes, 3);
    b.setDashedArray(dashes, 3);
    EXPECT_TRUE(a == b);
    const float other[] = {3, 1, 5};
    b.setDashedArray(other, 3);
    EXPECT_FALSE(a == b);
    a.setDashedArray(dashes, 0);
    b.setDashedArray(other, 0);
    EXPECT_TRUE(a == b);
    b.setLineCap(static_cast<eZYRLineCapType>(1));
    EXPECT_FALSE(a == b);

    // A copy owns its dashes.
    CZYRStrokeParams original;
    original.setDashedArray(dashes, 3);
    original.setStrokeAdjust(true);
    CZYRStrokeParams copy(original);
    EXPECT_NE(copy.getStrokeParams().dashArray, original.getStrokeParams().dashArray);
    EXPECT_TRUE(copy == original);
    CZYRStrokeParams assigned;
    assigned = original;
    original.setDashedArray(other, 3);
    EXPECT_EQ(assigned.getStrokeParams().dashArray[2], 2.0f);
    EXPECT_TRUE(assigned.getStrokeParams().strokeAdjust);
    assigned = CZYRStrokeParams();
    EXPECT_EQ(assigned.getStrokeParams().dashArray, nullptr);
    EXPECT_EQ(assigned.getStrokeParams().dashCount, 0);
}
