// Trace messages against a job's trace configuration read from the input: areas and
// categories with levels of any number or type, nested deeply, the process-wide tracing
// dictionary on top, then whole and multi-part messages in any order with any text. Every
// message the host receives must be one the levels let through.
#include <string>
#include <vector>

#include "FuzzSupport.h"

namespace {

using ZYRStd::CZYRDict;
using ZYRStd::CZYRUniString;

constexpr const char* kNames[] = {"All", "Render", "Memory", "Bands", "Fonts", ""};

CZYRUniString name(zyrfuzz::Input& in) {
    return CZYRUniString(kNames[in.byte() % std::size(kNames)]);
}

// A level of any kind: a number, text, a dictionary nested up to `depth` deep.
void setLevel(zyrfuzz::Input& in, CZYRDict& dict, const CZYRUniString& key, int depth) {
    switch (in.byte() % 4) {
    case 0:
        dict.set(key, static_cast<int32_t>(in.byte()) - 8);
        break;
    case 1:
        dict.set(key, static_cast<int32_t>(in.u32()));
        break;
    case 2:
        dict.set(key, CZYRUniString(in.text(8).c_str()));
        break;
    default: {
        CZYRDict inner;
        if (depth > 0)
            setLevel(in, inner, name(in), depth - 1);
        dict.set(key, inner);
    }
    }
}

CZYRDict configuration(zyrfuzz::Input& in) {
    CZYRDict config;
    for (int n = in.byte() % 6; n > 0; --n) {
        CZYRDict area;
        for (int m = in.byte() % 4; m > 0; --m)
            setLevel(in, area, name(in), in.byte() % 3 == 0 ? in.byte() + 100 : 2);
        config.set(name(in), area);
    }
    if (in.byte() % 2)
        setLevel(in, config, CZYRUniString("All"), 1);
    config.set(CZYRUniString("Path"), CZYRUniString("stdout")); // to the host, not a file
    return config;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    zyrfuzz::setUpOnce();
    zyrfuzz::Input in(data, size);
    CZYRDict params;
    params.set(CZYRUniString("JPJobID"), 7);
    params.set(CZYRUniString("ZYRTraceMsg"), configuration(in));
    if (in.byte() % 4 == 0)
        ZYRStd::ZYRTracingDict::getInstance().setTracingDict(configuration(in));
    int received = 0;
    try {
        ZYRStd::CZYRTraceMsg trace(ZYRHostKit::makeHostJob(
            7, params.getImpl(),
            [&](const ZYRPublic::sZYRTraceMsg& message, const ZYRPublic::sZYRTraceMsgDetail&) {
                zyrfuzz::require(message.text || message.wtext);
                ++received;
            }));
        for (int steps = 0; !in.empty() && steps < 256; ++steps) {
            const CZYRUniString area = name(in), category = name(in);
            const auto level = static_cast<ZYRPublic::eZYRTraceMsgLevel>(in.byte() % 8);
            const bool always = in.byte() % 8 == 0;
            const std::string text = in.text(40);
            const int before = received;
            switch (in.byte() % 6) {
            case 0: {
                const bool passes = always || level <= trace.getTraceMsgLevel(area, category);
                trace.traceMsg(area, category, level, text.c_str(), always);
                zyrfuzz::require(received == before + (passes ? 1 : 0) || !trace.isSendToHost());
                break;
            }
            case 1:
                trace.beginTraceMsg(area, category, level, text.c_str(), always);
                break;
            case 2:
                trace.traceMsg(text.c_str());
                break;
            case 3: {
                std::u16string wide(text.begin(), text.end());
                trace.traceMsg(area, category, level, wide.c_str(), always);
                break;
            }
            case 4:
                trace.endTraceMsg();
                break;
            default:
                (void)trace.getTraceMsgLevel(area, category);
            }
        }
    } catch (const ZYRStd::CZYRError&) {
        // A configuration the library refuses is reported, not crashed on.
    }
    ZYRStd::ZYRTracingDict::getInstance().setTracingDict(CZYRDict());
    return 0;
}
