// File URLs to paths: any UTF-16 text, through both the value and the boundary forms.
#include <string>

#include "FuzzSupport.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    zyrfuzz::setUpOnce();
    // Half the inputs start as a file URL, so that the decoding is reached often.
    std::u16string text = size && (data[0] & 1) ? u"file://" : u"";
    for (size_t i = 1; i + 1 < size; i += 2) {
        const char16_t unit = static_cast<char16_t>(data[i] | (data[i + 1] << 8));
        if (unit != 0)
            text.push_back(unit);
    }
    const ZYRStd::CZYRWString url(text.c_str(), static_cast<unsigned int>(text.size()));
    const ZYRStd::CZYRWString path = ZYRStd::DecodeFileURL(url);
    // Decoding never makes a text longer.
    if (path.length() > url.length())
        std::abort();

    ZYRStd::C_Error err;
    try {
        const ZYRStd::CZYRUniString uni(text.c_str());
        if (unsigned short* converted = ZYRStd::UniURL2UTF16Path(uni, err))
            ZYRStd::ZYRFree(converted);
    } catch (const ZYRStd::CZYRError&) {
    }
    return 0;
}
