/// \file
/// The error status that every boundary operation fills instead of throwing.
#pragma once

#include "eZYRErrorType.h"

namespace ZYRPublic {

/// The error status passed by reference as the last argument of boundary operations:
/// set once by the operation that fails, tested and read by its caller. The texts are
/// static and borrowed. Owned by one thread at a time; ZYRStd::C_Error implements it.
class I_Error {
public:
    virtual ~I_Error() = default;
    /// Clears the status back to kZYRErrorNoError.
    virtual void reset() = 0;
    /// True once an error has been set.
    virtual bool errorOccurred() const = 0;
    /// Records an error type, a static message and the source file and line that raised it.
    virtual void setError(eZYRErrorType type, const char* message, const char* srcFileName,
                          int srcLineNumber) = 0;
    /// The recorded type; kZYRErrorNoError when none.
    virtual eZYRErrorType getError() const = 0;
    /// The recorded message (static text, borrowed).
    virtual const char* getMessage() const = 0;
    /// The source name of the raiser, `source/zyr/std/<File>` for the library's own.
    virtual const char* getSrcFileName() const = 0;
    /// The source line of the raiser.
    virtual int getSrcLineNumber() const = 0;
};

} // namespace ZYRPublic
