// Dictionaries and arrays of typed values, their value wrappers and enumeration callbacks.
#pragma once

#include <cstdint>

#include "C_SmartPtr.h"
#include "I_Dict.h"
#include "ZYRStdExport.h"
#include "zyr/std/CZYRDataBuffer.h"
#include "zyr/std/CZYRPublicObject.h"
#include "zyr/std/CZYRUniString.h"

namespace ZYRStd {

using ZYRPublic::eZYRValType;
using ZYRPublic::I_Array;
using ZYRPublic::I_Dict;
using ZYRPublic::I_DictEnumProcs;

// New empty containers with one reference for the caller.
[[nodiscard]] ZYRSTD_API I_Dict* createDict(ZYRPublic::I_Error& err);
[[nodiscard]] ZYRSTD_API I_Array* createArray(ZYRPublic::I_Error& err);

class CZYRArray;
class CZYRDictEnumProcs;

// A shared dictionary; copies share contents. Failures are thrown as CZYRError.
class ZYRSTD_API CZYRDict : public CZYRInterfaceValue<I_Dict> {
public:
    CZYRDict(); // a new, empty dictionary
    CZYRDict(const CZYRDict& other) = default;
    CZYRDict(CZYRDict&& other) noexcept = default;
    CZYRDict(const C_SmartPtr<I_Dict>& dict) : CZYRInterfaceValue(dict.get(), true) {}
    CZYRDict(I_Dict* dict, bool addRef) : CZYRInterfaceValue(dict, addRef) {}
    CZYRDict& operator=(const CZYRDict& other) = default;
    CZYRDict& operator=(CZYRDict&& other) noexcept = default;
    ~CZYRDict() override;

    void set(const CZYRUniString& key, const CZYRUniString& value);
    void set(const CZYRUniString& key, const CZYRDict& value);
    void set(const CZYRUniString& key, const CZYRArray& value);
    void set(const CZYRUniString& key, const CZYRDataBuffer& value);
    void set(const CZYRUniString& key, unsigned int value);
    void set(const CZYRUniString& key, int32_t value);
    void set(const CZYRUniString& key, double value);
    void set(const CZYRUniString& key, bool value);
    void remove(const CZYRUniString& key);

    // Object outputs always change (invalid when missing); scalars only when found.
    bool get(const CZYRUniString& key, CZYRDict& out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, CZYRUniString& out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, CZYRArray& out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, CZYRDataBuffer& out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, unsigned int* out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, int32_t* out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, double* out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, bool* out, bool throwIfMissing = false) const;

    eZYRValType getType(const CZYRUniString& key) const;
    unsigned int getSize() const;
    void enumerate(CZYRDictEnumProcs* procs) const;
    void finalize();
    bool isFinalized() const;
    CZYRDict clone() const;
    unsigned long long getUniqueID() const;

private:
    I_Dict* valid() const;
};

// A shared array; copies share contents. Failures are thrown as CZYRError.
class ZYRSTD_API CZYRArray : public CZYRInterfaceValue<I_Array> {
public:
    CZYRArray(); // a new, empty array
    CZYRArray(const CZYRArray& other) = default;
    CZYRArray(CZYRArray&& other) noexcept = default;
    CZYRArray(const C_SmartPtr<I_Array>& array) : CZYRInterfaceValue(array.get(), true) {}
    CZYRArray(I_Array* array, bool addRef) : CZYRInterfaceValue(array, addRef) {}
    CZYRArray& operator=(const CZYRArray& other) = default;
    CZYRArray& operator=(CZYRArray&& other) noexcept = default;
    ~CZYRArray() override;

    // Setting past the end grows the array; the elements in between are holes.
    void set(unsigned int index, const CZYRUniString& value);
    void set(unsigned int index, const CZYRDict& value);
    void set(unsigned int index, const CZYRArray& value);
    void set(unsigned int index, const CZYRDataBuffer& value);
    void set(unsigned int index, unsigned int value);
    void set(unsigned int index, int32_t value);
    void set(unsigned int index, double value);
    void set(unsigned int index, bool value);
    void insert(unsigned int index);
    void remove(unsigned int index);

    bool get(unsigned int index, CZYRDict& out, bool throwIfMissing = false) const;
    bool get(unsigned int index, CZYRUniString& out, bool throwIfMissing = false) const;
    bool get(unsigned int index, CZYRArray& out, bool throwIfMissing = false) const;
    bool get(unsigned int index, CZYRDataBuffer& out, bool throwIfMissing = false) const;
    bool get(unsigned int index, unsigned int* out, bool throwIfMissing = false) const;
    bool get(unsigned int index, int32_t* out, bool throwIfMissing = false) const;
    bool get(unsigned int index, double* out, bool throwIfMissing = false) const;
    bool get(unsigned int index, bool* out, bool throwIfMissing = false) const;

    unsigned int getLength() const;
    eZYRValType getType(unsigned int index) const;
    void finalize();
    bool isFinalized() const;
    CZYRArray clone() const;
    unsigned long long getUniqueID() const;

private:
    I_Array* valid() const;
};

// Enumeration callbacks in wrapper types; true means "go on".
class ZYRSTD_API CZYRDictEnumProcs {
public:
    virtual ~CZYRDictEnumProcs();
    virtual bool enumProc(const CZYRUniString& key, const CZYRDataBuffer& value) = 0;
    virtual bool enumProc(const CZYRUniString& key, const CZYRArray& value) = 0;
    virtual bool enumProc(const CZYRUniString& key, const CZYRDict& value) = 0;
    virtual bool enumProc(const CZYRUniString& key, const CZYRUniString& value) = 0;
    virtual bool enumProc(const CZYRUniString& key, bool value) = 0;
    virtual bool enumProc(const CZYRUniString& key, double value) = 0;
    virtual bool enumProc(const CZYRUniString& key, unsigned int value) = 0;
    virtual bool enumProc(const CZYRUniString& key, int32_t value) = 0;
};

} // namespace ZYRStd
