/// \file
/// Arrays of typed values and their value wrapper.
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

/// A new empty array with one reference for the caller.
[[nodiscard]] ZYRSTD_API I_Array* createArray(ZYRPublic::I_Error& err);

class CZYRDict;

/// A shared array; copies share contents. Failures are thrown as CZYRError.
class ZYRSTD_API CZYRArray : public CZYRInterfaceValue<I_Array> {
public:
    CZYRArray(); ///< a new, empty array
    /// Copies and moves share the array; the wrappers take one more reference to it, or adopt the
    /// caller's with `addRef` false.
    ///@{
    CZYRArray(const CZYRArray& other) = default;
    CZYRArray(CZYRArray&& other) noexcept = default;
    CZYRArray(const C_SmartPtr<I_Array>& array) : CZYRInterfaceValue(array.get(), true) {}
    CZYRArray(I_Array* array, bool addRef) : CZYRInterfaceValue(array, addRef) {}
    CZYRArray& operator=(const CZYRArray& other) = default;
    CZYRArray& operator=(CZYRArray&& other) noexcept = default;
    ///@}
    ~CZYRArray() override;

    /// Stores `value` at `index`; containers and buffers are shared, not copied. Setting past
    /// the end grows the array; the elements in between are holes.
    ///@{
    void set(unsigned int index, const CZYRUniString& value);
    void set(unsigned int index, const CZYRDict& value);
    void set(unsigned int index, const CZYRArray& value);
    void set(unsigned int index, const CZYRDataBuffer& value);
    void set(unsigned int index, unsigned int value);
    void set(unsigned int index, int32_t value);
    void set(unsigned int index, double value);
    void set(unsigned int index, bool value);
    ///@}
    /// Inserts the integer 0 before `index`; an index past the end throws kZYRErrorLimitCheck.
    void insert(unsigned int index);
    /// Removes the element at `index`; an index past the end throws kZYRErrorLimitCheck.
    void remove(unsigned int index);

    /// The element at `index` in `out`, true when found; a hole or an index past the end gives
    /// false (kZYRErrorKeyNotFound with `throwIfMissing`), a value of another type throws.
    ///@{
    bool get(unsigned int index, CZYRDict& out, bool throwIfMissing = false) const;
    bool get(unsigned int index, CZYRUniString& out, bool throwIfMissing = false) const;
    bool get(unsigned int index, CZYRArray& out, bool throwIfMissing = false) const;
    bool get(unsigned int index, CZYRDataBuffer& out, bool throwIfMissing = false) const;
    bool get(unsigned int index, unsigned int* out, bool throwIfMissing = false) const;
    bool get(unsigned int index, int32_t* out, bool throwIfMissing = false) const;
    bool get(unsigned int index, double* out, bool throwIfMissing = false) const;
    bool get(unsigned int index, bool* out, bool throwIfMissing = false) const;
    ///@}

    /// The number of elements, holes included.
    unsigned int getLength() const;
    /// The element's type; kZYRValTypeNone for a hole or past the end.
    eZYRValType getType(unsigned int index) const;
    /// Makes the array and everything in it read-only; it may then be read from any thread.
    void finalize();
    /// True once finalized.
    bool isFinalized() const;
    /// A deep copy (strings and buffers shared), not finalized.
    CZYRArray clone() const;
    /// The array's process-unique identifier.
    unsigned long long getUniqueID() const;

private:
    I_Array* valid() const;
};

} // namespace ZYRStd
