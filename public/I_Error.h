// The error status that every boundary operation fills instead of throwing.
#pragma once

#include "eZYRErrorType.h"

namespace ZYRPublic {

class I_Error {
public:
    virtual ~I_Error() = default;
    virtual void reset() = 0;
    virtual bool errorOccurred() const = 0;
    virtual void setError(eZYRErrorType type, const char* message, const char* srcFileName,
                          int srcLineNumber) = 0;
    virtual eZYRErrorType getError() const = 0;
    virtual const char* getMessage() const = 0;
    virtual const char* getSrcFileName() const = 0;
    virtual int getSrcLineNumber() const = 0;
};

} // namespace ZYRPublic
