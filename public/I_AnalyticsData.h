/// \file
/// The analytics record that crosses the library boundary: keys and values about a piece of
/// work, handed to the analytics manager when finalized.
#pragma once

#include <cstdint>

#include "I_Error.h"
#include "I_UniString.h"

namespace ZYRPublic {

/// A record of named values about one piece of work, for the telemetry log. Made by
/// ZYRStd::createAnalyticsData with one reference for the caller; filled by one thread,
/// then finalized, which hands it to the analytics manager's worker thread. Operations
/// with `err` never throw and do nothing when it already holds an error.
class I_AnalyticsData {
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
    /// Stores `value` under `key`; a record made while analytics were inactive drops every
    /// value without error. Records kZYRErrorFinalized after finalize.
    ///@{
    virtual void set(I_UniString* key, I_UniString* value, I_Error& err) = 0;
    virtual void set(I_UniString* key, double value, I_Error& err) = 0;
    virtual void set(I_UniString* key, unsigned int value, I_Error& err) = 0;
    virtual void set(I_UniString* key, int32_t value, I_Error& err) = 0;
    virtual void set(I_UniString* key, bool value, I_Error& err) = 0;
    /// Reads the value under `key`: false when missing; kZYRErrorTypeCheck when the stored
    /// type differs. A string comes with one reference the caller owns.
    ///@{
    virtual bool get(I_UniString* key, I_UniString** out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, double* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, unsigned int* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, int32_t* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, bool* out, I_Error& err) = 0;
    ///@}
    /// False when the record was made while analytics were inactive.
    virtual bool isAnalyticsEnabled() = 0;
    /// Queues an enabled record to the analytics manager; later sets fail.
    virtual void finalize(I_Error& err) = 0;
    /// True once finalize has run.
    virtual bool isFinalized(I_Error& err) = 0;

protected:
    ~I_AnalyticsData() = default; ///< the last release deletes the object
};

} // namespace ZYRPublic
