// Error objects and the bridges between statuses and exceptions.
#include "zyr/std/core/CZYRError.h"

#include <atomic>

namespace ZYRStd {

namespace {
std::atomic<ZYRUnexpectedHandler> unexpectedHandler{&throwCZYRUnexpt};
constexpr const char* kBadAllocText = "bad allocation";
} // namespace

C_Error::~C_Error() = default;

const CZYRError& CZYRError::operator=(const CZYRError& other) noexcept {
    if (this != &other) {
        type_ = other.type_;
        message_ = other.message_;
        srcFileName_ = other.srcFileName_;
        srcLineNumber_ = other.srcLineNumber_;
        unexpected_ = other.unexpected_;
    }
    return *this;
}

CZYRError::~CZYRError() = default;

CZYRUnexpectError::CZYRUnexpectError() noexcept
    : CZYRError(ZYRPublic::kZYRErrorUnknown, nullptr, nullptr, -1) {
    markUnexpected();
}

CZYRUnexpectError::~CZYRUnexpectError() = default;

CZYRBadAlloc::CZYRBadAlloc(const char* message, const char* srcFileName, int srcLineNumber) noexcept
    : CZYRError(ZYRPublic::kZYRErrorOutOfMemory, message, srcFileName, srcLineNumber) {}

CZYRBadAlloc::~CZYRBadAlloc() = default;

const char* CZYRBadAlloc::what() const noexcept {
    return kBadAllocText;
}

ZYROutOfMemoryError::ZYROutOfMemoryError(const char* srcFileName, int srcLineNumber) noexcept
    : CZYRError(ZYRPublic::kZYRErrorOutOfMemory, "Memory alloc failed", srcFileName,
                srcLineNumber) {}

ZYROutOfMemoryError::~ZYROutOfMemoryError() = default;

const char* ZYROutOfMemoryError::what() const noexcept {
    return kBadAllocText;
}

ZYRUnexpectedHandler ZYRSetUnexpectedHandler(ZYRUnexpectedHandler handler) noexcept {
    return unexpectedHandler.exchange(handler);
}

ZYRUnexpectedHandler ZYRGetUnexpectedHandler() noexcept {
    return unexpectedHandler.load();
}

CZYRErrorSTC::CZYRErrorSTC(ZYRUnexpectedHandler handler) noexcept
    : previous_(ZYRSetUnexpectedHandler(handler)) {}

CZYRErrorSTC& CZYRErrorSTC::operator=(const CZYRErrorSTC& other) noexcept {
    previous_ = other.previous_;
    return *this;
}

CZYRErrorSTC::~CZYRErrorSTC() {
    ZYRSetUnexpectedHandler(previous_);
}

void ZYRCheckNThrowError(const I_Error& err) {
    if (err.errorOccurred())
        throw CZYRError(err.getError(), err.getMessage(), err.getSrcFileName(),
                        err.getSrcLineNumber());
}

void throwCZYRErrorIfErrorOccurred(const I_Error& err) {
    ZYRCheckNThrowError(err);
}

void throwCZYRUnexpt() {
    throw CZYRUnexpectError();
}

eZYRErrorType ZYRErrorFromStdException(const std::exception&) noexcept {
    return ZYRPublic::kZYRErrorUnknown;
}

eZYRErrorType ZYRErrorFromJTError(unsigned int) noexcept {
    return ZYRPublic::kZYRErrorUnknown;
}

void throwAssertionFailed(const char* srcFileName, int srcLineNumber) {
    throw CZYRError(ZYRPublic::kZYRErrorAssertionFailed, "assertion failed", srcFileName,
                    srcLineNumber);
}

} // namespace ZYRStd
