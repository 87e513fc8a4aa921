/// \file
/// Errors as exceptions (CZYRError and its kin) and as statuses (C_Error), and the bridges.
#pragma once

#include <type_traits>

#include <new>

#include "I_Error.h"
#include "ZYRStdExport.h"

namespace ZYRStd {

using ZYRPublic::eZYRErrorType;
using ZYRPublic::I_Error;

/// The status a caller builds on its stack and hands to a boundary operation.
class ZYRSTD_API C_Error : public I_Error {
public:
    C_Error() = default;
    /// Copies the recorded error.
    C_Error(const C_Error&) = default;
    /// Copies the recorded error.
    C_Error& operator=(const C_Error&) = default;
    ~C_Error() override;

    void reset() override { setError(ZYRPublic::kZYRErrorNoError, nullptr, nullptr, -1); }
    bool errorOccurred() const override { return type_ != ZYRPublic::kZYRErrorNoError; }
    /// Records an error; the texts are borrowed and must be static.
    void setError(eZYRErrorType type, const char* message, const char* srcFileName,
                  int srcLineNumber) override {
        type_ = type;
        message_ = message;
        srcFileName_ = srcFileName;
        srcLineNumber_ = srcLineNumber;
    }
    eZYRErrorType getError() const override { return type_; }
    const char* getMessage() const override { return message_; }
    const char* getSrcFileName() const override { return srcFileName_; }
    int getSrcLineNumber() const override { return srcLineNumber_; }

private:
    eZYRErrorType type_ = ZYRPublic::kZYRErrorNoError;
    const char* message_ = nullptr;
    const char* srcFileName_ = nullptr;
    int srcLineNumber_ = -1;
};

/// The library's exception. It never owns its texts: callers pass literals.
class ZYRSTD_API CZYRError {
public:
    /// An error of `type` raised at `srcFileName`:`srcLineNumber`; the texts must be static.
    CZYRError(eZYRErrorType type, const char* message, const char* srcFileName,
              int srcLineNumber) noexcept
        : type_(type), message_(message), srcFileName_(srcFileName), srcLineNumber_(srcLineNumber) {
    }
    /// Copies all fields.
    CZYRError(const CZYRError&) noexcept = default;
    /// Copies all fields; assignment to itself changes nothing.
    const CZYRError& operator=(const CZYRError& other) noexcept;
    virtual ~CZYRError();

    /// The error type.
    eZYRErrorType getError() const noexcept { return type_; }
    /// The message (static text, borrowed); may be null.
    const char* getMessage() const noexcept { return message_; }
    /// The source name of the raiser, `source/zyr/std/<File>` for the library's own.
    const char* getSrcFileName() const noexcept { return srcFileName_; }
    /// The source line of the raiser.
    int getSrcLineNumber() const noexcept { return srcLineNumber_; }
    /// True for a CZYRUnexpectError: raised by the unexpected-exception path.
    bool getUnExpectedErr() const noexcept { return unexpected_; }

    /// Replaces all fields but the unexpected flag; the texts must be static.
    void setError(eZYRErrorType type, const char* message, const char* srcFileName,
                  int srcLineNumber) noexcept {
        type_ = type;
        message_ = message;
        srcFileName_ = srcFileName;
        srcLineNumber_ = srcLineNumber;
    }

protected:
    /// Sets the unexpected flag, for CZYRUnexpectError.
    void markUnexpected() noexcept { unexpected_ = true; }

private:
    eZYRErrorType type_;
    const char* message_;
    const char* srcFileName_;
    int srcLineNumber_;
    bool unexpected_ = false;
};

/// Raised by throwCZYRUnexpt: type kZYRErrorUnknown, no message, unexpected flag set.
class ZYRSTD_API CZYRUnexpectError : public CZYRError {
public:
    CZYRUnexpectError() noexcept;
    ~CZYRUnexpectError() override;
};

/// Seen both by handlers of std::bad_alloc and by the library's error boundaries.
class ZYRSTD_API CZYRBadAlloc : public std::bad_alloc, public CZYRError {
public:
    /// A kZYRErrorOutOfMemory error with `message` (static text).
    CZYRBadAlloc(const char* message, const char* srcFileName, int srcLineNumber) noexcept;
    ~CZYRBadAlloc() override;
    /// The message given at construction.
    const char* what() const noexcept override;
};

/// What operator new of the library throws when no memory is left: kZYRErrorOutOfMemory,
/// "Memory alloc failed"; catchable as std::bad_alloc too.
class ZYRSTD_API ZYROutOfMemoryError : public CZYRError, public std::bad_alloc {
public:
    /// Raised at `srcFileName`:`srcLineNumber`.
    ZYROutOfMemoryError(const char* srcFileName, int srcLineNumber) noexcept;
    ~ZYROutOfMemoryError() override;
    /// "bad allocation", as std::bad_alloc answers.
    const char* what() const noexcept override;
};

/// A process-wide unexpected-exception handler.
using ZYRUnexpectedHandler = void (*)();

/// Installs the process-wide unexpected handler and returns the previous one. C++17 removed
/// std::set_unexpected, so the library keeps the handler itself for CZYRErrorSTC.
ZYRSTD_API ZYRUnexpectedHandler ZYRSetUnexpectedHandler(ZYRUnexpectedHandler handler) noexcept;
/// The installed unexpected handler, or null.
ZYRSTD_API ZYRUnexpectedHandler ZYRGetUnexpectedHandler() noexcept;

/// Installs a handler for its lifetime and puts the previous one back afterwards.
class ZYRSTD_API CZYRErrorSTC {
public:
    /// Installs `handler` and keeps the one it replaces.
    explicit CZYRErrorSTC(ZYRUnexpectedHandler handler) noexcept;
    CZYRErrorSTC(const CZYRErrorSTC&) = delete;
    /// Copies the kept handler.
    CZYRErrorSTC& operator=(const CZYRErrorSTC& other) noexcept;
    ~CZYRErrorSTC();

private:
    ZYRUnexpectedHandler previous_;
};

/// Throws a CZYRError with the type, message, file and line `err` recorded; returns when
/// it holds no error. `err` is left as it is.
ZYRSTD_API void ZYRCheckNThrowError(const I_Error& err);
/// The same as ZYRCheckNThrowError.
ZYRSTD_API void throwCZYRErrorIfErrorOccurred(const I_Error& err);
/// Throws a CZYRUnexpectError.
[[noreturn]] ZYRSTD_API void throwCZYRUnexpt();
/// The error type a boundary records for a standard exception: kZYRErrorUnknown.
ZYRSTD_API eZYRErrorType ZYRErrorFromStdException(const std::exception& e) noexcept;
/// The error type for a numeric code of another component: kZYRErrorUnknown for every code.
ZYRSTD_API eZYRErrorType ZYRErrorFromJTError(unsigned int code) noexcept;
/// Throws kZYRErrorAssertionFailed raised at `srcFileName`:`srcLineNumber`.
[[noreturn]] ZYRSTD_API void throwAssertionFailed(const char* srcFileName, int srcLineNumber);

/// Runs `call` with a local status and throws what it recorded: how a value wrapper turns
/// a boundary operation's status back into an exception.
template <class Call> auto throwing(Call call) {
    C_Error err;
    if constexpr (std::is_void_v<decltype(call(err))>) {
        call(err);
        throwCZYRErrorIfErrorOccurred(err);
    } else {
        auto result = call(err);
        throwCZYRErrorIfErrorOccurred(err);
        return result;
    }
}

} // namespace ZYRStd
