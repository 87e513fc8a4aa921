/// \file
/// Dictionaries and arrays of typed values that cross the library boundary.
#pragma once

#include <cstdint>

#include "I_DataBuffer.h"
#include "I_Error.h"
#include "I_UniString.h"

namespace ZYRPublic {

/// The type of a value held in a dictionary or an array.
enum eZYRValType : int32_t {
    kZYRValTypeNone = 0,       ///< a missing key, an index past the end, a hole in an array
    kZYRValTypeBool = 1,       ///< bool
    kZYRValTypeInt = 2,        ///< signed 32-bit integer
    kZYRValTypeUInt = 3,       ///< unsigned 32-bit integer
    kZYRValTypeDouble = 4,     ///< 64-bit double
    kZYRValTypeString = 5,     ///< I_UniString*
    kZYRValTypeDict = 6,       ///< I_Dict*
    kZYRValTypeArray = 7,      ///< I_Array*
    kZYRValTypeDataBuffer = 8, ///< I_DataBuffer*
};

class I_Array;
class I_Dict;

/// Visitor of I_Dict::enumerate, one overload per value type. The key and an
/// object value are borrowed for the call. Return true to go on, false to stop; a failure
/// may be recorded in `err`, which also stops the walk.
class I_DictEnumProcs {
public:
    /// Called once per entry with the value of that type.
    ///@{
    virtual bool enumProc(I_UniString* key, I_DataBuffer* value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, I_Array* value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, I_Dict* value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, I_UniString* value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, bool value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, double value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, unsigned int value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, int32_t value, I_Error& err) = 0;
    ///@}

protected:
    ~I_DictEnumProcs() = default;
};

/// A dictionary from Unicode-string keys to typed values, reference counted.
/// Created by ZYRStd::createDict with one reference for the caller. Operations that take
/// `err` do nothing when it already holds an error, never throw, and record their failure in it.
/// Not locked: one thread changes it at a time; once finalized it may be read from any thread.
class I_Dict {
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
    /// Calls `procs` for each entry in table order (not insertion order) until it returns
    /// false; kZYRErrorBadParam for a null `procs`.
    virtual void enumerate(I_DictEnumProcs* procs, I_Error& err) = 0;
    /// The type stored under `key`; kZYRValTypeNone for a missing or null key.
    virtual eZYRValType getType(I_UniString* key) = 0;
    /// Stores `value` under `key`, replacing any earlier value; an object value gains a
    /// reference held by the dictionary. Records kZYRErrorBadParam for a null key and
    /// kZYRErrorFinalized on a finalized dictionary.
    ///@{
    virtual void set(I_UniString* key, I_DataBuffer* value, I_Error& err) = 0;
    virtual void set(I_UniString* key, I_Array* value, I_Error& err) = 0;
    virtual void set(I_UniString* key, I_Dict* value, I_Error& err) = 0;
    virtual void set(I_UniString* key, I_UniString* value, I_Error& err) = 0;
    virtual void set(I_UniString* key, double value, I_Error& err) = 0;
    virtual void set(I_UniString* key, unsigned int value, I_Error& err) = 0;
    virtual void set(I_UniString* key, int32_t value, I_Error& err) = 0;
    virtual void set(I_UniString* key, bool value, I_Error& err) = 0;
    ///@}
    /// Removes `key` and releases its value; a missing key is no error. Records
    /// kZYRErrorFinalized on a finalized dictionary.
    virtual void remove(I_UniString* key, I_Error& err) = 0;
    /// Reads the value under `key` into `*out`: false, `out` untouched, when the key is missing;
    /// kZYRErrorTypeCheck when the stored type differs (no numeric conversion). Object values
    /// come with one reference the caller owns.
    ///@{
    virtual bool get(I_UniString* key, I_DataBuffer** out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, I_Array** out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, I_Dict** out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, I_UniString** out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, double* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, unsigned int* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, int32_t* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, bool* out, I_Error& err) = 0;
    ///@}
    /// Makes this dictionary and every dictionary and array nested in it read-only for good.
    virtual void finalize(I_Error& err) = 0;
    /// True once finalize has run.
    virtual bool isFinalized(I_Error& err) = 0;
    /// The number of entries.
    virtual unsigned int getSize(I_Error& err) = 0;
    /// A deep copy, not finalized, with one reference for the caller: nested containers are
    /// cloned, strings and data buffers shared. Null on failure.
    virtual I_Dict* clone(I_Error& err) = 0;

protected:
    ~I_Dict() = default;
};

/// A growable array of typed values, reference counted; may hold holes (kZYRValTypeNone).
/// Created by ZYRStd::createArray with one reference for the caller. Error, thread and
/// finalization rules are those of I_Dict.
class I_Array {
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
    /// Stores `value` at `index`, growing the array with holes when `index` is past the end;
    /// an object value gains a reference. Records kZYRErrorFinalized on a finalized array.
    ///@{
    virtual void set(unsigned int index, I_DataBuffer* value, I_Error& err) = 0;
    virtual void set(unsigned int index, I_Array* value, I_Error& err) = 0;
    virtual void set(unsigned int index, I_Dict* value, I_Error& err) = 0;
    virtual void set(unsigned int index, I_UniString* value, I_Error& err) = 0;
    virtual void set(unsigned int index, double value, I_Error& err) = 0;
    virtual void set(unsigned int index, unsigned int value, I_Error& err) = 0;
    virtual void set(unsigned int index, int32_t value, I_Error& err) = 0;
    virtual void set(unsigned int index, bool value, I_Error& err) = 0;
    ///@}
    /// Reads the element at `index` into `*out`: false for a hole or an index past the end;
    /// kZYRErrorTypeCheck when the stored type differs. Object values come with one
    /// reference the caller owns.
    ///@{
    virtual bool get(unsigned int index, I_DataBuffer** out, I_Error& err) = 0;
    virtual bool get(unsigned int index, I_Array** out, I_Error& err) = 0;
    virtual bool get(unsigned int index, I_Dict** out, I_Error& err) = 0;
    virtual bool get(unsigned int index, I_UniString** out, I_Error& err) = 0;
    virtual bool get(unsigned int index, double* out, I_Error& err) = 0;
    virtual bool get(unsigned int index, unsigned int* out, I_Error& err) = 0;
    virtual bool get(unsigned int index, int32_t* out, I_Error& err) = 0;
    virtual bool get(unsigned int index, bool* out, I_Error& err) = 0;
    ///@}
    /// Inserts the integer 0 before `index`; kZYRErrorLimitCheck when `index` is not below
    /// the length, kZYRErrorFinalized on a finalized array. Append with set at the length.
    virtual void insert(unsigned int index, I_Error& err) = 0;
    /// Erases the element at `index`; later elements move down. Same errors as insert.
    virtual void remove(unsigned int index, I_Error& err) = 0;
    /// The number of elements, holes included.
    virtual unsigned int getLength(I_Error& err) = 0;
    /// The type at `index`; kZYRValTypeNone for a hole or an index past the end.
    virtual eZYRValType getType(unsigned int index) = 0;
    /// Makes this array and every container nested in it read-only for good.
    virtual void finalize(I_Error& err) = 0;
    /// True once finalize has run.
    virtual bool isFinalized(I_Error& err) = 0;
    /// A deep copy, not finalized, with one reference for the caller; holes are kept.
    virtual I_Array* clone(I_Error& err) = 0;

protected:
    ~I_Array() = default;
};

} // namespace ZYRPublic
