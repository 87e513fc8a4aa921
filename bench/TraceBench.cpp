// Trace messages: a whole message written to the trace log against the same head and text
// written with fprintf and fflush, and a message the level test stops against two look-ups
// in unordered maps of 16-bit strings.
#include <benchmark/benchmark.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <unistd.h>
#include <unordered_map>

#include "BenchSupport.h"
#include "ZYRHostKit.h"
#include "ZYRStd.h"

namespace {

using namespace ZYRStd;

constexpr const char* kText = "band 12 of 40 rendered in 3 ms";

std::string& benchDir() {
    static std::string dir;
    return dir;
}

// A job of the small host with the given trace configuration; its progress interface
// drops what it is sent.
CZYRTraceMsg makeTrace(const CZYRDict& config) {
    CZYRDict params;
    params.set(CZYRUniString("JPJobID"), 7);
    params.set(CZYRUniString("ZYRTraceMsg"), config);
    params.finalize();
    return CZYRTraceMsg(ZYRHostKit::makeHostJob(7, params.getImpl()));
}

void BM_TraceWrite_Ours(benchmark::State& state) {
    closeTraceLogPath();
    const std::string path = benchDir() + "/ours.log";
    CZYRDict config;
    config.set(CZYRUniString("Path"), CZYRUniString(path.c_str()));
    config.set(CZYRUniString("All"), 8u);
    CZYRTraceMsg trace = makeTrace(config);
    const CZYRUniString area("Render");
    const CZYRUniString category("Bands");
    for (auto _ : state)
        trace.traceMsg(area, category, ZYRPublic::kZYRTraceMsgLevel2, kText, false, "band", 12);
    closeTraceLogPath();
    std::remove(path.c_str());
}

void BM_TraceWrite_Fprintf(benchmark::State& state) {
    const std::string path = benchDir() + "/peer.log";
    FILE* file = std::fopen(path.c_str(), "a");
    const auto start = std::chrono::steady_clock::now();
    for (auto _ : state) {
        const auto ms = std::chrono::duration_cast<std::chrono::milliseconds>(
                            std::chrono::steady_clock::now() - start)
                            .count();
        std::fprintf(file, "<ZYRTrace> Job %d L%d [%#.9g sec] [C:%s/%s] [F:%s/%u] \n%s\n", 7, 2,
                     static_cast<uint32_t>(ms) / 1000.0, "Render", "Bands", "band", 12u, kText);
        std::fflush(file);
    }
    std::fclose(file);
    std::remove(path.c_str());
}

void BM_TraceFiltered_Ours(benchmark::State& state) {
    closeTraceLogPath();
    CZYRDict config;
    config.set(CZYRUniString("Path"), CZYRUniString("stdout"));
    CZYRDict render;
    render.set(CZYRUniString("Bands"), 2u);
    render.set(CZYRUniString("Default"), 1u);
    config.set(CZYRUniString("Render"), render);
    CZYRTraceMsg trace = makeTrace(config);
    const CZYRUniString area("Render");
    const CZYRUniString category("Bands");
    for (auto _ : state)
        trace.traceMsg(area, category, ZYRPublic::kZYRTraceMsgLevel5, kText, false, "band", 12);
}

void BM_TraceFiltered_Maps(benchmark::State& state) {
    const std::unordered_map<std::u16string, int> areas{{u"Render", 0}, {u"Fonts", 1}};
    const std::unordered_map<std::u16string, int> categories{{u"Bands", 2}, {u"Default", 1}};
    const std::u16string area = u"Render";
    const std::u16string category = u"Bands";
    for (auto _ : state) {
        int level = 0;
        if (areas.find(area) != areas.end()) {
            const auto it = categories.find(category);
            level = it != categories.end() ? it->second : 0;
        }
        benchmark::DoNotOptimize(level);
        if (5 <= level)
            std::fputs(kText, stdout);
    }
}

BENCHMARK(BM_TraceWrite_Ours);
BENCHMARK(BM_TraceWrite_Fprintf);
BENCHMARK(BM_TraceFiltered_Ours);
BENCHMARK(BM_TraceFiltered_Maps);

} // namespace

int main(int argc, char** argv) {
    zyrbench::installFront();
    InitCommonUniStrings();
    InitDynamicUniStringCache();
    char pattern[] = "/tmp/zyrstd-tracebench-XXXXXX";
    if (const char* dir = ::mkdtemp(pattern))
        benchDir() = dir;
    else
        benchDir() = "/tmp";
    const int result = zyrbench::runWithRatios(
        argc, argv,
        {{"trace_write", "BM_TraceWrite_Ours", "BM_TraceWrite_Fprintf"},
         {"trace_filtered", "BM_TraceFiltered_Ours", "BM_TraceFiltered_Maps"}});
    ::rmdir(benchDir().c_str());
    ReleaseDynamicUniStringCache();
    ReleaseCommonUniStrings();
    return result;
}
