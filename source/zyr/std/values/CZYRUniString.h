/// \file
/// Unicode strings on ICU behind I_UniString, the interning value class CZYRUniString, and
/// the conversions to narrow, UTF-8, host-encoded, 16-bit and path forms.
#pragma once

#include <cstdint>

#include "C_SmartPtr.h"
#include "I_Error.h"
#include "I_UniString.h"
#include "ZYRStdExport.h"
#include "zyr/std/memory/CZYRMemBuffer.h"
#include "zyr/std/values/CZYRPublicObject.h"

namespace ZYRStd {

using ZYRPublic::C_SmartPtr;
using ZYRPublic::I_UniString;

class CZYRString;
class CZYRWString;

/// New strings with one reference for the caller, never interned. Null when `err` already
/// holds an error or the text is null (the encoding overload records the null text). Any thread.
///@{
[[nodiscard]] ZYRSTD_API I_UniString* createUniString(const char* text, const char* encoding,
                                                      ZYRPublic::I_Error& err);
[[nodiscard]] ZYRSTD_API I_UniString* createUniString(const char* text, ZYRPublic::I_Error& err);
[[nodiscard]] ZYRSTD_API I_UniString* createUniString(const char* text, unsigned int length,
                                                      const char* encoding,
                                                      ZYRPublic::I_Error& err);
[[nodiscard]] ZYRSTD_API I_UniString* createUniString(const char16_t* text,
                                                      ZYRPublic::I_Error& err);
///@}

/// A shared, immutable Unicode string; null inside means invalid. Built from text, equal
/// texts share one interned object.
class ZYRSTD_API CZYRUniString : public CZYRInterfaceValue<I_UniString> {
public:
    CZYRUniString() = default;
    /// Copies and moves share the string: one more reference, or the other's taken over.
    ///@{
    CZYRUniString(const CZYRUniString& other) = default;
    CZYRUniString(CZYRUniString&& other) noexcept = default;
    ///@}
    /// Holds `s`: one more reference, or with `addRef` false the caller's reference taken over.
    ///@{
    CZYRUniString(const C_SmartPtr<I_UniString>& s) : CZYRInterfaceValue(s.get(), true) {}
    explicit CZYRUniString(I_UniString* s, bool addRef = false) : CZYRInterfaceValue(s, addRef) {}
    ///@}
    /// The interned string of `text` (in `encoding`, or `length` bytes of it); a failure throws
    /// CZYRError.
    ///@{
    CZYRUniString(const char* text, const char* encoding);
    CZYRUniString(const char* text);
    CZYRUniString(const char* text, unsigned int length, const char* encoding);
    CZYRUniString(const char16_t* text);
    ///@}
    /// Shares the other's string, releasing the one held before.
    ///@{
    CZYRUniString& operator=(const CZYRUniString& other) = default;
    CZYRUniString& operator=(CZYRUniString&& other) noexcept = default;
    ///@}
    ~CZYRUniString() override;

    /// Comparison by text. An invalid left-hand value equals nothing and is less than
    /// everything.
    ///@{
    bool operator==(const CZYRUniString& other) const;
    bool operator==(const I_UniString* other) const;
    bool operator!=(const CZYRUniString& other) const { return !(*this == other); }
    bool operator<(const CZYRUniString& other) const;
    bool operator<(const I_UniString* other) const;
    ///@}

    /// This value becomes the concatenation with `other` (the shared object stays as it is).
    void append(const CZYRUniString& other);
    /// The concatenation with `other`, as a new value.
    CZYRUniString concat(const CZYRUniString& other) const;
    /// `*size` is the capacity in bytes on entry and the needed length in bytes on return.
    ///@{
    void convert(char* buffer, unsigned int* size, const char* encoding) const;
    void convert(char16_t* buffer, unsigned int* size) const;
    ///@}

    /// The text as UTF-16LE, borrowed for the string's life, with its size; null when invalid.
    const char* getUTF16LEBuffer(unsigned int* sizeInBytes) const;
    /// Throws kZYRErrorInvalidObject for an invalid value.
    unsigned long long getUniqueID() const;
    /// The hash of the text; 0 when invalid.
    uint32_t hashCode() const { return impl_ ? impl_->hashCode() : 0; }
    /// True for empty text or an invalid value.
    bool isEmpty() const { return !impl_ || impl_->isEmpty(); }
    /// The string's reference count, for diagnostics only.
    unsigned int debugRefCount() const { return impl_ ? impl_->debugGetRefCount() : 0; }

private:
    void intern(I_UniString* created, const ZYRPublic::I_Error& err);
};

/// Hash and equality by text, for unordered containers of strings.
struct CZYRUniStringHash {
    /// The string's hashCode.
    size_t operator()(const CZYRUniString& s) const noexcept { return s.hashCode(); }
};

/// Conversions to narrow (UniStringToChar, UniStringToString), UTF-8, host-encoded and
/// 16-bit text. The buffer forms convert in two passes into a scratch buffer and return the
/// units written, without the terminator; an invalid string gives empty text.
///@{
ZYRSTD_API unsigned int UniStringToChar(const CZYRUniString& s, CZYRMemBuffer<char>& out);
ZYRSTD_API unsigned int UniStringToUTF8(const CZYRUniString& s, CZYRMemBuffer<char>& out);
ZYRSTD_API unsigned int UniStringToWChar_t(const CZYRUniString& s, CZYRMemBuffer<char16_t>& out);
ZYRSTD_API CZYRString UniStringToString(const CZYRUniString& s);
ZYRSTD_API CZYRString UniStringToUTF8String(const CZYRUniString& s);
ZYRSTD_API CZYRString UniStringToHostEncodingString(const CZYRUniString& s);
ZYRSTD_API CZYRWString UniStringToWString(const CZYRUniString& s);
///@}
/// ICU's default converter name, "UTF-8" when it has none.
ZYRSTD_API const char* GetDefaultCodePage();

/// Zero-terminated UTF-16 paths from a string, an ASCII path or a URL, in blocks from
/// ZYRMalloc that the caller frees with ZYRFree; failures are recorded in `err`.
///@{
ZYRSTD_API unsigned short* UniStringToUTF16Path(CZYRUniString s, ZYRPublic::I_Error& err);
ZYRSTD_API unsigned short* ASCII2UTF16Path(const char* path, ZYRPublic::I_Error& err);
ZYRSTD_API unsigned short* UniURL2UTF16Path(const CZYRUniString& url, ZYRPublic::I_Error& err);
///@}
/// "file://" URLs to POSIX paths ("file:///tmp/a%20b" -> "/tmp/a b"); other texts unchanged.
ZYRSTD_API CZYRWString DecodeFileURL(const CZYRWString& url);

} // namespace ZYRStd
