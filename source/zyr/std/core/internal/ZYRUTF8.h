// The one UTF-8 coder of the library, its host kit, its tool and its tests: text, and paths.
//
// A path on Linux is bytes. Between UTF-16 and those bytes a path converts as UTF-8, and a
// byte that is not part of valid UTF-8 travels as the lone surrogate U+DC80 + (byte - 0x80),
// which converts back to that byte: every existing name opens and round-trips.
#pragma once

#include <cstddef>

namespace ZYRStd::detail {

// Appends `count` units as UTF-8: 16-bit units are UTF-16 (a surrogate pair is one code
// point), wider ones are code points. A lone surrogate or a value past U+10FFFF has no UTF-8
// form and becomes U+FFFD, except that with `escapedBytes` a lone U+DC80..U+DCFF becomes the
// byte it stands for.
template <class Bytes, class Unit>
void appendUTF8(Bytes& out, const Unit* units, std::size_t count, bool escapedBytes = false) {
    for (std::size_t i = 0; i < count; ++i) {
        auto c = static_cast<char32_t>(units[i]);
        if constexpr (sizeof(Unit) == 2) {
            if (c >= 0xD800 && c <= 0xDBFF && i + 1 < count && units[i + 1] >= 0xDC00 &&
                units[i + 1] <= 0xDFFF) {
                c = 0x10000 + ((c - 0xD800) << 10) + (units[++i] - 0xDC00);
            }
        }
        if (escapedBytes && c >= 0xDC80 && c <= 0xDCFF) {
            out += static_cast<char>(c - 0xDC00);
            continue;
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

// The code point of the well-formed UTF-8 sequence at `p`, advancing `p` past it; -1, with
// `p` unmoved, when the bytes there are not one (overlong forms, encoded surrogates and values
// past U+10FFFF are not).
inline long decodeUTF8(const unsigned char*& p, const unsigned char* end) {
    const unsigned char lead = *p;
    if (lead < 0x80) {
        ++p;
        return lead;
    }
    unsigned int extra = 0;
    char32_t c = 0;
    if (lead >= 0xC2 && lead <= 0xDF) {
        extra = 1;
        c = lead & 0x1F;
    } else if (lead >= 0xE0 && lead <= 0xEF) {
        extra = 2;
        c = lead & 0x0F;
    } else if (lead >= 0xF0 && lead <= 0xF4) {
        extra = 3;
        c = lead & 0x07;
    } else {
        return -1;
    }
    if (static_cast<std::size_t>(end - p) <= extra)
        return -1;
    for (unsigned int i = 1; i <= extra; ++i) {
        if ((p[i] & 0xC0) != 0x80)
            return -1;
        c = (c << 6) | (p[i] & 0x3F);
    }
    constexpr char32_t lowest[] = {0, 0x80, 0x800, 0x10000};
    if (c < lowest[extra] || c > 0x10FFFF || (c >= 0xD800 && c <= 0xDFFF))
        return -1;
    p += extra + 1;
    return static_cast<long>(c);
}

// Appends the path bytes [bytes, bytes + count) as UTF-16 units, each byte outside valid
// UTF-8 as its lone surrogate.
template <class Units> void appendPathUnits(Units& out, const char* bytes, std::size_t count) {
    const auto* p = reinterpret_cast<const unsigned char*>(bytes);
    const unsigned char* const end = p + count;
    while (p < end) {
        const long c = decodeUTF8(p, end);
        if (c < 0) {
            out += static_cast<char16_t>(0xDC00 + *p++);
        } else if (c >= 0x10000) {
            out += static_cast<char16_t>(0xD800 + ((c - 0x10000) >> 10));
            out += static_cast<char16_t>(0xDC00 + ((c - 0x10000) & 0x3FF));
        } else {
            out += static_cast<char16_t>(c);
        }
    }
}

// Appends the UTF-16 path [units, units + count) as the bytes the file system is given.
template <class Bytes> void appendPathBytes(Bytes& out, const char16_t* units, std::size_t count) {
    appendUTF8(out, units, count, true);
}

} // namespace ZYRStd::detail
