/// \file
/// The table of shared strings for frequent fixed texts, and the dynamic cache of others.
#pragma once

#include "C_SmartPtr.h"
#include "I_UniString.h"
#include "ZYRStdExport.h"
#include "zyr/std/core/CZYRClientBase.h"

namespace ZYRStd {

using ZYRPublic::C_SmartPtr;
using ZYRPublic::I_UniString;

/// The row of each named common string: kCommonUniStringRow_a is 0, and so on.
enum eZYRCommonUniStringRow : unsigned int {
/// Expands each row of the list into its row constant.
#define ZYR_COMMON_STRING(Name) kCommonUniStringRow_##Name,
#include "zyr/std/values/CZYRCommonUniStrings.def"
    kCommonUniStringNamedRows
};

/// Rows 0 to 625 of the table have an index and an accessor; 626 to 693 are found by text.
///@{
constexpr unsigned int kCommonUniStringRows = 694;
constexpr unsigned int kCommonUniStringAccessors = 626;
///@}
static_assert(kCommonUniStringNamedRows == kCommonUniStringAccessors,
              "every row with an accessor is named in CZYRCommonUniStrings.def");

/// The texts of the rows, in row order.
ZYRSTD_API const char* CommonUniStringText(unsigned int row);

/// The table of common strings: one shared, immutable string object per row, built once at
/// start-up and read from any thread.
class ZYRSTD_API IZYRCommonUniStrings : public CZYRClientBase {
public:
    ~IZYRCommonUniStrings() override;
    /// Row `index` with a reference added; kZYRErrorBadParam from 626 on.
    virtual C_SmartPtr<I_UniString> GetCachedCommonUniString(unsigned int index) const = 0;
    /// The table's object for `s`'s text, or `s` itself.
    virtual C_SmartPtr<I_UniString> findCommonUniString(const C_SmartPtr<I_UniString>& s) const = 0;

    /// One accessor per named row, in row order, named after its text: `str_<text>()` returns
    /// that row with a reference added, from any thread.
#define ZYR_COMMON_STRING(Name)                                                                    \
    virtual C_SmartPtr<I_UniString> str_##Name() const {                                           \
        return GetCachedCommonUniString(kCommonUniStringRow_##Name);                               \
    }
#include "zyr/std/values/CZYRCommonUniStrings.def"
};

/// The host builds the table and the cache at start-up and releases them at shutdown.
///@{
ZYRSTD_API void InitCommonUniStrings();
ZYRSTD_API void ReleaseCommonUniStrings();
///@}
/// Throws kZYRErrorInvalidFuncCall before InitCommonUniStrings.
ZYRSTD_API IZYRCommonUniStrings* GetCommonUniStrings();
/// The same for the dynamic cache.
///@{
ZYRSTD_API void InitDynamicUniStringCache();
ZYRSTD_API void ReleaseDynamicUniStringCache();
///@}
/// The object cached first for `s`'s text, or `s` (which may then be cached).
ZYRSTD_API C_SmartPtr<I_UniString> GetUniStringFromDynamicCache(const C_SmartPtr<I_UniString>& s);

} // namespace ZYRStd
