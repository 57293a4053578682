// Publish-to-receive latency through a real broker, with Nagle's algorithm
// on and off (set_tcp_nodelay on the broker, TCP_NODELAY on the publisher;
// the real-time library's own connections always set TCP_NODELAY).
//
// A raw publisher sends value messages stamped with the time of sending at a
// fixed rate; a real-time subscription receives them and the receiver takes
// the difference. Prints the median and the 99th percentile for each setting.
//
// Usage: bench_realtime_latency [messages per second] [seconds]

#include "support/TemporaryHome.h"
#include "support/TestBroker.h"

#include "fen/osdep/RegKey.h"
#include "network/protocol/Catalogue.h"
#include "network/protocol/ProcessState.h"
#include "network/protocol/Topics.h"
#include "network/protocol/ValueMessage.h"
#include "network/realtime/Connection.h"
#include "network/realtime/OrvekRealTime.h"
#include "value/VarData.h"

#include <mosquitto.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <thread>
#include <vector>

namespace {

namespace rt = qv::network::realtime;
namespace proto = qv::network::protocol;

double Seconds(const qv::fen::AbsTime& time)
{
    return static_cast<double>(time.seconds) + static_cast<double>(time.fraction) / 18446744073709551616.0;
}

class LatencyReceiver final : public rt::IOrvekRealTimeReceiver3 {
public:
    std::int32_t QueryInterface(const rt::Guid&, void** out) override
    {
        *out = nullptr;
        return static_cast<std::int32_t>(0x80004002u);
    }
    std::uint32_t AddRef() override { return 2; }
    std::uint32_t Release() override { return 1; }
    void Notification3() override {}
    void Notification4() override {}
    void Notification5() override {}
    void Notification6() override {}
    void OnDataChange(std::int32_t, std::uint32_t, const qv::value::VarData*, std::uint64_t quality, std::int32_t,
                      const qv::fen::AbsTime* time) override
    {
        if (quality != 0 || time->IsEarliest())
            return;
        const double latency = Seconds(rt::CurrentTime()) - Seconds(*time);
        std::lock_guard lock(mutex);
        latencies.push_back(latency);
    }
    std::mutex mutex;
    std::vector<double> latencies;
};

void Run(bool noDelay, int rate, int seconds)
{
    qv::test::TemporaryHome home;
    qv::test::TestBrokerOptions options;
    options.tcpNoDelay = noDelay;
    qv::test::TestBroker broker(options);
    {
        qv::fen::osdep::RegKey key(qv::fen::osdep::kLocalMachine, qv::fen::WString(u"SOFTWARE\\Quorvane\\Orvek"),
                                   false, true, u"");
        qv::fen::osdep::RegValue value;
        value.type = qv::fen::osdep::kRegDword;
        value.number = broker.Port();
        key.SetValue(u"DataPort", value);
    }

    mosquitto* publisher = mosquitto_new(nullptr, true, nullptr);
    mosquitto_int_option(publisher, MOSQ_OPT_TCP_NODELAY, noDelay ? 1 : 0);
    mosquitto_connect(publisher, "127.0.0.1", broker.Port(), 10);
    mosquitto_loop_start(publisher);
    auto publish = [&](const std::string& topic, const std::string& payload, int qos) {
        mosquitto_publish(publisher, nullptr, topic.c_str(), static_cast<int>(payload.size()), payload.data(), qos,
                          true);
    };
    publish(proto::ProcessTopic("bench", proto::TopicKind::Catalogue),
            proto::EncodeCatalogue({{{"x", 3, 0, 1}}, {}}), 1);
    publish(proto::ProcessTopic("bench", proto::TopicKind::State), proto::EncodeProcessState({}), 1);
    std::this_thread::sleep_for(std::chrono::milliseconds(200));

    LatencyReceiver receiver;
    rt::IOrvekRealTime* realTime = nullptr;
    rt::NewOrvekRealTime(nullptr, &receiver, &realTime);
    rt::ISubscription* subscription = nullptr;
    realTime->Subscribe(u"\\\\localhost\\bench\\x", 1, nullptr, &subscription);
    std::this_thread::sleep_for(std::chrono::milliseconds(500));
    {
        std::lock_guard lock(receiver.mutex);
        receiver.latencies.clear();
    }

    const std::string topic = proto::NamedTopic("bench", proto::TopicKind::Value, "x");
    const auto interval = std::chrono::nanoseconds(1000000000 / rate);
    auto next = std::chrono::steady_clock::now();
    for (long i = 0; i < static_cast<long>(rate) * seconds; ++i) {
        proto::ValueMessage message;
        message.value = qv::value::VarData::MakeNumeric(static_cast<double>(i));
        message.time = rt::CurrentTime();
        publish(topic, proto::EncodeValueMessage(message), 0);
        next += interval;
        while (std::chrono::steady_clock::now() < next) {
        }
    }
    std::this_thread::sleep_for(std::chrono::milliseconds(500));

    subscription->Release();
    realTime->Release();
    mosquitto_disconnect(publisher);
    mosquitto_loop_stop(publisher, false);
    mosquitto_destroy(publisher);

    std::vector<double> latencies;
    {
        std::lock_guard lock(receiver.mutex);
        latencies = receiver.latencies;
    }
    std::sort(latencies.begin(), latencies.end());
    if (latencies.empty()) {
        std::printf("nodelay=%d: nothing received\n", noDelay);
        return;
    }
    std::printf("nodelay=%-5s rate=%d/s received=%zu median=%.1f us p99=%.1f us\n", noDelay ? "true" : "false",
                rate, latencies.size(), latencies[latencies.size() / 2] * 1e6,
                latencies[latencies.size() * 99 / 100] * 1e6);
}

} // namespace

int main(int argc, char** argv)
{
    const int rate = argc > 1 ? std::atoi(argv[1]) : 20000;
    const int seconds = argc > 2 ? std::atoi(argv[2]) : 3;
    mosquitto_lib_init();
    Run(false, rate, seconds);
    Run(true, rate, seconds);
    mosquitto_lib_cleanup();
    return 0;
}
