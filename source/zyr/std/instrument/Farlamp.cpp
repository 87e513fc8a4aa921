// Farlamp: turns analytics records, document facts, errors, feature counters and surfaces
// into data groups and events of the telemetry library's session.
#include "zyr/std/instrument/Farlamp.h"

#include <dlfcn.h>
#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <atomic>
#include <condition_variable>
#include <cstdio>
#include <cstring>
#include <deque>
#include <filesystem>
#include <functional>
#include <future>
#include <limits>
#include <mutex>
#include <optional>
#include <sstream>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "Kelvrin.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRErrorStk.h"
#include "zyr/std/core/ZYRThreadSafety.h"
#include "zyr/std/instrument/internal/FarlampInternal.h"
#include "zyr/std/io/internal/ZYRFileSys_helper.h"
#include "zyr/std/values/CZYRCommonUniStrings.h"
#include "zyr/std/values/CZYRDict.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

namespace {

using namespace ZYRPublic;

// Loaded by name, so that a host's own library found first on the search path (or one the
// host has already loaded under this name) takes the place of ours.
constexpr const char* kLibraryName = "libKelvrin.so";
constexpr const char* kProductName = "ZYRStd";
constexpr const char* kSessionKind = "Print";
constexpr const char* kDefaultFolder = "./AnalyticsLogs";
// A probe of a name no one else uses, made exclusively: never a link into someone's file.
constexpr const char* kProbeTemplate = "/.zyrstd-probe-XXXXXX";
// Calls queued for the writer beyond this are dropped (and counted): a stalled library
// must not make the queue grow without end.
constexpr size_t kMaxQueuedCalls = 4096;
constexpr int kVersion[4] = {ZYRSTD_VERSION_MAJOR, ZYRSTD_VERSION_MINOR, ZYRSTD_VERSION_PATCH, 0};
constexpr short kNoErrorCode = -1;

struct EntryPoints {
    UTInitializeProc initialize = nullptr;
    UTStartSessionProc startSession = nullptr;
    UTAddToSessionProc addToSession = nullptr;
    UTLogEventProc logEvent = nullptr;
    UTNewDataGroupProc newDataGroup = nullptr;
    UTAddToGroupProc addToGroup = nullptr;
    UTCloseSessionProc closeSession = nullptr;
    UTGetOptInProc getOptIn = nullptr;
    UTSetOptInProc setOptIn = nullptr;
};

template <class Proc> bool lookUp(void* library, const char* name, Proc& out) {
    out = reinterpret_cast<Proc>(dlsym(library, name));
    return out != nullptr;
}

constexpr std::array<const char*, 8> kEventNames = {"CachePlacedObject",
                                                    "EnableCutContourProcessing",
                                                    "EnableLowResRasterization",
                                                    "ConvertTextToOutlines",
                                                    "RasterizeRegionsHavingMultipleText",
                                                    "GlobalRasterization",
                                                    "TextAntiAliasing",
                                                    "ZYREnableMTR"};

// The error types' enumeration names by value; 2 has none.
constexpr std::array<const char*, 36> kErrorTypeNames = {
    "kZYRErrorNoError",
    "kZYRErrorUnknown",
    nullptr,
    "kZYRErrorFatal",
    "kZYRErrorInitFailed",
    "kZYRErrorAssertionFailed",
    "kZYRErrorBadParam",
    "kZYRErrorOutOfMemory",
    "kZYRErrorClientAbort",
    "kZYRErrorIncompatibleAPI",
    "kZYRErrorNoTrappingLibrary",
    "kZYRErrorNoPermissionToPrint",
    "kZYRErrorInvalidPath",
    "kZYRErrorKeyNotFound",
    "kZYRErrorTypeCheck",
    "kZYRErrorLimitCheck",
    "kZYRErrorNotFinalized",
    "kZYRErrorFinalized",
    "kZYRErrorNoCurrentPoint",
    "kZYRErrorInvalidObject",
    "kZYRErrorInvalidFuncCall",
    "kZYRErrorIO",
    "kZYRErrorInvalidFileName",
    "kZYRErrorFileOpFailed",
    "kZYRErrorFileAccessRestricted",
    "kZYRErrorInvalidData",
    "kZYRErrorPDF",
    "kZYRErrorRipInternal",
    "kZYRErrorTrapInternal",
    "kZYRErrorRangeCheck",
    "kZYRErrorUndefinedResult",
    "kZYRErrorFileSystemNotInitialized",
    "kZYRErrorProcessNotAuthorized",
    "kZYRErrorAborting",
    "kZYRErrorOtherWorkerJobFailed",
    "kZYRErrorModuleNotInitialized",
};

const char* errorTypeName(eZYRErrorType type) {
    const auto index = static_cast<size_t>(type);
    return index < kErrorTypeNames.size() ? kErrorTypeNames[index] : nullptr;
}

void reportUniqueError(const char16_t* message) {
    try {
        CZYRErrorStk().reportUniqueError(ZYRMakeErrorInfo(kNoErrorCode, message));
    } catch (...) {
        // A report that cannot be made must not stop the logging.
    }
}

template <class T> std::string decimal(T value) {
    std::ostringstream out;
    out << value;
    return out.str();
}

std::string utf8(I_UniString* s) {
    return UniStringToUTF8String(CZYRUniString(s, true)).c_str();
}

// The value under `key` as text, in whatever type the source holds it; each getter is asked
// with a fresh status, since a getter of the wrong type records a type error.
template <class Source> std::optional<std::string> readText(Source* source, const char* key) {
    const CZYRUniString name(key);
    {
        C_Error err;
        I_UniString* s = nullptr;
        const bool found = source->get(name.getImpl(), &s, err);
        const CZYRUniString held(s, false);
        if (found && s && !err.errorOccurred())
            return utf8(s);
    }
    {
        C_Error err;
        unsigned int v = 0;
        if (source->get(name.getImpl(), &v, err) && !err.errorOccurred())
            return decimal(v);
    }
    {
        C_Error err;
        int32_t v = 0;
        if (source->get(name.getImpl(), &v, err) && !err.errorOccurred())
            return decimal(v);
    }
    {
        C_Error err;
        double v = 0;
        if (source->get(name.getImpl(), &v, err) && !err.errorOccurred())
            return decimal(v);
    }
    {
        C_Error err;
        bool v = false;
        if (source->get(name.getImpl(), &v, err) && !err.errorOccurred())
            return decimal(v);
    }
    return std::nullopt;
}

template <class T, class Source> std::optional<T> readValue(Source* source, const char* key) {
    C_Error err;
    T v{};
    if (source->get(CZYRUniString(key).getImpl(), &v, err) && !err.errorOccurred())
        return v;
    return std::nullopt;
}

// A surface extent as the whole number "%d" prints; out-of-range values are clamped, since
// converting them would be undefined.
int wholeUnits(double extent) {
    if (!(extent > std::numeric_limits<int>::min()))
        return extent > 0 ? std::numeric_limits<int>::max() : std::numeric_limits<int>::min();
    return extent < std::numeric_limits<int>::max() ? static_cast<int>(extent)
                                                    : std::numeric_limits<int>::max();
}

// A folder the session can write to: created when missing, then probed with a file.
bool usableFolder(const std::string& folder) {
    std::error_code ec;
    const std::filesystem::path path(folder);
    if (!std::filesystem::exists(path, ec) && !std::filesystem::create_directories(path, ec))
        return false;
    if (!std::filesystem::is_directory(path, ec))
        return false;
    std::string probe = folder + kProbeTemplate;
    const int fd = ::mkostemp(probe.data(), O_CLOEXEC);
    if (fd < 0)
        return false;
    ::close(fd);
    ::unlink(probe.c_str());
    return true;
}

// Where each analytics group goes, and which keys it carries.
enum class Into { NewGroup, ProductInfoGroup, JobInfoGroup };
struct GroupRule {
    const char* name;
    Into into;
    bool onlyWithRasterCaching; // only when xobjmode is 0 or 2
    std::array<const char*, 8> keys;
};
constexpr std::array<GroupRule, 8> kGroupRules = {{
    {"FontInfo",
     Into::NewGroup,
     false,
     {"NumSubstFont", "PreferredFont", "UseDefaultFont", "UseFontEmulation"}},
    {"ProductInfo",
     Into::ProductInfoGroup,
     false,
     {"OEMName", "OEMModelName", "NumDevices", "InstanceMode", "xobjMode"}},
    {"DripSessionInfo",
     Into::NewGroup,
     false,
     {"NumWorkers", "NumEngSimulators", "NumLRCS", "WorkerCrashedCount"}},
    {"dripCntrlJobInfo", Into::NewGroup, false, {"JobStatus", "JobCompleteTime", "NumSurfaces"}},
    {"ErrorInfo",
     Into::NewGroup,
     false,
     {"Area", "Type", "Parameter1", "Parameter2", "Parameter3", "Fatal"}},
    {"RasterCacheInfo",
     Into::JobInfoGroup,
     true,
     {"MaxIndividualRasterSize", "NumSmallRasters", "NumMediumRasters", "NumLargeRasters",
      "NumVeryLargeRasters", "RasterCacheOverflowCount", "RasterDiskCachingEnabled",
      "MaxXObjRasterCacheinMB"}},
    {"DLCacheInfo",
     Into::JobInfoGroup,
     true,
     {"IndividualMaxDLSize", "NumSmallDLs", "NumMediumDLs", "NumLargeDLs", "NumVeryLargeDLs",
      "DLCacheOverflowCount", "DLCacheMaxRAMinMB"}},
    {"JobInfo",
     Into::JobInfoGroup,
     false,
     {"SurfaceCount", "PlacedObjectCount", "TotalMediaSize", "ErrorOccured"}},
}};

} // namespace

// ---- the logger's state and its writer ------------------------------------------------

namespace {

// Runs the logger's calls into the library, one after another in the order they were
// posted, on a thread of its own: engine threads only queue their calls and never wait for
// the library's I/O.
class Writer {
public:
    ~Writer() { stop(); }

    void start() {
        const detail::LockGuard guard(lock_);
        if (running_)
            return;
        running_ = true;
        thread_ = std::thread([this] { run(); });
    }
    // Runs everything still queued, then ends the thread.
    void stop() {
        {
            const detail::LockGuard guard(lock_);
            running_ = false;
        }
        wake_.notify_one();
        if (thread_.joinable() && thread_.get_id() != std::this_thread::get_id())
            thread_.join();
    }
    // False when the call was not queued: no writer runs, or the queue is full.
    bool post(std::function<void()> call);

private:
    void run();

    detail::Mutex lock_; // guards queue_ and running_; never held while the library is called
    std::condition_variable wake_;
    std::deque<std::function<void()>> queue_ ZYR_GUARDED_BY(lock_);
    bool running_ ZYR_GUARDED_BY(lock_) = false;
    std::thread thread_;
};

// Everything the logger keeps between calls. The fields under `lock` are touched by the
// writer thread while a session is open, and by StartSession and CloseSession while no
// writer runs; `lock` is held across the calls into the library, which engine threads
// never make.
struct LoggerState {
    detail::Mutex lock; // guards the fields from libInst to prevSurfaceCount
    void* libInst ZYR_GUARDED_BY(lock) = nullptr;
    bool libraryFunctionLoaded ZYR_GUARDED_BY(lock) = false;
    bool initialized ZYR_GUARDED_BY(lock) = false;
    Kelvrin* logHandle ZYR_GUARDED_BY(lock) = nullptr;
    int ProductInfoGroupID ZYR_GUARDED_BY(lock) = -1;
    int JobInfoGroupID ZYR_GUARDED_BY(lock) = -1;
    double jobStartTime ZYR_GUARDED_BY(lock) = 0;
    int xobjmode ZYR_GUARDED_BY(lock) = 0;
    sSurfaceInfo currSurfaceInfo ZYR_GUARDED_BY(lock);
    sSurfaceInfo prevSurfaceInfo ZYR_GUARDED_BY(lock);
    unsigned int
        prevSurfaceCount ZYR_GUARDED_BY(lock) = 0; // surfaces in the run prevSurfaceInfo describes
    EntryPoints entry ZYR_GUARDED_BY(lock);        // valid while libraryFunctionLoaded

    // Read by every operation without a lock. Relaxed: it only gates work, and what a
    // logged call needs is handed over through the writer's queue under its lock.
    std::atomic<bool> loggingEnabled{false};
    // Relaxed: independent tallies; each is taken with one exchange when a job ends, so
    // no increment is lost between reading and resetting.
    std::atomic<unsigned int> eventCounters[kZYRAnalyticsEventAll] = {};
    // Relaxed: a tally, read at close after the writer and the analytics worker joined.
    std::atomic<unsigned long long> droppedRecords{0};

    Writer writer; // last: destroyed first, while the state it runs on is still alive
};

LoggerState state;

bool Writer::post(std::function<void()> call) {
    {
        const detail::LockGuard guard(lock_);
        if (!running_)
            return false;
        if (queue_.size() >= kMaxQueuedCalls) {
            state.droppedRecords.fetch_add(1, std::memory_order_relaxed);
            return false;
        }
        queue_.push_back(std::move(call));
    }
    wake_.notify_one();
    return true;
}

void Writer::run() {
    for (;;) {
        std::function<void()> call;
        {
            detail::UniqueLock guard(lock_);
            wake_.wait(guard.native(),
                       [&]() ZYR_REQUIRES(lock_) { return !queue_.empty() || !running_; });
            if (queue_.empty())
                return;
            call = std::move(queue_.front());
            queue_.pop_front();
        }
        const detail::LockGuard session(state.lock);
        try {
            call();
        } catch (...) {
            // The writer must survive a call it cannot complete.
        }
    }
}

// Queues `call` when logging is on; the call runs on the writer with state.lock held.
void postCall(std::function<void()> call) {
    if (state.loggingEnabled.load(std::memory_order_relaxed))
        state.writer.post(std::move(call));
}

using Counts = std::array<unsigned int, kZYRAnalyticsEventAll>;

// Takes every counter and resets it in one step each.
Counts takeCounters() {
    Counts counts{};
    for (int i = 0; i < kZYRAnalyticsEventAll; ++i)
        counts[i] = state.eventCounters[i].exchange(0, std::memory_order_relaxed);
    return counts;
}

// Logs the taken counts as events; expects state.lock held.
void logCountedEvents(const Counts& counts) ZYR_REQUIRES(state.lock) {
    for (int i = 0; i < kZYRAnalyticsEventAll; ++i) {
        if (counts[i] == 0)
            continue;
        const bool logged = (i >= kZYRAnalyticsEventEnableLowResRasterization &&
                             i <= kZYRAnalyticsEventZYREnableMTR) ||
                            (i == kZYRAnalyticsEventCachePlacedObject &&
                             counts[kZYRAnalyticsEventPlacedObjectCached] != 0) ||
                            (i == kZYRAnalyticsEventEnableCutContourProcessing &&
                             counts[kZYRAnalyticsEventCutContourProcessed] != 0);
        if (logged && state.logHandle)
            state.entry.logEvent(state.logHandle, "Job", "", kEventNames[i], nullptr, 0);
    }
}

// A new group holding `values` in order; expects state.lock held.
void logGroup(const char* name, const std::vector<std::pair<std::string, std::string>>& values)
    ZYR_REQUIRES(state.lock) {
    if (!state.logHandle)
        return;
    int group = -1;
    state.entry.newDataGroup(state.logHandle, name, "", name, group, nullptr, 0);
    for (const auto& [key, value] : values)
        state.entry.addToGroup(state.logHandle, group, key.c_str(), value.c_str());
}

// The path of `name` in this library's own directory. dlopen by name finds it there through
// the library's RUNPATH, but not when a sanitizer's interceptor makes the call (the search
// then uses the interceptor's RUNPATH), so the logger also asks for it by path.
std::string besideThisLibrary(const char* name) {
    Dl_info info{};
    if (!dladdr(reinterpret_cast<void*>(&Farlamp::LoggingEnabled), &info) || !info.dli_fname)
        return name;
    return (std::filesystem::path(info.dli_fname).parent_path() / name).string();
}

} // namespace

void noteDroppedAnalyticsRecords(unsigned long long count) {
    state.droppedRecords.fetch_add(count, std::memory_order_relaxed);
}

// ---- loading ------------------------------------------------------------------------------

void Farlamp::LoadLibraryFunction() {
    state.lock.assertHeld(); // called by the session calls and the writer, which hold it
    // The platform-version test of the original always passes here.
    state.libInst = dlopen(kLibraryName, RTLD_NOW | RTLD_LOCAL);
    if (!state.libInst)
        state.libInst = dlopen(besideThisLibrary(kLibraryName).c_str(), RTLD_NOW | RTLD_LOCAL);
    if (!state.libInst)
        return;
    void* const lib = state.libInst;
    EntryPoints found;
    state.libraryFunctionLoaded = lookUp(lib, "UTInitialize", found.initialize) &&
                                  lookUp(lib, "UTStartSession", found.startSession) &&
                                  lookUp(lib, "UTAddToSession", found.addToSession) &&
                                  lookUp(lib, "UTLogEvent", found.logEvent) &&
                                  lookUp(lib, "UTNewDataGroup", found.newDataGroup) &&
                                  lookUp(lib, "UTAddToGroup", found.addToGroup) &&
                                  lookUp(lib, "UTCloseSession", found.closeSession) &&
                                  lookUp(lib, "UTGetOptIn", found.getOptIn) &&
                                  lookUp(lib, "UTSetOptIn", found.setOptIn);
    if (state.libraryFunctionLoaded)
        state.entry = found;
    else
        UnloadLibraryFunction();
}

// Forgets everything of the session too: nothing may call into an unloaded library.
void Farlamp::UnloadLibraryFunction() {
    state.lock.assertHeld(); // called by the session calls and the writer, which hold it
    if (state.libInst)
        dlclose(state.libInst);
    state.libInst = nullptr;
    state.entry = EntryPoints{};
    state.libraryFunctionLoaded = false;
    state.initialized = false;
    state.loggingEnabled.store(false, std::memory_order_relaxed);
    state.logHandle = nullptr;
    state.ProductInfoGroupID = -1;
    state.JobInfoGroupID = -1;
    state.jobStartTime = 0;
    state.xobjmode = 0;
    state.currSurfaceInfo = state.prevSurfaceInfo = sSurfaceInfo{};
    state.prevSurfaceCount = 0;
    (void)takeCounters();
    state.droppedRecords.store(0, std::memory_order_relaxed);
}

void Farlamp::Initialize(bool active) {
    state.lock.assertHeld(); // called by the session calls and the writer, which hold it
    LoadLibraryFunction();
    if (!state.libraryFunctionLoaded)
        return;
    state.entry.initialize(kProductName, false, nullptr);
    state.entry.setOptIn(active ? 1 : 0);
    state.initialized = true;
    state.loggingEnabled.store(active, std::memory_order_relaxed);
}

// ---- the session --------------------------------------------------------------------------

bool Farlamp::StartSession(bool active, const char16_t* folder) {
    const detail::LockGuard lock(state.lock);
    if (!state.initialized)
        Initialize(active);
    if (!state.initialized)
        return false;
    char version[64];
    char shortVersion[32];
    std::snprintf(version, sizeof version, "%d.%d.%d.%d", kVersion[0], kVersion[1], kVersion[2],
                  kVersion[3]);
    std::snprintf(shortVersion, sizeof shortVersion, "%d.%d", kVersion[0], kVersion[1]);
    if (state.logHandle)
        return true;

    std::string sessionFolder = kDefaultFolder;
    if (active && folder && *folder) {
        std::string given =
            ZYRFileSys::utf16ToUTF8(folder, std::char_traits<char16_t>::length(folder)).c_str();
        if (usableFolder(given))
            sessionFolder = std::move(given);
        else
            reportUniqueError(u" Default directory was used to store analytics logs \n");
    }
    state.entry.startSession(state.logHandle, kSessionKind, kProductName, version, shortVersion, "",
                             sessionFolder.c_str());
    if (!state.logHandle)
        state.loggingEnabled.store(false, std::memory_order_relaxed); // nothing to log into
    if (state.loggingEnabled.load(std::memory_order_relaxed))
        state.writer.start();
    return state.logHandle != nullptr;
}

void Farlamp::CloseSession() {
    state.writer.stop(); // what engine threads queued is written first
    const detail::LockGuard lock(state.lock);
    if (state.loggingEnabled.load(std::memory_order_relaxed) && state.logHandle) {
        if (state.ProductInfoGroupID == -1) {
            state.entry.newDataGroup(state.logHandle, "ProductInfo", "", "ProductInfo",
                                     state.ProductInfoGroupID, nullptr, 0);
            for (const char* key : {"OEMName", "OEMModelName", "NumDevices", "InstanceMode"})
                state.entry.addToGroup(state.logHandle, state.ProductInfoGroupID, key, "NoData");
        }
        if (const auto dropped = state.droppedRecords.load(std::memory_order_relaxed))
            state.entry.addToSession(state.logHandle, "DroppedRecords", decimal(dropped).c_str());
    }
    if (state.logHandle)
        state.entry.closeSession(state.logHandle);
    state.logHandle = nullptr;
    UnloadLibraryFunction();
}

bool Farlamp::LoggingEnabled() {
    return state.loggingEnabled.load(std::memory_order_relaxed);
}

// ---- data groups --------------------------------------------------------------------------

namespace {

// Writes one analytics record; runs on the writer.
// The session's one group of `name`, opened the first time it is asked for.
int openedOnce(int& id, const char* name) ZYR_REQUIRES(state.lock) {
    if (id == -1)
        state.entry.newDataGroup(state.logHandle, name, "", name, id, nullptr, 0);
    return id;
}

void logRecord(I_AnalyticsData* source) ZYR_REQUIRES(state.lock) {
    const auto groupName = readValue<I_UniString*>(source, "DataGroupName");
    if (!groupName || !*groupName || !state.logHandle)
        return;
    const CZYRUniString name(*groupName, false);
    for (const GroupRule& rule : kGroupRules) {
        if (!(name == CZYRUniString(rule.name)))
            continue;
        if (rule.onlyWithRasterCaching && state.xobjmode != 0 && state.xobjmode != 2)
            return;
        int group = -1;
        switch (rule.into) {
        case Into::NewGroup:
            state.entry.newDataGroup(state.logHandle, rule.name, "", rule.name, group, nullptr, 0);
            break;
        case Into::ProductInfoGroup:
            group = openedOnce(state.ProductInfoGroupID, "ProductInfo");
            if (const auto mode = readValue<unsigned int>(source, "xobjMode"))
                state.xobjmode = static_cast<int>(*mode);
            break;
        case Into::JobInfoGroup:
            group = openedOnce(state.JobInfoGroupID, "JobInfo");
            if (const auto start = readValue<double>(source, "StartTime"))
                state.jobStartTime = *start;
            break;
        }
        for (const char* key : rule.keys) {
            if (!key)
                break;
            if (const auto value = readText(source, key))
                state.entry.addToGroup(state.logHandle, group, key, value->c_str());
            else if (std::strcmp(key, "PreferredFont") == 0)
                state.entry.addToGroup(state.logHandle, group, key,
                                       "ERROR : PreferredFont Not Found");
        }
        return;
    }
}

} // namespace

// Runs on the analytics worker, which waits for the writer: the worker's own queue is where
// records wait, bounded, while the library is slow.
void Farlamp::LogDataObject(const C_SmartPtr<I_AnalyticsData>& record) {
    if (!LoggingEnabled() || !record)
        return;
    std::promise<void> written;
    C_SmartPtr<I_AnalyticsData> held = record;
    if (state.writer.post([&written, held]() ZYR_REQUIRES(state.lock) {
            const struct Done {
                std::promise<void>& done;
                ~Done() { done.set_value(); }
            } done{written};
            logRecord(held.get());
        }))
        written.get_future().wait();
}

void Farlamp::LogDict(const CZYRDict& info) {
    if (!LoggingEnabled() || !info.isValid())
        return;
    // The facts are read here, the group written by the writer.
    std::vector<std::pair<std::string, std::string>> values;
    try {
        I_Dict* source = info.getImpl();
        const auto groupName = readValue<I_UniString*>(source, "DataGroupName");
        if (!groupName || !*groupName)
            return;
        if (!(CZYRUniString(*groupName, false) == CZYRUniString("PDFInfo")))
            return;
        const auto major = readText(source, "PDFMajorVersion");
        const auto minor = readText(source, "PDFMinorVersion");
        if (major && minor)
            values.emplace_back("PDFVersion", *major + "." + *minor);
        constexpr std::pair<const char*, const char*> kFacts[] = {{"PDFE", "PDFE"},
                                                                  {"PDFX", "PDFX"},
                                                                  {"PDFA", "PDFA"},
                                                                  {"PDFUA", "PDFUA"},
                                                                  {"PDFVT", "PDFVT"},
                                                                  {"creatorApp", "PDFCreatorApp"},
                                                                  {"PreTrapped", "PDFPreTrapped"},
                                                                  {"HasPassword", "SecurityType"},
                                                                  {"NumPages", "NumPages"}};
        for (const auto& [logged, key] : kFacts)
            if (const auto value = readText(source, key))
                values.emplace_back(logged, *value);
    } catch (...) {
        return; // facts that cannot be read are not logged
    }
    postCall([values = std::move(values)]()
                 ZYR_REQUIRES(state.lock) { logGroup("PDFInfo", values); });
}

void Farlamp::LogZYRError(eZYRErrorType type, const char* area, const char* file) {
    if (!LoggingEnabled())
        return;
    const char* name = errorTypeName(type);
    if (!name)
        reportUniqueError(u" Error code not updated in Analytics \n");
    std::string fileName = file ? file : "";
    if (const auto slash = fileName.find_last_of("/\\"); slash != std::string::npos)
        fileName.erase(0, slash + 1);
    std::vector<std::pair<std::string, std::string>> values = {
        {"Area", area ? area : ""}, {"Type", name ? name : decimal(static_cast<int>(type))},
        {"Parameter1", fileName},   {"Parameter2", ""},
        {"Parameter3", ""},         {"Fatal", type == kZYRErrorFatal ? "1" : "0"}};
    postCall([values = std::move(values)]()
                 ZYR_REQUIRES(state.lock) { logGroup("ErrorInfo", values); });
}

// ---- events -------------------------------------------------------------------------------

unsigned int Farlamp::LogEvent(eZYRAnalyticsEventType type, bool peek) {
    if (!LoggingEnabled())
        return 0;
    if (type >= 0 && type < kZYRAnalyticsEventAll) {
        auto& counter = state.eventCounters[type];
        return peek ? counter.load(std::memory_order_relaxed)
                    : counter.fetch_add(1, std::memory_order_relaxed) + 1;
    }
    if (type == kZYRAnalyticsEventAll)
        postCall([counts = takeCounters()]()
                     ZYR_REQUIRES(state.lock) { logCountedEvents(counts); });
    return 0;
}

void Farlamp::LogEventNow(eZYRAnalyticsEventType type) {
    if (type < 0 || static_cast<size_t>(type) >= kEventNames.size())
        return;
    postCall([type]() ZYR_REQUIRES(state.lock) {
        if (state.logHandle)
            state.entry.logEvent(state.logHandle, "Job", "", kEventNames[type], nullptr, 0);
    });
}

void Farlamp::FlushJob(double time) {
    if (!LoggingEnabled())
        return;
    // One set of counts serves the job's values and its events.
    postCall([time, counts = takeCounters()]() ZYR_REQUIRES(state.lock) {
        if (!state.logHandle)
            return;
        if (state.JobInfoGroupID != -1) {
            char elapsed[64];
            std::snprintf(elapsed, sizeof elapsed, "%.2f", time - state.jobStartTime);
            const auto add = [](const char* key, const char* value) ZYR_REQUIRES(state.lock) {
                state.entry.addToGroup(state.logHandle, state.JobInfoGroupID, key, value);
            };
            add("CompletionTime", elapsed);
            add("HasTrapping", counts[kZYRAnalyticsEventHasTrapping] ? "1" : "0");
            add("HasTransparency", counts[kZYRAnalyticsEventHasTransparency] ? "1" : "0");
        }
        logCountedEvents(counts);
        if (state.prevSurfaceCount > 0)
            LogSurfaceDataGroupHelper(state.prevSurfaceInfo);
        state.prevSurfaceInfo = sSurfaceInfo{};
        state.prevSurfaceCount = 0;
        state.JobInfoGroupID = -1; // the next job gets a group of its own
    });
}

// ---- surfaces -----------------------------------------------------------------------------

void Farlamp::UpdateCurrentSurfaceInfo(double width, double height, unsigned int placedObjects) {
    postCall([surface = sSurfaceInfo{width, height, placedObjects}]()
                 ZYR_REQUIRES(state.lock) { state.currSurfaceInfo = surface; });
}

void Farlamp::LogSurfaceDataGroup() {
    postCall([]() ZYR_REQUIRES(state.lock) {
        if (!state.logHandle)
            return;
        if (state.prevSurfaceCount > 0 && state.currSurfaceInfo == state.prevSurfaceInfo) {
            ++state.prevSurfaceCount;
            return;
        }
        if (state.prevSurfaceCount > 0)
            LogSurfaceDataGroupHelper(state.prevSurfaceInfo);
        state.prevSurfaceInfo = state.currSurfaceInfo;
        state.prevSurfaceCount = 1;
    });
}

void Farlamp::LogSurfaceDataGroupHelper(sSurfaceInfo& info) {
    state.lock.assertHeld(); // called by the session calls and the writer, which hold it
    if (!state.logHandle)
        return;
    char resolution[64];
    std::snprintf(resolution, sizeof resolution, "%dX%d", wholeUnits(info.width),
                  wholeUnits(info.height));
    int group = -1;
    state.entry.newDataGroup(state.logHandle, "SurfaceInfo", "", "Surface", group, nullptr, 0);
    state.entry.addToGroup(state.logHandle, group, "Surface Resolution", resolution);
    state.entry.addToGroup(state.logHandle, group, "Placed Objects",
                           decimal(info.placedObjects).c_str());
    state.entry.addToGroup(state.logHandle, group, "count",
                           decimal(state.prevSurfaceCount).c_str());
}

} // namespace ZYRStd
