// zyrstd demo: how a host embeds the library. It starts the library up, allocates under a
// memory limit, follows one allocation under memory pressure through the renderer and the
// flushable caches, runs a small traced job that ends with a memory report, logs analytics
// records into a telemetry session file, and ends with the leak report.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <sys/stat.h>
#include <thread>
#include <vector>

#include "Commands.h"
#include "I_Job.h"
#include "I_SurfaceQueue.h"
#include "ZYRHostKit.h"
#include "ZYRStd.h"

namespace zyrtool {

namespace {

using namespace ZYRStd;

constexpr unsigned int kMiB = 1024 * 1024;

// The host's allocator: plain malloc, counting the calls the library makes.
struct HostHeap {
    unsigned long allocations = 0;
    unsigned long frees = 0;
};

tZYRMemMgr hostRecord(HostHeap& heap) {
    return {[](size_t n, void* data) {
                ++static_cast<HostHeap*>(data)->allocations;
                return std::malloc(n);
            },
            [](void* p, size_t n, void*) { return std::realloc(p, n); },
            [](void* p, void* data) {
                ++static_cast<HostHeap*>(data)->frees;
                std::free(p);
            },
            &heap};
}

void section(const char* title) {
    std::printf("\n== %s\n", title);
}

void printUsage(const char* when) {
    std::printf("   memory in use %s: %llu bytes of a %llu MiB limit\n", when, GetMemUsage(),
                ZYRGetMemLimit() / kMiB);
}

// Trace callback: the library hands each report line to the host this way.
void printTrace(ZYRPublic::sZYRTraceMsg* msg, ZYRPublic::sZYRTraceMsgDetail* detail, void*) {
    if (msg->text)
        std::printf("   [level %d, %s:%u] %s", detail->level, detail->srcFile, detail->srcLine,
                    msg->text);
}

// An engine cache that can give its memory back when asked.
class Cache : public I_FlushableMemoryClient {
public:
    Cache(const char* name, unsigned int bytes) : name_(name) {
        block_ = ZYRMalloc(bytes);
        size_ = block_ ? bytes : 0;
    }
    ~Cache() override { ZYRFree(block_); }

    bool flushMemory(unsigned int bytesNeeded, unsigned int, eFlushMemorySeverity) override {
        std::printf("   %s is asked to give back %u bytes: frees %u\n", name_, bytesNeeded, size_);
        if (!block_)
            return false;
        ZYRFree(block_);
        block_ = nullptr;
        size_ = 0;
        return true;
    }
    unsigned int getFlushableMemorySize() override { return size_; }
    const char* getClientName() override { return name_; }

private:
    const char* name_;
    void* block_;
    unsigned int size_;
};

// Stands in for the renderer: catching up frees the bands it has printed.
class Renderer : public ZYRPublic::I_SurfaceQueue {
public:
    explicit Renderer(unsigned int bandBytes) : bands_(ZYRMalloc(bandBytes)) {}
    ~Renderer() { ZYRFree(bands_); }
    bool synchronize(bool) override {
        std::puts("   the renderer catches up and frees 8 MiB of printed bands");
        ZYRFree(bands_);
        bands_ = nullptr;
        return true;
    }

private:
    void* bands_;
};

// The demo's files live in a folder of its own, made afresh under a unique name: two demos
// at once do not meet, and no one else's link stands where a log is opened.
struct WorkFolder {
    std::string path = (std::filesystem::temp_directory_path() / "zyrstd-demo-XXXXXX").string();
    bool made = ::mkdtemp(path.data()) != nullptr;
    ~WorkFolder() {
        std::error_code ec;
        if (made)
            std::filesystem::remove_all(path, ec);
    }
    std::string file(const char* name) const { return path + "/" + name; }
};

void allocationUnderPressure(const WorkFolder& work) {
    section("One allocation under memory pressure");
    const std::string logPath = work.file("dmm.log");
    ::setenv("ZYR_DMM_LOG", logPath.c_str(), 1);
    tZYRMemMgr any{};
    ZYRStdInit_ZYRDMMEnv_set(&any); // opens the DMM log named by ZYR_DMM_LOG
    ZYRStdInit_InitializeFlushableMemoryClientRegistry();

    // Only blockable threads may wait for the renderer or ask caches to flush.
    SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("interpreter", true));

    Cache fonts("FontCache", 40 * kMiB), images("ImageCache", 120 * kMiB),
        paths("PathCache", 20 * kMiB);
    for (Cache* cache : {&fonts, &images, &paths})
        RegisterFlushableMemoryClient(cache, false);
    Renderer renderer(8 * kMiB);
    RegisterSurfaceQueueInstance(&renderer);

    // Fill memory up to the limit, leaving 30 MiB free.
    const unsigned long long room = ZYRGetMemLimit() - GetMemUsage();
    void* pages = ZYRMalloc(static_cast<unsigned int>(room - 30 * kMiB));
    printUsage("with the caches full");

    std::puts("   the interpreter asks for 64 MiB:");
    void* block = ZYRDMMMalloc(64 * kMiB, "Interpreter", nullptr, nullptr, nullptr,
                               ZYRPublic::eFlushMemorySeverityNormal);
    std::printf("   -> %s\n", block ? "granted after recovery" : "refused");
    printUsage("after recovery");

    ZYRFree(block);
    ZYRFree(pages);
    RegisterSurfaceQueueInstance(nullptr);
    for (Cache* cache : {&fonts, &images, &paths})
        UnregisterFlushableMemoryClient(cache);
    SetCZYRThreadSpecificPtr(nullptr);
    ZYRStdInit_ZYRDMMEnv_set(nullptr); // writes the peak lines and closes the log

    std::printf("   the DMM log (%s) tells the story:\n", logPath.c_str());
    std::ifstream log(logPath);
    for (std::string line; std::getline(log, line);) {
        // The log writes its apostrophe as the Windows-1252 byte 0x92; show it readably.
        for (size_t at; (at = line.find('\x92')) != std::string::npos;)
            line.replace(at, 1, "\u2019");
        std::printf("   | %s\n", line.c_str());
    }
    std::remove(logPath.c_str());
}

CZYRDict areaLevel(const char* key, unsigned int level) {
    CZYRDict area;
    area.set(CZYRUniString(key), level);
    return area;
}

void tracedJob(const WorkFolder& work) {
    section("A traced job and its memory report");
    InitCommonUniStrings();
    InitDynamicUniStringCache();
    const std::string logPath = work.file("trace.log");
    {
        // The job's trace configuration: where the log goes and how much each area says.
        CZYRDict config;
        // The path's bytes as UTF-16, which the library turns back into the same bytes.
        config.set(CZYRUniString("Path"),
                   CZYRUniString(ZYRHostKit::utf8ToUTF16(logPath.c_str()).c_str()));
        config.set(CZYRUniString("Render"), areaLevel("All", 3));
        config.set(CZYRUniString("Memory"), areaLevel("All", 4));
        CZYRDict params;
        params.set(CZYRUniString("JPJobID"), 1);
        params.set(CZYRUniString("ZYRTraceMsg"), config);
        // The host's progress interface shows what the library routes to it.
        CZYRTraceMsg trace(ZYRHostKit::makeHostJob(
            1, params.getImpl(),
            [](const ZYRPublic::sZYRTraceMsg& message,
               const ZYRPublic::sZYRTraceMsgDetail& detail) {
                std::printf("   the host's progress interface receives (level %d): %s\n",
                            detail.level, message.text ? message.text : "(wide text)");
            }));

        const CZYRUniString render("Render");
        trace.traceMsg(render, CZYRUniString("Bands"), ZYRPublic::kZYRTraceMsgLevel2,
                       "band 1 of 4 rendered", false, "demo", __LINE__);
        trace.traceMsg(render, CZYRUniString("Bands"), ZYRPublic::kZYRTraceMsgLevel5,
                       "too detailed for level 3: filtered out");
        trace.beginTraceMsg(render, CZYRUniString("Fonts"), ZYRPublic::kZYRTraceMsgLevel1,
                            "fonts used:");
        trace.traceMsg(u"C:\\Fonts\\Serif.ttf");
        trace.traceMsg("Sans (emulated)");
        trace.endTraceMsg();
        trace.traceMsg(CZYRUniString("DLCacheOEMInfo"), CZYRUniString("Cache"),
                       ZYRPublic::kZYRTraceMsgLevel0, "display-list cache: 3 entries");
        ReportMemoryUsage(trace, kReportMemoryUsageAfterJob, "demo", ZYRPublic::kZYRTraceMsgLevel2);
        DumpVMStatistics(trace);
    }
    closeTraceLogPath();
    ReleaseDynamicUniStringCache();
    ReleaseCommonUniStrings();

    std::printf("   the trace log (%s):\n", logPath.c_str());
    std::ifstream log(logPath);
    for (std::string line; std::getline(log, line);)
        std::printf("   | %s\n", line.c_str());
}

// Analytics: records logged on the library's worker into a telemetry session file in a
// temporary folder, whose path and lines are printed.
void analyticsSession(const WorkFolder& work) {
    section("Analytics records and the telemetry session");
    const std::string folder = work.file("analytics");
    if (::mkdir(folder.c_str(), 0700) != 0) {
        std::puts("   no temporary folder: analytics skipped");
        return;
    }
    InitCommonUniStrings();
    InitDynamicUniStringCache();
    const CZYRWString folder16 = ZYRHostKit::utf8ToUTF16(folder.c_str());
    ZYRSetAnalyticsActive(true);
    ZYRSetAnalyticsLogFolder(folder16.c_str());
    ZYRAnalyticsManagerInit();
    if (!ZYRIsAnalyticsActive()) {
        std::puts("   libKelvrin.so was not found: analytics stay inactive");
    } else {
        CZYRAnalyticsData product;
        product.set(CZYRUniString("DataGroupName"), CZYRUniString("ProductInfo"));
        product.set(CZYRUniString("OEMName"), CZYRUniString("Demo Printers"));
        product.set(CZYRUniString("xobjMode"), 0u);
        product.finalize();
        CZYRAnalyticsData job;
        job.set(CZYRUniString("DataGroupName"), CZYRUniString("JobInfo"));
        job.set(CZYRUniString("StartTime"), 100.0);
        job.set(CZYRUniString("SurfaceCount"), 2u);
        job.finalize();
        std::puts("   two records finalized; the worker logs them while this thread goes on");
        Farlamp::LogEvent(kZYRAnalyticsEventTextAntiAliasing, false);
        for (int page = 0; page < 2; ++page) {
            Farlamp::UpdateCurrentSurfaceInfo(2480, 3508, 3);
            Farlamp::LogSurfaceDataGroup();
        }
        // Termination drops what the worker has not reached: give it a moment first.
        const auto sessionFile = [&] {
            for (const auto& entry : std::filesystem::directory_iterator(folder))
                if (entry.path().extension() == ".jsonl")
                    return entry.path().string();
            return std::string();
        };
        const auto lines = [](const std::string& file) {
            std::ifstream in(file);
            std::vector<std::string> all;
            for (std::string line; std::getline(in, line);)
                all.push_back(line);
            return all;
        };
        for (int i = 0; i < 2000 && lines(sessionFile()).size() < 6; ++i)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        Farlamp::FlushJob(102.5);
        ZYRAnalyticsManagerTerm();
        const std::string file = sessionFile();
        std::printf("   session file: %s\n", file.c_str());
        for (const auto& line : lines(file))
            std::printf("     %s\n", line.c_str());
    }
    ZYRAnalyticsManagerTerm();
    ZYRSetAnalyticsActive(false);
    ZYRSetAnalyticsLogFolder(nullptr);
    ReleaseDynamicUniStringCache();
    ReleaseCommonUniStrings();
}

} // namespace

int runDemo(int argc, char**) {
    if (argc > 1)
        return usageError("demo", "takes no arguments");
    section("Start-up");
    // Level 2 keeps every block with its allocation number, so that leaks can be named.
    ::setenv("ZYR_MEMORY_STAT", "2", 1);
    HostHeap heap;
    tZYRMemMgr record = hostRecord(heap);
    ZYRStdInit_ZYRMemMgrSet(&record);
    std::printf("   host memory procedures installed; statistics level %d\n", ZYRGetMemStatLevel());
    ZYRSetMemLimit(400ull * kMiB);
    printUsage("at start");

    section("Allocation under the limit");
    std::vector<void*> blocks;
    for (unsigned int size : {64u, 4096u, 1u << 20})
        blocks.push_back(ZYRMalloc(size));
    printUsage("after three blocks");
    const unsigned long long room = ZYRGetMemLimit() - GetMemUsage();
    void* tooBig = ZYRMalloc(static_cast<unsigned int>(room));
    std::printf("   asking for all %llu free bytes (plus the block's bookkeeping): %s\n", room,
                tooBig ? "granted" : "refused");
    std::u16string notice;
    CZYRErrorStk errors;
    if (errors.getErrorMessage(notice))
        std::printf("   the error stack says: %s",
                    std::string(notice.begin(), notice.end()).c_str());
    ZYRFree(blocks.back());
    blocks.pop_back();
    void* retry = ZYRMalloc(static_cast<unsigned int>(room - 2 * kMiB));
    std::printf("   after freeing the 1 MiB block, asking for %llu bytes: %s\n", room - 2 * kMiB,
                retry ? "granted" : "refused");
    ZYRFree(retry);
    ZYRFree(tooBig);

    const WorkFolder work;
    if (!work.made) {
        std::fputs("zyrstd: demo: cannot make a temporary folder\n", stderr);
        return 1;
    }
    allocationUnderPressure(work);
    tracedJob(work);
    analyticsSession(work);
    TerminateErrorStk();

    section("Memory state and leak report");
    const sZYRDbgMemState state = ZYRMemMgr_dbgMemState();
    std::printf("   %u allocations, %u resizes, %u frees; %u bytes held, peak %u bytes\n",
                state.allocCount, state.reallocCount, state.freeCount, state.currentBytes,
                state.peakBytes);
    std::puts("   two blocks are still held, so the report names them:");
    ZYRStdInit_ZYRMemMgrDumpMemList(printTrace, nullptr);
    for (void* p : blocks)
        ZYRFree(p);
    std::puts("   after freeing them:");
    ZYRStdInit_ZYRMemMgrDumpMemList(printTrace, nullptr);
    std::printf("   the host allocator saw %lu allocations and %lu frees\n", heap.allocations,
                heap.frees);
    ZYRStdInit_TerminateFlushableMemoryClientRegistry();
    return 0;
}

} // namespace zyrtool
