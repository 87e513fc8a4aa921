/// \file
/// How hard a flush request presses the flushable memory clients.
#pragma once

namespace ZYRPublic {

/// How hard a flush presses the flushable memory clients (I_FlushableMemoryClient).
enum eFlushMemorySeverity : int {
    eFlushMemorySeverityNormal = 0, ///< only clients that can give back the amount are asked
    eFlushMemorySeverityUrgent = 1, ///< every client is asked, whatever it holds
};

} // namespace ZYRPublic
