/// \file
/// The engine's host interfaces that a job hands out through its interface set. The library
/// only passes them on, except for the trace operations of the progress interface.
#pragma once

#include "I_Error.h"
#include "I_UniString.h"
#include "sZYRTraceMsg.h"

namespace ZYRPublic {

class I_Job;
class I_Surface;

/// The count protocol every host interface begins with; the last release deletes.
class I_OEMRefCounted {
public:
    /// Takes one more reference; any thread.
    virtual void addRef() = 0;
    /// Drops one reference; the last one deletes the object.
    virtual void release() = 0;
    /// True while more than one reference is held.
    virtual bool isShared() const = 0;
    /// The present count, for diagnostics only.
    virtual unsigned int debugGetRefCount() const = 0;

protected:
    ~I_OEMRefCounted() = default;
};

/// Opaque to the library: their other operations belong to the engine's modules.
class I_OEMCuttingInfoMgr : public I_OEMRefCounted {
protected:
    ~I_OEMCuttingInfoMgr() = default;
};
/// The engine's PDF pre-processor.
class I_OEMPDFPreProcessor : public I_OEMRefCounted {
protected:
    ~I_OEMPDFPreProcessor() = default;
};
/// The engine's tag evaluator.
class I_OEMTagEvaluatorInterface : public I_OEMRefCounted {
protected:
    ~I_OEMTagEvaluatorInterface() = default;
};
/// The engine's XObject resolver.
class I_OEMXObjectResolver : public I_OEMRefCounted {
protected:
    ~I_OEMXObjectResolver() = default;
};
/// The engine's XObject manager.
class I_OEMXObjMgr : public I_OEMRefCounted {
protected:
    ~I_OEMXObjMgr() = default;
};
/// The engine's device colour adjustment.
class I_OEMDeviceColorAdjustment : public I_OEMRefCounted {
protected:
    ~I_OEMDeviceColorAdjustment() = default;
};
/// The engine's screen (halftone) manager.
class I_OEMScreenMgr : public I_OEMRefCounted {
protected:
    ~I_OEMScreenMgr() = default;
};
/// The engine's frame-marker factory.
class I_OEMFrameMarkerFactory : public I_OEMRefCounted {
protected:
    ~I_OEMFrameMarkerFactory() = default;
};
/// The engine's raster output interface.
class I_OEMRasterInterface : public I_OEMRefCounted {
protected:
    ~I_OEMRasterInterface() = default;
};
/// The engine's raster buffer manager.
class I_OEMRasterBufferMgr : public I_OEMRefCounted {
protected:
    ~I_OEMRasterBufferMgr() = default;
};
/// The engine's calibration manager.
class I_OEMCalibrationMgr : public I_OEMRefCounted {
protected:
    ~I_OEMCalibrationMgr() = default;
};

/// Where trace messages reach the host. Each operation reports failure through `err`.
class I_OEMProgressInterface : public I_OEMRefCounted {
public:
    /// A continuation text of the open message.
    virtual void traceMsg(const sZYRTraceMsg* msg, I_Error& err) = 0;
    /// A whole message.
    virtual void traceMsg(I_Job* job, I_Surface* surface, I_UniString* area, I_UniString* category,
                          const sZYRTraceMsg* msg, const sZYRTraceMsgDetail* detail,
                          I_Error& err) = 0;
    /// Opens a multi-part message.
    virtual void beginTraceMsg(I_Job* job, I_Surface* surface, I_UniString* area,
                               I_UniString* category, const sZYRTraceMsg* msg,
                               const sZYRTraceMsgDetail* detail, I_Error& err) = 0;
    /// Closes the message opened by beginTraceMsg.
    virtual void endTraceMsg(I_Error& err) = 0;

protected:
    ~I_OEMProgressInterface() = default;
};

} // namespace ZYRPublic
