// Applying data changes to the watch list: packets per second into lists of
// 100 and 10,000 items (the handle index keeps the cost of a change flat),
// with a value change alone and with value, time and quality; and the heap
// held per listed item.

#include "views/watchlist/WatchList.h"
#include "views/watchlist/WatchListHost.h"

#include <benchmark/benchmark.h>

#include <malloc.h>

#include <string>

namespace {

using namespace qv;
using fbfen::orvekclient::DataChangePacket;

/// A document that issues handles in turn and subscribes nothing.
class CountingHost final : public views::WatchListHost {
public:
    std::int32_t SubscribeItem(const fen::WString&) override { return ++last; }
    void Unsubscribe(std::int32_t) override {}
    void SetModified(bool) override {}
    void NotifyRemoved(const std::vector<std::int32_t>&) override {}
    std::int32_t last = 0;
};

document::ItemBatch Items(int count)
{
    document::ItemBatch batch;
    batch.reserve(static_cast<std::size_t>(count));
    for (int i = 0; i < count; ++i)
        batch.emplace_back("\\\\plant\\load\\v" + std::to_string(1000000 + i), value::TypeCode::Numeric, 1);
    return batch;
}

void BM_ApplyChange(benchmark::State& state)
{
    const int items = static_cast<int>(state.range(0));
    const bool everything = state.range(1) != 0;
    CountingHost host;
    views::WatchList list(host, nullptr);
    document::ItemBatch batch = Items(items);
    list.InsertItems(batch);

    DataChangePacket packet;
    packet.changeMask = everything ? 0xF : 0x1;
    packet.timestamp = {0, 3'900'000'000};
    std::int64_t n = 0;
    for (auto _ : state) {
        // Handles spread over the whole list, as a busy plant delivers them.
        packet.handle = static_cast<std::int32_t>((n * 7919) % items) + 1;
        packet.value = value::VarData::MakeNumeric(static_cast<double>(n) * 0.37);
        packet.quality = (n & 0x3F) == 0 ? 0x10 : 0;
        packet.timestamp.seconds += 1;
        list.Queue()->Deliver(packet);
        list.ApplyNextChange();
        ++n;
    }
    state.SetItemsProcessed(n);
}
BENCHMARK(BM_ApplyChange)->ArgsProduct({{100, 10000}, {0, 1}})->ArgNames({"items", "all"});

void BM_MemoryPerItem(benchmark::State& state)
{
    constexpr int kItems = 10000;
    double perItem = 0;
    for (auto _ : state) {
        CountingHost host;
        const std::size_t before = mallinfo2().uordblks;
        {
            views::WatchList list(host, nullptr);
            document::ItemBatch batch = Items(kItems);
            list.InsertItems(batch);
            batch = {}; // the producer's batch goes; the list keeps its own records
            // Every row has shown a value, a time and a quality once.
            for (int h = 1; h <= kItems; ++h) {
                DataChangePacket packet{h, 0xF, {0, 3'900'000'000}, 0, 0, value::VarData::MakeNumeric(h * 1.5)};
                list.Queue()->Deliver(packet);
                list.ApplyNextChange();
            }
            perItem = static_cast<double>(mallinfo2().uordblks - before) / kItems;
        }
    }
    state.counters["bytes_per_item"] = perItem;
}
BENCHMARK(BM_MemoryPerItem)->Iterations(1)->Unit(benchmark::kMillisecond);

} // namespace
