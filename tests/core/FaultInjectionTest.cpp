// Every allocation of a realistic workload fails in turn: nothing may crash, leak, leave the
// accounting off or post a notice, and each kind of caller reports its failure with the
// record hosts know it by.
#include <gtest/gtest.h>

#include <memory>
#include <set>
#include <string>
#include <tuple>
#include <vector>

#include "TestSupport.h"
#include "ZYRStd.h"
#include "zyr/std/memory/ZYRPool.h"

using namespace ZYRStd;

namespace {

struct OnClientBase : CZYRClientBase {
    int payload[4];
};

// Values, strings, the dynamic memory manager, the container allocator, the sure variants of
// the front, class allocation, smart-pointer boxes and a pool in one go.
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
    std::unique_ptr<void, void (*)(void*)> sure(ZYRSureCalloc(4, 10), ZYRFree);
    void* grown = ZYRSureRealloc(sure.get(), 400);
    sure.release();
    sure.reset(grown);
    sure.reset(ZYRSureMalloc(24));
    delete new OnClientBase;
    CZYRSmartZYRRefPtr<CZYRSmartRefPtrContainer<int>> box(
        CZYRSmartRefPtrContainer<int>::create(nullptr));
    ZYRFixedSizePool pool(16, 4);
    pool.Free(pool.SureAlloc());
}

using Record = std::tuple<std::string, std::string, int>; // message, source, line

} // namespace

class FaultInjectionTest : public ::testing::TestWithParam<int> {};

TEST_P(FaultInjectionTest, EveryAllocationMayFail) {
    zyrtest::FailingHost host;
    tZYRMemMgr record = host.record();
    zyrtest::installFront(GetParam(), &record);
    CZYRErrorStk notices; // built before measuring; it lives for the process
    workload();           // the dynamic string cache keeps its texts from now on
    const unsigned long long baseline = GetMemUsage();
    host.calls = 0;
    workload();
    const unsigned int callsPerRun = host.calls;
    ASSERT_GT(callsPerRun, 10u);

    std::u16string text;
    notices.getErrorMessage(text); // what earlier tests left there
    std::set<Record> seen;
    for (unsigned int failing = 1; failing <= callsPerRun; ++failing) {
        host.calls = 0;
        host.failAt = failing;
        try {
            workload();
        } catch (const CZYRError& e) {
            EXPECT_EQ(e.getError(), ZYRPublic::kZYRErrorOutOfMemory) << "allocation " << failing;
            seen.emplace(e.getMessage() ? e.getMessage() : "(null)", e.getSrcFileName(),
                         e.getSrcLineNumber());
        } catch (const std::bad_alloc&) {
        }
        host.failAt = 0;
        ASSERT_EQ(GetMemUsage(), baseline) << "allocation " << failing << " failed";
        text.clear();
        ASSERT_FALSE(notices.getErrorMessage(text)) << "a failing host is no refusal to report";
    }
    for (const Record& designed : {
             Record{"(null)", "source/zyr/std/ZYRMem", 2042},
             Record{"(null)", "source/zyr/std/ZYRMem", 2050},
             Record{"(null)", "source/zyr/std/ZYRMem", 2058},
             Record{"Mem error in ZYRStdAllocator", "source/zyr/std/CZYRStdAllocator", 94},
             Record{"Memory alloc failed", "source/zyr/std/CZYRClientBase", 92},
             Record{"allocating smart ptr container", "source/zyr/std/CZYRSmartPtr", 242},
             Record{"ZYRFixedSizePool allocation failed", "source/zyr/std/ZYRPool", 102},
         })
        EXPECT_TRUE(seen.count(designed)) << std::get<0>(designed) << " " << std::get<2>(designed);
    zyrtest::installFront(0);
}

// Plain and guarded fronts.
INSTANTIATE_TEST_SUITE_P(StatisticsLevels, FaultInjectionTest, ::testing::Values(0, 1));
