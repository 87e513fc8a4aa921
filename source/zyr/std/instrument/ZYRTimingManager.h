/// \file
/// Fine-grained timing of code sections: named accumulators, scoped stop watches and the
/// calibration of the tick counter they read.
#pragma once

#include "ZYRStdExport.h"

namespace ZYRStd {

class ZYRTimeAccumulator;

/// Static members only. Initialize() runs before the first stop watch is used.
class ZYRSTD_API ZYRTimingManager {
public:
    ZYRTimingManager() = delete;

    /// Calibrates the construct times and the ticks per second; returns true.
    static bool Initialize();
    /// Empties the list of named accumulators.
    static void Terminate();
    /// 0 until Initialize() has run.
    static long long GetClocksPerSec();
    /// The calibrated ticks a stop watch adds to its own measurement.
    static long long GetAvgInnerConstructTime();
    /// The calibrated ticks a stop watch costs its caller.
    static long long GetAvgOuterConstructTime();
    /// Whether ticks come from the processor's invariant time-stamp counter (true) or from
    /// the monotonic clock in nanoseconds.
    static bool UsesTimeStampCounter();

    /// Kept for callers; does nothing.
    static void InitializeSurfaceTime();
    /// Kept for callers; does nothing.
    static void RecordSurfaceTime(unsigned int, unsigned int, long long);

    /// The three measurement lines, measured when one of them is first asked for (the bus
    /// measurement writes 128 MiB, a cost no host should pay at every start-up).
    static const char* GetTimerAccuracyLine();
    /// The memory-bus measurement line, static text.
    static const char* GetBusSpeedLine();
    /// The cache measurement line, static text.
    static const char* GetCacheSpeedLine();

    /// The named accumulators alive now, in order of construction.
    static unsigned int GetNamedAccumulatorCount();
    /// Null past the end.
    static ZYRTimeAccumulator* GetNamedAccumulator(unsigned int index);

private:
    friend class ZYRTimeAccumulator;
    friend class ZYRStopWatch;

    static void InitTiming();

    static long long fClocksPerSec;
    static long long fAvgInnerConstructTime;
    static long long fAvgOuterConstructTime;
};

/// Sums the ticks spent under its stop watches. Used from one thread at a time.
class ZYRSTD_API ZYRTimeAccumulator {
public:
    /// `name` and `file` are not copied: they must outlive the accumulator. A non-empty
    /// name enters the accumulator in the timing manager's list.
    ZYRTimeAccumulator(const char* name, const char* file, int line);
    /// Leaves the list, so that it never holds a dead accumulator.
    ~ZYRTimeAccumulator();
    ZYRTimeAccumulator(const ZYRTimeAccumulator&) = delete;
    ZYRTimeAccumulator& operator=(const ZYRTimeAccumulator&) = delete;

    /// The name given at construction, borrowed.
    const char* GetTimerName() const;
    /// The source file given at construction, borrowed.
    const char* GetSourceFile() const;
    /// The source line given at construction.
    int GetSourceLine() const;
    /// The passes measured so far, recursive ones included.
    int GetTotalCalls() const;
    /// The ticks summed so far.
    long long GetTotalTicks() const;
    /// Total ticks in seconds; 0 before the manager is calibrated.
    double GetCurrentTotalTime() const;

private:
    friend class ZYRStopWatch;

    const char* fName;
    const char* fFile;
    int fLine;
    long long fTotalTicks = 0;
    int fTotalCalls = 0;
    int fNesting = 0;
    long long fReserved[2] = {};
};

/// Measures one pass of the enclosing scope into an accumulator. Recursive passes on the
/// same accumulator count as calls, but only the outermost one adds its time.
class ZYRSTD_API ZYRStopWatch {
public:
    /// Starts measuring into `acc`; the destructor stops and adds the time.
    explicit ZYRStopWatch(ZYRTimeAccumulator& acc);
    ~ZYRStopWatch();
    ZYRStopWatch(const ZYRStopWatch&) = delete;
    ZYRStopWatch& operator=(const ZYRStopWatch&) = delete;

    /// The current tick count, ordered after the instructions before it.
    static void ReadTimeStampCounter32(long long* out);

private:
    ZYRTimeAccumulator& fAcc;
    long long fStart;
    long long fInnerConstructTime;
};

/// The library's millisecond clock, the one trace records carry.
ZYRSTD_API int Clock();
/// Sleeps the calling thread for `milliseconds` (nothing for 0 or less).
ZYRSTD_API void ThreadSleep(int milliseconds);

} // namespace ZYRStd
