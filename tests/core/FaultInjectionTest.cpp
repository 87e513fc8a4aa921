// Every allocation of a realistic workload fails in turn: nothing may crash, leak or
// leave the accounting off.
#include <gtest/gtest.h>

#include <vector>

#include "TestSupport.h"
#include "ZYRStd.h"

using namespace ZYRStd;

namespace {

// Values, strings, the dynamic memory manager and the container allocator in one go.
void workload() {
    CZYRDict dict;
    dict.set(CZYRUniString("first key"), 1u);
    CZYRArray array;
    array.set(3, CZYRUniString("element"));
    array.set(1, CZYRDataBuffer("bytes", 5));
    dict.set(CZYRUniString("array"), array);
    const CZYRDict copy = dict.clone();
    CZYRUniString joined = CZYRUniString("left").concat(CZYRUniString("right"));
    joined.append(CZYRUniString("more"));
    const CZYRString narrow(joined);
    void* block = ZYRDMMMalloc(100, "FAULTS", nullptr, nullptr, nullptr,
                               ZYRPublic::eFlushMemorySeverityNormal);
    ZYRDMMFree(block, "FAULTS", nullptr);
    std::vector<int, CZYRStdAllocator<int>> numbers(64, 7);
    numbers.resize(1000);
}

} // namespace

class FaultInjectionTest : public ::testing::TestWithParam<int> {};

TEST_P(FaultInjectionTest, EveryAllocationMayFail) {
    zyrtest::FailingHost host;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(GetParam(), &record);
    const CZYRErrorStk notices; // built before measuring; it lives for the process
    workload();                 // the dynamic string cache keeps its texts from now on
    const unsigned long long baseline = GetMemUsage();
    host.calls = 0;
    workload();
    const unsigned int callsPerRun = host.calls;
    ASSERT_GT(callsPerRun, 10u);

    for (unsigned int failing = 1; failing <= callsPerRun; ++failing) {
        host.calls = 0;
        host.failAt = failing;
        try {
            workload();
        } catch (const CZYRError&) {
        } catch (const std::bad_alloc&) {
        }
        host.failAt = 0;
        ASSERT_EQ(GetMemUsage(), baseline) << "allocation " << failing << " failed";
    }
    zyrtest::installFront(0);
}

// Plain and guarded fronts.
INSTANTIATE_TEST_SUITE_P(StatisticsLevels, FaultInjectionTest, ::testing::Values(0, 1));
