// The twelve job look-ups share one walk: job, interface set, getter.
#include "zyr/std/engine/ZYROEMInterfacesInternal.h"

#include "zyr/std/core/CZYRError.h"

namespace ZYRStd {

using namespace ZYRPublic;

namespace {

constexpr const char* kSource = "source/zyr/std/ZYROEMInterfacesInternal";
// The source lines the two errors of the look-up have always carried.
constexpr int kNoInterfaceSetLine = 37;
constexpr int kRequiredMissingLine = 42;

template <class Interface>
using Getter = bool (I_OEMInterfaceSet::*)(Interface** out, I_Error& err);

template <class Interface>
C_SmartPtr<Interface> getFromJob(const C_SmartPtr<I_Job>& job, Getter<Interface> getter,
                                 bool required, I_Error& err) {
    // A null job has no interfaces either; calling through it would crash.
    C_SmartPtr<I_OEMInterfaceSet> set(job ? job->getOEMInterfaces(err) : nullptr, false);
    if (!set)
        throw CZYRError(kZYRErrorInitFailed, "Error getting OEM Interface", kSource,
                        kNoInterfaceSetLine);
    Interface* raw = nullptr;
    const bool found = (set.get()->*getter)(&raw, err);
    // What the getter handed out is ours even when it says "not found": released then.
    C_SmartPtr<Interface> result(raw, false);
    if (!found)
        result.reset();
    // A getter that says "found" but hands out nothing has not found it either.
    if (!result && required)
        err.setError(kZYRErrorBadParam, "Required OEM interface not found", kSource,
                     kRequiredMissingLine);
    return result;
}

} // namespace

C_SmartPtr<I_OEMCalibrationMgr> GetOEMCalibrationMgrInterfaceFromJob(const C_SmartPtr<I_Job>& job,
                                                                     I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMCalibrationMgr, true, err);
}

C_SmartPtr<I_OEMCuttingInfoMgr> GetOEMCuttingInfoMgrInterfaceFromJob(const C_SmartPtr<I_Job>& job,
                                                                     I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMCuttingInfoMgr, false, err);
}

C_SmartPtr<I_OEMDeviceColorAdjustment> GetDeviceColorAdjustmentFromJob(const C_SmartPtr<I_Job>& job,
                                                                       I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMDeviceColorAdjustment, false, err);
}

C_SmartPtr<I_OEMFrameMarkerFactory>
GetOEMFrameMarkerFactoryInterfaceFromJob(const C_SmartPtr<I_Job>& job, I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMFrameMarkerFactory, true, err);
}

C_SmartPtr<I_OEMPDFPreProcessor> GetOEMPDFPreProcessorFromJob(const C_SmartPtr<I_Job>& job,
                                                              I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMPDFPreProcessor, false, err);
}

C_SmartPtr<I_OEMProgressInterface> GetOEMProgressInterfaceFromJob(const C_SmartPtr<I_Job>& job,
                                                                  I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMProgressInterface, true, err);
}

C_SmartPtr<I_OEMRasterBufferMgr> GetOEMRasterBufferMgrInterfaceFromJob(const C_SmartPtr<I_Job>& job,
                                                                       I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMRasterBufferMgr, true, err);
}

C_SmartPtr<I_OEMRasterInterface> GetOEMRasterInterfaceFromJob(const C_SmartPtr<I_Job>& job,
                                                              I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMRasterInterface, true, err);
}

C_SmartPtr<I_OEMScreenMgr> GetOEMScreenMgrInterfaceFromJob(const C_SmartPtr<I_Job>& job,
                                                           bool required, I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMScreenMgr, required, err);
}

C_SmartPtr<I_OEMTagEvaluatorInterface>
GetOEMTagEvaluatorInterfaceFromJob(const C_SmartPtr<I_Job>& job, I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMTagEvaluatorInterface, false, err);
}

C_SmartPtr<I_OEMXObjMgr> GetOEMXObjMgrFromJob(const C_SmartPtr<I_Job>& job, I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMXObjMgr, false, err);
}

C_SmartPtr<I_OEMXObjectResolver> GetOEMXObjectResolverFromJob(const C_SmartPtr<I_Job>& job,
                                                              I_Error& err) {
    return getFromJob(job, &I_OEMInterfaceSet::getOEMXObjectResolver, false, err);
}

} // namespace ZYRStd
