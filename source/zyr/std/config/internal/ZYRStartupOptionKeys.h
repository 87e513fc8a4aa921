// Every setup-file key the start-up options know, with how it is read and how its effective
// value prints, and the host's start-up order over them. One list for hosts, tools and tests.
#pragma once

#include <cstdio>
#include <cstring>
#include <string>
#include <type_traits>

#include "zyr/std/config/ZYRStartupOptions.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

// How a key's value is read (see the key setters).
enum class eZYRStartupReading {
    kBool,     // TrueOrFalse
    kHighLow,  // HighOrLow
    kInt,      // atoi
    kUnsigned, // atoi taken as unsigned
    kInt64,    // a signed 64-bit number
    kFloat,    // atof narrowed to 32 bits
    kText,     // copied as it is
    kWord,     // one of a few names
    kSpecial,  // a rule of its own: rounded, clamped, a bit of a word, or handed elsewhere
};

struct sZYRStartupOptionKey {
    const char* key;
    eZYRStartupReading reading;
    // The effective value as text; null for a key that only acts on something else.
    std::string (*show)();
};

namespace detail {
inline std::string showValue(bool v) {
    return v ? "true" : "false";
}
inline std::string showValue(int32_t v) {
    return std::to_string(v);
}
inline std::string showValue(unsigned int v) {
    return std::to_string(v);
}
inline std::string showValue(long long v) {
    return std::to_string(v);
}
inline std::string showValue(unsigned long long v) {
    return std::to_string(v);
}
inline std::string showValue(float v) {
    char text[64];
    std::snprintf(text, sizeof text, "%g", static_cast<double>(v));
    return text;
}
inline std::string showValue(const std::string& v) {
    return v;
}
template <class Enum>
requires std::is_enum_v<Enum> std::string showValue(Enum v) {
    return std::to_string(static_cast<int32_t>(v));
}

template <class Record> const Record& storedRecord();
template <> inline const sMTOptions& storedRecord() {
    return ZYRGetMTOptions();
}
template <> inline const sDLCacheOptions& storedRecord() {
    return ZYRGetDLCacheOptions();
}
template <> inline const sMarkerOptions& storedRecord() {
    return ZYRGetMarkerOptions();
}
template <> inline const sSLDLOptions& storedRecord() {
    return ZYRGetSLDLOptions();
}
} // namespace detail

// The four records' keys, then the store's, in the order the option tables list them.
inline const sZYRStartupOptionKey kZYRStartupOptionKeys[] = {
#define ZYR_RECORD_KEY(record, key, field, reading, rule, value)                                   \
    {key, eZYRStartupReading::reading,                                                             \
     [] { return detail::showValue(detail::storedRecord<record>().field); }},
#define ZYR_STORE_KEY(setter, key, field, type, value, reading, rule, getter)                      \
    {key, eZYRStartupReading::reading, [] { return detail::showValue(getter()); }},
#define ZYR_OWN_KEY(setter, key, rule, reading, getter)                                            \
    {key, eZYRStartupReading::reading, [] { return detail::showValue(getter()); }},
#define ZYR_ACTION_KEY(setter, key, rule, reading) {key, eZYRStartupReading::reading, nullptr},
#include "zyr/std/config/internal/ZYRStartupOptions.def"
};

using tZYRStartupKeySetter = void (*)(const char* key, const char* value);

// Every key setter of the store; each ignores the keys of the others.
inline constexpr tZYRStartupKeySetter kZYRStartupKeySetters[] = {
#define ZYR_KEY_SETTER(setter) setter,
#include "zyr/std/config/internal/ZYRStartupOptions.def"
};

// True for a key that some setter or record parser acts on.
inline bool ZYRIsStartupOptionKey(const char* key) {
    for (const sZYRStartupOptionKey& row : kZYRStartupOptionKeys) {
        if (std::strcmp(row.key, key) == 0)
            return true;
    }
    return false;
}

// The host's start-up order: records filled with their defaults, every pair fed to every
// key setter and record parser, then the records stored.
class CZYRStartupOptionFeeder {
public:
    CZYRStartupOptionFeeder() {
        ZYRFillDefaultMTOptions(mt_);
        ZYRFillDefaultDLCacheOptions(dlCache_, CZYRUniString());
        ZYRFillDefaultMarkerOptions(marker_);
        ZYRFillDefaultSLDLOptions(sldl_);
    }

    void feed(const char* key, const char* value) {
        for (const tZYRStartupKeySetter setter : kZYRStartupKeySetters)
            setter(key, value);
        ZYRParseMTOptions(&mt_, key, value);
        ZYRParseDLCacheOptions(&dlCache_, key, value);
        ZYRParseMarkerOptions(&marker_, key, value);
        ZYRParseSLDLOptions(&sldl_, key, value);
    }

    void store() const {
        ZYRSetMTOptions(mt_);
        ZYRSetDLCacheOptions(dlCache_);
        ZYRSetMarkerOptions(marker_);
        ZYRSetSLDLOptions(sldl_);
    }

private:
    sMTOptions mt_;
    sDLCacheOptions dlCache_;
    sMarkerOptions marker_;
    sSLDLOptions sldl_;
};

} // namespace ZYRStd
