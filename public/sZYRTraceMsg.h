// The records a trace message travels in, and the host's trace callback type.
#pragma once

#include <cstdint>

namespace ZYRPublic {

// 0 to 8 are the ordinary levels; the five values from 0x1FAB1DEA are kept as they are.
enum eZYRTraceMsgLevel : int32_t {
    kZYRTraceMsgLevel0 = 0,
    kZYRTraceMsgLevel1 = 1,
    kZYRTraceMsgLevel2 = 2,
    kZYRTraceMsgLevel3 = 3,
    kZYRTraceMsgLevel4 = 4,
    kZYRTraceMsgLevel5 = 5,
    kZYRTraceMsgLevel6 = 6,
    kZYRTraceMsgLevel7 = 7,
    kZYRTraceMsgLevel8 = 8,
};

struct sZYRTraceMsg {
    const char* text;
    const char16_t* wtext;
};

struct sZYRTraceMsgDetail {
    int32_t level;
    const char* srcFile;
    uint32_t srcLine;
    const char* threadName;
    uint64_t threadID;
    uint32_t clockTicks;
};

using tZYRTraceMsgCallback = void (*)(sZYRTraceMsg*, sZYRTraceMsgDetail*, void* clientData);

} // namespace ZYRPublic
