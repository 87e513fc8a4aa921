// Shared helpers for the benchmarks.
#include "BenchSupport.h"
#include "ZYRHostKit.h"

#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <map>
#include <unistd.h>

#include "ZYRStd.h"

namespace zyrbench {

namespace {

// Prints as the console reporter does and keeps the best real time of each benchmark.
class RecordingReporter : public benchmark::ConsoleReporter {
public:
    RecordingReporter() : ConsoleReporter(::isatty(STDOUT_FILENO) ? OO_Color : OO_None) {}

    void ReportRuns(const std::vector<Run>& runs) override {
        for (const Run& run : runs) {
            if (run.run_type != Run::RT_Iteration || run.error_occurred || run.iterations == 0)
                continue;
            const double perIteration =
                run.real_accumulated_time / static_cast<double>(run.iterations);
            auto [it, inserted] = best_.try_emplace(ratioKey(run), perIteration);
            if (!inserted && perIteration < it->second)
                it->second = perIteration;
        }
        ConsoleReporter::ReportRuns(runs);
    }

    // The printed name without the run settings, so that repetitions share one entry.
    static std::string ratioKey(const Run& run) {
        benchmark::BenchmarkName name = run.run_name;
        name.min_time.clear();
        name.min_warmup_time.clear();
        name.repetitions.clear();
        return name.str();
    }

    const double* bestTime(const std::string& name) const {
        const auto it = best_.find(name);
        return it == best_.end() ? nullptr : &it->second;
    }

private:
    std::map<std::string, double> best_; // seconds per iteration, by benchmark name
};

} // namespace

void installFront() {
    ZYRStd::tZYRMemMgr host = ZYRHostKit::crtMemMgr();
    ZYRStd::ZYRStdInit_ZYRMemMgrSet(&host);
}

int runWithRatios(int argc, char** argv, const std::vector<RatioPair>& ratios) {
    installFront();

    // Flags given on the command line come later and so still win over this default.
    std::vector<char*> args(argv, argv + argc);
    static char interleave[] = "--benchmark_enable_random_interleaving=true";
    args.insert(args.begin() + (argc > 0 ? 1 : 0), interleave);
    int count = static_cast<int>(args.size());
    args.push_back(nullptr);
    benchmark::Initialize(&count, args.data());
    if (benchmark::ReportUnrecognizedArguments(count, args.data()))
        return 1;

    RecordingReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();

    std::fflush(stdout);
    for (const RatioPair& ratio : ratios) {
        const double* ours = reporter.bestTime(ratio.ours);
        const double* peer = reporter.bestTime(ratio.peer);
        if (!ours || !peer || *peer <= 0) {
            std::fprintf(stderr, "RATIO %s: no result for %s or %s\n", ratio.name.c_str(),
                         ratio.ours.c_str(), ratio.peer.c_str());
            continue;
        }
        std::printf("RATIO %s ours_over_peer=%.3f\n", ratio.name.c_str(), *ours / *peer);
    }
    std::fflush(stdout);
    return 0;
}

} // namespace zyrbench
