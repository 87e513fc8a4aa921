/// \file
/// The records a trace message travels in, and the host's trace callback type.
#pragma once

#include <cstdint>

namespace ZYRPublic {

/// 0 to 8 are the ordinary levels; the five values from 0x1FAB1DEA are kept as they are.
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

/// The text of a trace message, narrow or wide; both borrowed for the call.
struct sZYRTraceMsg {
    const char* text;      ///< the text, or null
    const char16_t* wtext; ///< the UTF-16 text, or null
};

/// Where and when a trace message was made; texts borrowed for the call.
struct sZYRTraceMsgDetail {
    int32_t level;          ///< an eZYRTraceMsgLevel
    const char* srcFile;    ///< source file name of the emitter
    uint32_t srcLine;       ///< source line of the emitter
    const char* threadName; ///< name of the emitting thread, from its per-thread record
    uint64_t threadID;      ///< unique identifier of the emitting thread
    uint32_t clockTicks;    ///< process clock in milliseconds when the message was made
};

/// A host's trace sink: the message, its details and the data given at registration.
using tZYRTraceMsgCallback = void (*)(sZYRTraceMsg*, sZYRTraceMsgDetail*, void* clientData);

} // namespace ZYRPublic
