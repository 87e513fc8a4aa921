// Unicode strings from bytes in every encoding the library names, and back out through
// every conversion.
#include <string>

#include "FuzzSupport.h"

namespace {

constexpr const char* kEncodings[] = {"UTF-16LE", "UTF-8", "US-ASCII", "ASCII", nullptr};

void convertEveryWay(const ZYRStd::CZYRUniString& s) {
    ZYRStd::UniStringToString(s);
    ZYRStd::UniStringToUTF8String(s);
    ZYRStd::UniStringToHostEncodingString(s);
    const ZYRStd::CZYRWString wide = ZYRStd::UniStringToWString(s);
    ZYRStd::CZYRMemBuffer<char> narrow;
    ZYRStd::UniStringToChar(s, narrow);
    ZYRStd::UniStringToUTF8(s, narrow);
    ZYRStd::CZYRMemBuffer<char16_t> units;
    ZYRStd::UniStringToWChar_t(s, units);
    for (const char* encoding : kEncodings) {
        char small[16];
        unsigned int room = sizeof small;
        s.convert(small, &room, encoding ? encoding : ZYRStd::GetDefaultCodePage());
    }
    ZYRStd::C_Error err;
    if (unsigned short* path = ZYRStd::UniStringToUTF16Path(s, err))
        ZYRStd::ZYRFree(path);
    // The same text rebuilt from its UTF-16 form is the same string (the wide form of a
    // text with a NUL unit stops there, so those are left out).
    unsigned int bytes = 0;
    const char* ownUnits = s.getUTF16LEBuffer(&bytes);
    const std::u16string own(reinterpret_cast<const char16_t*>(ownUnits), bytes / 2);
    if (own.find(u'\0') == std::u16string::npos) {
        if (std::u16string(wide.c_str(), wide.length()) != own ||
            ZYRStd::CZYRUniString(own.c_str()) != s)
            std::abort();
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    zyrfuzz::setUpOnce();
    if (size == 0)
        return 0;
    const char* encoding = kEncodings[data[0] % std::size(kEncodings)];
    const std::string bytes(reinterpret_cast<const char*>(data + 1), size - 1);
    try {
        const ZYRStd::CZYRUniString s =
            encoding ? ZYRStd::CZYRUniString(bytes.data(), static_cast<unsigned int>(bytes.size()),
                                             encoding)
                     : ZYRStd::CZYRUniString(bytes.c_str());
        convertEveryWay(s);
        convertEveryWay(s.concat(s));
    } catch (const ZYRStd::CZYRError&) {
        // Text an encoding cannot carry is refused with an error.
    }
    return 0;
}
