// Data changes per second from the library's OnDataChange through the data
// callback and the change queues to the consumer that applies them, with one
// and two queues (data views). "Inline" runs producer and consumer on one
// thread, which is the floor cost of the path without any waiting; the
// threaded runs put the producer on its own thread, as the library does,
// and wake the consumer once per packet.

#include "client/ChangeQueue.h"
#include "client/Receiver.h"

#include <benchmark/benchmark.h>

#include <boost/make_shared.hpp>

#include <condition_variable>
#include <mutex>
#include <thread>
#include <vector>

namespace {

using namespace qv::fbfen::orvekclient;

/// Counts notifications and wakes the consumer, as a posted message would.
class Wakeups {
public:
    void Post()
    {
        {
            std::lock_guard lock(mutex_);
            ++pending_;
        }
        posted_.notify_one();
    }
    void Take()
    {
        std::unique_lock lock(mutex_);
        posted_.wait(lock, [&] { return pending_ > 0; });
        --pending_;
    }

private:
    std::mutex mutex_;
    std::condition_variable posted_;
    long pending_ = 0;
};

struct Views {
    std::vector<ChangeQueuePtr> queues;
};

void Dispatch(void* context, std::int32_t handle, std::uint32_t mask, const qv::value::VarData* value,
              std::uint64_t quality, std::int32_t error, qv::fen::AbsTime time)
{
    const DataChangePacket packet{handle, mask, time, quality, error, *value};
    for (const auto& queue : static_cast<Views*>(context)->queues)
        queue->Deliver(packet);
}

/// Applies a packet as the watch list would: it keeps the value.
struct Consumer {
    qv::value::VarData kept;
    double sum = 0;
    void operator()(const DataChangePacket& p)
    {
        kept = p.value;
        sum += p.value.ToDouble();
    }
};

void BM_HandOverInline(benchmark::State& state)
{
    const auto queueCount = state.range(0);
    Views views;
    for (int i = 0; i < queueCount; ++i)
        views.queues.push_back(boost::make_shared<ChangeQueue>(nullptr));
    auto* receiver = new Receiver;
    receiver->SetCallbackContext(&views);
    receiver->SetDataCallback(Dispatch);
    Consumer consumer;
    const qv::fen::AbsTime time{0, 3'900'000'000};
    std::int64_t n = 0;
    for (auto _ : state) {
        const auto value = qv::value::VarData::MakeNumeric(static_cast<double>(n));
        receiver->OnDataChange(static_cast<std::int32_t>(n % 1000), 0xF, &value, 0, 0, &time);
        for (const auto& queue : views.queues)
            queue->ApplyNext(consumer);
        ++n;
    }
    benchmark::DoNotOptimize(consumer.sum);
    receiver->Release();
    state.SetItemsProcessed(n);
}
BENCHMARK(BM_HandOverInline)->Arg(1)->Arg(2);

void BM_HandOverThreaded(benchmark::State& state)
{
    const auto queueCount = state.range(0);
    constexpr int kChanges = 200'000;
    for (auto _ : state) {
        Wakeups wakeups;
        Views views;
        for (int i = 0; i < queueCount; ++i)
            views.queues.push_back(boost::make_shared<ChangeQueue>([&wakeups] { wakeups.Post(); }));
        auto* receiver = new Receiver;
        receiver->SetCallbackContext(&views);
        receiver->SetDataCallback(Dispatch);
        std::thread library([receiver] {
            const qv::fen::AbsTime time{0, 3'900'000'000};
            for (int i = 0; i < kChanges; ++i) {
                const auto value = qv::value::VarData::MakeNumeric(i);
                receiver->OnDataChange(i % 1000, 0xF, &value, 0, 0, &time);
            }
        });
        Consumer consumer;
        // One wake-up per packet; the consumer applies the oldest packet of
        // each queue in turn, as each view handles its own messages.
        for (long i = 0; i < kChanges * queueCount; ++i) {
            wakeups.Take();
            for (const auto& queue : views.queues)
                if (queue->ApplyNext(consumer))
                    break;
        }
        library.join();
        receiver->Release();
        benchmark::DoNotOptimize(consumer.sum);
    }
    // Changes from the library per second; each reaches every queue.
    state.SetItemsProcessed(state.iterations() * kChanges);
}
BENCHMARK(BM_HandOverThreaded)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime();

} // namespace
