// Shared helpers for the benchmarks: a main() that also compares us with a peer library.
#pragma once

#include <string>
#include <vector>

namespace zyrbench {

// One "RATIO <name> ours_over_peer=<x>" line: the real time per iteration of the benchmark
// `ours` divided by that of `peer`, both named as the benchmark library prints them but
// without the min_time, min_warmup_time and repeats parts (for example "BM_MD5_Ours",
// "BM_Copy/4096" or "BM_Copy/4096/real_time").
struct RatioPair {
    std::string name;
    std::string ours;
    std::string peer;
};

// Installs a malloc-based host record in the allocation front; without one every
// allocation through the front fails. runWithRatios calls it first.
void installFront();

// The whole of a benchmark program's main(): installs the front, runs the registered
// benchmarks under the usual --benchmark_* flags, then prints one RATIO line per pair.
// Repetitions are interleaved at random so that both sides see the same machine load,
// and the fastest repetition of each benchmark is compared.
int runWithRatios(int argc, char** argv, const std::vector<RatioPair>& ratios);

} // namespace zyrbench
