// Changes per second, publish-to-receive latency and memory per subscription
// of the real-time library, measured against a bare libmosquitto subscriber
// on the same broker in the same run.
//
// Changes per second: the subscriber is held (its receiving thread blocks in
// the first change) while a raw publisher sends N value messages over 100
// variables at full speed; the broker queues them (max_queued_messages 0
// lifts its limit, so none is dropped). Then the subscriber is let go and
// the time until the last change arrives gives its rate: what the subscriber
// can take, not what the publisher can send.
//
// Latency: the publisher sends the changes of one variable at a fixed rate;
// each carries its sequence number, and the receiver looks up when it was
// sent (steady clock, the same process). Median and 99th percentile.
//
// Memory: resident set before and after 10,000 subscriptions to distinct
// variables, each with a retained value, once all have delivered it.
//
// Usage: bench_realtime_throughput [changes] [latency rate per second] [latency seconds]

#include "network/RealTimeTestSupport.h"

#include "network/protocol/Catalogue.h"
#include "network/protocol/ProcessState.h"
#include "network/protocol/Topics.h"
#include "network/protocol/ValueMessage.h"

#include <algorithm>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <mutex>
#include <thread>
#include <unistd.h>

namespace {

namespace rt = qv::network::realtime;
namespace proto = qv::network::protocol;
using qv::value::VarData;
using Clock = std::chrono::steady_clock;
using namespace std::chrono_literals;

constexpr const char* kProcess = "bench";
/// Variables 0 to 99 take the changes at full speed, 100 those at a fixed rate.
constexpr std::size_t kVariables = 100;
constexpr std::size_t kLatencyVariable = kVariables;

std::string VariableName(std::size_t index)
{
    return "v" + std::to_string(index);
}

std::string ValueTopic(const std::string& path)
{
    return proto::NamedTopic(kProcess, proto::TopicKind::Value, path);
}

std::string ValuePayload(double number)
{
    proto::ValueMessage message;
    message.value = VarData::MakeNumeric(number);
    message.time = {0, 3786912000};
    return proto::EncodeValueMessage(message);
}

/// What both kinds of subscriber record: a count of changes, optionally
/// the arrival time of each sequence number, and a gate that holds the
/// receiving thread.
class Tally {
public:
    void Arrived(double number)
    {
        std::unique_lock lock(mutex_);
        changed_.wait(lock, [&] { return open_; });
        if (!arrivals_.empty() && number >= 0 && number < static_cast<double>(arrivals_.size()))
            arrivals_[static_cast<std::size_t>(number)] = Clock::now();
        if (++count_ >= target_) {
            last_ = Clock::now();
            changed_.notify_all();
        }
    }
    /// Starts counting afresh towards `target`; with `timed`, arrival times
    /// of sequence numbers 0 to target - 1 are kept.
    void Reset(std::size_t target, bool timed)
    {
        std::lock_guard lock(mutex_);
        count_ = 0;
        target_ = target;
        arrivals_.assign(timed ? target : 0, Clock::time_point{});
    }
    void Hold(bool held)
    {
        std::lock_guard lock(mutex_);
        open_ = !held;
        changed_.notify_all();
    }
    /// Waits for the target; the moment it was reached, or nothing.
    std::optional<Clock::time_point> Wait(std::chrono::seconds timeout)
    {
        std::unique_lock lock(mutex_);
        if (!changed_.wait_for(lock, timeout, [&] { return count_ >= target_; }))
            return std::nullopt;
        return last_;
    }
    std::size_t Count()
    {
        std::lock_guard lock(mutex_);
        return count_;
    }
    std::vector<Clock::time_point> Arrivals()
    {
        std::lock_guard lock(mutex_);
        return arrivals_;
    }

private:
    std::mutex mutex_;
    std::condition_variable changed_;
    bool open_ = true;
    std::size_t count_ = 0;
    std::size_t target_ = 0;
    Clock::time_point last_;
    std::vector<Clock::time_point> arrivals_;
};

class TallyReceiver final : public rt::IOrvekRealTimeReceiver3 {
public:
    explicit TallyReceiver(Tally& tally) : tally_(tally) {}
    std::int32_t QueryInterface(const rt::Guid&, void** out) override
    {
        *out = nullptr;
        return static_cast<std::int32_t>(0x80004002u);
    }
    std::uint32_t AddRef() override { return 2; } // lives on the stack
    std::uint32_t Release() override { return 1; }
    void Notification3() override {}
    void Notification4() override {}
    void Notification5() override {}
    void Notification6() override {}
    void OnDataChange(std::int32_t, std::uint32_t, const VarData* value, std::uint64_t quality, std::int32_t,
                      const qv::fen::AbsTime*) override
    {
        if (quality == 0)
            tally_.Arrived(value->ToDouble());
    }

private:
    Tally& tally_;
};

/// The two subscribers under comparison, each on its own connection.
class Subscriber {
public:
    virtual ~Subscriber() = default;
    virtual const char* Name() const = 0;
    virtual void Subscribe(const std::vector<std::string>& paths) = 0;
    Tally tally;
};

class RealTimeSubscriber final : public Subscriber {
public:
    RealTimeSubscriber() { rt::NewOrvekRealTime(nullptr, &receiver_, &realTime_); }
    ~RealTimeSubscriber() override
    {
        for (auto* subscription : subscriptions_)
            subscription->Release();
        realTime_->Release();
    }
    const char* Name() const override { return "network/realtime"; }
    void Subscribe(const std::vector<std::string>& paths) override
    {
        for (const std::string& path : paths) {
            std::u16string url = u"\\\\localhost\\bench\\";
            url.append(path.begin(), path.end());
            rt::ISubscription* subscription = nullptr;
            realTime_->Subscribe(url.c_str(), static_cast<std::int32_t>(subscriptions_.size()), nullptr,
                                 &subscription);
            subscriptions_.push_back(subscription);
        }
    }

private:
    TallyReceiver receiver_{tally};
    rt::IOrvekRealTime* realTime_ = nullptr;
    std::vector<rt::ISubscription*> subscriptions_;
};

/// Takes each message's number straight from the payload, no JSON decoding.
class BareSubscriber final : public Subscriber {
public:
    explicit BareSubscriber(std::uint16_t port)
    {
        handle_ = mosquitto_new(nullptr, true, this);
        mosquitto_int_option(handle_, MOSQ_OPT_TCP_NODELAY, 1);
        mosquitto_message_callback_set(handle_, [](mosquitto*, void* self, const mosquitto_message* message) {
            const auto* text = static_cast<const char*>(message->payload);
            const std::string_view payload(text, static_cast<std::size_t>(message->payloadlen));
            const auto at = payload.find("\"n\":");
            if (at != std::string_view::npos)
                static_cast<BareSubscriber*>(self)->tally.Arrived(std::strtod(text + at + 4, nullptr));
        });
        mosquitto_connect(handle_, "127.0.0.1", port, 10);
        mosquitto_loop_start(handle_);
    }
    ~BareSubscriber() override
    {
        mosquitto_disconnect(handle_);
        mosquitto_loop_stop(handle_, false);
        mosquitto_destroy(handle_);
    }
    const char* Name() const override { return "bare libmosquitto"; }
    void Subscribe(const std::vector<std::string>& paths) override
    {
        for (const std::string& path : paths)
            mosquitto_subscribe(handle_, nullptr, ValueTopic(path).c_str(), 0);
    }

private:
    mosquitto* handle_;
};

/// The process "bench" with `count` numeric variables, published raw.
void PublishProcess(qv::test::RawClient& publisher, std::size_t count)
{
    proto::Catalogue catalogue;
    for (std::size_t i = 0; i < count; ++i)
        catalogue.variables.push_back({VariableName(i), 3, 0, 1});
    publisher.Publish(proto::ProcessTopic(kProcess, proto::TopicKind::Catalogue), proto::EncodeCatalogue(catalogue));
    for (std::size_t i = 0; i < count; ++i)
        publisher.Publish(ValueTopic(VariableName(i)), ValuePayload(-1.0));
    publisher.Publish(proto::ProcessTopic(kProcess, proto::TopicKind::State), proto::EncodeProcessState({}));
}

/// Sends QoS 0 messages quickly from its own raw connection.
class FastPublisher {
public:
    explicit FastPublisher(std::uint16_t port)
    {
        handle_ = mosquitto_new(nullptr, true, this);
        mosquitto_int_option(handle_, MOSQ_OPT_TCP_NODELAY, 1);
        mosquitto_publish_callback_set(handle_, [](mosquitto*, void* self, int) {
            auto* publisher = static_cast<FastPublisher*>(self);
            std::lock_guard lock(publisher->mutex_);
            publisher->acknowledged_ = true;
            publisher->changed_.notify_all();
        });
        mosquitto_connect(handle_, "127.0.0.1", port, 10);
        mosquitto_loop_start(handle_);
    }
    ~FastPublisher()
    {
        mosquitto_disconnect(handle_);
        mosquitto_loop_stop(handle_, false);
        mosquitto_destroy(handle_);
    }
    void Send(const std::string& topic, const std::string& payload)
    {
        mosquitto_publish(handle_, nullptr, topic.c_str(), static_cast<int>(payload.size()), payload.data(), 0, true);
    }
    /// Returns once the broker has taken everything sent so far: it handles
    /// one client's packets in order, so the acknowledgement of a QoS 1
    /// message comes after every message before it has been routed.
    void Flush()
    {
        std::unique_lock lock(mutex_);
        acknowledged_ = false;
        mosquitto_publish(handle_, nullptr, "bench/flushed", 1, "1", 1, false);
        changed_.wait_for(lock, 30s, [&] { return acknowledged_; });
    }

private:
    mosquitto* handle_;
    std::mutex mutex_;
    std::condition_variable changed_;
    bool acknowledged_ = false;
};

double ChangesPerSecond(Subscriber& subscriber, std::uint16_t port, const std::vector<std::string>& topics, const std::vector<std::string>& payloads)
{
    const std::size_t variables = topics.size();
    std::vector<std::string> paths;
    for (std::size_t i = 0; i < variables; ++i)
        paths.push_back(VariableName(i));
    subscriber.tally.Reset(variables, false);
    subscriber.Subscribe(paths);
    if (!subscriber.tally.Wait(10s)) {
        std::printf("%s: the first values did not arrive\n", subscriber.Name());
        return 0;
    }

    subscriber.tally.Reset(payloads.size(), false);
    subscriber.tally.Hold(true);
    FastPublisher publisher(port);
    for (std::size_t i = 0; i < payloads.size(); ++i)
        publisher.Send(topics[i % variables], payloads[i]);
    publisher.Flush();
    const auto start = Clock::now();
    subscriber.tally.Hold(false);
    const auto end = subscriber.tally.Wait(30s);
    if (!end) {
        std::printf("%s: only %zu of %zu changes arrived\n", subscriber.Name(), subscriber.tally.Count(),
                    payloads.size());
        return 0;
    }
    return static_cast<double>(payloads.size()) / std::chrono::duration<double>(*end - start).count();
}

struct Latency {
    double median = 0;
    double p99 = 0;
    std::size_t received = 0;
};

Latency MeasureLatency(Subscriber& subscriber, std::uint16_t port, int rate, int seconds)
{
    const std::string path = VariableName(kLatencyVariable);
    subscriber.tally.Reset(1, false);
    subscriber.Subscribe({path});
    subscriber.tally.Wait(10s);

    const std::size_t count = static_cast<std::size_t>(rate) * static_cast<std::size_t>(seconds);
    std::vector<std::string> payloads;
    for (std::size_t i = 0; i < count; ++i)
        payloads.push_back(ValuePayload(static_cast<double>(i)));
    std::vector<Clock::time_point> sent(count);
    subscriber.tally.Reset(count, true);
    {
        FastPublisher publisher(port);
        const std::string topic = ValueTopic(path);
        const auto interval = std::chrono::nanoseconds(1'000'000'000 / rate);
        auto next = Clock::now();
        for (std::size_t i = 0; i < count; ++i) {
            while (Clock::now() < next) {
            }
            sent[i] = Clock::now();
            publisher.Send(topic, payloads[i]);
            next += interval;
        }
        subscriber.tally.Wait(5s);
    }
    const auto arrivals = subscriber.tally.Arrivals();
    std::vector<double> latencies;
    for (std::size_t i = 0; i < count; ++i)
        if (arrivals[i] != Clock::time_point{})
            latencies.push_back(std::chrono::duration<double, std::micro>(arrivals[i] - sent[i]).count());
    Latency result;
    result.received = latencies.size();
    if (latencies.empty())
        return result;
    std::sort(latencies.begin(), latencies.end());
    result.median = latencies[latencies.size() / 2];
    result.p99 = latencies[latencies.size() * 99 / 100];
    return result;
}

long ResidentBytes()
{
    std::ifstream statm("/proc/self/statm");
    long size = 0;
    long resident = 0;
    statm >> size >> resident;
    return resident * sysconf(_SC_PAGESIZE);
}

double BytesPerSubscription(qv::test::RawClient& publisher, std::size_t count)
{
    const std::size_t offset = 1000; // clear of the variables of the rate runs
    proto::Catalogue catalogue;
    for (std::size_t i = 0; i < offset + count; ++i)
        catalogue.variables.push_back({VariableName(i), 3, 0, 1});
    publisher.Publish(proto::ProcessTopic(kProcess, proto::TopicKind::Catalogue), proto::EncodeCatalogue(catalogue));
    for (std::size_t i = offset; i < offset + count; ++i)
        publisher.Publish(ValueTopic(VariableName(i)), ValuePayload(static_cast<double>(i)));

    std::vector<std::string> paths;
    for (std::size_t i = offset; i < offset + count; ++i)
        paths.push_back(VariableName(i));
    const long before = ResidentBytes();
    RealTimeSubscriber subscriber;
    subscriber.tally.Reset(count, false);
    subscriber.Subscribe(paths);
    if (!subscriber.tally.Wait(30s)) {
        std::printf("memory: only %zu of %zu subscriptions delivered their value\n", subscriber.tally.Count(), count);
        return 0;
    }
    return static_cast<double>(ResidentBytes() - before) / static_cast<double>(count);
}

} // namespace

int main(int argc, char** argv)
{
    const std::size_t changes = argc > 1 ? std::strtoul(argv[1], nullptr, 10) : 200000;
    const int rate = argc > 2 ? std::atoi(argv[2]) : 5000;
    const int seconds = argc > 3 ? std::atoi(argv[3]) : 2;
    if (changes == 0 || rate <= 0 || seconds <= 0) {
        std::fprintf(stderr, "usage: bench_realtime_throughput [changes] [latency rate per second] [latency seconds]\n");
        return 2;
    }
    constexpr std::size_t kMemorySubscriptions = 10000;

    mosquitto_lib_init();
    qv::test::TemporaryHome home;
    qv::test::TestBrokerOptions options;
    // Quiet and unlimited: the broker must neither log each message nor drop
    // QoS 0 messages queued for a held subscriber.
    options.extraConfig = "log_type none\nlog_type error\nmax_queued_messages 0\n";
    qv::test::TestBroker broker(options);
    qv::test::SetDataPort(broker.Port());
    qv::test::RawClient control(broker.Port());
    PublishProcess(control, kVariables + 1);

    std::vector<std::string> topics;
    for (std::size_t i = 0; i < kVariables; ++i)
        topics.push_back(ValueTopic(VariableName(i)));
    std::vector<std::string> payloads;
    for (std::size_t i = 0; i < changes; ++i)
        payloads.push_back(ValuePayload(static_cast<double>(i)));

    std::printf("changes per second, %zu changes over %zu variables:\n", changes, kVariables);
    double realTimeRate = 0;
    double bareRate = 0;
    {
        RealTimeSubscriber subscriber;
        realTimeRate = ChangesPerSecond(subscriber, broker.Port(), topics, payloads);
    }
    {
        BareSubscriber subscriber(broker.Port());
        bareRate = ChangesPerSecond(subscriber, broker.Port(), topics, payloads);
    }
    std::printf("  network/realtime   %10.0f /s\n  bare libmosquitto  %10.0f /s\n  ratio              %10.2f\n",
                realTimeRate, bareRate, bareRate > 0 ? realTimeRate / bareRate : 0.0);

    std::printf("latency, %d changes per second for %d s:\n", rate, seconds);
    Latency realTimeLatency;
    Latency bareLatency;
    {
        RealTimeSubscriber subscriber;
        realTimeLatency = MeasureLatency(subscriber, broker.Port(), rate, seconds);
    }
    {
        BareSubscriber subscriber(broker.Port());
        bareLatency = MeasureLatency(subscriber, broker.Port(), rate, seconds);
    }
    for (const auto& [name, latency] : {std::pair{"network/realtime ", realTimeLatency},
                                        std::pair{"bare libmosquitto", bareLatency}})
        std::printf("  %s  median %7.1f us  p99 %7.1f us  (%zu received)\n", name, latency.median, latency.p99,
                    latency.received);
    if (bareLatency.median > 0)
        std::printf("  ratio              median %7.2f      p99 %7.2f\n", realTimeLatency.median / bareLatency.median,
                    realTimeLatency.p99 / bareLatency.p99);

    const double perSubscription = BytesPerSubscription(control, kMemorySubscriptions);
    std::printf("memory: %.0f bytes resident per subscription (%zu subscriptions of distinct variables)\n",
                perSubscription, kMemorySubscriptions);
    mosquitto_lib_cleanup();
    return 0;
}
