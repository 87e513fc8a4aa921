// Finalizing an analytics record (the hand-over to the manager's worker, not the logging)
// against the plain pattern: a std::shared_ptr pushed to a std::deque under a std::mutex with
// a notify, drained by a consumer thread of its own.
#include <benchmark/benchmark.h>

#include <condition_variable>
#include <deque>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

#include "BenchSupport.h"
#include "ZYRStd.h"

namespace {

using namespace ZYRStd;

constexpr size_t kBatch = 1024; // records built with the clock stopped, then finalized
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
    std::vector<CZYRAnalyticsData> batch;
    size_t next = kBatch;
    for (auto _ : state) {
        if (next == kBatch) {
            state.PauseTiming();
            batch.clear();
            for (size_t i = 0; i < kBatch; ++i) {
                CZYRAnalyticsData& record = batch.emplace_back();
                for (unsigned int v = 0; v < kValues; ++v)
                    record.set(keys()[v], v);
            }
            next = 0;
            state.ResumeTiming();
        }
        batch[next++].finalize();
    }
}

struct PeerRecord {
    std::vector<std::pair<std::string, unsigned int>> values;
};

// The peer's queue and its consumer, which takes one record at a time as our worker does.
class PeerQueue {
public:
    PeerQueue()
        : consumer_([this] {
              std::unique_lock lock(lock_);
              for (;;) {
                  wakeup_.wait(lock, [this] { return stop_ || !queue_.empty(); });
                  if (stop_)
                      return;
                  std::shared_ptr<PeerRecord> taken = std::move(queue_.front());
                  queue_.pop_front();
                  lock.unlock();
                  taken.reset();
                  lock.lock();
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
    std::vector<std::shared_ptr<PeerRecord>> batch;
    size_t next = kBatch;
    for (auto _ : state) {
        if (next == kBatch) {
            state.PauseTiming();
            batch.clear();
            for (size_t i = 0; i < kBatch; ++i) {
                auto record = std::make_shared<PeerRecord>();
                for (unsigned int v = 0; v < kValues; ++v)
                    record->values.emplace_back("Key" + std::to_string(v), v);
                batch.push_back(std::move(record));
            }
            next = 0;
            state.ResumeTiming();
        }
        queue.push(batch[next++]);
    }
}

BENCHMARK(BM_AnalyticsEnqueue_Ours);
BENCHMARK(BM_AnalyticsEnqueue_Peer);

} // namespace

int main(int argc, char** argv) {
    const int result = zyrbench::runWithRatios(
        argc, argv,
        {{"analytics_enqueue", "BM_AnalyticsEnqueue_Ours", "BM_AnalyticsEnqueue_Peer"}});
    ZYRAnalyticsManagerTerm();
    return result;
}
