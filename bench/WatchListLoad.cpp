// Loading a 10,000-item watch list (.vsd) and subscribing it through the
// monitor's document against a real broker, with orvek-sim publishing the
// items (its load process). Figures: the time to read the file, list and
// subscribe every item; the time until every row shows its first value;
// resident memory per item. Baseline in the same run: the same URLs
// subscribed straight through the real-time library, until every first
// value has arrived.
//
// Usage: bench_watch_list_load [items]

#include "network/RealTimeTestSupport.h"
#include "support/ChildProcess.h"

#include "document/DocumentFile.h"
#include "document/MonitorDoc.h"
#include "fen/osdep/TextConversion.h"
#include "network/session/OrvekSession.h"
#include "views/watchlist/DocumentDataView.h"

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <set>
#include <unistd.h>

namespace {

using namespace qv;
using Clock = std::chrono::steady_clock;
using namespace std::chrono_literals;
namespace rt = network::realtime;

long ResidentBytes()
{
    std::ifstream statm("/proc/self/statm");
    long size = 0, resident = 0;
    statm >> size >> resident;
    return resident * sysconf(_SC_PAGESIZE);
}

std::string Url(int i)
{
    char text[48];
    std::snprintf(text, sizeof text, "\\\\localhost\\load\\v%06d", i);
    return text;
}

double Seconds(Clock::duration d)
{
    return std::chrono::duration<double>(d).count();
}

/// Counts the distinct handles that delivered a value.
class FirstValues final : public rt::IOrvekRealTimeReceiver3 {
public:
    std::int32_t QueryInterface(const rt::Guid&, void** out) override
    {
        *out = nullptr;
        return static_cast<std::int32_t>(0x80004002u);
    }
    std::uint32_t AddRef() override { return 1; }
    std::uint32_t Release() override { return 1; }
    void Notification3() override {}
    void Notification4() override {}
    void Notification5() override {}
    void Notification6() override {}
    void OnDataChange(std::int32_t handle, std::uint32_t, const value::VarData* v, std::uint64_t quality,
                      std::int32_t, const fen::AbsTime*) override
    {
        if (quality != 0 || v->Code() != value::TypeCode::Numeric)
            return;
        std::lock_guard lock(mutex_);
        if (seen_.insert(handle).second && seen_.size() == wanted_)
            done_.notify_all();
    }
    bool Wait(std::size_t wanted, std::chrono::seconds timeout)
    {
        std::unique_lock lock(mutex_);
        wanted_ = wanted;
        return done_.wait_for(lock, timeout, [&] { return seen_.size() >= wanted_; });
    }

private:
    std::mutex mutex_;
    std::condition_variable done_;
    std::set<std::int32_t> seen_;
    std::size_t wanted_ = 0;
};

/// Subscribes every URL straight through the library; seconds until every
/// first value arrived, or -1.
double SubscribeRaw(int items)
{
    network::session::IOrvekSession* session = nullptr;
    network::session::NewOrvekSession(&session);
    FirstValues receiver;
    rt::IOrvekRealTime* realTime = nullptr;
    rt::NewOrvekRealTime(session, &receiver, &realTime);
    std::vector<rt::ISubscription*> subscriptions;
    const auto start = Clock::now();
    for (int i = 0; i < items; ++i) {
        const fen::WString url = fen::osdep::ToWide(fen::String(Url(i).c_str()));
        rt::ISubscription* subscription = nullptr;
        realTime->Subscribe(url.c_str(), i + 1, nullptr, &subscription);
        subscriptions.push_back(subscription);
    }
    const bool all = receiver.Wait(static_cast<std::size_t>(items), 60s);
    const double seconds = Seconds(Clock::now() - start);
    for (auto* subscription : subscriptions)
        subscription->Release();
    realTime->Release();
    session->Release();
    return all ? seconds : -1;
}

} // namespace

int main(int argc, char** argv)
{
    const int items = argc > 1 ? std::atoi(argv[1]) : 10000;
    test::TemporaryHome home;
    test::TestBroker broker;
    test::SetDataPort(broker.Port());
    test::ChildProcess sim(ORVEK_SIM_PROGRAM, {"--port", std::to_string(broker.Port()), "--load",
                                               std::to_string(items), "--rate", "100", "--seconds", "300"});

    document::ItemBatch rows;
    for (int i = 0; i < items; ++i)
        rows.emplace_back(Url(i), value::TypeCode::Numeric, 1);
    const std::string path = (home.Home() / "load.vsd").string();
    document::SaveDocument(path, rows, document::WindowPlacement{});

    // Once through, unmeasured, so that the plant has published everything.
    if (SubscribeRaw(items) < 0) {
        std::fprintf(stderr, "the load process never delivered all %d values\n", items);
        return 1;
    }
    const double raw = SubscribeRaw(items);

    const long residentBefore = ResidentBytes();
    const auto start = Clock::now();
    std::mutex mutex;
    std::condition_variable posted;
    long pending = 0;
    long applied = 0;
    double opened = 0, allShown = -1;
    {
        document::CMonitorDoc doc(false);
        views::DocumentDataView view(doc, [&] {
            std::lock_guard lock(mutex);
            ++pending;
            posted.notify_one();
        });
        doc.OpenDocument(path);
        opened = Seconds(Clock::now() - start);

        // The user-interface thread: one change per notification, until
        // every row shows a value.
        std::vector<char> shown(static_cast<std::size_t>(items) + 1);
        int rowsShown = 0;
        views::WatchList& list = view.List();
        while (rowsShown < items && Clock::now() - start < 60s) {
            {
                std::unique_lock lock(mutex);
                if (!posted.wait_for(lock, 1s, [&] { return pending > 0; }))
                    continue;
                --pending;
            }
            ++applied;
            if (const auto handle = list.ApplyNextChange()) {
                const auto row = list.RowOf(*handle);
                if (row && !list.CellText(*row, views::Column::Value).empty() && *handle <= items &&
                    !shown[static_cast<std::size_t>(*handle)]) {
                    shown[static_cast<std::size_t>(*handle)] = 1;
                    ++rowsShown;
                }
            }
        }
        if (rowsShown == items)
            allShown = Seconds(Clock::now() - start);
        const long resident = ResidentBytes() - residentBefore;
        std::printf("items                          %d\n", items);
        std::printf("open, list and subscribe       %.3f s (%.0f items/s)\n", opened, items / opened);
        std::printf("until every row shows a value  %.3f s (%ld changes applied)\n", allShown, applied);
        std::printf("same URLs, bare library        %.3f s\n", raw);
        std::printf("document path / bare library   %.2f\n", allShown / raw);
        std::printf("resident memory per item       %.0f bytes (library, document and list)\n",
                    static_cast<double>(resident) / items);
        view.Shutdown(false);
    }
    return allShown < 0 ? 1 : 0;
}
