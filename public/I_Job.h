// The engine's job as the library sees it: an identifier, parameters and host interfaces.
#pragma once

#include <cstdint>

#include "I_Dict.h"
#include "I_Error.h"
#include "I_OEMInterfaceSet.h"

namespace ZYRPublic {

// Implemented by the engine; every object returned carries one reference for the caller.
class I_Job {
public:
    virtual void addRef() = 0;
    virtual void release() = 0;
    virtual bool isShared() const = 0;
    virtual unsigned int debugGetRefCount() const = 0;
    virtual uint64_t getJobID() const = 0;
    // The job's parameters ("JPJobID", "ZYRTraceMsg", ...), or null.
    virtual I_Dict* getJobDict(I_Error& err) = 0;
    virtual I_OEMInterfaceSet* getOEMInterfaces(I_Error& err) = 0;

protected:
    ~I_Job() = default;
};

} // namespace ZYRPublic
