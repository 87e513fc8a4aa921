// ASCIIHex: decoding hostile text, and decode(encode(x)) = x.
#include "FilterFuzz.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    zyrfuzz::fuzzFilter<ZYRStd::CZYRStreamFilterASCIIHEX, ZYRStd::CZYRStreamFilterASCIIHEXDecode>(
        data, size);
    return 0;
}
