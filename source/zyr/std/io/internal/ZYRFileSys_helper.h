// Small pieces shared by the stream and file-system implementations: the error-reporting
// call of the streams and the conversions between path texts.
#pragma once

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

// UTF-16 to UTF-8, the encoding of POSIX path bytes. A lone surrogate becomes U+FFFD.
inline ZYRStd::CZYRString utf16ToUTF8(const char16_t* text, unsigned int length) {
    ZYRStd::CZYRString out;
    out.str().reserve(length);
    ZYRStd::detail::appendUTF8(out.str(), text, length);
    return out;
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

// The path bytes the operating system is given.
inline ZYRStd::CZYRString nativePathOf(const ZYRStd::CZYRUniString& path) {
    return utf16ToUTF8(ZYRStd::UniStringToWString(path));
}

} // namespace ZYRFileSys
