// Hexadecimal text to a narrow string: any text, no crash, at most one byte per two digits.
#include <cstring>

#include "FuzzSupport.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    zyrfuzz::setUpOnce();
    const std::string text(reinterpret_cast<const char*>(data), size);
    const ZYRStd::CZYRString bytes = ZYRStd::CZYRStringFromHexASCIIString(text.c_str());
    if (bytes.length() > std::strlen(text.c_str()) / 2 + 1)
        std::abort();
    return 0;
}
