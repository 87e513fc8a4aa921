// Small pieces shared by the stream and file-system implementations: the error-reporting
// call of the streams and the conversions between path texts.
#pragma once

#include <string>
#include <string_view>
#include <utility>

#include "IZYRFileName.h"
#include "I_Error.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/internal/ZYRUTF8.h"
#include "zyr/std/values/CZYRString.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRFileSys {

// The error-reporting read and write of every stream: the error type goes into `err`,
// the result is 0 and nothing propagates. `err` is left alone on success.
template <class Body>
unsigned int reportStreamError(ZYRPublic::eZYRErrorType& err, Body&& body) noexcept {
    try {
        return std::forward<Body>(body)();
    } catch (const ZYRStd::CZYRError& e) {
        err = e.getError();
    } catch (...) {
        err = ZYRPublic::kZYRErrorUnknown;
    }
    return 0;
}

// A UTF-16 path as the bytes the file system is given (UTF-8, with escaped bytes restored).
inline ZYRStd::CZYRString utf16ToUTF8(const char16_t* text, unsigned int length) {
    ZYRStd::CZYRString out;
    out.str().reserve(length);
    ZYRStd::detail::appendPathBytes(out.str(), text, length);
    return out;
}

// Path bytes as the library's path text; bytes outside UTF-8 travel as lone surrogates.
inline ZYRStd::CZYRUniString uniPathOf(const char* bytes, std::size_t length) {
    std::u16string units;
    units.reserve(length);
    ZYRStd::detail::appendPathUnits(units, bytes, length);
    return ZYRStd::CZYRUniString(units.c_str());
}

inline ZYRStd::CZYRUniString uniPathOf(const char* bytes) {
    return uniPathOf(bytes, std::char_traits<char>::length(bytes));
}

inline ZYRStd::CZYRString utf16ToUTF8(const ZYRStd::CZYRWString& text) {
    return utf16ToUTF8(text.c_str(), text.length());
}

// The text of a file name; a null name or a null path is the empty path.
inline ZYRStd::CZYRWString widePathOf(const ZYRFileName::IZYRFileName* name) {
    const ZYRStd::CZYRWString* path = name ? name->getFullPath() : nullptr;
    return path ? *path : ZYRStd::CZYRWString();
}

inline ZYRStd::CZYRUniString uniStringOf(const ZYRStd::CZYRWString& text) {
    return ZYRStd::CZYRUniString(text.c_str());
}

// The units of a path as they are, up to the first zero unit: the wide conversion of strings
// would make the lone surrogate of an escaped byte into U+FFFD.
inline ZYRStd::CZYRWString pathUnitsOf(const ZYRStd::CZYRUniString& path) {
    unsigned int bytes = 0;
    const char* data = path.isValid() ? path.getImpl()->getUTF16LEBuffer(&bytes) : nullptr;
    if (!data)
        return {};
    std::u16string_view units(reinterpret_cast<const char16_t*>(data), bytes / 2);
    units = units.substr(0, units.find(u'\0'));
    return ZYRStd::CZYRWString(units.data(), static_cast<unsigned int>(units.size()));
}

// The path bytes the operating system is given.
inline ZYRStd::CZYRString nativePathOf(const ZYRStd::CZYRUniString& path) {
    return utf16ToUTF8(pathUnitsOf(path));
}

} // namespace ZYRFileSys
