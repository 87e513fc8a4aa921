// Timing: the tick source, its calibration, accumulators and stop watches.
#include "zyr/std/instrument/ZYRTimingManager.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#if defined(__x86_64__) || defined(__i386__)
#include <cpuid.h>
#include <immintrin.h>
#include <x86intrin.h>
#define ZYR_TIMING_X86 1
#endif

#include "zyr/std/core/ZYRThreadSafety.h"
#include "zyr/std/core/internal/ZYRMemInternal.h"

namespace ZYRStd {

long long ZYRTimingManager::fClocksPerSec = 0;
long long ZYRTimingManager::fAvgInnerConstructTime = 0;
long long ZYRTimingManager::fAvgOuterConstructTime = 0;

namespace {

// An invariant counter ticks at one rate in every power state and on every core; without
// one, ticks are monotonic-clock nanoseconds.
bool hasInvariantTsc() {
#ifdef ZYR_TIMING_X86
    unsigned int a = 0, b = 0, c = 0, d = 0;
    if (__get_cpuid(0x80000000u, &a, &b, &c, &d) == 0 || a < 0x80000007u)
        return false;
    if (__get_cpuid(0x80000007u, &a, &b, &c, &d) == 0)
        return false;
    return (d & (1u << 8)) != 0;
#else
    return false;
#endif
}

// Asked on first use, so that a stop watch in another file's static initialiser sees the
// same tick source as every later one.
bool usesTsc() {
    static const bool invariant = hasInvariantTsc();
    return invariant;
}

long long monotonicNanos() {
    timespec ts{};
    clock_gettime(CLOCK_MONOTONIC, &ts);
    return static_cast<long long>(ts.tv_sec) * 1000000000LL + ts.tv_nsec;
}

inline long long readTicks() {
#ifdef ZYR_TIMING_X86
    if (usesTsc()) {
        // lfence orders the read after earlier instructions as the serialising cpuid did,
        // without cpuid's exit to the hypervisor on virtual machines.
        _mm_lfence();
        return static_cast<long long>(__rdtsc());
    }
#endif
    return monotonicNanos();
}

detail::Mutex& listMutex() {
    static detail::Mutex m;
    return m;
}

std::vector<ZYRTimeAccumulator*>& namedList() ZYR_REQUIRES(listMutex()) {
    static std::vector<ZYRTimeAccumulator*> list;
    return list;
}

struct MeasurementLines {
    std::string accuracy;
    std::string bus;
    std::string cache;
};

double ticksToSeconds(long long ticks) {
    const long long perSec = ZYRTimingManager::GetClocksPerSec();
    return perSec > 0 ? static_cast<double>(ticks) / static_cast<double>(perSec) : 0.0;
}

// Bytes per elapsed second in millions, truncated; an elapsed time too short to measure
// counts as one tick rather than dividing by zero.
int millionBytesPerSecond(double bytes, long long ticks) {
    const double seconds = ticksToSeconds(std::max(ticks, 1LL));
    if (seconds <= 0)
        return 0;
    const double speed = bytes / seconds / 1000000.0;
    return speed >= 2147483647.0 ? 2147483647 : static_cast<int>(speed);
}

std::string format(const char* fmt, auto... args) {
    char buffer[256];
    std::snprintf(buffer, sizeof buffer, fmt, args...);
    return buffer;
}

constexpr int kAccuracyBytes = 1000;
constexpr std::size_t kBusBytes = 128u << 20;
constexpr int kCachePasses = 128;
constexpr int kCacheWords = 512;

long long timeMemset(unsigned char* buffer) {
    const long long start = readTicks();
    std::memset(buffer, start & 0xff, kAccuracyBytes);
    // Keeps the stores from being dropped as dead.
    asm volatile("" : : "r"(buffer) : "memory");
    return readTicks() - start;
}

std::string measureAccuracy() {
    unsigned char buffer[kAccuracyBytes];
    timeMemset(buffer); // warms the cache, so that both timed passes see the same state
    const long long first = timeMemset(buffer);
    const long long second = timeMemset(buffer);
    const double accuracy =
        first <= 0
            ? 1000.0
            : std::fabs(1.0 - static_cast<double>(second) / static_cast<double>(first)) * 100.0;
    return format("\nTimer Accuracy -- %3.3lf percent of the time of memset on %d bytes\nClocks "
                  "Per Second -- %g\n**************\n",
                  accuracy, kAccuracyBytes,
                  static_cast<double>(ZYRTimingManager::GetClocksPerSec()));
}

std::string measureBus() {
#ifdef ZYR_TIMING_X86
    if (__builtin_cpu_supports("sse")) {
        struct FreeDeleter {
            void operator()(float* p) const { std::free(p); }
        };
        std::unique_ptr<float, FreeDeleter> buffer(
            static_cast<float*>(std::aligned_alloc(64, kBusBytes)));
        if (buffer) {
            const __m128 value = _mm_set1_ps(1.0f);
            float* const p = buffer.get();
            // Fresh pages fault on their first store; that is the kernel's time, not the bus's.
            std::memset(p, 0, kBusBytes);
            const long long start = readTicks();
            for (std::size_t i = 0; i < kBusBytes / sizeof(float); i += 4)
                _mm_stream_ps(p + i, value);
            _mm_sfence();
            const long long elapsed = readTicks() - start;
            return format("\nMeasured Bus Speed (using SIMD 'movntps') -- %d million bytes per "
                          "second",
                          millionBytesPerSecond(static_cast<double>(kBusBytes), elapsed));
        }
    }
#endif
    return "\nMeasured Bus Speed (using SIMD 'movntps') -- unavailable -- 'movntps' "
           "unimplemented";
}

std::string measureCache() {
    std::uint32_t words[kCacheWords];
    const long long start = readTicks();
    for (int pass = 0; pass < kCachePasses; ++pass) {
        for (int i = 0; i < kCacheWords; ++i)
            words[i] = static_cast<std::uint32_t>(pass + i);
        // Every pass must store: the compiler may not fold the passes into one.
        asm volatile("" : : "r"(words) : "memory");
    }
    const long long elapsed = readTicks() - start;
    const double bytes = double(kCachePasses) * kCacheWords * sizeof(std::uint32_t);
    return format("\nMeasured Cache Memory Speed (using \"C\" loop) -- %d million bytes per second",
                  millionBytesPerSecond(bytes, elapsed));
}

const MeasurementLines& measurementLines() {
    static const MeasurementLines lines = [] {
        if (ZYRTimingManager::GetClocksPerSec() <= 0)
            ZYRTimingManager::Initialize();
        return MeasurementLines{measureAccuracy(), measureBus(), measureCache()};
    }();
    return lines;
}

} // namespace

void ZYRTimingManager::InitTiming() {
    // 1. What a stop watch costs the pass it measures and the pass around it.
    fAvgInnerConstructTime = 0;
    fAvgOuterConstructTime = 0;
    constexpr unsigned long long kPasses = 64;
    ZYRTimeAccumulator outer("", __FILE__, __LINE__);
    ZYRTimeAccumulator inner("", __FILE__, __LINE__);
    {
        ZYRStopWatch outerWatch(outer);
        for (unsigned long long i = 0; i < kPasses; ++i) {
            ZYRStopWatch innerWatch(inner);
        }
    }
    const auto rounded = [](long long total) {
        return static_cast<long long>(
            (static_cast<unsigned long long>(std::max(total, 0LL)) + kPasses / 2) / kPasses);
    };
    fAvgInnerConstructTime = rounded(inner.GetTotalTicks());
    fAvgOuterConstructTime = rounded(outer.GetTotalTicks()) - fAvgInnerConstructTime;

    // 2. Ticks per second, against the monotonic clock.
    if (!usesTsc()) {
        fClocksPerSec = 1000000000LL;
        return;
    }
    const long long ticks0 = readTicks();
    const long long nanos0 = monotonicNanos();
    ThreadSleep(100);
    const long long ticks1 = readTicks();
    const long long nanos1 = monotonicNanos();
    const long long nanos = std::max(nanos1 - nanos0, 1LL);
    fClocksPerSec = static_cast<long long>(static_cast<double>(ticks1 - ticks0) * 1e9 /
                                           static_cast<double>(nanos));
}

bool ZYRTimingManager::Initialize() {
    InitTiming();
    return true;
}

void ZYRTimingManager::Terminate() {
    detail::LockGuard lock(listMutex());
    namedList().clear();
}

long long ZYRTimingManager::GetClocksPerSec() {
    return fClocksPerSec;
}

long long ZYRTimingManager::GetAvgInnerConstructTime() {
    return fAvgInnerConstructTime;
}

long long ZYRTimingManager::GetAvgOuterConstructTime() {
    return fAvgOuterConstructTime;
}

bool ZYRTimingManager::UsesTimeStampCounter() {
    return usesTsc();
}

void ZYRTimingManager::InitializeSurfaceTime() {}

void ZYRTimingManager::RecordSurfaceTime(unsigned int, unsigned int, long long) {}

const char* ZYRTimingManager::GetTimerAccuracyLine() {
    return measurementLines().accuracy.c_str();
}

const char* ZYRTimingManager::GetBusSpeedLine() {
    return measurementLines().bus.c_str();
}

const char* ZYRTimingManager::GetCacheSpeedLine() {
    return measurementLines().cache.c_str();
}

unsigned int ZYRTimingManager::GetNamedAccumulatorCount() {
    detail::LockGuard lock(listMutex());
    return static_cast<unsigned int>(namedList().size());
}

ZYRTimeAccumulator* ZYRTimingManager::GetNamedAccumulator(unsigned int index) {
    detail::LockGuard lock(listMutex());
    return index < namedList().size() ? namedList()[index] : nullptr;
}

ZYRTimeAccumulator::ZYRTimeAccumulator(const char* name, const char* file, int line)
    : fName(name), fFile(file), fLine(line) {
    if (fName && *fName) {
        detail::LockGuard lock(listMutex());
        namedList().push_back(this);
    }
}

ZYRTimeAccumulator::~ZYRTimeAccumulator() {
    if (fName && *fName) {
        detail::LockGuard lock(listMutex());
        auto& list = namedList();
        list.erase(std::remove(list.begin(), list.end(), this), list.end());
    }
}

const char* ZYRTimeAccumulator::GetTimerName() const {
    return fName;
}

const char* ZYRTimeAccumulator::GetSourceFile() const {
    return fFile;
}

int ZYRTimeAccumulator::GetSourceLine() const {
    return fLine;
}

int ZYRTimeAccumulator::GetTotalCalls() const {
    return fTotalCalls;
}

long long ZYRTimeAccumulator::GetTotalTicks() const {
    return fTotalTicks;
}

double ZYRTimeAccumulator::GetCurrentTotalTime() const {
    return ticksToSeconds(fTotalTicks);
}

ZYRStopWatch::ZYRStopWatch(ZYRTimeAccumulator& acc)
    : fAcc(acc), fStart(0), fInnerConstructTime(ZYRTimingManager::fAvgInnerConstructTime) {
    ++fAcc.fTotalCalls;
    ++fAcc.fNesting;
    fStart = readTicks();
}

ZYRStopWatch::~ZYRStopWatch() {
    const long long now = readTicks();
    const long long elapsed = now - (fStart + fInnerConstructTime);
    if (--fAcc.fNesting == 0)
        fAcc.fTotalTicks += elapsed;
}

void ZYRStopWatch::ReadTimeStampCounter32(long long* out) {
    if (out)
        *out = readTicks();
}

int Clock() {
    return static_cast<int>(detail::processClockMs());
}

void ThreadSleep(int milliseconds) {
    if (milliseconds <= 0)
        return;
    std::this_thread::sleep_until(std::chrono::steady_clock::now() +
                                  std::chrono::milliseconds(milliseconds));
}

} // namespace ZYRStd
