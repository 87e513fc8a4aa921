// The twelve job look-ups: references, the required rule and the two errors.
#include <gtest/gtest.h>

#include <type_traits>

#include "EngineFakes.h"
#include "zyr/std/engine/ZYROEMInterfacesInternal.h"

using namespace ZYRStd;
using namespace zyrtest;

namespace {

template <class I> C_SmartPtr<I> fake() {
    if constexpr (std::is_same_v<I, ZYRPublic::I_OEMProgressInterface>)
        return C_SmartPtr<I>(new FakeProgress, false);
    else
        return C_SmartPtr<I>(new FakeOEM<I>, false);
}

struct Fixture {
    C_SmartPtr<FakeInterfaceSet> set = make<FakeInterfaceSet>();
    C_SmartPtr<FakeJob> job = make<FakeJob>();
    C_SmartPtr<ZYRPublic::I_Job> asJob() const { return job; }
    Fixture() { job->interfaces = set; }
};

// Checks one look-up with the interface present and absent; `required` is the rule.
template <class I, class Lookup>
void checkLookup(const char* name, C_SmartPtr<I> FakeInterfaceSet::*slot, bool required,
                 Lookup lookup) {
    SCOPED_TRACE(name);
    Fixture f;
    const C_SmartPtr<I> held = fake<I>();
    (*f.set).*slot = held;
    C_Error err;
    {
        const C_SmartPtr<I> got = lookup(f.asJob(), err);
        EXPECT_EQ(got.get(), held.get());
        EXPECT_FALSE(err.errorOccurred());
        EXPECT_EQ(held->debugGetRefCount(), 3u) << "the set's, ours and the result's";
    }
    EXPECT_EQ(held->debugGetRefCount(), 2u) << "the result gave its reference back";

    ((*f.set).*slot).reset();
    EXPECT_FALSE(lookup(f.asJob(), err));
    EXPECT_EQ(err.errorOccurred(), required);
    if (required) {
        EXPECT_EQ(err.getError(), ZYRPublic::kZYRErrorBadParam);
        EXPECT_STREQ(err.getMessage(), "Required OEM interface not found");
        EXPECT_STREQ(err.getSrcFileName(), "source/zyr/std/ZYROEMInterfacesInternal");
        EXPECT_EQ(err.getSrcLineNumber(), 42);
    }
    // "Found" with nothing handed out is treated as not found.
    f.set->claimFound = true;
    err.reset();
    EXPECT_FALSE(lookup(f.asJob(), err));
    EXPECT_EQ(err.errorOccurred(), required);

    f.job->interfaces.reset();
    try {
        lookup(f.asJob(), err);
        ADD_FAILURE() << "a job without interface set";
    } catch (const CZYRError& e) {
        EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorInitFailed);
        EXPECT_STREQ(e.getMessage(), "Error getting OEM Interface");
        EXPECT_EQ(e.getSrcLineNumber(), 37);
    }
    EXPECT_EQ(f.set->debugGetRefCount(), 1u) << "the look-up released the set";
    EXPECT_THROW(lookup(C_SmartPtr<ZYRPublic::I_Job>(), err), CZYRError);
}

} // namespace

TEST(ZYROEMInterfacesInternalTest, EveryLookupAndItsRule) {
    checkLookup("calibration", &FakeInterfaceSet::calibration, true,
                GetOEMCalibrationMgrInterfaceFromJob);
    checkLookup("cutting", &FakeInterfaceSet::cutting, false, GetOEMCuttingInfoMgrInterfaceFromJob);
    checkLookup("color", &FakeInterfaceSet::colorAdjustment, false,
                GetDeviceColorAdjustmentFromJob);
    checkLookup("frame marker", &FakeInterfaceSet::frameMarker, true,
                GetOEMFrameMarkerFactoryInterfaceFromJob);
    checkLookup("preprocessor", &FakeInterfaceSet::preProcessor, false,
                GetOEMPDFPreProcessorFromJob);
    checkLookup("progress", &FakeInterfaceSet::progress, true, GetOEMProgressInterfaceFromJob);
    checkLookup("raster buffer", &FakeInterfaceSet::rasterBuffer, true,
                GetOEMRasterBufferMgrInterfaceFromJob);
    checkLookup("raster", &FakeInterfaceSet::raster, true, GetOEMRasterInterfaceFromJob);
    checkLookup("tag evaluator", &FakeInterfaceSet::tagEvaluator, false,
                GetOEMTagEvaluatorInterfaceFromJob);
    checkLookup("xobj", &FakeInterfaceSet::xobjMgr, false, GetOEMXObjMgrFromJob);
    checkLookup("xobject resolver", &FakeInterfaceSet::xobjectResolver, false,
                GetOEMXObjectResolverFromJob);
    for (const bool required : {true, false})
        checkLookup("screen", &FakeInterfaceSet::screenMgr, required,
                    [required](const C_SmartPtr<ZYRPublic::I_Job>& job, ZYRPublic::I_Error& err) {
                        return GetOEMScreenMgrInterfaceFromJob(job, required, err);
                    });
}
