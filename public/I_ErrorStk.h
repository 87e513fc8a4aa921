// The process-wide stack of error messages that the host fetches as one text.
#pragma once

#include <cstdint>

namespace ZYRPublic {

constexpr unsigned int kZYRErrorMessageLength = 1024;

struct sZYRErrorInfo {
    int16_t errorCode; // -1 for an error without a code
    char16_t message[kZYRErrorMessageLength + 1];
    sZYRErrorInfo* next; // a reporter sets it to null
};

class I_ErrorStk {
public:
    virtual void reportError(short errorCode, const char16_t* message, int unused) = 0;
    virtual void reportError(sZYRErrorInfo info) = 0;
    virtual void reportUniqueError(short errorCode, const char16_t* message, int unused) = 0;
    // Adds nothing when the calling thread already holds the same message text.
    virtual void reportUniqueError(sZYRErrorInfo info) = 0;
    // `buffer` (at least 1025 units) holds a filter on entry and the collected text on a
    // true return; every record of every thread is dropped.
    virtual bool getErrorMessage(char16_t* buffer, unsigned short* length) = 0;
    virtual ~I_ErrorStk() = default;
};

} // namespace ZYRPublic
