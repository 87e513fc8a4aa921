/// \file
/// The error types carried by I_Error statuses and CZYRError exceptions.
#pragma once

#include <cstdint>

namespace ZYRPublic {

/// What went wrong: the type recorded in an I_Error and carried by a ZYRStd::CZYRError.
enum eZYRErrorType : int32_t {
    kZYRErrorNoError = 0,
    kZYRErrorUnknown = 1,
    // 2 is reserved and has no name.
    kZYRErrorFatal = 3,
    kZYRErrorInitFailed = 4,
    kZYRErrorAssertionFailed = 5,
    kZYRErrorBadParam = 6,
    kZYRErrorOutOfMemory = 7,
    kZYRErrorClientAbort = 8,
    kZYRErrorIncompatibleAPI = 9,
    kZYRErrorNoTrappingLibrary = 10,
    kZYRErrorNoPermissionToPrint = 11,
    kZYRErrorInvalidPath = 12,
    kZYRErrorKeyNotFound = 13,
    kZYRErrorTypeCheck = 14,
    kZYRErrorLimitCheck = 15,
    kZYRErrorNotFinalized = 16,
    kZYRErrorFinalized = 17,
    kZYRErrorNoCurrentPoint = 18,
    kZYRErrorInvalidObject = 19,
    kZYRErrorInvalidFuncCall = 20,
    kZYRErrorIO = 21,
    kZYRErrorInvalidFileName = 22,
    kZYRErrorFileOpFailed = 23,
    kZYRErrorFileAccessRestricted = 24,
    kZYRErrorInvalidData = 25,
    kZYRErrorPDF = 26,
    kZYRErrorRipInternal = 27,
    kZYRErrorTrapInternal = 28,
    kZYRErrorRangeCheck = 29,
    kZYRErrorUndefinedResult = 30,
    kZYRErrorFileSystemNotInitialized = 31,
    kZYRErrorProcessNotAuthorized = 32,
    kZYRErrorAborting = 33,
    kZYRErrorOtherWorkerJobFailed = 34,
    kZYRErrorModuleNotInitialized = 35,
};

} // namespace ZYRPublic
