/// \file
/// The engine's job as the library sees it: an identifier, parameters and host interfaces.
#pragma once

#include <cstdint>

#include "I_Dict.h"
#include "I_Error.h"
#include "I_OEMInterfaceSet.h"

namespace ZYRPublic {

/// Implemented by the engine; every object returned carries one reference for the caller.
class I_Job {
public:
    /// Takes one more reference; any thread.
    virtual void addRef() = 0;
    /// Drops one reference; the last one deletes the object.
    virtual void release() = 0;
    /// True while more than one reference is held.
    virtual bool isShared() const = 0;
    /// The present count, for diagnostics only.
    virtual unsigned int debugGetRefCount() const = 0;
    /// The engine's number for the job.
    virtual uint64_t getJobID() const = 0;
    /// The job's parameters ("JPJobID", "ZYRTraceMsg", ...), or null.
    virtual I_Dict* getJobDict(I_Error& err) = 0;
    /// The host interfaces of the job, or null.
    virtual I_OEMInterfaceSet* getOEMInterfaces(I_Error& err) = 0;

protected:
    ~I_Job() = default;
};

} // namespace ZYRPublic
