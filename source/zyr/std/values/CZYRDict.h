// Dictionaries of typed values, their value wrapper and enumeration callbacks; arrays
// come along from CZYRArray.h.
#pragma once

#include <cstdint>

#include "C_SmartPtr.h"
#include "I_Dict.h"
#include "ZYRStdExport.h"
#include "zyr/std/values/CZYRDataBuffer.h"
#include "zyr/std/values/CZYRPublicObject.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

using ZYRPublic::eZYRValType;
using ZYRPublic::I_Array;
using ZYRPublic::I_Dict;
using ZYRPublic::I_DictEnumProcs;

// A new empty dictionary with one reference for the caller.
[[nodiscard]] ZYRSTD_API I_Dict* createDict(ZYRPublic::I_Error& err);

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

#include "zyr/std/values/CZYRArray.h"
