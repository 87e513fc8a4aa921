/// \file
/// The immutable, reference-counted Unicode string that crosses the library boundary.
#pragma once

#include <cstdint>

#include "I_Error.h"

namespace ZYRPublic {

/// An immutable Unicode (UTF-16) string shared by reference; any thread may read it.
/// Made through ZYRStd::CZYRUniString or the common strings table, with one reference for
/// the caller.
class I_UniString {
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
    /// UTF-16LE into `buffer`; `*size` is the capacity in bytes on entry and the needed
    /// length in bytes on return.
    virtual void convert(char16_t* buffer, unsigned int* size, I_Error& err) const = 0;
    /// The same with any ICU converter name.
    virtual void convert(char* buffer, unsigned int* size, const char* encoding,
                         I_Error& err) const = 0;
    /// Orders by the raw UTF-16LE bytes, as memcmp would.
    virtual bool lessThan(const I_UniString* other) const = 0;
    /// True when both texts have the same UTF-16LE bytes.
    virtual bool equals(const I_UniString* other) const = 0;
    /// ICU's hash of the text; the dictionary's bucket key.
    virtual uint32_t hashCode() const = 0;
    /// The text as UTF-16LE bytes, not terminated, borrowed while a reference is held;
    /// its size goes to `*sizeInBytes`.
    virtual const char* getUTF16LEBuffer(unsigned int* sizeInBytes) const = 0;
    /// A new string with one reference for the caller: this text followed by other's.
    virtual I_UniString* concat(const I_UniString* other, I_Error& err) const = 0;
    /// True for the empty text.
    virtual bool isEmpty() const = 0;

protected:
    ~I_UniString() = default; ///< the last release deletes the object
};

} // namespace ZYRPublic
