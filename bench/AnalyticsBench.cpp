// Finalizing an analytics record (the hand-over to the manager's worker, not the logging)
// against the plain pattern: a std::shared_ptr pushed to a std::deque under a std::mutex with
// a notify, drained by a consumer thread of its own.
#include <benchmark/benchmark.h>

#include <condition_variable>
#include <deque>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "BenchSupport.h"
#include "ZYRStd.h"

namespace {

using namespace ZYRStd;

constexpr size_t kRecords = size_t{1} << 16;
constexpr unsigned int kValues = 8;

// The manager runs with a session that records nothing, so its worker only drains the queue
// like the peer's consumer does; records are enabled so that finalize enqueues them.
void startAnalytics() {
    static const bool started = [] {
        InitCommonUniStrings();
        InitDynamicUniStringCache();
        ZYRSetAnalyticsActive(false);
        ZYRAnalyticsManagerInit();
        ZYRSetAnalyticsActive(true);
        return GetZYRAnalyticsManager() != nullptr;
    }();
    if (!started)
        std::abort(); // libKelvrin.so beside the library is missing
}

const std::vector<CZYRUniString>& keys() {
    static const std::vector<CZYRUniString> all = [] {
        std::vector<CZYRUniString> k;
        for (unsigned int i = 0; i < kValues; ++i)
            k.emplace_back(("Key" + std::to_string(i)).c_str());
        return k;
    }();
    return all;
}

void BM_AnalyticsEnqueue_Ours(benchmark::State& state) {
    startAnalytics();
    std::vector<CZYRAnalyticsData> records(kRecords);
    for (CZYRAnalyticsData& record : records)
        for (unsigned int v = 0; v < kValues; ++v)
            record.set(keys()[v], v);
    size_t next = 0;
    for (auto _ : state)
        records[next++].finalize();
}

struct PeerRecord {
    std::vector<std::pair<std::string, unsigned int>> values;
};

// The peer's queue and its consumer, which drains as our worker does: everything queued is
// taken under one lock and dropped outside it, so that only the hand-over differs.
class PeerQueue {
public:
    PeerQueue()
        : consumer_([this] {
              std::deque<std::shared_ptr<PeerRecord>> taken;
              for (;;) {
                  {
                      std::unique_lock lock(lock_);
                      wakeup_.wait(lock, [this] { return stop_ || !queue_.empty(); });
                      if (stop_)
                          return;
                      taken.swap(queue_);
                  }
                  taken.clear();
              }
          }) {}
    ~PeerQueue() {
        {
            const std::lock_guard guard(lock_);
            stop_ = true;
        }
        wakeup_.notify_one();
        consumer_.join();
    }
    void push(std::shared_ptr<PeerRecord> record) {
        {
            const std::lock_guard guard(lock_);
            queue_.push_back(std::move(record));
        }
        wakeup_.notify_one();
    }

private:
    std::mutex lock_;
    std::condition_variable wakeup_;
    std::deque<std::shared_ptr<PeerRecord>> queue_;
    bool stop_ = false;
    std::thread consumer_;
};

void BM_AnalyticsEnqueue_Peer(benchmark::State& state) {
    PeerQueue queue;
    std::vector<std::shared_ptr<PeerRecord>> records(kRecords);
    for (auto& record : records) {
        record = std::make_shared<PeerRecord>();
        for (unsigned int v = 0; v < kValues; ++v)
            record->values.emplace_back("Key" + std::to_string(v), v);
    }
    size_t next = 0;
    for (auto _ : state)
        queue.push(records[next++]);
}

// One record per iteration, built before the clock starts and destroyed after it stops, so
// that only the hand-over is timed: building or freeing records beside it made both sides
// fight over the allocator, and the result depended on who lost.
BENCHMARK(BM_AnalyticsEnqueue_Ours)->Iterations(kRecords)->Repetitions(9);
BENCHMARK(BM_AnalyticsEnqueue_Peer)->Iterations(kRecords)->Repetitions(9);

} // namespace

int main(int argc, char** argv) {
    const std::string runs = "/iterations:" + std::to_string(kRecords);
    const int result =
        zyrbench::runWithRatios(argc, argv,
                                {{"analytics_enqueue", "BM_AnalyticsEnqueue_Ours" + runs,
                                  "BM_AnalyticsEnqueue_Peer" + runs}});
    ZYRAnalyticsManagerTerm();
    return result;
}
