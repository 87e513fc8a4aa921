// The error boundary every I_Error operation runs its body through.
#pragma once

#include <utility>

#include "zyr/std/core/CZYRError.h"

namespace ZYRStd {

// Runs `body` and turns whatever it throws into `err`; nothing escapes. A status that
// already holds an error makes the call a no-op. `unknownMessage`, `source` and `line`
// name the operation for exceptions the library does not know.
template <class Result, class Body>
Result ZYRErrorBoundary(I_Error& err, Result empty, const char* unknownMessage, const char* source,
                        int line, Body&& body) noexcept {
    if (err.errorOccurred())
        return empty;
    try {
        return std::forward<Body>(body)();
    } catch (const CZYRError& e) {
        err.setError(e.getError(), e.getMessage(), e.getSrcFileName(), e.getSrcLineNumber());
    } catch (const I_Error& e) {
        err.setError(e.getError(), e.getMessage(), e.getSrcFileName(), e.getSrcLineNumber());
    } catch (...) {
        err.setError(ZYRPublic::kZYRErrorUnknown, unknownMessage, source, line);
    }
    return empty;
}

template <class Body>
void ZYRErrorBoundaryVoid(I_Error& err, const char* unknownMessage, const char* source, int line,
                          Body&& body) noexcept {
    ZYRErrorBoundary(err, 0, unknownMessage, source, line, [&] {
        std::forward<Body>(body)();
        return 0;
    });
}

} // namespace ZYRStd
