#include <gtest/gtest.h>
#include <sys/mman.h>
#include <sys/resource.h>

#include <filesystem>
#include <future>
#include <map>
#include <random>
#include <thread>

#include "TestSupport.h"

using namespace ZYRStd;
using zyrtest::thrown;
using Counts = std::vector<unsigned int>;

namespace {

constexpr unsigned long long kLimit = 400ull << 20; // the lowest limit that can be set

std::u16string fetch(std::u16string filter = u"") {
    CZYRErrorStk stack;
    return stack.getErrorMessage(filter) ? filter : u"<none>";
}

struct ZYRMemTest : ::testing::Test {
    void SetUp() override { TearDown(); }
    void TearDown() override {
        zyrtest::installFront(0);
        fetch();
    }
};
using CZYRErrorStkTest = ZYRMemTest;

void report(const char16_t* text, bool unique = false) {
    CZYRErrorStk stack;
    unique ? stack.reportUniqueError(ZYRMakeErrorInfo(1, text))
           : stack.reportError(ZYRMakeErrorInfo(1, text));
}

// Takes usage to the limit plus `offset` (a multiple of 8), at any statistics level.
void* fillToLimit(long long offset = 0) {
    ZYRSetMemLimit(kLimit);
    DisableMemUsageCheck();
    const unsigned long long overhead = ZYRGetMemStatLevel() ? 20 : 0; // guards and header
    void* filler = ZYRMalloc(static_cast<unsigned int>(kLimit + offset - GetMemUsage() - overhead));
    EnableMemUsageCheck();
    EXPECT_TRUE(filler && GetMemUsage() == kLimit + offset);
    return filler;
}

// A host whose next call, once armed, waits inside the host until it is let go.
struct GateHost {
    std::atomic<bool> armed{false};
    std::promise<void> entered, release;
    void wait() {
        if (armed.exchange(false))
            entered.set_value(), release.get_future().wait();
    }
    tZYRMemMgr record() {
        return {
            [](size_t n, void* gate) { return static_cast<GateHost*>(gate)->wait(), malloc(n); },
            [](void* p, size_t n, void* gate) {
                return static_cast<GateHost*>(gate)->wait(), realloc(p, n);
            },
            [](void* p, void*) { free(p); }, this};
    }
};

const auto aligned16 = [](const void* p) { return reinterpret_cast<uintptr_t>(p) % 16 == 0; };
const auto grants = [](unsigned int size) {
    void* p = ZYRMalloc(size);
    ZYRFree(p);
    return p != nullptr;
};

Counts tracked() {
    const sZYRDbgMemState s = ZYRMemMgr_dbgMemState();
    return {s.allocCount, s.reallocCount, s.freeCount, s.currentBytes, s.peakBytes};
}

std::vector<std::string> leakReport() {
    std::vector<std::string> lines;
    ZYRStdInit_ZYRMemMgrDumpMemList(
        [](ZYRPublic::sZYRTraceMsg* msg, ZYRPublic::sZYRTraceMsgDetail*, void* data) {
            static_cast<std::vector<std::string>*>(data)->push_back(msg->text);
        },
        &lines);
    return lines;
}

} // namespace

// The front against a model at each statistics level: allocations, zeroed ones, resizes and
// frees of random sizes, the host failing now and then, the check switched off and on (the
// disables nest) and the limit a few KiB away.
TEST_F(ZYRMemTest, FrontAgainstModel) {
    EXPECT_EQ(thrown([] { (void)ZYRSureMalloc(0); }), "7: <null> (source/zyr/std/ZYRMem:2042)");
    EXPECT_TRUE(!ZYRMemSize(nullptr) && (ZYRFree(nullptr), true));
    for (const int level : {0, 1, 2}) {
        SCOPED_TRACE(level);
        zyrtest::FailingHost host;
        tZYRMemMgr record = host.record();
        zyrtest::installFront(level, &record);
        const auto accounted = [level](unsigned long long n) { // guarded: header and tail too
            return level ? (std::max(n, 1ull) + 27) & ~7ull : (n + 7) & ~7ull;
        };
        void* filler = fillToLimit(-(16 << 10));
        const sZYRDbgMemState start = ZYRMemMgr_dbgMemState();
        unsigned long long used = GetMemUsage(), peak = start.peakBytes;
        Counts counts{start.allocCount, start.reallocCount, start.freeCount, 0, 0};
        int check = 1;
        std::map<unsigned char*, unsigned int> live; // a block's bytes hold its size's low byte
        std::mt19937 rng(level + 1);
        for (int step = 0; step < 3000; ++step) {
            SCOPED_TRACE(step);
            const unsigned int op = rng() % 8, copies = op == 1 ? rng() % 3 : 1;
            const unsigned int size = rng() % 4 ? rng() % 100 : rng() % 6000, n = copies * size;
            auto* p = live.empty() || op < 2 ? nullptr
                                             : std::next(live.begin(), rng() % live.size())->first;
            host.failAll = rng() % 6 == 0;
            if (op == 7) {
                const bool enable = rng() % 2;
                enable ? EnableMemUsageCheck() : DisableMemUsageCheck();
                check += enable ? check < 1 : -1;
            } else if (op == 6 && p) {
                used -= accounted(live[p]), counts[2] += level != 0;
                live.erase(p), ZYRFree(p);
            } else {
                const unsigned int old = p ? live[p] : 0;
                auto* q = static_cast<unsigned char*>(op == 0   ? ZYRMalloc(n)
                                                      : op == 1 ? ZYRCalloc(copies, size)
                                                                : ZYRRealloc(p, n));
                const unsigned long long grown = used + accounted(n) - (p ? accounted(old) : 0);
                const bool asked = n != 0 || (op < 2 && level != 0); // else null, or p back
                const bool granted = asked && (check < 1 || grown <= kLimit) && !host.failAll;
                ASSERT_TRUE(granted ? q != nullptr : q == (asked ? nullptr : p))
                    << "p for no bytes";
                if (!granted)
                    continue;
                ASSERT_TRUE(aligned16(q) && ZYRMemSize(q) == (level ? std::max(n, 1u) : n));
                ASSERT_EQ(std::count(q, q + std::min(old, n), old & 0xFF), std::min(old, n));
                ASSERT_TRUE(op != 1 || std::count(q, q + n, 0) == n) << "zeroed";
                if (level) {
                    ASSERT_EQ(thrown([q] { ZYRDbgCheckZYRMemAllocPtr(q); }), "no error");
                }
                std::memset(q, n & 0xFF, n);
                used = grown, peak = std::max(peak, used), counts[p ? 1 : 0] += level != 0;
                live.erase(p), live[q] = n;
            }
            counts[3] = static_cast<unsigned int>(used),
            counts[4] = static_cast<unsigned int>(peak);
            ASSERT_TRUE(GetMemUsage() == used && tracked() == (level ? counts : Counts(5, 0)));
        }
        for (; check < 1; ++check)
            EnableMemUsageCheck();
        for (const auto& [p, n] : live)
            ZYRFree(p);
        ZYRFree(filler);
    }
}

TEST_F(ZYRMemTest, FreedBytesAreReusedOnlyUnderTheLimitAndCountedAcrossThreads) {
    const unsigned long long used = GetMemUsage();
    void* filler = fillToLimit(-4096);
    void* small = ZYRMalloc(4096);
    EXPECT_TRUE(small && GetMemUsage() == kLimit);
    ZYRFree(small);
    EXPECT_EQ(GetMemUsage(), kLimit - 4096);
    small = ZYRMalloc(2048);
    void* other = ZYRMalloc(2048);
    EXPECT_TRUE(small && other && !grants(8));
    ZYRFree(other);
    std::thread([] { EXPECT_TRUE(grants(2048)); }).join();
    ZYRFree(small);
    ZYRFree(filler);

    EXPECT_EQ(GetMemUsage(), used);
    // Usage counts what other threads freed, while they run and once they end.
    std::thread([] { SetCZYRThreadSpecificPtr(new CZYRThreadSpecificPtr("short", true)); }).join();
    EXPECT_EQ(GetMemUsage(), used);
    void* block = ZYRMalloc(1000);
    std::promise<void> freed, done;
    std::thread renderer([&] {
        ZYRFree(block);
        freed.set_value();
        done.get_future().wait();
    });
    freed.get_future().wait();
    EXPECT_EQ(GetMemUsage(), used);
    done.set_value();
    renderer.join();
}

// Every request reserves its bytes before it asks the host: a resize waiting in the host
// holds its room, and so does an allocation (usage never passes the limit meanwhile).
TEST_F(ZYRMemTest, LimitIsAHardCapAtEveryLevel) {
    const unsigned long long machine = ZYRGetMemLimit();
    for (const auto& [set, got] : {std::pair{machine + 1, machine},
                                   {1024ull << 20, 1024ull << 20},
                                   {100000000ull, kLimit}}) {
        ZYRSetMemLimit(set);
        EXPECT_EQ(ZYRGetMemLimit(), got);
    }
    EXPECT_EQ(ZYRGetMemReserve(), 314572800u);
    for (const int level : {0, 1, 2})
        for (const bool resizeWaits : {true, false}) {
            SCOPED_TRACE(std::to_string(level) + (resizeWaits ? " resize" : " allocation"));
            GateHost gate;
            tZYRMemMgr record = gate.record();
            zyrtest::installFront(level, &record);
            void* small = ZYRMalloc(64);
            void* filler = fillToLimit(-8);
            EXPECT_EQ(VirtualMemAlloc(1), nullptr) << "a page is more than the room left";
            ZYRFree(filler);
            filler = fillToLimit(-4096);
            gate.armed = true;
            void* waiting = nullptr;
            std::thread first(
                [&] { waiting = resizeWaits ? ZYRRealloc(small, 3064) : ZYRMalloc(3000); });
            gate.entered.get_future().wait();
            void* second = resizeWaits ? ZYRMalloc(2000) : ZYRRealloc(small, 2064);
            EXPECT_EQ(second, nullptr) << "the waiting request holds the room";
            gate.release.set_value();
            first.join();
            EXPECT_TRUE(waiting && GetMemUsage() <= kLimit);
            for (void* p : {waiting, filler, resizeWaits ? nullptr : small})
                ZYRFree(p);
        }
}

TEST_F(ZYRMemTest, GuardCheckFindsDamageWithoutReadingPastTheBlock) {
    const std::string invalid =
        "3: ZYRCheckZYRMemAllocPtr:: ptr is invalid (source/zyr/std/ZYRMem:2012)";
    auto check = [](void* p) { return thrown([p] { ZYRDbgCheckZYRMemAllocPtr(p); }); };
    for (int level : {1, 2}) {
        SCOPED_TRACE(level);
        zyrtest::installFront(level);
        auto* one = static_cast<unsigned char*>(ZYRMalloc(0));
        one[1] = 0; // the first byte of the tail guard
        EXPECT_EQ(check(one) + check(nullptr), invalid + "no error");
        ZYRFree(one);

        auto* block = static_cast<unsigned char*>(ZYRMalloc(32));
        block[-1] ^= 0xFF; // head guard
        EXPECT_EQ(check(block), invalid);
        block[-1] ^= 0xFF;
        const uint32_t size = 32, wild = 0xFFFFFF00u; // reading the tail there would fault
        std::memcpy(block - 16, &wild, sizeof wild);
        block[-1] ^= level == 1 ? 0xFF : 0;
        EXPECT_EQ(check(block), invalid);
        block[-1] ^= level == 1 ? 0xFF : 0;
        std::memcpy(block - 16, &size, sizeof size);
        ZYRFree(block);
    }
}

TEST_F(ZYRMemTest, TrackerCountsAndLeakReport) {
    zyrtest::installFront(2);
    void *a = ZYRMalloc(10), *b = ZYRMalloc(30), *c = ZYRMalloc(30);
    const std::vector<std::string> lines = leakReport();
    ASSERT_EQ(lines.size(), 6u);
    char expected[256];
    std::snprintf(expected, sizeof expected,
                  "ZYRMem: Leaked %8u bytes at Memory Ptr:: %#lx, Allocation Count = %8u\n", 10u,
                  static_cast<unsigned long>(reinterpret_cast<uintptr_t>(a) - 16), 1u);
    EXPECT_EQ(lines[0], expected);
    EXPECT_TRUE(lines[1].find("      30 bytes") != std::string::npos &&
                lines[1].ends_with("Allocation Count =        2\n") &&
                lines[2].ends_with("Allocation Count =        3\n"));
    EXPECT_EQ(lines[3] + lines[4] + lines[5],
              "ZYRMem: Largest leak       30 bytes at Allocation Count =        2\n"
              "ZYRMem: Total Leaked: 144 bytes\n" // 32 + 56 + 56
              "ZYRMem: Peak memory consumption: 144 bytes\n");
    for (void* p : {a, b, c})
        ZYRFree(p);
    EXPECT_EQ(leakReport().at(1), "ZYRMem: Total Leaked: 0 bytes\n");
    zyrtest::installFront(0);
    EXPECT_TRUE(leakReport().empty());

    const unsigned char low[] = {0x01, 0x7F}, high[] = {0x01, 0x80};
    EXPECT_EQ((std::vector{Memcmp(low, high, 2), Memcmp(high, low, 2), Memcmp(low, high, 1)}),
              (std::vector{-1, 1, 0}));
    char buffer[8] = "abcdefg";
    Memmove(buffer + 1, buffer, 6);
    EXPECT_STREQ(buffer, "aabcdef");
}

TEST_F(ZYRMemTest, VirtualBlocksAreCountedAndDecommittedByWholePages) {
    const unsigned int page = GetPageSize();
    EXPECT_EQ(VirtualMemAllocUnitSize(), std::max(page, 65536u));
    EXPECT_EQ(VirtualMemAlloc(0), nullptr);
    const unsigned long long before = GetMemUsage();
    auto pages = [before, page] { return (GetMemUsage() - before) / page; };
    auto* block = static_cast<unsigned char*>(VirtualMemAlloc(4 * page + 1));
    EXPECT_EQ(pages(), 5u);
    std::memset(block, 0xAB, 5 * page);
    VirtualMemDecommit(block, block + page / 2, 3 * page); // every page it touches: 0 to 3
    EXPECT_EQ(pages(), 1u);
    VirtualMemDecommit(block, block + page, 2 * page); // already decommitted: no change
    VirtualMemDecommit(nullptr, block, page);
    VirtualMemDecommit(block, block, 0);
    EXPECT_TRUE(pages() == 1 && block[4 * page] == 0xAB);
    VirtualMemFree(block);
    VirtualMemFree(block); // no longer ours: nothing happens
    VirtualMemFree(nullptr);
    EXPECT_EQ(GetMemUsage(), before);

    zyrtest::installFront(2);
    block = static_cast<unsigned char*>(VirtualMemAlloc(3 * page));
    VirtualMemDecommit(block, block + page, 1);
    const unsigned int once = ZYRMemMgr_dbgMemState().currentBytes;
    VirtualMemDecommit(block, block + page, page); // nothing left there: nothing changes
    const unsigned int twice = ZYRMemMgr_dbgMemState().currentBytes;
    VirtualMemFree(block);
    EXPECT_EQ((Counts{once, twice, ZYRMemMgr_dbgMemState().currentBytes}),
              (Counts{2 * page, 2 * page, 0}))
        << "the tracker must not wrap";

    zyrtest::installFront(0);
    ZYRSetMemLimit(kLimit);
    DisableMemUsageCheck();
    void* big = VirtualMemAlloc(401u << 20); // past the limit: the check is off
    EnableMemUsageCheck();
    EXPECT_TRUE(big && !VirtualMemAlloc(1));
    VirtualMemFree(big);
}

TEST_F(ZYRMemTest, StatusKeepsTheReserveBack) {
    tZYRVirtualMemoryInfo info{};
    const auto room = [&info] { return VirtualMemStatus(&info), info.availableForAllocation; };
    void* filler = fillToLimit();
    EXPECT_EQ(room(), 0u);
    ZYRFree(filler);
    // A reservation of address space uses no memory (sanitizers map terabytes too).
    void* reserved =
        mmap(nullptr, 1ull << 40, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    filler = fillToLimit(-static_cast<long long>(ZYRGetMemReserve() + (1 << 20)));
    const uint64_t left = room();
    EXPECT_TRUE(reserved != MAP_FAILED && left > 0 && left <= (1u << 20)) << left;
    munmap(reserved, 1ull << 40);
    ZYRFree(filler);
    EXPECT_LE(info.availablePhysical, info.totalPhysical);
    ZYRSetTestAvailablePhysicalMemory(false);
    VirtualMemStatus(&info);
    EXPECT_EQ(info.availablePhysical, info.totalPhysical);
    ZYRSetTestAvailablePhysicalMemory(true);
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__) // they map terabytes
    EXPECT_EXIT(
        {
            rlimit as{};
            getrlimit(RLIMIT_AS, &as);
            as.rlim_cur = info.totalVirtual - 1; // below the machine's, above what is mapped
            setrlimit(RLIMIT_AS, &as);
            VirtualMemStatus(&info);
            std::_Exit(info.totalVirtual == as.rlim_cur ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
#endif
}

TEST_F(ZYRMemTest, CgroupCapIsTheProcessesOwnGroup) {
    zyrtest::TempDir dir;
    const std::string root = dir.file("fs"), self = dir.file("cgroup");
    auto put = [&](const std::string& path, const std::string& text) {
        std::filesystem::create_directories(std::filesystem::path(path).parent_path());
        zyrtest::writeFile(path, text);
    };
    const std::string large = "9223372036854771712\n";
    for (const auto& [path, text] : {std::pair<std::string, std::string>{"/memory.max", "max\n"},
                                     {"/system.slice/memory.max", "3000000\n"},
                                     {"/system.slice/engine.service/memory.max", "max\n"},
                                     {"/memory/memory.limit_in_bytes", large},
                                     {"/memory/jobs/memory.limit_in_bytes", large},
                                     {"/memory/jobs/print/memory.limit_in_bytes", "5000000\n"},
                                     {"/system.slice/memory.current", "1000000\n"},
                                     {"/memory/jobs/print/memory.usage_in_bytes", "6000000\n"}})
        put(root + path, text);
    const std::tuple<const char*, uint64_t, uint64_t> cases[] = {
        // group, cap, room
        {"0::/system.slice/engine.service\n", 3000000, 2000000}, // a parent's cap binds
        {"0::/\n", UINT64_MAX, UINT64_MAX},                      // the root has no cap
        {"0::/gone\n", UINT64_MAX, UINT64_MAX},
        {"12:cpu,cpuacct:/jobs\n4:memory:/jobs/print\n0::/jobs\n", 5000000, 0},   // over its cap
        {"3:cpuset,memory:/jobs\n", 9223372036854771712u, 9223372036854771712u}}; // no usage
    for (const auto& [group, cap, room] : cases) {
        put(self, group);
        EXPECT_EQ(detail::cgroupMemoryLimit(self, root), cap) << group;
        EXPECT_EQ(detail::cgroupMemoryRoom(self, root), room) << group;
    }
    put(root + "/system.slice/engine.service/memory.max", "2000000\n");
    put(root + "/memory.max", "7000000\n");
    put(self, "0::/system.slice/engine.service\n");
    EXPECT_EQ(detail::cgroupMemoryLimit(self, root) +
                  detail::cgroupMemoryLimit(dir.file("missing"), root),
              9000000u);
    tZYRVirtualMemoryInfo info{};
    VirtualMemStatus(&info);
    EXPECT_LE(info.totalVirtual, detail::cgroupMemoryLimit("/proc/self/cgroup", "/sys/fs/cgroup"));
}

TEST_F(CZYRErrorStkTest, OrderFilterUniquenessAndTheRawInterface) {
    for (const char16_t* text : {u"a", u"b"})
        report(text);
    const std::u16string first = fetch();
    EXPECT_EQ(first + fetch(), u"ba<none>") << "fetching empties the stack";
    for (const char16_t* text : {u"c", u"ab", u""})
        report(text);
    EXPECT_EQ(fetch(u"xxabyy"), u"c") << "the filter skips messages it contains";
    report(u"same", true);
    report(u"same", true);
    std::thread([] { report(u"same", true); }).join();
    EXPECT_EQ(fetch(), u"samesame") << "unique per thread";
    uint32_t ids[2] = {};
    for (int i = 0; i < 2; ++i)
        std::thread([&ids, i] {
            report((ids[i] = ZYRGetCurrentThreadId(), i ? u"2" : u"1"));
        }).join();
    EXPECT_EQ(fetch(), ids[0] < ids[1] ? u"12" : u"21") << "threads in identifier order";
    report(std::u16string(2000, u'x').c_str());
    EXPECT_EQ(fetch().size(), 1024u) << "messages and results are cut at 1024";
    report(std::u16string(700, u'a').c_str());
    report(std::u16string(700, u'b').c_str());
    EXPECT_EQ(fetch(), std::u16string(700, u'b') + std::u16string(324, u'a'));
    C_Error err; // the raw interface leaves the length alone when nothing is found
    I_ErrorStk* raw = createErrorStk(err);
    char16_t buffer[1025] = u"";
    unsigned short length = 77;
    EXPECT_TRUE(!raw->getErrorMessage(buffer, &length) && length == 77);
    raw->reportError(3, u"xyz", 0);
    EXPECT_TRUE(raw->getErrorMessage(buffer, &length) && std::u16string(buffer, length) == u"xyz");
    report(u"lost");
    TerminateErrorStk();
    EXPECT_EQ(fetch(), u"<none>") << "a new stack starts empty";
}

TEST_F(CZYRErrorStkTest, OutOfMemoryNoticeFromAnyThreadIsSafeAgainstTerminate) {
    void* filler = fillToLimit();
    std::atomic<bool> refusing{true};
    std::thread renderer([&] {
        for (int i = 0; i < 20000; ++i)
            EXPECT_FALSE(grants(64));
        refusing = false;
    });
    while (refusing)
        TerminateErrorStk();
    renderer.join();
    TerminateErrorStk(); // the very first notice also builds the stack
    EXPECT_FALSE(grants(64) || grants(64));
    EXPECT_EQ(fetch(), u"Insufficient Memory.\n");
    ZYRFree(filler);
}
