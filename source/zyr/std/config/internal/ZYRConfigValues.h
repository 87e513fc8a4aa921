// The readings of setup-file values: the C library's number rules, made to saturate.
#pragma once

#include <cstdint>

namespace ZYRStd::detail {

// atoi's reading (leading blanks, a sign, the digits up to the first other byte, 0 for
// none), saturated at the 32-bit bounds instead of overflowing.
int32_t readInt32(const char* s);
// The same for a signed 64-bit number (what "%I64d" and _atoi64 read); `found` tells
// whether any digit was there.
int64_t readInt64(const char* s, bool* found = nullptr);
// atof's reading narrowed to 32 bits; beyond the float range it gives an infinity.
float readFloat(const char* s);
// True when `s` is a decimal number and nothing else (blanks and a sign may lead).
bool isWholeNumber(const char* s);

} // namespace ZYRStd::detail
