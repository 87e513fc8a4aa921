// Small pieces shared by the stream and file-system implementations: the error-reporting
// call of the streams and the conversions between path texts.
#pragma once

#include <utility>

#include "IZYRFileName.h"
#include "I_Error.h"
#include "zyr/std/core/CZYRError.h"
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
    auto& bytes = out.str();
    bytes.reserve(length);
    for (unsigned int i = 0; i < length; ++i) {
        char32_t c = text[i];
        if (c >= 0xD800 && c <= 0xDBFF && i + 1 < length && text[i + 1] >= 0xDC00 &&
            text[i + 1] <= 0xDFFF) {
            c = 0x10000 + ((c - 0xD800) << 10) + (text[++i] - 0xDC00);
        } else if (c >= 0xD800 && c <= 0xDFFF) {
            c = 0xFFFD;
        }
        if (c < 0x80) {
            bytes += static_cast<char>(c);
        } else if (c < 0x800) {
            bytes += static_cast<char>(0xC0 | (c >> 6));
            bytes += static_cast<char>(0x80 | (c & 0x3F));
        } else if (c < 0x10000) {
            bytes += static_cast<char>(0xE0 | (c >> 12));
            bytes += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            bytes += static_cast<char>(0x80 | (c & 0x3F));
        } else {
            bytes += static_cast<char>(0xF0 | (c >> 18));
            bytes += static_cast<char>(0x80 | ((c >> 12) & 0x3F));
            bytes += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            bytes += static_cast<char>(0x80 | (c & 0x3F));
        }
    }
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
