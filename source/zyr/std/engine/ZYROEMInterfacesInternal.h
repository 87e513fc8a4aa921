/// \file
/// The host interfaces of a job, fetched through its interface set, one function each.
#pragma once

#include "C_SmartPtr.h"
#include "I_Error.h"
#include "I_Job.h"
#include "ZYRStdExport.h"

namespace ZYRStd {

using ZYRPublic::C_SmartPtr;
using ZYRPublic::I_Job;

/// Each returns the interface with one reference, or null when the job has none. A job
/// without an interface set (or a null job) throws kZYRErrorInitFailed "Error getting OEM
/// Interface"; a missing interface that is required records kZYRErrorBadParam "Required OEM
/// interface not found" in `err`. Required: calibration manager, frame-marker factory,
/// progress interface, raster buffer manager, raster interface, and the screen manager when
/// `required` says so.
///@{
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMCalibrationMgr>
GetOEMCalibrationMgrInterfaceFromJob(const C_SmartPtr<I_Job>& job, ZYRPublic::I_Error& err);
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMCuttingInfoMgr>
GetOEMCuttingInfoMgrInterfaceFromJob(const C_SmartPtr<I_Job>& job, ZYRPublic::I_Error& err);
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMDeviceColorAdjustment>
GetDeviceColorAdjustmentFromJob(const C_SmartPtr<I_Job>& job, ZYRPublic::I_Error& err);
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMFrameMarkerFactory>
GetOEMFrameMarkerFactoryInterfaceFromJob(const C_SmartPtr<I_Job>& job, ZYRPublic::I_Error& err);
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMPDFPreProcessor>
GetOEMPDFPreProcessorFromJob(const C_SmartPtr<I_Job>& job, ZYRPublic::I_Error& err);
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMProgressInterface>
GetOEMProgressInterfaceFromJob(const C_SmartPtr<I_Job>& job, ZYRPublic::I_Error& err);
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMRasterBufferMgr>
GetOEMRasterBufferMgrInterfaceFromJob(const C_SmartPtr<I_Job>& job, ZYRPublic::I_Error& err);
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMRasterInterface>
GetOEMRasterInterfaceFromJob(const C_SmartPtr<I_Job>& job, ZYRPublic::I_Error& err);
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMScreenMgr>
GetOEMScreenMgrInterfaceFromJob(const C_SmartPtr<I_Job>& job, bool required,
                                ZYRPublic::I_Error& err);
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMTagEvaluatorInterface>
GetOEMTagEvaluatorInterfaceFromJob(const C_SmartPtr<I_Job>& job, ZYRPublic::I_Error& err);
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMXObjMgr> GetOEMXObjMgrFromJob(const C_SmartPtr<I_Job>& job,
                                                                    ZYRPublic::I_Error& err);
ZYRSTD_API C_SmartPtr<ZYRPublic::I_OEMXObjectResolver>
GetOEMXObjectResolverFromJob(const C_SmartPtr<I_Job>& job, ZYRPublic::I_Error& err);
///@}

} // namespace ZYRStd
