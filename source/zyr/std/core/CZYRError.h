// Errors as exceptions (CZYRError and its kin) and as statuses (C_Error), and the bridges.
#pragma once

#include <type_traits>

#include <new>

#include "I_Error.h"
#include "ZYRStdExport.h"

namespace ZYRStd {

using ZYRPublic::eZYRErrorType;
using ZYRPublic::I_Error;

// The status a caller builds on its stack and hands to a boundary operation.
class ZYRSTD_API C_Error : public I_Error {
public:
    C_Error() = default;
    C_Error(const C_Error&) = default;
    C_Error& operator=(const C_Error&) = default;
    ~C_Error() override;

    void reset() override { setError(ZYRPublic::kZYRErrorNoError, nullptr, nullptr, -1); }
    bool errorOccurred() const override { return type_ != ZYRPublic::kZYRErrorNoError; }
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

// The library's exception. It never owns its texts: callers pass literals.
class ZYRSTD_API CZYRError {
public:
    CZYRError(eZYRErrorType type, const char* message, const char* srcFileName,
              int srcLineNumber) noexcept
        : type_(type), message_(message), srcFileName_(srcFileName), srcLineNumber_(srcLineNumber) {
    }
    CZYRError(const CZYRError&) noexcept = default;
    const CZYRError& operator=(const CZYRError& other) noexcept;
    virtual ~CZYRError();

    eZYRErrorType getError() const noexcept { return type_; }
    const char* getMessage() const noexcept { return message_; }
    const char* getSrcFileName() const noexcept { return srcFileName_; }
    int getSrcLineNumber() const noexcept { return srcLineNumber_; }
    bool getUnExpectedErr() const noexcept { return unexpected_; }

    void setError(eZYRErrorType type, const char* message, const char* srcFileName,
                  int srcLineNumber) noexcept {
        type_ = type;
        message_ = message;
        srcFileName_ = srcFileName;
        srcLineNumber_ = srcLineNumber;
    }

protected:
    void markUnexpected() noexcept { unexpected_ = true; }

private:
    eZYRErrorType type_;
    const char* message_;
    const char* srcFileName_;
    int srcLineNumber_;
    bool unexpected_ = false;
};

class ZYRSTD_API CZYRUnexpectError : public CZYRError {
public:
    CZYRUnexpectError() noexcept;
    ~CZYRUnexpectError() override;
};

// Seen both by handlers of std::bad_alloc and by the library's error boundaries.
class ZYRSTD_API CZYRBadAlloc : public std::bad_alloc, public CZYRError {
public:
    CZYRBadAlloc(const char* message, const char* srcFileName, int srcLineNumber) noexcept;
    ~CZYRBadAlloc() override;
    const char* what() const noexcept override;
};

class ZYRSTD_API ZYROutOfMemoryError : public CZYRError, public std::bad_alloc {
public:
    ZYROutOfMemoryError(const char* srcFileName, int srcLineNumber) noexcept;
    ~ZYROutOfMemoryError() override;
    const char* what() const noexcept override;
};

using ZYRUnexpectedHandler = void (*)();

// C++17 removed std::set_unexpected; the library keeps the process-wide unexpected
// handler itself so that CZYRErrorSTC still scopes one for its callers.
ZYRSTD_API ZYRUnexpectedHandler ZYRSetUnexpectedHandler(ZYRUnexpectedHandler handler) noexcept;
ZYRSTD_API ZYRUnexpectedHandler ZYRGetUnexpectedHandler() noexcept;

// Installs a handler for its lifetime and puts the previous one back afterwards.
class ZYRSTD_API CZYRErrorSTC {
public:
    explicit CZYRErrorSTC(ZYRUnexpectedHandler handler) noexcept;
    CZYRErrorSTC(const CZYRErrorSTC&) = delete;
    CZYRErrorSTC& operator=(const CZYRErrorSTC& other) noexcept;
    ~CZYRErrorSTC();

private:
    ZYRUnexpectedHandler previous_;
};

ZYRSTD_API void ZYRCheckNThrowError(const I_Error& err);
ZYRSTD_API void throwCZYRErrorIfErrorOccurred(const I_Error& err);
[[noreturn]] ZYRSTD_API void throwCZYRUnexpt();
ZYRSTD_API eZYRErrorType ZYRErrorFromStdException(const std::exception& e) noexcept;
ZYRSTD_API eZYRErrorType ZYRErrorFromJTError(unsigned int code) noexcept;
[[noreturn]] ZYRSTD_API void throwAssertionFailed(const char* srcFileName, int srcLineNumber);

// Runs `call` with a local status and throws what it recorded: how a value wrapper turns
// a boundary operation's status back into an exception.
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
