/// \file
/// The process-wide stack of error messages that the host fetches as one text.
#pragma once

#include <cstdint>

namespace ZYRPublic {

/// The longest message text of a record, in UTF-16 units, without its terminator.
constexpr unsigned int kZYRErrorMessageLength = 1024;

/// One error record as the host reports it.
struct sZYRErrorInfo {
    int16_t errorCode; ///< -1 for an error without a code
    char16_t
        message[kZYRErrorMessageLength + 1]; ///< NUL-terminated UTF-16 text, copied by the stack
    sZYRErrorInfo* next;                     ///< a reporter sets it to null
};

/// The process-wide error stack, obtained from ZYRStd::getErrorStk (borrowed, never
/// released). Records are kept per reporting thread; every operation locks the stack,
/// so any thread may call it.
class I_ErrorStk {
public:
    /// Pushes a record for the calling thread; `unused` is ignored.
    virtual void reportError(short errorCode, const char16_t* message, int unused) = 0;
    /// Pushes a copy of `info` for the calling thread.
    virtual void reportError(sZYRErrorInfo info) = 0;
    /// Like reportError, but adds nothing when the calling thread already holds the same text.
    virtual void reportUniqueError(short errorCode, const char16_t* message, int unused) = 0;
    /// Adds nothing when the calling thread already holds the same message text.
    virtual void reportUniqueError(sZYRErrorInfo info) = 0;
    /// `buffer` (at least 1025 units) holds a filter on entry and the collected text on a
    /// true return; every record of every thread is dropped.
    virtual bool getErrorMessage(char16_t* buffer, unsigned short* length) = 0;
    virtual ~I_ErrorStk() = default;
};

} // namespace ZYRPublic
