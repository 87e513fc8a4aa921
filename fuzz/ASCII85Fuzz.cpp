// ASCII85: decoding hostile text, and decode(encode(x)) = x.
#include "FilterFuzz.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    zyrfuzz::fuzzFilter<ZYRStd::CZYRStreamFilterASCII85, ZYRStd::CZYRStreamFilterASCII85Decode>(
        data, size);
    return 0;
}
