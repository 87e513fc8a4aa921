// Farlamp: turns analytics records, document facts, errors, feature counters and surfaces
// into data groups and events of the telemetry library's session.
#include "zyr/std/instrument/Farlamp.h"

#include <dlfcn.h>

#include <array>
#include <atomic>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <limits>
#include <optional>
#include <sstream>
#include <string>
#include <utility>

#include "Kelvrin.h"
#include "zyr/std/core/CZYRError.h"
#include "zyr/std/core/CZYRErrorStk.h"
#include "zyr/std/io/internal/ZYRFileSys_helper.h"
#include "zyr/std/values/CZYRCommonUniStrings.h"
#include "zyr/std/values/CZYRDict.h"
#include "zyr/std/values/CZYRUniString.h"

namespace ZYRStd {

std::mutex Farlamp::stateLock;
void* Farlamp::libInst = nullptr;
bool Farlamp::libraryFunctionLoaded = false;
bool Farlamp::initialized = false;
std::atomic<bool> Farlamp::loggingEnabled{false};
Kelvrin* Farlamp::logHandle = nullptr;
int Farlamp::ProductInfoGroupID = -1;
int Farlamp::JobInfoGroupID = -1;
double Farlamp::jobStartTime = 0;
int Farlamp::xobjmode = 0;
sSurfaceInfo Farlamp::currSurfaceInfo;
sSurfaceInfo Farlamp::prevSurfaceInfo;
unsigned int Farlamp::prevSurfaceCount = 0;
std::atomic<unsigned int> Farlamp::eventCounters[kZYRAnalyticsEventAll];

namespace {

using namespace ZYRPublic;

// Loaded by name, so that a host's own library found first on the search path (or one the
// host has already loaded under this name) takes the place of ours.
constexpr const char* kLibraryName = "libKelvrin.so";
constexpr const char* kProductName = "ZYRStd";
constexpr const char* kSessionKind = "Print";
constexpr const char* kDefaultFolder = "./AnalyticsLogs";
constexpr const char* kProbeFile = "/test.txt";
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
EntryPoints entry; // guarded by Farlamp::stateLock; valid while libraryFunctionLoaded

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
    const std::string probe = folder + kProbeFile;
    FILE* file = std::fopen(probe.c_str(), "w");
    if (!file)
        return false;
    std::fclose(file);
    std::remove(probe.c_str());
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

// ---- loading ------------------------------------------------------------------------------

namespace {

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

void Farlamp::LoadLibraryFunction() {
    // The platform-version test of the original always passes here.
    libInst = dlopen(kLibraryName, RTLD_NOW | RTLD_LOCAL);
    if (!libInst)
        libInst = dlopen(besideThisLibrary(kLibraryName).c_str(), RTLD_NOW | RTLD_LOCAL);
    if (!libInst)
        return;
    EntryPoints found;
    libraryFunctionLoaded = lookUp(libInst, "UTInitialize", found.initialize) &&
                            lookUp(libInst, "UTStartSession", found.startSession) &&
                            lookUp(libInst, "UTAddToSession", found.addToSession) &&
                            lookUp(libInst, "UTLogEvent", found.logEvent) &&
                            lookUp(libInst, "UTNewDataGroup", found.newDataGroup) &&
                            lookUp(libInst, "UTAddToGroup", found.addToGroup) &&
                            lookUp(libInst, "UTCloseSession", found.closeSession) &&
                            lookUp(libInst, "UTGetOptIn", found.getOptIn) &&
                            lookUp(libInst, "UTSetOptIn", found.setOptIn);
    if (libraryFunctionLoaded)
        entry = found;
    else
        UnloadLibraryFunction();
}

// Forgets everything of the session too: nothing may call into an unloaded library.
void Farlamp::UnloadLibraryFunction() {
    if (libInst)
        dlclose(libInst);
    libInst = nullptr;
    entry = EntryPoints{};
    libraryFunctionLoaded = false;
    initialized = false;
    loggingEnabled = false;
    logHandle = nullptr;
    ProductInfoGroupID = -1;
    JobInfoGroupID = -1;
    jobStartTime = 0;
    xobjmode = 0;
    currSurfaceInfo = prevSurfaceInfo = sSurfaceInfo{};
    prevSurfaceCount = 0;
    for (auto& counter : eventCounters)
        counter.store(0, std::memory_order_relaxed);
}

void Farlamp::Initialize(bool active) {
    LoadLibraryFunction();
    if (!libraryFunctionLoaded)
        return;
    entry.initialize(kProductName, false, nullptr);
    entry.setOptIn(active ? 1 : 0);
    initialized = true;
    loggingEnabled = active;
}

// ---- the session --------------------------------------------------------------------------

bool Farlamp::StartSession(bool active, const char16_t* folder) {
    const std::lock_guard lock(stateLock);
    if (!initialized)
        Initialize(active);
    if (!initialized)
        return false;
    char version[64];
    char shortVersion[32];
    std::snprintf(version, sizeof version, "%d.%d.%d.%d", kVersion[0], kVersion[1], kVersion[2],
                  kVersion[3]);
    std::snprintf(shortVersion, sizeof shortVersion, "%d.%d", kVersion[0], kVersion[1]);
    if (logHandle)
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
    entry.startSession(logHandle, kSessionKind, kProductName, version, shortVersion, "",
                       sessionFolder.c_str());
    if (!logHandle)
        loggingEnabled = false; // nothing to log into
    return logHandle != nullptr;
}

void Farlamp::CloseSession() {
    const std::lock_guard lock(stateLock);
    if (loggingEnabled && logHandle && ProductInfoGroupID == -1) {
        entry.newDataGroup(logHandle, "ProductInfo", "", "ProductInfo", ProductInfoGroupID, nullptr,
                           0);
        for (const char* key : {"OEMName", "OEMModelName", "NumDevices", "InstanceMode"})
            entry.addToGroup(logHandle, ProductInfoGroupID, key, "NoData");
    }
    if (logHandle)
        entry.closeSession(logHandle);
    logHandle = nullptr;
    UnloadLibraryFunction();
}

bool Farlamp::LoggingEnabled() {
    return loggingEnabled;
}

// ---- data groups --------------------------------------------------------------------------

void Farlamp::LogDataObject(const C_SmartPtr<I_AnalyticsData>& record) {
    if (!loggingEnabled)
        return; // the common case of an opted-out session, without the lock
    const std::lock_guard lock(stateLock);
    if (!loggingEnabled || !logHandle || !record)
        return;
    try {
        I_AnalyticsData* source = record.get();
        const auto groupName = readValue<I_UniString*>(source, "DataGroupName");
        if (!groupName || !*groupName)
            return;
        const CZYRUniString name(*groupName, false);
        for (const GroupRule& rule : kGroupRules) {
            if (!(name == CZYRUniString(rule.name)))
                continue;
            if (rule.onlyWithRasterCaching && xobjmode != 0 && xobjmode != 2)
                return;
            int group = -1;
            switch (rule.into) {
            case Into::NewGroup:
                entry.newDataGroup(logHandle, rule.name, "", rule.name, group, nullptr, 0);
                break;
            case Into::ProductInfoGroup:
                if (ProductInfoGroupID == -1)
                    entry.newDataGroup(logHandle, "ProductInfo", "", "ProductInfo",
                                       ProductInfoGroupID, nullptr, 0);
                group = ProductInfoGroupID;
                if (const auto mode = readValue<unsigned int>(source, "xobjMode"))
                    xobjmode = static_cast<int>(*mode);
                break;
            case Into::JobInfoGroup:
                if (JobInfoGroupID == -1)
                    entry.newDataGroup(logHandle, "JobInfo", "", "JobInfo", JobInfoGroupID, nullptr,
                                       0);
                group = JobInfoGroupID;
                if (const auto start = readValue<double>(source, "StartTime"))
                    jobStartTime = *start;
                break;
            }
            for (const char* key : rule.keys) {
                if (!key)
                    break;
                if (const auto value = readText(source, key))
                    entry.addToGroup(logHandle, group, key, value->c_str());
                else if (std::strcmp(key, "PreferredFont") == 0)
                    entry.addToGroup(logHandle, group, key, "ERROR : PreferredFont Not Found");
            }
            return;
        }
    } catch (...) {
        // The worker thread must survive a record it cannot read.
    }
}

void Farlamp::LogDict(const CZYRDict& info) {
    const std::lock_guard lock(stateLock);
    if (!loggingEnabled || !logHandle || !info.isValid())
        return;
    try {
        I_Dict* source = info.getImpl();
        const auto groupName = readValue<I_UniString*>(source, "DataGroupName");
        if (!groupName || !*groupName)
            return;
        if (!(CZYRUniString(*groupName, false) == CZYRUniString("PDFInfo")))
            return;
        int group = -1;
        entry.newDataGroup(logHandle, "PDFInfo", "", "PDFInfo", group, nullptr, 0);
        const auto major = readText(source, "PDFMajorVersion");
        const auto minor = readText(source, "PDFMinorVersion");
        if (major && minor)
            entry.addToGroup(logHandle, group, "PDFVersion", (*major + "." + *minor).c_str());
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
                entry.addToGroup(logHandle, group, logged, value->c_str());
    } catch (...) {
        // Facts that cannot be read are not logged.
    }
}

void Farlamp::LogZYRError(eZYRErrorType type, const char* area, const char* file) {
    const std::lock_guard lock(stateLock);
    if (!loggingEnabled || !logHandle)
        return;
    const char* name = errorTypeName(type);
    if (!name)
        reportUniqueError(u" Error code not updated in Analytics \n");
    const std::string typeText = name ? name : decimal(static_cast<int>(type));
    std::string fileName = file ? file : "";
    if (const auto slash = fileName.find_last_of("/\\"); slash != std::string::npos)
        fileName.erase(0, slash + 1);
    int group = -1;
    entry.newDataGroup(logHandle, "ErrorInfo", "", "ErrorInfo", group, nullptr, 0);
    entry.addToGroup(logHandle, group, "Area", area ? area : "");
    entry.addToGroup(logHandle, group, "Type", typeText.c_str());
    entry.addToGroup(logHandle, group, "Parameter1", fileName.c_str());
    entry.addToGroup(logHandle, group, "Parameter2", "");
    entry.addToGroup(logHandle, group, "Parameter3", "");
    entry.addToGroup(logHandle, group, "Fatal", type == kZYRErrorFatal ? "1" : "0");
}

// ---- events -------------------------------------------------------------------------------

unsigned int Farlamp::LogEvent(eZYRAnalyticsEventType type, bool peek) {
    if (!loggingEnabled)
        return 0;
    if (type >= 0 && type < kZYRAnalyticsEventAll) {
        // Relaxed: the counters are independent tallies read when a job ends.
        auto& counter = eventCounters[type];
        return peek ? counter.load(std::memory_order_relaxed)
                    : counter.fetch_add(1, std::memory_order_relaxed) + 1;
    }
    if (type != kZYRAnalyticsEventAll)
        return 0;
    const std::lock_guard lock(stateLock);
    for (int i = 0; i < kZYRAnalyticsEventAll; ++i) {
        if (eventCounters[i].load(std::memory_order_relaxed) == 0)
            continue;
        const bool logged =
            (i >= kZYRAnalyticsEventEnableLowResRasterization &&
             i <= kZYRAnalyticsEventZYREnableMTR) ||
            (i == kZYRAnalyticsEventCachePlacedObject &&
             eventCounters[kZYRAnalyticsEventPlacedObjectCached].load(std::memory_order_relaxed)) ||
            (i == kZYRAnalyticsEventEnableCutContourProcessing &&
             eventCounters[kZYRAnalyticsEventCutContourProcessed].load(std::memory_order_relaxed));
        if (logged && logHandle)
            entry.logEvent(logHandle, "Job", "", kEventNames[i], nullptr, 0);
        eventCounters[i].store(0, std::memory_order_relaxed);
    }
    return 0;
}

void Farlamp::LogEventNow(eZYRAnalyticsEventType type) {
    const std::lock_guard lock(stateLock);
    if (!loggingEnabled || !logHandle || type < 0 ||
        static_cast<size_t>(type) >= kEventNames.size())
        return;
    entry.logEvent(logHandle, "Job", "", kEventNames[type], nullptr, 0);
}

void Farlamp::FlushJob(double time) {
    if (!loggingEnabled)
        return;
    {
        const std::lock_guard lock(stateLock);
        if (!logHandle)
            return;
        if (JobInfoGroupID != -1) {
            char elapsed[64];
            std::snprintf(elapsed, sizeof elapsed, "%.2f", time - jobStartTime);
            entry.addToGroup(logHandle, JobInfoGroupID, "CompletionTime", elapsed);
            entry.addToGroup(logHandle, JobInfoGroupID, "HasTrapping",
                             eventCounters[kZYRAnalyticsEventHasTrapping] ? "1" : "0");
            entry.addToGroup(logHandle, JobInfoGroupID, "HasTransparency",
                             eventCounters[kZYRAnalyticsEventHasTransparency] ? "1" : "0");
        }
    }
    LogEvent(kZYRAnalyticsEventAll, true);
    const std::lock_guard lock(stateLock);
    if (prevSurfaceCount > 0)
        LogSurfaceDataGroupHelper(prevSurfaceInfo);
    prevSurfaceInfo = sSurfaceInfo{};
    prevSurfaceCount = 0;
    JobInfoGroupID = -1; // the next job gets a group of its own
}

// ---- surfaces -----------------------------------------------------------------------------

void Farlamp::UpdateCurrentSurfaceInfo(double width, double height, unsigned int placedObjects) {
    const std::lock_guard lock(stateLock);
    if (loggingEnabled)
        currSurfaceInfo = {width, height, placedObjects};
}

void Farlamp::LogSurfaceDataGroup() {
    const std::lock_guard lock(stateLock);
    if (!loggingEnabled || !logHandle)
        return;
    if (prevSurfaceCount > 0 && currSurfaceInfo == prevSurfaceInfo) {
        ++prevSurfaceCount;
        return;
    }
    if (prevSurfaceCount > 0)
        LogSurfaceDataGroupHelper(prevSurfaceInfo);
    prevSurfaceInfo = currSurfaceInfo;
    prevSurfaceCount = 1;
}

void Farlamp::LogSurfaceDataGroupHelper(sSurfaceInfo& info) {
    if (!logHandle)
        return;
    char resolution[64];
    std::snprintf(resolution, sizeof resolution, "%dX%d", wholeUnits(info.width),
                  wholeUnits(info.height));
    int group = -1;
    entry.newDataGroup(logHandle, "SurfaceInfo", "", "Surface", group, nullptr, 0);
    entry.addToGroup(logHandle, group, "Surface Resolution", resolution);
    entry.addToGroup(logHandle, group, "Placed Objects", decimal(info.placedObjects).c_str());
    entry.addToGroup(logHandle, group, "count", decimal(prevSurfaceCount).c_str());
}

} // namespace ZYRStd
