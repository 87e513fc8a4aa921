// The analytics record that crosses the library boundary: keys and values about a piece of
// work, handed to the analytics manager when finalized.
#pragma once

#include <cstdint>

#include "I_Error.h"
#include "I_UniString.h"

namespace ZYRPublic {

class I_AnalyticsData {
public:
    virtual void addRef() = 0;
    virtual void release() = 0;
    virtual bool isShared() const = 0;
    virtual unsigned int debugGetRefCount() const = 0;
    virtual const unsigned int* debugGetRefCountAddr() const = 0;
    virtual uint64_t getUniqueID() const = 0;
    // A record created while analytics were inactive drops every value without error.
    virtual void set(I_UniString* key, I_UniString* value, I_Error& err) = 0;
    virtual void set(I_UniString* key, double value, I_Error& err) = 0;
    virtual void set(I_UniString* key, unsigned int value, I_Error& err) = 0;
    virtual void set(I_UniString* key, int32_t value, I_Error& err) = 0;
    virtual void set(I_UniString* key, bool value, I_Error& err) = 0;
    // String values come with a reference the caller owns.
    virtual bool get(I_UniString* key, I_UniString** out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, double* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, unsigned int* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, int32_t* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, bool* out, I_Error& err) = 0;
    virtual bool isAnalyticsEnabled() = 0;
    // Queues an enabled record to the analytics manager; later sets fail.
    virtual void finalize(I_Error& err) = 0;
    virtual bool isFinalized(I_Error& err) = 0;

protected:
    ~I_AnalyticsData() = default; // the last release deletes the object
};

} // namespace ZYRPublic
