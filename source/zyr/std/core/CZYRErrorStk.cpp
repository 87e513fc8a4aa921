// The error stack: per-thread stacks of messages, fetched and emptied as one text.
#include "zyr/std/core/CZYRErrorStk.h"

#include <cstdlib>
#include <map>
#include <memory>
#include <mutex>

#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/core/ZYRThreadSafety.h"
#include "zyr/std/core/internal/ZYRErrorBoundary.h"

namespace ZYRStd {

namespace {

// Hosts see these in the error records of this file.
constexpr const char* kSource = "source/zyr/std/CZYRErrorStk";
constexpr int kCreateLine = 146;

constexpr unsigned int kMaxUnits = ZYRPublic::kZYRErrorMessageLength;

size_t boundedLength(const char16_t* text) {
    size_t n = 0;
    while (text && n < kMaxUnits && text[n] != u'\0')
        ++n;
    return n;
}

void copyBounded(char16_t* to, const char16_t* from) {
    const size_t n = boundedLength(from);
    std::char_traits<char16_t>::copy(to, from, n);
    to[n] = u'\0';
}

std::u16string_view textOf(const sZYRErrorInfo& record) {
    return {record.message, boundedLength(record.message)};
}

// Records live on the C runtime heap, outside the memory limit: the out-of-memory notice
// is reported exactly when the limit refuses everything else.
struct RecordFree {
    void operator()(sZYRErrorInfo* record) const noexcept { std::free(record); }
};
using RecordPtr = std::unique_ptr<sZYRErrorInfo, RecordFree>;

RecordPtr newRecord(const sZYRErrorInfo& info) {
    RecordPtr record(static_cast<sZYRErrorInfo*>(std::malloc(sizeof(sZYRErrorInfo))));
    if (!record)
        throw CZYRError(ZYRPublic::kZYRErrorOutOfMemory, "Memory alloc failed", kSource, __LINE__);
    record->errorCode = info.errorCode;
    copyBounded(record->message, info.message);
    record->next = nullptr;
    return record;
}

class IImp_ZYRErrorStk final : public I_ErrorStk, public CZYRClientBase {
public:
    ~IImp_ZYRErrorStk() override {
        for (auto& [thread, head] : stacks_)
            freeChain(head);
    }

    void reportError(short errorCode, const char16_t* message, int) override {
        reportError(ZYRMakeErrorInfo(errorCode, message));
    }
    void reportError(sZYRErrorInfo info) override { push(info, false); }
    void reportUniqueError(short errorCode, const char16_t* message, int) override {
        reportUniqueError(ZYRMakeErrorInfo(errorCode, message));
    }
    void reportUniqueError(sZYRErrorInfo info) override { push(info, true); }

    bool getErrorMessage(char16_t* buffer, unsigned short* length) override {
        detail::LockGuard lock(mutex_);
        const std::u16string filter(buffer, boundedLength(buffer));
        buffer[0] = u'\0';
        std::u16string result;
        bool appended = false;
        for (auto& [thread, head] : stacks_) {
            for (const sZYRErrorInfo* record = head; record; record = record->next) {
                const std::u16string_view text = textOf(*record);
                if (!filter.empty() && !text.empty() && filter.find(text) != std::u16string::npos)
                    continue;
                result.append(text);
                appended = true;
            }
            freeChain(head);
        }
        if (!appended)
            return false;
        const size_t n = std::min<size_t>(result.size(), kMaxUnits);
        std::char_traits<char16_t>::copy(buffer, result.data(), n);
        buffer[n] = u'\0';
        if (length)
            *length = static_cast<unsigned short>(n);
        return true;
    }

private:
    static void freeChain(sZYRErrorInfo*& head) {
        while (head)
            RecordPtr(std::exchange(head, head->next));
    }

    void push(const sZYRErrorInfo& info, bool unique) {
        RecordPtr record = newRecord(info);
        detail::LockGuard lock(mutex_);
        sZYRErrorInfo*& head = stacks_[ZYRGetCurrentThreadId()];
        if (unique) {
            for (const sZYRErrorInfo* r = head; r; r = r->next)
                if (textOf(*r) == textOf(*record))
                    return;
        }
        record->next = head;
        head = record.release();
    }

    detail::Mutex mutex_; // guards stacks_ and every record
    std::map<uint32_t, sZYRErrorInfo*> stacks_ ZYR_GUARDED_BY(mutex_); // thread id -> newest
};

// The stack lives in static storage: the out-of-memory notice must reach it exactly when
// the front refuses to allocate, and two threads may be the first to report at once.
detail::Mutex processStackMutex; // guards processStack
alignas(IImp_ZYRErrorStk) unsigned char processStackStorage[sizeof(IImp_ZYRErrorStk)];
IImp_ZYRErrorStk* processStack ZYR_GUARDED_BY(processStackMutex) = nullptr;

} // namespace

sZYRErrorInfo ZYRMakeErrorInfo(short errorCode, const char16_t* message) {
    sZYRErrorInfo info{};
    info.errorCode = errorCode;
    copyBounded(info.message, message);
    info.next = nullptr;
    return info;
}

I_ErrorStk* createErrorStk(ZYRPublic::I_Error& err) {
    return ZYRErrorBoundary<I_ErrorStk*>(
        err, nullptr, "Error in ZYRStd::createErrorStk", kSource, kCreateLine, []() -> I_ErrorStk* {
            detail::LockGuard lock(processStackMutex);
            if (!processStack)
                processStack = ::new (processStackStorage) IImp_ZYRErrorStk;
            return processStack;
        });
}

void TerminateErrorStk() {
    detail::LockGuard lock(processStackMutex);
    if (processStack)
        std::exchange(processStack, nullptr)->~IImp_ZYRErrorStk();
}

namespace detail {

void reportUniqueToProcessStack(const sZYRErrorInfo& info) {
    // Under the lock that TerminateErrorStk takes: the out-of-memory notice comes from any
    // thread at any time, also while the host is shutting the stack down.
    detail::LockGuard lock(processStackMutex);
    if (!processStack)
        processStack = ::new (processStackStorage) IImp_ZYRErrorStk;
    processStack->reportUniqueError(info);
}

} // namespace detail

CZYRErrorStk::CZYRErrorStk() : impl_(nullptr) {
    C_Error err;
    impl_ = createErrorStk(err);
    throwCZYRErrorIfErrorOccurred(err);
}

CZYRErrorStk::~CZYRErrorStk() = default;

bool CZYRErrorStk::getErrorMessage(std::u16string& text) {
    char16_t buffer[ZYRPublic::kZYRErrorMessageLength + 1];
    copyBounded(buffer, text.c_str());
    text.clear();
    unsigned short length = 0;
    const bool found = impl_->getErrorMessage(buffer, &length);
    text.append(buffer, boundedLength(buffer));
    return found;
}

} // namespace ZYRStd
