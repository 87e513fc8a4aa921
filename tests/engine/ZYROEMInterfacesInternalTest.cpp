#include <gtest/gtest.h>

#include "EngineFakes.h"
#include "TestSupport.h"
#include "zyr/std/engine/ZYROEMInterfacesInternal.h"

using namespace ZYRStd;
using namespace zyrtest;

namespace {

template <class I, class Lookup>
void checkLookup(const char* name, C_SmartPtr<I> FakeInterfaceSet::*slot, bool required,
                 Lookup lookup) {
    SCOPED_TRACE(name);
    const auto set = make<FakeInterfaceSet>();
    const auto job = make<FakeJob>();
    job->interfaces = set;
    C_SmartPtr<I> held;
    if constexpr (std::is_same_v<I, ZYRPublic::I_OEMProgressInterface>)
        held = make<FakeProgress>();
    else
        held = make<FakeOEM<I>>();
    (*set).*slot = held;
    C_Error err;
    {
        const C_SmartPtr<I> got = lookup(job, err);
        EXPECT_EQ(got.get(), held.get());
        EXPECT_FALSE(err.errorOccurred());
        EXPECT_EQ(held->debugGetRefCount(), 3u) << "the set's, ours and the result's";
    }
    EXPECT_EQ(held->debugGetRefCount(), 2u) << "the result gave its reference back";

    const auto absent = [&] {
        C_Error status;
        EXPECT_FALSE(lookup(job, status));
        return status.errorOccurred() ? describe(status) : "none";
    };
    const std::string missing = required ? "6: Required OEM interface not found "
                                           "(source/zyr/std/ZYROEMInterfacesInternal:42)"
                                         : "none";
    set->denyFound = true;
    EXPECT_EQ(absent(), missing);
    EXPECT_EQ(held->debugGetRefCount(), 2u) << "what came with \"not found\" was released";
    set->denyFound = false;
    ((*set).*slot).reset();
    EXPECT_EQ(absent(), missing);
    set->claimFound = true;
    EXPECT_EQ(absent(), missing);
    job->interfaces.reset();
    EXPECT_EQ(thrown([&] { lookup(job, err); }),
              "4: Error getting OEM Interface (source/zyr/std/ZYROEMInterfacesInternal:37)");
    EXPECT_EQ(set->debugGetRefCount(), 1u) << "the look-up released the set";
    EXPECT_THROW(lookup(C_SmartPtr<ZYRPublic::I_Job>(), err), CZYRError);
}

} // namespace

TEST(ZYROEMInterfacesInternalTest, EveryLookupAndItsRule) {
#define ZYRTEST_LOOKUP(slot, required, lookup)                                                     \
    checkLookup(#slot, &FakeInterfaceSet::slot, required, lookup)
    ZYRTEST_LOOKUP(calibration, true, GetOEMCalibrationMgrInterfaceFromJob);
    ZYRTEST_LOOKUP(cutting, false, GetOEMCuttingInfoMgrInterfaceFromJob);
    ZYRTEST_LOOKUP(colorAdjustment, false, GetDeviceColorAdjustmentFromJob);
    ZYRTEST_LOOKUP(frameMarker, true, GetOEMFrameMarkerFactoryInterfaceFromJob);
    ZYRTEST_LOOKUP(preProcessor, false, GetOEMPDFPreProcessorFromJob);
    ZYRTEST_LOOKUP(progress, true, GetOEMProgressInterfaceFromJob);
    ZYRTEST_LOOKUP(rasterBuffer, true, GetOEMRasterBufferMgrInterfaceFromJob);
    ZYRTEST_LOOKUP(raster, true, GetOEMRasterInterfaceFromJob);
    ZYRTEST_LOOKUP(tagEvaluator, false, GetOEMTagEvaluatorInterfaceFromJob);
    ZYRTEST_LOOKUP(xobjMgr, false, GetOEMXObjMgrFromJob);
    ZYRTEST_LOOKUP(xobjectResolver, false, GetOEMXObjectResolverFromJob);
#undef ZYRTEST_LOOKUP
    for (const bool required : {true, false})
        checkLookup("screen", &FakeInterfaceSet::screenMgr, required,
                    [required](const C_SmartPtr<ZYRPublic::I_Job>& job, ZYRPublic::I_Error& err) {
                        return GetOEMScreenMgrInterfaceFromJob(job, required, err);
                    });
}
