// An immutable, reference-counted block of bytes that crosses the library boundary.
#pragma once

#include <cstdint>

namespace ZYRPublic {

class I_DataBuffer {
public:
    virtual void addRef() = 0;
    virtual void release() = 0;
    virtual bool isShared() const = 0;
    virtual unsigned int debugGetRefCount() const = 0;
    virtual const unsigned int* debugGetRefCountAddr() const = 0;
    virtual uint64_t getUniqueID() const = 0;
    virtual const char* getBuffer() const = 0;
    virtual unsigned int getLength() const = 0;

protected:
    ~I_DataBuffer() = default; // the last release deletes the object
};

} // namespace ZYRPublic
