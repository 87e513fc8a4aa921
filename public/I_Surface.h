/// \file
/// The engine's surfaces and the chain from a surface to its job: surface, owner, parent, job.
#pragma once

#include <cstdint>

#include "I_Error.h"
#include "I_Job.h"

namespace ZYRPublic {

/// The owner's parent, from which a surface's job is reached; implemented by the engine.
class I_SurfaceOwnerParent {
public:
    /// Takes one more reference; any thread.
    virtual void addRef() = 0;
    /// Drops one reference; the last one deletes the object.
    virtual void release() = 0;
    /// True while more than one reference is held.
    virtual bool isShared() const = 0;
    /// The present count, for diagnostics only.
    virtual unsigned int debugGetRefCount() const = 0;
    /// One reference for the caller, or null.
    virtual I_Job* getJob(I_Error& err) = 0;

protected:
    ~I_SurfaceOwnerParent() = default;
};

/// What owns a surface; implemented by the engine.
class I_SurfaceOwner {
public:
    /// Takes one more reference; any thread.
    virtual void addRef() = 0;
    /// Drops one reference; the last one deletes the object.
    virtual void release() = 0;
    /// True while more than one reference is held.
    virtual bool isShared() const = 0;
    /// The present count, for diagnostics only.
    virtual unsigned int debugGetRefCount() const = 0;
    /// The owner's parent with one reference for the caller, or null.
    virtual I_SurfaceOwnerParent* getOwner(I_Error& err) = 0;

protected:
    ~I_SurfaceOwner() = default;
};

/// A device surface being rendered; implemented by the engine.
class I_Surface {
public:
    /// Takes one more reference; any thread.
    virtual void addRef() = 0;
    /// Drops one reference; the last one deletes the object.
    virtual void release() = 0;
    /// True while more than one reference is held.
    virtual bool isShared() const = 0;
    /// The present count, for diagnostics only.
    virtual unsigned int debugGetRefCount() const = 0;
    /// The engine's number for the surface.
    virtual uint64_t getSurfaceID() const = 0;
    /// The surface's owner with one reference for the caller, or null.
    virtual I_SurfaceOwner* getOwner(I_Error& err) = 0;

protected:
    ~I_Surface() = default;
};

} // namespace ZYRPublic
