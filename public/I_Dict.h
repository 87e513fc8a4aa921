// Dictionaries and arrays of typed values that cross the library boundary.
#pragma once

#include <cstdint>

#include "I_DataBuffer.h"
#include "I_Error.h"
#include "I_UniString.h"

namespace ZYRPublic {

enum eZYRValType : int32_t {
    kZYRValTypeNone = 0, // a missing key, an index past the end, a hole in an array
    kZYRValTypeBool = 1,
    kZYRValTypeInt = 2,
    kZYRValTypeUInt = 3,
    kZYRValTypeDouble = 4,
    kZYRValTypeString = 5,
    kZYRValTypeDict = 6,
    kZYRValTypeArray = 7,
    kZYRValTypeDataBuffer = 8,
};

class I_Array;
class I_Dict;

// Called once per entry; true means "go on".
class I_DictEnumProcs {
public:
    virtual bool enumProc(I_UniString* key, I_DataBuffer* value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, I_Array* value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, I_Dict* value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, I_UniString* value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, bool value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, double value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, unsigned int value, I_Error& err) = 0;
    virtual bool enumProc(I_UniString* key, int32_t value, I_Error& err) = 0;

protected:
    ~I_DictEnumProcs() = default;
};

class I_Dict {
public:
    virtual void addRef() = 0;
    virtual void release() = 0;
    virtual bool isShared() const = 0;
    virtual unsigned int debugGetRefCount() const = 0;
    virtual const unsigned int* debugGetRefCountAddr() const = 0;
    virtual uint64_t getUniqueID() const = 0;
    virtual void enumerate(I_DictEnumProcs* procs, I_Error& err) = 0;
    virtual eZYRValType getType(I_UniString* key) = 0;
    virtual void set(I_UniString* key, I_DataBuffer* value, I_Error& err) = 0;
    virtual void set(I_UniString* key, I_Array* value, I_Error& err) = 0;
    virtual void set(I_UniString* key, I_Dict* value, I_Error& err) = 0;
    virtual void set(I_UniString* key, I_UniString* value, I_Error& err) = 0;
    virtual void set(I_UniString* key, double value, I_Error& err) = 0;
    virtual void set(I_UniString* key, unsigned int value, I_Error& err) = 0;
    virtual void set(I_UniString* key, int32_t value, I_Error& err) = 0;
    virtual void set(I_UniString* key, bool value, I_Error& err) = 0;
    virtual void remove(I_UniString* key, I_Error& err) = 0;
    // Object values come with a reference the caller owns.
    virtual bool get(I_UniString* key, I_DataBuffer** out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, I_Array** out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, I_Dict** out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, I_UniString** out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, double* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, unsigned int* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, int32_t* out, I_Error& err) = 0;
    virtual bool get(I_UniString* key, bool* out, I_Error& err) = 0;
    virtual void finalize(I_Error& err) = 0;
    virtual bool isFinalized(I_Error& err) = 0;
    virtual unsigned int getSize(I_Error& err) = 0;
    virtual I_Dict* clone(I_Error& err) = 0;

protected:
    ~I_Dict() = default;
};

class I_Array {
public:
    virtual void addRef() = 0;
    virtual void release() = 0;
    virtual bool isShared() const = 0;
    virtual unsigned int debugGetRefCount() const = 0;
    virtual const unsigned int* debugGetRefCountAddr() const = 0;
    virtual uint64_t getUniqueID() const = 0;
    virtual void set(unsigned int index, I_DataBuffer* value, I_Error& err) = 0;
    virtual void set(unsigned int index, I_Array* value, I_Error& err) = 0;
    virtual void set(unsigned int index, I_Dict* value, I_Error& err) = 0;
    virtual void set(unsigned int index, I_UniString* value, I_Error& err) = 0;
    virtual void set(unsigned int index, double value, I_Error& err) = 0;
    virtual void set(unsigned int index, unsigned int value, I_Error& err) = 0;
    virtual void set(unsigned int index, int32_t value, I_Error& err) = 0;
    virtual void set(unsigned int index, bool value, I_Error& err) = 0;
    virtual bool get(unsigned int index, I_DataBuffer** out, I_Error& err) = 0;
    virtual bool get(unsigned int index, I_Array** out, I_Error& err) = 0;
    virtual bool get(unsigned int index, I_Dict** out, I_Error& err) = 0;
    virtual bool get(unsigned int index, I_UniString** out, I_Error& err) = 0;
    virtual bool get(unsigned int index, double* out, I_Error& err) = 0;
    virtual bool get(unsigned int index, unsigned int* out, I_Error& err) = 0;
    virtual bool get(unsigned int index, int32_t* out, I_Error& err) = 0;
    virtual bool get(unsigned int index, bool* out, I_Error& err) = 0;
    virtual void insert(unsigned int index, I_Error& err) = 0;
    virtual void remove(unsigned int index, I_Error& err) = 0;
    virtual unsigned int getLength(I_Error& err) = 0;
    virtual eZYRValType getType(unsigned int index) = 0;
    virtual void finalize(I_Error& err) = 0;
    virtual bool isFinalized(I_Error& err) = 0;
    virtual I_Array* clone(I_Error& err) = 0;

protected:
    ~I_Array() = default;
};

} // namespace ZYRPublic
