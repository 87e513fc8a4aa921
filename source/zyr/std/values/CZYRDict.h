/// \file
/// Dictionaries of typed values, their value wrapper and enumeration callbacks; arrays
/// come along from CZYRArray.h.
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

/// A new empty dictionary with one reference for the caller.
[[nodiscard]] ZYRSTD_API I_Dict* createDict(ZYRPublic::I_Error& err);

class CZYRArray;
class CZYRDictEnumProcs;

/// A shared dictionary; copies share contents. Failures are thrown as CZYRError.
class ZYRSTD_API CZYRDict : public CZYRInterfaceValue<I_Dict> {
public:
    CZYRDict(); ///< a new, empty dictionary
    /// Copies and moves share the dictionary; the wrappers take one more reference to it, or adopt
    /// the caller's with `addRef` false.
    ///@{
    CZYRDict(const CZYRDict& other) = default;
    CZYRDict(CZYRDict&& other) noexcept = default;
    CZYRDict(const C_SmartPtr<I_Dict>& dict) : CZYRInterfaceValue(dict.get(), true) {}
    CZYRDict(I_Dict* dict, bool addRef) : CZYRInterfaceValue(dict, addRef) {}
    CZYRDict& operator=(const CZYRDict& other) = default;
    CZYRDict& operator=(CZYRDict&& other) noexcept = default;
    ///@}
    ~CZYRDict() override;

    /// Stores `value` under `key`, replacing what was there; containers and buffers are shared, not
    /// copied. A finalized dictionary throws.
    ///@{
    void set(const CZYRUniString& key, const CZYRUniString& value);
    void set(const CZYRUniString& key, const CZYRDict& value);
    void set(const CZYRUniString& key, const CZYRArray& value);
    void set(const CZYRUniString& key, const CZYRDataBuffer& value);
    void set(const CZYRUniString& key, unsigned int value);
    void set(const CZYRUniString& key, int32_t value);
    void set(const CZYRUniString& key, double value);
    void set(const CZYRUniString& key, bool value);
    ///@}
    /// Removes the key; a missing key is not an error.
    void remove(const CZYRUniString& key);

    /// The value under `key` in `out`, true when found; a missing key gives false
    /// (kZYRErrorKeyNotFound with `throwIfMissing`), a value of another type throws. Object outputs
    /// always change (invalid when missing); scalars only when found.
    ///@{
    bool get(const CZYRUniString& key, CZYRDict& out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, CZYRUniString& out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, CZYRArray& out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, CZYRDataBuffer& out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, unsigned int* out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, int32_t* out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, double* out, bool throwIfMissing = false) const;
    bool get(const CZYRUniString& key, bool* out, bool throwIfMissing = false) const;
    ///@}

    /// The type stored under `key`, kZYRValTypeNone when missing.
    eZYRValType getType(const CZYRUniString& key) const;
    /// The number of keys.
    unsigned int getSize() const;
    /// Calls `procs` once per entry, in table order, until a callback answers false.
    void enumerate(CZYRDictEnumProcs* procs) const;
    /// Makes the dictionary and everything in it read-only; it may then be read from any thread.
    void finalize();
    /// True once finalized.
    bool isFinalized() const;
    /// A deep copy (strings and buffers shared), not finalized.
    CZYRDict clone() const;
    /// The dictionary's process-unique identifier.
    unsigned long long getUniqueID() const;

private:
    I_Dict* valid() const;
};

/// Enumeration callbacks in wrapper types; true means "go on".
class ZYRSTD_API CZYRDictEnumProcs {
public:
    virtual ~CZYRDictEnumProcs();
    /// One entry, by the type of its value.
    ///@{
    virtual bool enumProc(const CZYRUniString& key, const CZYRDataBuffer& value) = 0;
    virtual bool enumProc(const CZYRUniString& key, const CZYRArray& value) = 0;
    virtual bool enumProc(const CZYRUniString& key, const CZYRDict& value) = 0;
    virtual bool enumProc(const CZYRUniString& key, const CZYRUniString& value) = 0;
    virtual bool enumProc(const CZYRUniString& key, bool value) = 0;
    virtual bool enumProc(const CZYRUniString& key, double value) = 0;
    virtual bool enumProc(const CZYRUniString& key, unsigned int value) = 0;
    virtual bool enumProc(const CZYRUniString& key, int32_t value) = 0;
    ///@}
};

} // namespace ZYRStd

#include "zyr/std/values/CZYRArray.h"
