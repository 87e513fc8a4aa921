// The immutable, reference-counted Unicode string that crosses the library boundary.
#pragma once

#include <cstdint>

#include "I_Error.h"

namespace ZYRPublic {

class I_UniString {
public:
    virtual void addRef() = 0;
    virtual void release() = 0;
    virtual bool isShared() const = 0;
    virtual unsigned int debugGetRefCount() const = 0;
    virtual const unsigned int* debugGetRefCountAddr() const = 0;
    virtual uint64_t getUniqueID() const = 0;
    // UTF-16LE into `buffer`; `*size` is the capacity in bytes on entry and the needed
    // length in bytes on return.
    virtual void convert(char16_t* buffer, unsigned int* size, I_Error& err) const = 0;
    // The same with any ICU converter name.
    virtual void convert(char* buffer, unsigned int* size, const char* encoding,
                         I_Error& err) const = 0;
    // Orders by the raw UTF-16LE bytes, as memcmp would.
    virtual bool lessThan(const I_UniString* other) const = 0;
    virtual bool equals(const I_UniString* other) const = 0;
    virtual uint32_t hashCode() const = 0;
    virtual const char* getUTF16LEBuffer(unsigned int* sizeInBytes) const = 0;
    // A new string with one reference for the caller: this text followed by other's.
    virtual I_UniString* concat(const I_UniString* other, I_Error& err) const = 0;
    virtual bool isEmpty() const = 0;

protected:
    ~I_UniString() = default; // the last release deletes the object
};

} // namespace ZYRPublic
