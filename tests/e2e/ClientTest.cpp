// The monitor's client against a real broker and the demo plant: changes
// reach a change queue, writes reach the plant, ended subscriptions go quiet
// and the client can be destroyed with subscriptions still open.

#include "EndToEndSupport.h"
#include "network/SimulatorProcess.h"

#include "client/ChangeQueue.h"
#include "client/OCException.h"
#include "client/OrvekClient.h"
#include "fen/OrvekURL.h"
#include "value/TypeCodes.h"

#include <csignal>

namespace qv::test {
namespace {

using namespace fbfen::orvekclient;

/// A consumer that applies each packet as its notification arrives.
class QueueWatcher {
public:
    QueueWatcher() : queue_([this] { Notified(); }) {}

    static void Callback(void* context, std::int32_t handle, std::uint32_t mask, const value::VarData* value,
                         std::uint64_t quality, std::int32_t error, fen::AbsTime time)
    {
        static_cast<QueueWatcher*>(context)->queue_.Deliver({handle, mask, time, quality, error, *value});
    }

    /// Applies packets until one of `handle` has a value that `match` accepts.
    bool WaitFor(std::int32_t handle, const std::function<bool(const value::VarData&)>& match)
    {
        const auto deadline = std::chrono::steady_clock::now() + 5s;
        std::unique_lock lock(mutex_);
        while (true) {
            if (!notified_.wait_until(lock, deadline, [&] { return pending_ > 0; }))
                return false;
            --pending_;
            bool found = false;
            queue_.ApplyNext([&](const DataChangePacket& p) {
                counts_[p.handle]++;
                found = p.handle == handle && (p.changeMask & 1) && match(p.value);
            });
            if (found)
                return true;
        }
    }

    int Count(std::int32_t handle)
    {
        std::lock_guard lock(mutex_);
        while (pending_ > 0) {
            --pending_;
            queue_.ApplyNext([&](const DataChangePacket& p) { counts_[p.handle]++; });
        }
        return counts_[handle];
    }

private:
    void Notified()
    {
        {
            std::lock_guard lock(mutex_);
            ++pending_;
        }
        notified_.notify_one();
    }

    ChangeQueue queue_;
    std::mutex mutex_;
    std::condition_variable notified_;
    int pending_ = 0;
    std::map<std::int32_t, int> counts_;
};

bool IsNumber(const value::VarData& v)
{
    return v.Code() == value::TypeCode::Numeric;
}

TEST_F(EndToEnd, ClientSubscribesWritesUnsubscribesAndClosesWithOpenSubscriptions)
{
    Simulator sim({"--port", std::to_string(broker_->Port()), "--seconds", "20"});
    QueueWatcher watcher;
    auto client = std::make_unique<OrvekClient>(nullptr);
    client->SetCallbackContext(&watcher);
    client->SetDataCallback(QueueWatcher::Callback);

    client->Subscribe(1, fen::OrvekURL(u"\\\\LocalHost\\boiler\\drum.level"), 0, 0);
    client->Subscribe(2, fen::OrvekURL(u"\\\\.\\boiler\\drum.level.setpoint"), 0, 0);
    // A handle in use, and a URL without a host, are refused; the first
    // subscription of handle 1 goes on.
    for (const char16_t* url : {u"\\\\localhost\\tanks\\levels", u"boiler\\drum.level"}) {
        try {
            client->Subscribe(url[0] == u'\\' ? 1 : 3, fen::OrvekURL(url), 0, 0);
            ADD_FAILURE() << "subscribed twice or without a host";
        } catch (const fen::exception::Exception& e) {
            EXPECT_EQ(dynamic_cast<const OCException&>(e).GetStatus(), kStatusInvalidArgument);
        }
    }
    ASSERT_TRUE(watcher.WaitFor(1, IsNumber));
    ASSERT_TRUE(watcher.WaitFor(1, IsNumber)) << "the level keeps changing";

    client->Write(2, value::VarData::MakeNumeric(42.5));
    EXPECT_TRUE(watcher.WaitFor(2, [](const value::VarData& v) { return v.ToDouble() == 42.5; }));
    client->Write(99, value::VarData::MakeNumeric(1)); // never subscribed: nothing happens

    // After the end, at most a change already under way still arrives.
    client->Unsubscribe(1);
    client->Unsubscribe(1);
    std::this_thread::sleep_for(300ms);
    const int atEnd = watcher.Count(1);
    std::this_thread::sleep_for(1500ms);
    EXPECT_LE(watcher.Count(1), atEnd + 1);

    client.reset(); // subscription 2 still open
    sim.Signal(SIGTERM);
    EXPECT_EQ(sim.Wait(5s), 0);
}

} // namespace
} // namespace qv::test
