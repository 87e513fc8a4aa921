/// \file
/// An immutable, reference-counted block of bytes that crosses the library boundary.
#pragma once

#include <cstdint>

namespace ZYRPublic {

/// Bytes that never change once made, shared by reference; any thread may read them.
/// Made by ZYRStd::createDataBuffer with one reference for the caller.
class I_DataBuffer {
public:
    /// Takes one more reference; any thread.
    virtual void addRef() = 0;
    /// Drops one reference; the last one deletes the object.
    virtual void release() = 0;
    /// True while more than one reference is held.
    virtual bool isShared() const = 0;
    /// The present count, for diagnostics only.
    virtual unsigned int debugGetRefCount() const = 0;
    /// The address of the count word, for diagnostics only.
    virtual const unsigned int* debugGetRefCountAddr() const = 0;
    /// The object's process-unique identifier, fixed at creation.
    virtual uint64_t getUniqueID() const = 0;
    /// The bytes, borrowed: valid while a reference is held.
    virtual const char* getBuffer() const = 0;
    /// The number of bytes.
    virtual unsigned int getLength() const = 0;

protected:
    ~I_DataBuffer() = default; ///< the last release deletes the object
};

} // namespace ZYRPublic
