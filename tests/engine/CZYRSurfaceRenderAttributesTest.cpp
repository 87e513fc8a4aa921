#include <gtest/gtest.h>

#include <climits>
#include <cmath>

#include "EngineFakes.h"
#include "TestSupport.h"
#include "zyr/std/engine/CZYRStrokeParams.h"
#include "zyr/std/engine/CZYRSurfaceRenderAttributes.h"

using namespace ZYRStd;
using namespace zyrtest;

namespace {

CZYRColorantOrderArray colorants(int n) {
    static const char* const names[] = {"Cyan", "Magenta", "Yellow", "Black"};
    CZYRColorantOrderArray order;
    for (int i = 0; i < n; ++i)
        order.add(names[i], i);
    return order;
}

struct Device {
    unsigned int components = 3, first = 8, fourth = 1, second = 1, third = 1;
    double xRes = 72.0, yRes = 144.0;
    CZYRRect rect{0, 0, 10, 20};
    sZYRDeviceValueBlock block{2, 1, 512, 0};
    bool firstFlag = false, secondFlag = false, thirdFlag = true;
    CZYRColorantOrderArray order = colorants(3);
    CZYRArray array;
    CZYRRasterDeviceAttributes make() const {
        return {components, first, xRes,   yRes,  rect,       fourth,    block,
                firstFlag,  order, second, third, secondFlag, thirdFlag, array};
    }
};

using Raster = FakeOEM<ZYRPublic::I_OEMRasterInterface>;

template <class I> void registerItem(CZYRInterfaceRegistry& registry, int id, I* value) {
    registry.registerInterface(new CZYRCRegisterItem<I*>(id, value),
                               ZYRRegisterInterfaceDefaultDeleteProc, true);
}

struct Registry {
    CZYRInterfaceRegistry registry;
    Registry(Raster* raster, FakeProgress* progress) {
        if (raster)
            registerItem<ZYRPublic::I_OEMRasterInterface>(registry, kZYRRasterInterfaceID, raster);
        if (progress)
            registerItem<ZYRPublic::I_OEMProgressInterface>(registry, kZYRProgressInterfaceID,
                                                            progress);
    }
};

} // namespace

TEST(CZYRSurfaceRenderAttributesTest, DeviceValidationAndEquality) {
    Device d;
    d.thirdFlag = false;
    d.components = 4;
    EXPECT_EQ(thrown([&] { d.make(); }),
              describe(ZYRPublic::kZYRErrorBadParam, "invalid num components in colorant array",
                       "source/zyr/std/CZYRRasterDeviceAttributes", 113));
    d.order = colorants(4);
    EXPECT_STREQ(d.make().getColorantOrder().getEntry(3).name.c_str(), "Black");
    EXPECT_THROW(d.make().getColorantOrder().getEntry(4), CZYRError);

    const CZYRRasterDeviceAttributes base = Device().make();
    EXPECT_TRUE(base == Device().make());
    const auto differs = [&](const std::function<void(Device&)>& change) {
        Device d;
        change(d);
        return !(base == d.make()) && !(d.make() == base) && d.make() == d.make();
    };
    // One field at a time, the last of the comparison's chain among them.
    const std::function<void(Device&)> changes[] = {
        [](auto& d) { ++d.components; },
        [](auto& d) { d.thirdFlag = false; },
        [](auto& d) { d.rect = CZYRRect(0, 0, 10, 21); },
        [](auto& d) { d.block.value[2] = 513; },
        [](auto& d) { d.order.setValue(1); },
        [](auto& d) { d.order = colorants(4); },
        [](auto& d) { (d.order = colorants(2)).add("Other", 2); },
        [](auto& d) { (d.order = colorants(2)).add("Yellow", 3); },
        [](auto& d) { (d.array = CZYRArray()).set(0, 1u); }};
    for (size_t i = 0; i < std::size(changes); ++i)
        EXPECT_TRUE(differs(changes[i])) << "change " << i;
}

TEST(CZYRSurfaceRenderAttributesTest, DeviceExtentsRoundUpAndSaturate) {
    EXPECT_TRUE(CZYRSurfaceRenderAttributes().getWidth() == 183600 &&
                CZYRSurfaceRenderAttributes().getHeight() == 237600)
        << "612 by 792 at 300";
    const auto raster = make<Raster>();
    const auto progress = make<FakeProgress>();
    const Registry r(raster.get(), progress.get());
    const auto surface = makeSurface(9, makeJob(CZYRDict()));
    const struct {
        CZYRRect rect;
        double xRes, yRes;
        int width, height;
    } cases[] = {
        {{0, 0, 1.001, 2.0}, 1.0, 1.0, 2, 2},
        {{0, 0, 10, 10}, 1e300, std::nan(""), INT_MAX, 0},
        {{0, 0, -10, -10}, 1e300, 0.5, INT_MIN, -5},
    };
    for (const auto& c : cases) {
        Device d;
        std::tie(d.rect, d.xRes, d.yRes) = std::tie(c.rect, c.xRes, c.yRes);
        const CZYRSurfaceRenderAttributes attrs(d.make(), surface, 0, 0, r.registry, 5);
        EXPECT_TRUE(attrs.getWidth() == c.width && attrs.getHeight() == c.height) << c.xRes;
    }
}

TEST(CZYRSurfaceRenderAttributesTest, SurfaceConstructorWalksLooksUpAndCompares) {
    const auto job = makeJob(CZYRDict());
    const auto dev = Device().make();
    const auto raster = make<Raster>(), raster2 = make<Raster>();
    const auto progress = make<FakeProgress>(), progress2 = make<FakeProgress>();
    const Registry full(raster.get(), progress.get()), noRaster(nullptr, progress.get()),
        noProgress(raster.get(), nullptr), otherRaster(raster2.get(), progress.get()),
        otherProgress(raster.get(), progress2.get());
    const auto attempt = [&](const C_SmartPtr<ZYRPublic::I_Surface>& surface, const Registry& r) {
        return thrown([&] { CZYRSurfaceRenderAttributes(dev, surface, 0, 0, r.registry, 1); });
    };
    const auto invalid = [](const char* message, int line) {
        return describe(ZYRPublic::kZYRErrorInvalidData, message,
                        "source/zyr/std/CZYRSurfaceRenderAttributes", line);
    };
    EXPECT_EQ(attempt(makeSurface(3, job), noProgress), invalid("missing interface", 65));
    EXPECT_EQ(attempt(makeSurface(3, job), noRaster), invalid("missing interface", 57));
    for (const int id : {kZYRRasterInterfaceID, kZYRProgressInterfaceID}) {
        Registry wrongType(raster.get(), progress.get()); // an item of another type there
        static int notAnInterface = 0;
        registerItem<int>(wrongType.registry, id, &notAnInterface);
        EXPECT_EQ(attempt(makeSurface(3, job), wrongType),
                  invalid("missing interface", id == kZYRRasterInterfaceID ? 57 : 65));
    }
    EXPECT_EQ(attempt(makeSurface(3, C_SmartPtr<ZYRPublic::I_Job>()), full),
              invalid("miss job", 46));
    EXPECT_EQ(attempt(C_SmartPtr<ZYRPublic::I_Surface>(), full), invalid("miss job", 46));
    const auto fail = [](auto& link, auto& next) {
        link.failWith = ZYRPublic::kZYRErrorTypeCheck;
        next.reset();
    };
    const auto s0 = makeSurface(3, job), s1 = makeSurface(3, job), s2 = makeSurface(3, job);
    fail(*s0, s0->owner);
    fail(*s1->owner, s1->owner->parent);
    fail(*s2->owner->parent, s2->owner->parent->job);
    for (const auto& broken : {s0, s1, s2})
        EXPECT_EQ(attempt(broken, full), "14: getter failed (fake:1)");

    const auto surface = makeSurface(77, job);
    const unsigned int flags = kZYRFirstSurface | kZYRFrontSurface;
    const auto withSame = [&](const Registry& r, unsigned int surfaceFlags,
                              unsigned int renderFlags, unsigned long long jobID) {
        return CZYRSurfaceRenderAttributes(dev, surface, surfaceFlags, renderFlags, r.registry,
                                           jobID);
    };
    const CZYRSurfaceRenderAttributes attrs =
        withSame(full, flags, kZYRTrapInEmulatedColorSpace, 12);
    EXPECT_TRUE(attrs.getJob().get() == job.get() && attrs.getJobID() == 12 &&
                attrs.getSurfaceID() == 77 && attrs.getOEMRasterInterface().get() == raster.get() &&
                attrs.getOEMProgessInterface().get() == progress.get() &&
                attrs.getRasterDeviceAttributes() == dev);
    EXPECT_TRUE(attrs.isFirstSurface() && attrs.isFrontSurface() && !attrs.isLastSurface() &&
                !attrs.useDocumentTransfers() && attrs.trapInEmulatedColorSpace());

    const unsigned int before = raster->debugGetRefCount();
    CZYRSurfaceRenderAttributes copy(attrs);
    EXPECT_EQ(raster->debugGetRefCount(), before + 1);
    registerItem<ZYRPublic::I_OEMRasterInterface>(copy.getResourceHolder(), 5, raster.get());
    EXPECT_TRUE(copy == attrs);
    Device other;
    other.xRes = 1;
    const CZYRSurfaceRenderAttributes variants[] = {
        withSame(full, flags, 0, 12),
        withSame(full, kZYRFirstSurface, kZYRTrapInEmulatedColorSpace, 12),
        withSame(full, flags, kZYRTrapInEmulatedColorSpace, 13),
        withSame(otherRaster, flags, kZYRTrapInEmulatedColorSpace, 12),
        withSame(otherProgress, flags, kZYRTrapInEmulatedColorSpace, 12),
        CZYRSurfaceRenderAttributes(other.make(), surface, flags, kZYRTrapInEmulatedColorSpace,
                                    full.registry, 12),
        CZYRSurfaceRenderAttributes(dev, makeSurface(77, job), flags, kZYRTrapInEmulatedColorSpace,
                                    full.registry, 12),
    };
    for (size_t i = 0; i < std::size(variants); ++i)
        EXPECT_FALSE(variants[i] == attrs) << "variant " << i;
    for (const bool otherJob : {false, true}) {
        surface->id = otherJob ? 77 : 78;
        if (otherJob)
            surface->owner->parent->job = makeJob(CZYRDict());
        EXPECT_FALSE(withSame(full, flags, kZYRTrapInEmulatedColorSpace, 12) == attrs) << otherJob;
    }
}

TEST(CZYRSurfaceRenderAttributesTest, EndOfJob) {
    auto job = make<FakeJob>();
    job->id = 4242;
    auto progress = make<FakeProgress>();
    C_Error err;
    err.setError(ZYRPublic::kZYRErrorUnknown, "why", "here", 3);
    const CZYRSurfaceRenderAttributes end(C_SmartPtr<ZYRPublic::I_Job>(job), progress, err);
    EXPECT_TRUE(end.endOfJob() && end.isLastSurface() && !end.isFirstSurface() &&
                end.getJobID() == 4242 && end.getSurfaceID() == 4242 &&
                !end.getOEMRasterInterface() &&
                end.getOEMProgessInterface().get() == progress.get() && end.getWidth() == 183600);
    EXPECT_EQ(describe(end.getError()), "1: why (here:3)");
    EXPECT_EQ(CZYRSurfaceRenderAttributes(C_SmartPtr<ZYRPublic::I_Job>(), progress, err).getJobID(),
              0u);
}

TEST(CZYRSurfaceRenderAttributesTest, StrokeParams) {
    CZYRStrokeParams p;
    const sStrokeParams& s = p.getStrokeParams();
    EXPECT_TRUE(s.lineWidth == 1 && s.miterLimit == 10 && !s.dashArray && s.lineCap == 2 &&
                s.lineJoin == 0);
    for (const auto& [given, width, limit] : {std::tuple{-1.0f, 0.0f, 1.0f},
                                              {std::nanf(""), 0.0f, 1.0f},
                                              {0.5f, 0.5f, 1.0f},
                                              {2.5f, 2.5f, 2.5f}}) {
        p.setLineWidth(given);
        p.setMiterLimit(given);
        EXPECT_TRUE(s.lineWidth == width && s.miterLimit == limit) << given;
    }

    const float dashes[] = {3, 1, 2}, other[] = {3, 1, 5};
    p.setDashedArray(dashes, 3);
    float* const storage = s.dashArray;
    ASSERT_NE(storage, dashes);
    p.setDashedArray(other, 3);
    EXPECT_TRUE(s.dashArray == storage && s.dashArray[2] == 5) << "as many values, same storage";
    p.setDashedArray(dashes + 1, 1);
    p.setDashedArray(s.dashArray, 1); // from its own storage
    EXPECT_TRUE(s.dashArray == storage && s.dashArray[0] == 1.0f) << "the storage never shrinks";
    p.setDashedArray(nullptr, 0);
    EXPECT_TRUE(s.dashCount == 0 && s.dashArray == storage);
    for (const auto& [values, count] : {std::pair{dashes, -1}, {nullptr, 2}})
        EXPECT_THROW(p.setDashedArray(values, count), CZYRError);

    CZYRStrokeParams base;
    base.setDashedArray(dashes, 3);
    const std::function<void(CZYRStrokeParams&)> changes[] = {
        [](auto& c) { c.setLineWidth(2); }, [&](auto& c) { c.setDashedArray(dashes, 2); },
        [&](auto& c) { c.setDashedArray(other, 3); },
        [](auto& c) { c.setLineJoin(static_cast<eZYRLineJoinType>(1)); }};
    for (size_t i = 0; i < std::size(changes); ++i) {
        CZYRStrokeParams changed(base);
        EXPECT_TRUE(changed == base);
        changes[i](changed);
        EXPECT_FALSE(changed == base) << "change " << i;
    }
    CZYRStrokeParams a, b;
    a.setDashedArray(dashes, 0);
    b.setDashedArray(other, 0);
    EXPECT_TRUE(a == b) << "no dashes, nothing to compare";

    base.setStrokeAdjust(true);
    CZYRStrokeParams copy(base), assigned;
    assigned = base;
    EXPECT_TRUE(copy == base && assigned == base &&
                copy.getStrokeParams().dashArray != base.getStrokeParams().dashArray);
    base.setDashedArray(other, 3);
    EXPECT_EQ(assigned.getStrokeParams().dashArray[2], 2.0f);
    assigned = CZYRStrokeParams();
    EXPECT_TRUE(!assigned.getStrokeParams().dashArray && assigned.getStrokeParams().dashCount == 0);
}
