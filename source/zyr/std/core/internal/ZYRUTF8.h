// The one UTF-8 encoder of the library, its host kit and its tool.
#pragma once

#include <cstddef>

namespace ZYRStd::detail {

// Appends `count` units as UTF-8: 16-bit units are UTF-16 (a surrogate pair is one code
// point), wider ones are code points. A lone surrogate or a value past U+10FFFF has no UTF-8
// form and becomes U+FFFD.
template <class Bytes, class Unit>
void appendUTF8(Bytes& out, const Unit* units, std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) {
        auto c = static_cast<char32_t>(units[i]);
        if constexpr (sizeof(Unit) == 2) {
            if (c >= 0xD800 && c <= 0xDBFF && i + 1 < count && units[i + 1] >= 0xDC00 &&
                units[i + 1] <= 0xDFFF) {
                c = 0x10000 + ((c - 0xD800) << 10) + (units[++i] - 0xDC00);
            }
        }
        if (c > 0x10FFFF || (c >= 0xD800 && c <= 0xDFFF))
            c = 0xFFFD;
        if (c < 0x80) {
            out += static_cast<char>(c);
        } else if (c < 0x800) {
            out += static_cast<char>(0xC0 | (c >> 6));
            out += static_cast<char>(0x80 | (c & 0x3F));
        } else if (c < 0x10000) {
            out += static_cast<char>(0xE0 | (c >> 12));
            out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (c & 0x3F));
        } else {
            out += static_cast<char>(0xF0 | (c >> 18));
            out += static_cast<char>(0x80 | ((c >> 12) & 0x3F));
            out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (c & 0x3F));
        }
    }
}

} // namespace ZYRStd::detail
