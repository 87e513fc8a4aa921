// Trace messages: configuration, level rules, routing, and the trace log with its layout.
#include "zyr/std/trace/CZYRTraceMsg.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <string_view>
#include <unistd.h>

#include "zyr/std/config/ZYRResourceDirs.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/ZYRThread.h"
#include "zyr/std/core/internal/ZYRErrorBoundary.h"
#include "zyr/std/core/internal/ZYRMemInternal.h"
#include "zyr/std/core/internal/ZYRNoDestructor.h"
#include "zyr/std/core/internal/ZYRUTF8.h"
#include "zyr/std/engine/ZYROEMInterfacesInternal.h"
#include "zyr/std/io/internal/ZYRFileSys_helper.h"
#include "zyr/std/values/CZYRCommonUniStrings.h"
#include "zyr/std/values/CZYRString.h"
#include "zyr/std/values/internal/ZYRDictChanges.h"

namespace ZYRStd {

using namespace ZYRPublic;

namespace {

constexpr const char* kSource = "source/zyr/std/CZYRTraceMsg";
constexpr const char* kWriterSource = "source/zyr/std/CZYRProgressInterface";
// The writer's error records have always named these lines.
constexpr int kWriterTraceMsgLine = 371;
constexpr int kWriterBeginLine = 400;
constexpr int kWriterContinuationLine = 453;
constexpr int kWriterEndLine = 474;
constexpr int32_t kHighestOrdinaryLevel = 8;
constexpr const char* kOpenFailedWarning =
    "TRACE WARNING: File open failed for trace log file. Trace logs will be shown in standard "
    "output\n";

// Trace clocks count from the library's load, not from the first message.
[[maybe_unused]] const uint32_t clockStartedAtLoad = detail::processClockMs();

// ---- the trace log -----------------------------------------------------------------------

struct TraceLog {
    ZYRStd::mutex mutex; // guards file and path: every write, the opening and the closing
    FILE* file ZYR_GUARDED_BY(mutex) = nullptr;
    std::string path ZYR_GUARDED_BY(mutex);
};

// Never destroyed: messages written during static destruction still find it.
TraceLog& traceLog() {
    static detail::NoDestructor<TraceLog> log;
    return *log;
}

// Caller holds the log mutex.
void openLogLocked(TraceLog& log, const std::string& path) ZYR_REQUIRES(log.mutex) {
    if (log.file) {
        std::fclose(log.file);
        log.file = nullptr;
        log.path.clear();
    }
    // Appending, as fopen's "a" does, but never through a link someone else placed there.
    const int fd =
        ::open(path.c_str(), O_WRONLY | O_APPEND | O_CREAT | O_NOFOLLOW | O_CLOEXEC, 0666);
    log.file = fd >= 0 ? ::fdopen(fd, "a") : nullptr;
    if (fd >= 0 && !log.file)
        ::close(fd);
    if (log.file) {
        log.path = path;
    } else {
        std::fputs(kOpenFailedWarning, stdout);
        std::fflush(stdout);
    }
}

// "traceLog.log" in the configured temporary directory, else in the process's one: an
// empty directory would put the log at the root of the file system.
std::string defaultLogPath() {
    std::string dir = ZYRGetTempDirectory();
    if (dir.empty()) {
        const char* tmp = std::getenv("TMPDIR");
        dir = tmp && *tmp ? tmp : "/tmp";
    }
    return dir + "/traceLog.log";
}

// ---- texts -------------------------------------------------------------------------------

std::u16string_view unitsOf(const I_UniString* s) {
    if (!s)
        return {};
    unsigned int bytes = 0;
    const char* buffer = s->getUTF16LEBuffer(&bytes);
    if (!buffer)
        return {};
    return {reinterpret_cast<const char16_t*>(buffer), bytes / sizeof(char16_t)};
}

void appendText(std::string& out, const CZYRUniString& s) {
    const std::u16string_view units = unitsOf(s.getImpl());
    detail::appendUTF8(out, units.data(), units.size());
}

bool textIs(const CZYRUniString& s, std::u16string_view text) {
    return unitsOf(s.getImpl()) == text;
}

// Wide texts in the log file are paths more often than not: slashes, no leading "\\",
// and a drive letter behind a slash.
std::string logFileForm(const char16_t* wide) {
    std::u16string_view units(wide);
    if (units.size() >= 2 && units[0] == u'\\' && units[1] == u'\\')
        units.remove_prefix(2);
    std::string out;
    if (units.size() >= 2 && units[1] == u':' &&
        ((units[0] >= u'A' && units[0] <= u'Z') || (units[0] >= u'a' && units[0] <= u'z')))
        out += '/';
    const size_t start = out.size();
    detail::appendUTF8(out, units.data(), units.size());
    for (size_t i = start; i < out.size(); ++i)
        if (out[i] == '\\')
            out[i] = '/';
    return out;
}

std::string plainForm(const char16_t* wide) {
    std::string out;
    const std::u16string_view units(wide);
    detail::appendUTF8(out, units.data(), units.size());
    return out;
}

bool hasText(const sZYRTraceMsg* msg) {
    return msg && (msg->text || msg->wtext);
}

// One message part into the log (or standard output while it is closed): `head`, the
// message text, an optional line break and `tail`, in one write under the log mutex, then
// flushed. Wide texts take the path form only in the log file. `head` is the caller's
// scratch text and is used up.
void writePart(std::string& head, const sZYRTraceMsg& msg, bool lineBreak, std::string_view tail) {
    std::string wideInFile;
    std::string wideOnScreen;
    if (!msg.text) {
        wideInFile = logFileForm(msg.wtext);
        wideOnScreen = plainForm(msg.wtext);
    }
    TraceLog& log = traceLog();
    ZYRStd::mutex::scoped_lock lock(log.mutex);
    FILE* out = log.file ? log.file : stdout;
    if (msg.text)
        head += msg.text;
    else
        head += log.file ? wideInFile : wideOnScreen;
    if (lineBreak)
        head += '\n';
    head += tail;
    std::fwrite(head.data(), 1, head.size(), out);
    std::fflush(out);
}

// Per-thread scratch text for message parts, so that writing allocates nothing once warm.
std::string& scratch() {
    thread_local std::string text;
    text.clear();
    return text;
}

void writeMarker(std::string_view marker) {
    TraceLog& log = traceLog();
    ZYRStd::mutex::scoped_lock lock(log.mutex);
    FILE* out = log.file ? log.file : stdout;
    std::fwrite(marker.data(), 1, marker.size(), out);
    std::fflush(out);
}

// "<ZYRTrace> Job 7 L2 [1.50000000 sec] [C:Render/Bands] [F:band/12] " and a line break.
std::string& formatHead(std::string& head, int32_t jobNumber, const CZYRUniString& area,
                        const CZYRUniString& category, const sZYRTraceMsgDetail* detail) {
    const sZYRTraceMsgDetail none{0, nullptr, 0, nullptr, 0, 0};
    const sZYRTraceMsgDetail& d = detail ? *detail : none;
    char number[96];
    std::snprintf(number, sizeof number, "<ZYRTrace> Job %d L%d [%#.9g sec] [C:", jobNumber,
                  d.level, d.clockTicks / 1000.0);
    head += number;
    appendText(head, area);
    if (!category.isEmpty()) {
        head += '/';
        appendText(head, category);
    }
    head += "] ";
    if (d.srcFile) {
        head += "[F:";
        head += d.srcFile;
        std::snprintf(number, sizeof number, "/%u] ", d.srcLine);
        head += number;
    }
    if (d.threadName) {
        head += "[Th:";
        head += d.threadName;
        std::snprintf(number, sizeof number, "/%llu] ",
                      static_cast<unsigned long long>(d.threadID));
        head += number;
    }
    head += '\n';
    return head;
}

// ---- reading the configuration -------------------------------------------------------------

// Reads without exceptions: a value of another type counts as absent.
C_SmartPtr<I_Dict> readDict(I_Dict* dict, I_UniString* key) {
    if (!dict || !key || dict->getType(key) != kZYRValTypeDict)
        return {};
    C_Error err;
    I_Dict* out = nullptr;
    const bool found = dict->get(key, &out, err);
    C_SmartPtr<I_Dict> result(out, false);
    return found && !err.errorOccurred() ? result : C_SmartPtr<I_Dict>();
}

CZYRUniString readString(I_Dict* dict, I_UniString* key) {
    if (!dict || !key || dict->getType(key) != kZYRValTypeString)
        return {};
    C_Error err;
    I_UniString* out = nullptr;
    dict->get(key, &out, err);
    return CZYRUniString(out, false);
}

// Signed or unsigned, read as a signed 32-bit number.
bool readNumber(I_Dict* dict, I_UniString* key, int32_t& value) {
    if (!dict || !key)
        return false;
    C_Error err;
    switch (dict->getType(key)) {
    case kZYRValTypeInt:
        return dict->get(key, &value, err);
    case kZYRValTypeUInt: {
        unsigned int raw = 0;
        if (!dict->get(key, &raw, err))
            return false;
        value = static_cast<int32_t>(raw);
        return true;
    }
    default:
        return false;
    }
}

bool isEmptyDict(I_Dict* dict) {
    if (!dict)
        return true;
    C_Error err;
    return dict->getSize(err) == 0;
}

// Lets a CZYRError through and turns anything else into the operation's unknown error.
template <class Body> auto guarded(const char* unknownMessage, int line, Body&& body) {
    try {
        return std::forward<Body>(body)();
    } catch (const CZYRError&) {
        throw;
    } catch (...) {
        throw CZYRError(kZYRErrorUnknown, unknownMessage, kSource, line);
    }
}

} // namespace

// ---- levels ------------------------------------------------------------------------------

int32_t mapToTraceMsgLevel(int32_t value) {
    if (value < 0)
        return 0;
    if (value <= kHighestOrdinaryLevel)
        return value;
    if (value >= kZYRTraceMsgKeptLevelFirst && value <= kZYRTraceMsgKeptLevelLast)
        return value;
    return kHighestOrdinaryLevel;
}

// ---- CZYRProgressInterface ---------------------------------------------------------------

void CZYRProgressInterface::TraceMsg(int32_t jobNumber, I_Job*, I_Surface*,
                                     const CZYRUniString& area, const CZYRUniString& category,
                                     const sZYRTraceMsg* msg, const sZYRTraceMsgDetail* detail,
                                     I_Error& err) {
    ZYRErrorBoundaryVoid(err, "Unknown exception in CZYRProgressInterface::TraceMsg", kWriterSource,
                         kWriterTraceMsgLine, [&] {
                             if (!hasText(msg))
                                 return;
                             writePart(formatHead(scratch(), jobNumber, area, category, detail),
                                       *msg, true, {});
                         });
}

void CZYRProgressInterface::beginTraceMsg(int32_t jobNumber, I_Job*, I_Surface*,
                                          const CZYRUniString& area, const CZYRUniString& category,
                                          const sZYRTraceMsg* msg, const sZYRTraceMsgDetail* detail,
                                          I_Error& err) {
    ZYRErrorBoundaryVoid(err, "Unknown exception in CZYRProgressInterface::beginTraceMsg",
                         kWriterSource, kWriterBeginLine, [&] {
                             if (!hasText(msg))
                                 return;
                             writePart(formatHead(scratch(), jobNumber, area, category, detail),
                                       *msg, true, "<<\n");
                         });
}

void CZYRProgressInterface::traceMsg(const sZYRTraceMsg* msg, I_Error& err) {
    ZYRErrorBoundaryVoid(err, "Unknown exception in CZYRProgressInterface::traceMsg", kWriterSource,
                         kWriterContinuationLine, [&] {
                             if (hasText(msg))
                                 writePart(scratch(), *msg, true, {});
                         });
}

void CZYRProgressInterface::endTraceMsg(I_Error& err) {
    ZYRErrorBoundaryVoid(err, "Unknown exception in CZYRProgressInterface::endTraceMsg",
                         kWriterSource, kWriterEndLine, [&] { writeMarker(">>\n"); });
}

// ---- the process-wide tracing dictionary ---------------------------------------------------

namespace {
// Guards ZYRTracingDict::tracingDict: jobs on several threads read it while a host sets it.
ZYRStd::mutex& tracingDictMutex() {
    static detail::NoDestructor<ZYRStd::mutex> m;
    return *m;
}
} // namespace

C_SmartPtr<I_Dict> ZYRTracingDict::tracingDict;

ZYRTracingDict& ZYRTracingDict::getInstance() {
    static ZYRTracingDict instance;
    return instance;
}

void ZYRTracingDict::setTracingDict(const CZYRDict& dict) {
    C_SmartPtr<I_Dict> copy;
    if (!isEmptyDict(dict.getImpl())) {
        C_Error err;
        copy = C_SmartPtr<I_Dict>(dict.getImpl()->clone(err), false);
        if (err.errorOccurred())
            copy.reset();
    }
    ZYRStd::mutex::scoped_lock lock(tracingDictMutex());
    std::swap(tracingDict, copy);
}

C_SmartPtr<I_Dict> ZYRTracingDict::getTracingDict() const {
    ZYRStd::mutex::scoped_lock lock(tracingDictMutex());
    return tracingDict;
}

ZYRTracingDict::~ZYRTracingDict() {
    ZYRStd::mutex::scoped_lock lock(tracingDictMutex());
    tracingDict.reset();
}

// ---- CZYRTraceMsg ------------------------------------------------------------------------

CZYRTraceMsg::CZYRTraceMsg(const C_SmartPtr<I_Job>& job) : job_(job), config_(nullptr, false) {
    guarded("Unknown exception in CZYRTraceMsg::CZYRTraceMsg", __LINE__, [&] { internalInit(); });
}

CZYRTraceMsg::CZYRTraceMsg(const C_SmartPtr<I_Surface>& surface)
    : surface_(surface), config_(nullptr, false) {
    guarded("Unknown exception in CZYRTraceMsg::CZYRTraceMsg", __LINE__, [&] {
        // The walk's own errors are not reported; a missing step is.
        C_Error err;
        C_SmartPtr<ZYRPublic::I_SurfaceOwner> owner(surface_ ? surface_->getOwner(err) : nullptr,
                                                    false);
        C_SmartPtr<ZYRPublic::I_SurfaceOwnerParent> parent(owner ? owner->getOwner(err) : nullptr,
                                                           false);
        job_ = C_SmartPtr<I_Job>(parent ? parent->getJob(err) : nullptr, false);
        if (!job_)
            throw CZYRError(kZYRErrorInvalidData, "miss job", kSource, __LINE__);
        internalInit();
    });
}

CZYRTraceMsg::~CZYRTraceMsg() = default;

void CZYRTraceMsg::internalInit() {
    guarded("Unknown exception in CZYRTraceMsg::internalInit", __LINE__, [&] {
        const IZYRCommonUniStrings* common = GetCommonUniStrings();
        keyAll_ = CZYRUniString(common->str_All());
        keyDefault_ = CZYRUniString(common->str_Default());

        C_Error err;
        progress_ = GetOEMProgressInterfaceFromJob(job_, err);
        throwCZYRErrorIfErrorOccurred(err);

        C_SmartPtr<I_Dict> jobDict(job_->getJobDict(err), false);
        throwCZYRErrorIfErrorOccurred(err);
        // Read once: a job's parameters do not change while it runs. A job without
        // "JPJobID" prints as job 0.
        if (!readNumber(jobDict.get(), common->str_JPJobID().get(), jobNumber_))
            jobNumber_ = 0;
        const C_SmartPtr<I_Dict> global = ZYRTracingDict::getInstance().getTracingDict();
        C_SmartPtr<I_Dict> config = readDict(jobDict.get(), common->str_ZYRTraceMsg().get());
        if (!config && !global)
            return; // tracing is off for this job

        // Both are kept by reference and read only at the keys asked for: a copy or a walk of
        // the whole would have to cope with cycles and deep nesting in the host's data.
        if (global && isEmptyDict(config.get()))
            config = global;
        else
            global_ = global;
        config_ = CZYRDict(config);
        configEmpty_ = isEmptyDict(config.get()) && isEmptyDict(global_.get());
        configChanges_ = dictChangeCount(config.get());
        if (global_) {
            globalChanges_ = dictChangeCount(global_.get());
            if (!globalChanges_)
                configChanges_ = nullptr;
        }

        const CZYRUniString keyPath("Path");
        const CZYRUniString path = readString(holderOf(keyPath.getImpl()), keyPath.getImpl());
        {
            TraceLog& log = traceLog();
            ZYRStd::mutex::scoped_lock lock(log.mutex);
            if (!log.file) {
                if (textIs(path, u"stdout"))
                    sendToHost_ = true;
                else if (path.isValid())
                    openLogLocked(log, ZYRFileSys::nativePathOf(path).c_str());
                else
                    openLogLocked(log, defaultLogPath());
            }
        }

        int32_t value = 0;
        if (readNumber(holderOf(keyAll_.getImpl()), keyAll_.getImpl(), value)) {
            fixedLevelSet_ = true;
            fixedLevel_ = mapToTraceMsgLevel(value);
        }
        if (readNumber(holderOf(keyDefault_.getImpl()), keyDefault_.getImpl(), value))
            defaultLevel_ = mapToTraceMsgLevel(value);
    });
}

int32_t CZYRTraceMsg::configuredLevel(const CZYRUniString& area,
                                      const CZYRUniString& category) const {
    if (configEmpty_)
        return 0;
    if (fixedLevelSet_)
        return fixedLevel_;
    if (area.isEmpty())
        return 0;
    if (!configChanges_)
        return lookUpLevel(areaDict(area).get(), category);

    int32_t level = 0;
    if (cachedLevel(area, category, level))
        return level;
    const C_SmartPtr<I_Dict> dict = areaDict(area);
    level = lookUpLevel(dict.get(), category);
    cacheLevel(area, category, level, dict.get());
    return level;
}

// Relaxed loads and stores of the slots and counts, here and in cacheLevel: the sequence
// number's acquire and release order them, and a dictionary change made on another thread
// reaches this one only through the host's own synchronisation, which orders its count too.
bool CZYRTraceMsg::cachedLevel(const CZYRUniString& area, const CZYRUniString& category,
                               int32_t& level) const {
    const LevelCache& cache = levelCache_;
    const uint32_t begin = cache.sequence.load(std::memory_order_acquire);
    if ((begin & 1) != 0 ||
        cache.configSeen.load(std::memory_order_relaxed) !=
            configChanges_->load(std::memory_order_relaxed) ||
        (globalChanges_ && cache.globalSeen.load(std::memory_order_relaxed) !=
                               globalChanges_->load(std::memory_order_relaxed)))
        return false;
    for (const LevelSlot& slot : cache.slots) {
        if (slot.area.load(std::memory_order_relaxed) != area.getImpl() ||
            slot.category.load(std::memory_order_relaxed) != category.getImpl())
            continue;
        level = slot.level.load(std::memory_order_relaxed);
        const std::atomic<uint32_t>* changes = slot.areaChanges.load(std::memory_order_relaxed);
        const uint32_t seen = slot.areaSeen.load(std::memory_order_relaxed);
        std::atomic_thread_fence(std::memory_order_acquire);
        // The dictionary of `changes` lives as long as this object, whatever the slot holds.
        return cache.sequence.load(std::memory_order_relaxed) == begin &&
               (!changes || changes->load(std::memory_order_relaxed) == seen);
    }
    return false;
}

void CZYRTraceMsg::cacheLevel(const CZYRUniString& area, const CZYRUniString& category,
                              int32_t level, I_Dict* areaDict) const {
    LevelCache& cache = levelCache_;
    const std::atomic<uint32_t>* changes = areaDict ? dictChangeCount(areaDict) : nullptr;
    if (areaDict && !changes)
        return; // another implementation's dictionary: its changes cannot be seen
    std::unique_lock<std::mutex> lock(cache.writer.native(), std::try_to_lock);
    if (!lock.owns_lock())
        return;
    cache.writer.assertHeld(); // by `lock`, until the return
    if (areaDict) {
        const auto kept =
            cache.areaDicts.begin() + static_cast<std::ptrdiff_t>(cache.areaDictCount);
        if (std::find_if(cache.areaDicts.begin(), kept,
                         [&](const auto& d) { return d.get() == areaDict; }) == kept) {
            if (cache.areaDictCount == kKeptAreaDicts)
                return; // so many area dictionaries: the rest are looked up each time
            cache.areaDicts[cache.areaDictCount++] = C_SmartPtr<I_Dict>(areaDict, true);
        }
    }
    const uint32_t sequence = cache.sequence.load(std::memory_order_relaxed);
    cache.sequence.store(sequence + 1, std::memory_order_relaxed);
    std::atomic_thread_fence(std::memory_order_release);
    const uint32_t configNow = configChanges_->load(std::memory_order_relaxed);
    const uint32_t globalNow = globalChanges_ ? globalChanges_->load(std::memory_order_relaxed) : 0;
    if (cache.configSeen.load(std::memory_order_relaxed) != configNow ||
        cache.globalSeen.load(std::memory_order_relaxed) != globalNow) {
        for (LevelSlot& slot : cache.slots)
            slot.area.store(nullptr, std::memory_order_relaxed);
        cache.configSeen.store(configNow, std::memory_order_relaxed);
        cache.globalSeen.store(globalNow, std::memory_order_relaxed);
    }
    LevelSlot& slot = cache.slots[cache.next];
    slot.area.store(area.getImpl(), std::memory_order_relaxed);
    slot.category.store(category.getImpl(), std::memory_order_relaxed);
    slot.level.store(level, std::memory_order_relaxed);
    slot.areaChanges.store(changes, std::memory_order_relaxed);
    slot.areaSeen.store(changes ? changes->load(std::memory_order_relaxed) : 0,
                        std::memory_order_relaxed);
    cache.areas[cache.next] = area;
    cache.categories[cache.next] = category;
    cache.next = (cache.next + 1) % kCachedLevels;
    cache.sequence.store(sequence + 2, std::memory_order_release);
}

I_Dict* CZYRTraceMsg::holderOf(I_UniString* key) const {
    if (global_ && global_->getType(key) != kZYRValTypeNone)
        return global_.get();
    return config_.getImpl();
}

C_SmartPtr<I_Dict> CZYRTraceMsg::areaDict(const CZYRUniString& area) const {
    return readDict(holderOf(area.getImpl()), area.getImpl());
}

int32_t CZYRTraceMsg::lookUpLevel(I_Dict* areaDict, const CZYRUniString& category) const {
    if (!areaDict)
        return 0;
    int32_t value = 0;
    if (readNumber(areaDict, keyAll_.getImpl(), value) ||
        (!category.isEmpty() && readNumber(areaDict, category.getImpl(), value)) ||
        readNumber(areaDict, keyDefault_.getImpl(), value))
        return mapToTraceMsgLevel(value);
    return defaultLevel_;
}

eZYRTraceMsgLevel CZYRTraceMsg::getTraceMsgLevel(const CZYRUniString& area,
                                                 const CZYRUniString& category) const {
    return guarded("Unknown exception in CZYRTraceMsg::getTraceMsgLevel", __LINE__,
                   [&] { return static_cast<eZYRTraceMsgLevel>(configuredLevel(area, category)); });
}

bool CZYRTraceMsg::passes(const CZYRUniString& area, const CZYRUniString& category, int32_t level,
                          bool alwaysTrace) const {
    if (alwaysTrace)
        return true;
    if (configEmpty_)
        return false;
    return level <= (fixedLevelSet_ ? fixedLevel_ : 0) || level <= configuredLevel(area, category);
}

bool CZYRTraceMsg::routesToHost(const CZYRUniString& area, const CZYRUniString& category) const {
    return sendToHost_ || textIs(area, u"DLCacheOEMInfo") ||
           (textIs(area, u"FontMgr") && textIs(category, u"EmulatedFontInfo"));
}

void CZYRTraceMsg::emit(Kind kind, const CZYRUniString& area, const CZYRUniString& category,
                        int32_t level, const sZYRTraceMsg& msg, const char* srcFile,
                        unsigned int srcLine) {
    const CZYRThreadSpecificPtr* thread = GetCZYRThreadSpecificPtr();
    const sZYRTraceMsgDetail record{level,
                                    srcFile,
                                    srcLine,
                                    thread ? thread->getThreadName() : nullptr,
                                    thread ? thread->getThreadId() : 0,
                                    detail::processClockMs()};
    if (kind == Kind::begin)
        inMessage_ = true;
    C_Error err;
    if (routesToHost(area, category)) {
        if (kind == Kind::begin)
            progress_->beginTraceMsg(job_.get(), surface_.get(), area.getImpl(), category.getImpl(),
                                     &msg, &record, err);
        else
            progress_->traceMsg(job_.get(), surface_.get(), area.getImpl(), category.getImpl(),
                                &msg, &record, err);
    } else {
        if (kind == Kind::begin)
            writer_.beginTraceMsg(jobNumber_, job_.get(), surface_.get(), area, category, &msg,
                                  &record, err);
        else
            writer_.TraceMsg(jobNumber_, job_.get(), surface_.get(), area, category, &msg, &record,
                             err);
    }
    lastArea_ = area;
    lastCategory_ = category;
    throwCZYRErrorIfErrorOccurred(err);
}

void CZYRTraceMsg::continuation(const sZYRTraceMsg& msg) {
    if (!inMessage_)
        return;
    C_Error err;
    if (routesToHost(lastArea_, lastCategory_))
        progress_->traceMsg(&msg, err);
    else
        writer_.traceMsg(&msg, err);
    throwCZYRErrorIfErrorOccurred(err);
}

void CZYRTraceMsg::beginTraceMsg(const CZYRUniString& area, const CZYRUniString& category,
                                 eZYRTraceMsgLevel level, const char* text, bool alwaysTrace,
                                 const char* srcFile, unsigned int srcLine) {
    guarded("Unknown exception in CZYRTraceMsg::beginTraceMsg", __LINE__, [&] {
        if (passes(area, category, level, alwaysTrace))
            emit(Kind::begin, area, category, level, sZYRTraceMsg{text, nullptr}, srcFile, srcLine);
    });
}

void CZYRTraceMsg::beginTraceMsg(const CZYRUniString& area, const CZYRUniString& category,
                                 eZYRTraceMsgLevel level, const char16_t* text, bool alwaysTrace,
                                 const char* srcFile, unsigned int srcLine) {
    guarded("Unknown exception in CZYRTraceMsg::beginTraceMsg", __LINE__, [&] {
        if (passes(area, category, level, alwaysTrace))
            emit(Kind::begin, area, category, level, sZYRTraceMsg{nullptr, text}, srcFile, srcLine);
    });
}

void CZYRTraceMsg::traceMsg(const char* text) {
    guarded("Unknown exception in CZYRTraceMsg::traceMsg", __LINE__, [&] {
        continuation(sZYRTraceMsg{text, nullptr});
    });
}

void CZYRTraceMsg::traceMsg(const char16_t* text) {
    guarded("Unknown exception in CZYRTraceMsg::traceMsg", __LINE__, [&] {
        continuation(sZYRTraceMsg{nullptr, text});
    });
}

void CZYRTraceMsg::endTraceMsg() {
    guarded("Unknown exception in CZYRTraceMsg::endTraceMsg", __LINE__, [&] {
        if (!inMessage_)
            return;
        C_Error err;
        if (routesToHost(lastArea_, lastCategory_))
            progress_->endTraceMsg(err);
        else
            writer_.endTraceMsg(err);
        inMessage_ = false;
        throwCZYRErrorIfErrorOccurred(err);
    });
}

void CZYRTraceMsg::traceMsg(const CZYRUniString& area, const CZYRUniString& category,
                            eZYRTraceMsgLevel level, const char* text, bool alwaysTrace,
                            const char* srcFile, unsigned int srcLine) {
    guarded("Unknown exception in CZYRTraceMsg::traceMsg", __LINE__, [&] {
        if (passes(area, category, level, alwaysTrace))
            emit(Kind::whole, area, category, level, sZYRTraceMsg{text, nullptr}, srcFile, srcLine);
    });
}

void CZYRTraceMsg::traceMsg(const CZYRUniString& area, const CZYRUniString& category,
                            eZYRTraceMsgLevel level, const char16_t* text, bool alwaysTrace,
                            const char* srcFile, unsigned int srcLine) {
    guarded("Unknown exception in CZYRTraceMsg::traceMsg", __LINE__, [&] {
        if (passes(area, category, level, alwaysTrace))
            emit(Kind::whole, area, category, level, sZYRTraceMsg{nullptr, text}, srcFile, srcLine);
    });
}

// ---- free functions ----------------------------------------------------------------------

void closeTraceLogPath() {
    TraceLog& log = traceLog();
    ZYRStd::mutex::scoped_lock lock(log.mutex);
    if (log.file)
        std::fclose(log.file);
    log.file = nullptr;
    log.path.clear();
}

std::string ZYRGetTraceLogPath() {
    TraceLog& log = traceLog();
    ZYRStd::mutex::scoped_lock lock(log.mutex);
    return log.file ? log.path : std::string();
}

void ZYRTraceMsgCallbackInternal(sZYRTraceMsg* msg, sZYRTraceMsgDetail* detail, void*) {
    if (!hasText(msg) || !detail || detail->level != ZYRPublic::kZYRTraceMsgLevel4)
        return;
    try {
        writePart(scratch(), *msg, false, {});
    } catch (...) {
        // A report line that cannot be written is dropped; the callback must not throw.
    }
}

} // namespace ZYRStd
