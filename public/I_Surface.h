// The engine's surfaces and the chain from a surface to its job: surface, owner, parent, job.
#pragma once

#include <cstdint>

#include "I_Error.h"
#include "I_Job.h"

namespace ZYRPublic {

class I_SurfaceOwnerParent {
public:
    virtual void addRef() = 0;
    virtual void release() = 0;
    virtual bool isShared() const = 0;
    virtual unsigned int debugGetRefCount() const = 0;
    // One reference for the caller, or null.
    virtual I_Job* getJob(I_Error& err) = 0;

protected:
    ~I_SurfaceOwnerParent() = default;
};

class I_SurfaceOwner {
public:
    virtual void addRef() = 0;
    virtual void release() = 0;
    virtual bool isShared() const = 0;
    virtual unsigned int debugGetRefCount() const = 0;
    virtual I_SurfaceOwnerParent* getOwner(I_Error& err) = 0;

protected:
    ~I_SurfaceOwner() = default;
};

class I_Surface {
public:
    virtual void addRef() = 0;
    virtual void release() = 0;
    virtual bool isShared() const = 0;
    virtual unsigned int debugGetRefCount() const = 0;
    virtual uint64_t getSurfaceID() const = 0;
    virtual I_SurfaceOwner* getOwner(I_Error& err) = 0;

protected:
    ~I_Surface() = default;
};

} // namespace ZYRPublic
