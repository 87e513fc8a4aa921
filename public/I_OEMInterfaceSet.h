/// \file
/// The set of host interfaces a job carries; each getter hands out one reference.
#pragma once

#include "I_Error.h"
#include "I_OEMInterfaces.h"

namespace ZYRPublic {

/// True with `*out` set (one reference for the caller) when the job has the interface.
class I_OEMInterfaceSet : public I_OEMRefCounted {
public:
    /// One getter per host interface.
    ///@{
    virtual bool getOEMCuttingInfoMgr(I_OEMCuttingInfoMgr** out, I_Error& err) = 0;
    virtual bool getOEMPDFPreProcessor(I_OEMPDFPreProcessor** out, I_Error& err) = 0;
    virtual bool getOEMTagEvaluatorInterface(I_OEMTagEvaluatorInterface** out, I_Error& err) = 0;
    virtual bool getOEMXObjectResolver(I_OEMXObjectResolver** out, I_Error& err) = 0;
    virtual bool getOEMXObjMgr(I_OEMXObjMgr** out, I_Error& err) = 0;
    virtual bool getOEMDeviceColorAdjustment(I_OEMDeviceColorAdjustment** out, I_Error& err) = 0;
    virtual bool getOEMScreenMgr(I_OEMScreenMgr** out, I_Error& err) = 0;
    virtual bool getOEMFrameMarkerFactory(I_OEMFrameMarkerFactory** out, I_Error& err) = 0;
    virtual bool getOEMRasterInterface(I_OEMRasterInterface** out, I_Error& err) = 0;
    virtual bool getOEMRasterBufferMgr(I_OEMRasterBufferMgr** out, I_Error& err) = 0;
    virtual bool getOEMProgressInterface(I_OEMProgressInterface** out, I_Error& err) = 0;
    virtual bool getOEMCalibrationMgr(I_OEMCalibrationMgr** out, I_Error& err) = 0;
    ///@}

protected:
    ~I_OEMInterfaceSet() = default;
};

} // namespace ZYRPublic
