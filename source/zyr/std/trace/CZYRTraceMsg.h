/// \file
/// Trace messages bound to a job: the per-job level filter, routing to the host's progress
/// interface or to the process-wide trace log, and the log writer.
#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>

#include "C_SmartPtr.h"
#include "I_Error.h"
#include "I_Job.h"
#include "I_Surface.h"
#include "ZYRStdExport.h"
#include "sZYRTraceMsg.h"
#include "zyr/std/core/CZYRClientBase.h"
#include "zyr/std/core/ZYRThreadSafety.h"
#include "zyr/std/values/CZYRDict.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

using ZYRPublic::eZYRTraceMsgLevel;
using ZYRPublic::I_Job;
using ZYRPublic::I_OEMProgressInterface;
using ZYRPublic::I_Surface;
using ZYRPublic::sZYRTraceMsg;
using ZYRPublic::sZYRTraceMsgDetail;

/// The five levels above 8 that configurations keep as they are, first and last.
///@{
constexpr int32_t kZYRTraceMsgKeptLevelFirst = 0x1FAB1DEA;
constexpr int32_t kZYRTraceMsgKeptLevelLast = 0x1FAB1DEE;
///@}

/// A configured value as a level: below 0 gives 0, 0 to 8 and the kept levels stay, the
/// rest gives 8.
ZYRSTD_API int32_t mapToTraceMsgLevel(int32_t value);

/// Writes messages into the trace log (standard output while the log is closed). Head and
/// text of one message go out in one write under the log mutex and are flushed at once.
/// Failures are recorded in `err`, never thrown.
class ZYRSTD_API CZYRProgressInterface {
public:
    /// A whole message: the head line (job, area, category, source) and its text.
    void TraceMsg(int32_t jobNumber, I_Job* job, I_Surface* surface, const CZYRUniString& area,
                  const CZYRUniString& category, const sZYRTraceMsg* msg,
                  const sZYRTraceMsgDetail* detail, ZYRPublic::I_Error& err);
    /// The head line and the first text of a message that continues.
    void beginTraceMsg(int32_t jobNumber, I_Job* job, I_Surface* surface, const CZYRUniString& area,
                       const CZYRUniString& category, const sZYRTraceMsg* msg,
                       const sZYRTraceMsgDetail* detail, ZYRPublic::I_Error& err);
    /// More text of the open message.
    void traceMsg(const sZYRTraceMsg* msg, ZYRPublic::I_Error& err);
    /// Ends the open message.
    void endTraceMsg(ZYRPublic::I_Error& err);
};

/// The tracing dictionary that applies to every job, merged into each job's configuration.
class ZYRSTD_API ZYRTracingDict {
public:
    /// The process's one instance; any thread.
    static ZYRTracingDict& getInstance();
    /// Keeps a clone of `dict`; an invalid or empty dictionary clears it.
    void setTracingDict(const CZYRDict& dict);
    /// A new reference, or null.
    C_SmartPtr<ZYRPublic::I_Dict> getTracingDict() const;
    ~ZYRTracingDict();

private:
    ZYRTracingDict() = default;
    ZYRTracingDict(const ZYRTracingDict&) = delete;
    ZYRTracingDict& operator=(const ZYRTracingDict&) = delete;

    static C_SmartPtr<ZYRPublic::I_Dict> tracingDict;
};

/// One thread at a time, but for getTraceMsgLevel, which any number may ask. Failures are thrown as
/// CZYRError; anything else thrown inside becomes kZYRErrorUnknown "Unknown exception in
/// CZYRTraceMsg::<operation>".
class ZYRSTD_API CZYRTraceMsg : public CZYRClientBase {
public:
    /// Throws the job look-up's error when the job has no progress interface.
    explicit CZYRTraceMsg(const C_SmartPtr<I_Job>& job);
    /// Finds the job through the surface's owner and its parent; a surface whose walk meets
    /// a null step throws kZYRErrorInvalidData "miss job".
    explicit CZYRTraceMsg(const C_SmartPtr<I_Surface>& surface);
    /// Shares the job, surface and configuration; the level cache starts empty.
    ///@{
    CZYRTraceMsg(const CZYRTraceMsg& other) = default;
    CZYRTraceMsg& operator=(const CZYRTraceMsg& other) = default;
    ///@}
    /// Neither ends an open message nor closes the log.
    ~CZYRTraceMsg() override;

    /// Opens a message under `area` and `category` when `level` passes the job's filter (or
    /// `alwaysTrace`), sending it to the host's progress interface or to the trace log;
    /// `srcFile` and `srcLine` name the caller in the head line.
    ///@{
    void beginTraceMsg(const CZYRUniString& area, const CZYRUniString& category,
                       eZYRTraceMsgLevel level, const char* text, bool alwaysTrace = false,
                       const char* srcFile = nullptr, unsigned int srcLine = 0);
    void beginTraceMsg(const CZYRUniString& area, const CZYRUniString& category,
                       eZYRTraceMsgLevel level, const char16_t* text, bool alwaysTrace = false,
                       const char* srcFile = nullptr, unsigned int srcLine = 0);
    ///@}
    /// Continuation texts and the end of the open message; nothing without one.
    ///@{
    void traceMsg(const char* text);
    void traceMsg(const char16_t* text);
    void endTraceMsg();
    ///@}
    /// A whole message, filtered and routed as beginTraceMsg.
    ///@{
    void traceMsg(const CZYRUniString& area, const CZYRUniString& category, eZYRTraceMsgLevel level,
                  const char* text, bool alwaysTrace = false, const char* srcFile = nullptr,
                  unsigned int srcLine = 0);
    void traceMsg(const CZYRUniString& area, const CZYRUniString& category, eZYRTraceMsgLevel level,
                  const char16_t* text, bool alwaysTrace = false, const char* srcFile = nullptr,
                  unsigned int srcLine = 0);
    ///@}

    /// The level configured for the pair (the process-wide configuration over the job's);
    /// any thread.
    eZYRTraceMsgLevel getTraceMsgLevel(const CZYRUniString& area,
                                       const CZYRUniString& category) const;

    /// The job, borrowed.
    const C_SmartPtr<I_Job>& getJob() const { return job_; }
    /// True when the configured "Path" is "stdout": every message goes to the host's progress
    /// interface.
    bool isSendToHost() const { return sendToHost_; }

private:
    enum class Kind { whole, begin };

    void internalInit();
    bool passes(const CZYRUniString& area, const CZYRUniString& category, int32_t level,
                bool alwaysTrace) const;
    void emit(Kind kind, const CZYRUniString& area, const CZYRUniString& category, int32_t level,
              const sZYRTraceMsg& msg, const char* srcFile, unsigned int srcLine);
    void continuation(const sZYRTraceMsg& msg);
    bool routesToHost(const CZYRUniString& area, const CZYRUniString& category) const;
    int32_t configuredLevel(const CZYRUniString& area, const CZYRUniString& category) const;
    /// The dictionary that answers for a top-level key: the process-wide one when it has the
    /// key, else the job's.
    ZYRPublic::I_Dict* holderOf(ZYRPublic::I_UniString* key) const;
    C_SmartPtr<ZYRPublic::I_Dict> areaDict(const CZYRUniString& area) const;
    int32_t lookUpLevel(ZYRPublic::I_Dict* areaDict, const CZYRUniString& category) const;

    /// The levels of the latest (area, category) pairs, by string object. A level stays
    /// right while neither the configuration nor the area's dictionary has changed, which
    /// their change counts tell; dictionaries of other implementations are never cached.
    ///
    /// getTraceMsgLevel is const and may be asked from several threads, and the filter must
    /// cost next to nothing: readers take no lock but read the slots between two readings of
    /// a sequence number that a writer makes odd while it changes them (a miss, or a reading
    /// that overlapped a change, looks the level up instead). Writers are serialised by a
    /// mutex they only try; a writer that would wait does not cache. A copy starts empty.
    static constexpr size_t kCachedLevels = 4;
    static constexpr size_t kKeptAreaDicts = 16;
    struct LevelSlot {
        std::atomic<const void*> area{nullptr};
        std::atomic<const void*> category{nullptr};
        std::atomic<int32_t> level{0};
        std::atomic<const std::atomic<uint32_t>*> areaChanges{nullptr}; ///< null: no area dict
        std::atomic<uint32_t> areaSeen{0};
    };
    struct LevelCache {
        LevelCache() = default;
        LevelCache(const LevelCache&) {}
        /// The assigned object has another configuration: its answers go.
        LevelCache& operator=(const LevelCache&) {
            const detail::LockGuard lock(writer);
            const uint32_t at = sequence.load(std::memory_order_relaxed);
            sequence.store(at + 1, std::memory_order_relaxed);
            std::atomic_thread_fence(std::memory_order_release);
            for (LevelSlot& slot : slots)
                slot.area.store(nullptr, std::memory_order_relaxed);
            sequence.store(at + 2, std::memory_order_release);
            return *this;
        }
        std::atomic<uint32_t> sequence{0};
        std::atomic<uint32_t> configSeen{0};
        std::atomic<uint32_t> globalSeen{0};
        std::array<LevelSlot, kCachedLevels> slots;
        /// The writer's side, under `writer`: the strings of the slots, kept alive so that
        /// their addresses cannot be reused by other strings, and every area dictionary whose
        /// change count a slot names, kept for the object's life, as a reader may still read
        /// that count after the slot has moved on.
        detail::Mutex writer;
        std::array<CZYRUniString, kCachedLevels> areas ZYR_GUARDED_BY(writer);
        std::array<CZYRUniString, kCachedLevels> categories ZYR_GUARDED_BY(writer);
        std::array<C_SmartPtr<ZYRPublic::I_Dict>, kKeptAreaDicts> areaDicts ZYR_GUARDED_BY(writer);
        size_t areaDictCount ZYR_GUARDED_BY(writer) = 0;
        size_t next ZYR_GUARDED_BY(writer) = 0;
    };
    bool cachedLevel(const CZYRUniString& area, const CZYRUniString& category,
                     int32_t& level) const;
    void cacheLevel(const CZYRUniString& area, const CZYRUniString& category, int32_t level,
                    ZYRPublic::I_Dict* areaDict) const;

    C_SmartPtr<I_Job> job_;
    C_SmartPtr<I_Surface> surface_;
    CZYRDict config_; ///< the job's configuration, or the process-wide one when it has none
    /// The process-wide configuration over the job's: its keys replace the job's, read in
    /// place, as the job's dictionary is the host's and may be finalized.
    C_SmartPtr<ZYRPublic::I_Dict> global_;
    C_SmartPtr<I_OEMProgressInterface> progress_;
    bool fixedLevelSet_ = false;
    int fixedLevel_ = 0;
    int defaultLevel_ = 0;
    CZYRUniString keyAll_;
    CZYRUniString keyDefault_;
    bool inMessage_ = false;
    CZYRProgressInterface writer_;
    CZYRUniString lastArea_;
    CZYRUniString lastCategory_;
    bool sendToHost_ = false;
    bool configEmpty_ = true;
    int32_t jobNumber_ = 0; ///< "JPJobID" of the job's parameters, 0 without one
    const std::atomic<uint32_t>* configChanges_ = nullptr; ///< null: levels are not cached
    const std::atomic<uint32_t>* globalChanges_ = nullptr;
    mutable LevelCache levelCache_;
};

/// Closes the trace log; the next configuration that enables tracing opens one again.
ZYRSTD_API void closeTraceLogPath();
/// The trace log's path while it is open, else empty (for hosts that show where it is).
ZYRSTD_API std::string ZYRGetTraceLogPath();
/// A trace callback for the library's own reports: writes the text of level-4 records.
ZYRSTD_API void ZYRTraceMsgCallbackInternal(sZYRTraceMsg* msg, sZYRTraceMsgDetail* detail,
                                            void* clientData);

} // namespace ZYRStd
