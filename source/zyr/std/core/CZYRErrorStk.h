/// \file
/// The process-wide error stack and its wrapper.
#pragma once

#include <string>

#include "I_Error.h"
#include "I_ErrorStk.h"
#include "ZYRStdExport.h"

namespace ZYRStd {

using ZYRPublic::I_ErrorStk;
using ZYRPublic::sZYRErrorInfo;

/// The process-wide stack, created on the first call; null when `err` already holds an error.
ZYRSTD_API I_ErrorStk* createErrorStk(ZYRPublic::I_Error& err);
/// Destroys the stack and its records; call only while no other thread uses it.
ZYRSTD_API void TerminateErrorStk();

/// Wrapper of the process-wide error stack (createErrorStk) for code that throws; borrows
/// the stack, never owns it. Any thread may use it: the stack locks itself.
class ZYRSTD_API CZYRErrorStk {
public:
    /// Throws the CZYRError that createErrorStk recorded.
    CZYRErrorStk();
    /// Refers to the same stack.
    CZYRErrorStk(const CZYRErrorStk&) = default;
    /// Refers to the same stack.
    CZYRErrorStk& operator=(const CZYRErrorStk&) = default;
    virtual ~CZYRErrorStk();

    /// Pushes a copy of `info` for the calling thread.
    void reportError(sZYRErrorInfo info) { impl_->reportError(info); }
    /// Pushes it unless the calling thread already holds the same text.
    void reportUniqueError(sZYRErrorInfo info) { impl_->reportUniqueError(info); }
    /// `text` is the filter on entry (at most 1024 units of it count) and the result after.
    bool getErrorMessage(std::u16string& text);
    /// The stack, borrowed.
    I_ErrorStk* getImpl() const { return impl_; }

private:
    I_ErrorStk* impl_; ///< not owned
};

/// A record ready to report: the code and at most 1024 units of `message`.
ZYRSTD_API sZYRErrorInfo ZYRMakeErrorInfo(short errorCode, const char16_t* message);

namespace detail {
/// Reports `info` once on the process-wide stack (created when needed), holding the stack's
/// lock throughout so that TerminateErrorStk cannot destroy it meanwhile. Not exported.
void reportUniqueToProcessStack(const sZYRErrorInfo& info);
} // namespace detail

} // namespace ZYRStd
