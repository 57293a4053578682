#include "network/realtime/Connection.h"

#include "network/protocol/Catalogue.h"
#include "network/protocol/ProcessState.h"
#include "network/protocol/ProtocolError.h"
#include "network/protocol/Topics.h"
#include "network/protocol/ValueMessage.h"
#include "network/protocol/VarDataJson.h"
#include "network/protocol/WriteRequest.h"
#include "network/realtime/HostResolver.h"

#include <mosquitto.h>
#include <nlohmann/json.hpp>

#include <cerrno>
#include <chrono>
#include <condition_variable>
#include <map>
#include <optional>
#include <set>
#include <thread>
#include <unistd.h>
#include <vector>

namespace qv::network::realtime {
namespace {

namespace proto = protocol;
using Clock = std::chrono::steady_clock;

constexpr auto kMinPause = std::chrono::milliseconds(100);
constexpr auto kMaxPause = std::chrono::seconds(2);
constexpr int kKeepAliveSeconds = 10;
/// How long one turn of the network loop may wait; bounds how late the
/// thread notices that it should stop or that the login changed.
constexpr int kLoopTimeoutMs = 100;
constexpr auto kLoginCheckInterval = std::chrono::milliseconds(250);

/// An UNSUBSCRIBE of a topic no one uses. The broker handles a client's
/// packets in order, so its UNSUBACK arrives only after every retained
/// message of the SUBSCRIBEs sent before it.
constexpr const char* kBarrierTopic = "orvek/v1/%/sync";

std::atomic<std::uint64_t> g_clientCounter{0};

/// Subscriptions use QoS 0: QoS 1 messages can be held back by the broker's
/// in-flight window while the UNSUBACK barrier is not, and a message lost
/// with its connection is fetched again (retained) after the reconnect.
constexpr int kSubscribeQos = 0;

struct Condition {
    std::uint64_t quality = QualityBits::Connecting;
    std::int32_t error = 0;
};

/// What a subscription is to show.
struct Outcome {
    value::VarData value;
    std::uint64_t quality = 0;
    std::int32_t error = 0;
    fen::AbsTime time = fen::AbsTime::Earliest();
    /// The time is the moment of evaluation, not the value's: it does not by
    /// itself make a change.
    bool timeIsNow = false;
    /// Keep the last value and time delivered, with new quality and error.
    bool keepLast = false;
};

std::string ValueKey(const value::VarData& value)
{
    try {
        return proto::VarDataToJson(value).dump();
    } catch (...) {
        return std::string();
    }
}

} // namespace

void ReceiverLink::Deliver(std::int32_t handle, std::uint32_t mask, const value::VarData& value,
                           std::uint64_t quality, std::int32_t error, const fen::AbsTime& time) noexcept
{
    if (!open_)
        return;
    try {
        receiver_->OnDataChange(handle, mask, &value, quality, error, &time);
    } catch (...) {
        // The receiver's failure must not reach the broker's thread.
    }
}

fen::AbsTime CurrentTime() noexcept
{
    const auto since = std::chrono::system_clock::now().time_since_epoch();
    const auto seconds = std::chrono::floor<std::chrono::seconds>(since);
    const auto nanoseconds = std::chrono::duration_cast<std::chrono::nanoseconds>(since - seconds).count();
    fen::AbsTime time;
    time.seconds = seconds.count() + fen::kUnixEpochOffset;
    time.fraction = static_cast<std::uint64_t>((static_cast<unsigned __int128>(nanoseconds) << 64) / 1000000000u);
    return time;
}

struct Connection::State {
    struct Sub {
        std::int32_t handle = 0;
        std::string process;
        std::string path;
        std::string valueTopic;
        /// The barrier whose answer makes the subscription ready; 0 for none.
        int barrier = 0;
        bool ready = false;
        bool delivered = false;
        value::VarData lastValue;
        std::string lastValueKey;
        std::uint64_t lastQuality = 0;
        std::int32_t lastError = 0;
        fen::AbsTime lastTime = fen::AbsTime::Earliest();
    };
    /// What the process's catalogue says of one variable.
    struct Listed {
        std::uint32_t access = 0;
        /// The process has published a value, which the value topic retains.
        bool valued = false;
    };
    struct Process {
        int refs = 0;
        std::optional<proto::RunState> state;
        std::optional<std::map<std::string, Listed>> catalogue; ///< by path
        bool malformed = false;
        bool denied = false;
    };
    struct Topic {
        int refs = 0;
        std::optional<proto::ValueMessage> message;
        std::string valueKey;
        bool malformed = false;
        bool denied = false;
    };
    struct Delivery {
        std::int32_t handle;
        std::uint32_t mask;
        value::VarData value;
        std::uint64_t quality;
        std::int32_t error;
        fen::AbsTime time;
    };

    std::string host;
    std::uint16_t port = 0;
    session::IOrvekSession* session = nullptr;
    std::shared_ptr<ReceiverLink> receiver;
    std::string clientId;
    mosquitto* handle = nullptr;
    std::thread thread;

    std::mutex mutex;
    std::condition_variable wake;
    bool stopping = false;
    bool connected = false;
    /// Subscriptions added while not connected, still to be told the condition.
    bool freshPending = false;
    Condition condition;
    session::SessionCredentials credentials;
    std::uint64_t nextSubId = 1;
    std::uint64_t nextWriteId = 1;
    std::map<std::uint64_t, Sub> subs;
    std::map<std::string, Process> processes;
    std::map<std::string, Topic> topics;
    /// Barrier mid to the subscriptions it makes ready.
    std::map<int, std::vector<std::uint64_t>> barriers;
    /// SUBSCRIBE mid to its topics, to find refusals in the SUBACK.
    std::map<int, std::vector<std::string>> pendingSubscribes;
    std::vector<Delivery> deliveries;

    // Everything below runs with `mutex` held.

    Outcome Evaluate(const Sub& sub) const
    {
        Outcome outcome;
        if (!connected || !sub.ready) {
            outcome.quality = condition.quality;
            outcome.error = condition.error;
            outcome.keepLast = true;
            outcome.timeIsNow = true;
            return outcome;
        }
        const Process& process = processes.at(sub.process);
        const Topic& topic = topics.at(sub.valueTopic);
        auto none = [&](std::uint64_t quality, std::int32_t error) {
            outcome.quality = quality;
            outcome.error = error;
            outcome.timeIsNow = true;
            return outcome;
        };
        auto withValue = [&](std::uint64_t quality, std::int32_t error) {
            if (topic.message) {
                outcome.value = topic.message->value;
                outcome.time = topic.message->time;
            } else {
                outcome.keepLast = true;
            }
            outcome.quality = quality;
            outcome.error = error;
            return outcome;
        };
        if (process.denied || topic.denied)
            return none(QualityBits::AccessDenied, ErrorCodes::AccessDenied);
        if (process.malformed || topic.malformed)
            return withValue(QualityBits::SubscriptionFailure, ErrorCodes::ProtocolViolation);
        if (!process.state)
            return none(QualityBits::Nonexistant, ErrorCodes::NoSuchVariable);
        if (*process.state != proto::RunState::Running)
            return withValue(QualityBits::ProcessFailure, ErrorCodes::ProcessFailed);
        if (!process.catalogue)
            return none(QualityBits::Nonexistant, ErrorCodes::NoSuchVariable);
        const auto entry = process.catalogue->find(sub.path);
        if (entry == process.catalogue->end())
            return none(QualityBits::Nonexistant, ErrorCodes::NoSuchVariable);
        if ((entry->second.access & proto::Access::Read) == 0)
            return none(QualityBits::AccessDenied, ErrorCodes::AccessDenied);
        if (!topic.message) {
            // The process publishes a value ahead of the catalogue that calls
            // the variable valued, so once the retained messages are in (the
            // subscription is ready) a missing value is one the broker
            // withholds: its access-control list grants the subscription
            // but does not let the value through.
            if (entry->second.valued)
                return none(QualityBits::AccessDenied, ErrorCodes::AccessDenied);
            return none(QualityBits::NoKnownValue, 0);
        }
        outcome.value = topic.message->value;
        outcome.quality = topic.message->quality;
        outcome.error = topic.message->error;
        outcome.time = topic.message->time;
        return outcome;
    }

    /// Queues the change from what `sub` showed last to `outcome`, if any.
    void Update(Sub& sub, Outcome outcome)
    {
        std::string key;
        if (outcome.keepLast && sub.delivered) {
            outcome.value = sub.lastValue;
            outcome.time = sub.lastTime;
            outcome.timeIsNow = false;
            key = sub.lastValueKey;
        } else {
            key = ValueKey(outcome.value);
        }
        if (outcome.timeIsNow)
            outcome.time = sub.delivered && key == sub.lastValueKey ? sub.lastTime : CurrentTime();
        std::uint32_t mask = ChangeMask::All;
        if (sub.delivered) {
            mask = 0;
            if (key != sub.lastValueKey)
                mask |= ChangeMask::Value;
            if (outcome.time != sub.lastTime)
                mask |= ChangeMask::Timestamp;
            if (outcome.quality != sub.lastQuality || outcome.error != sub.lastError)
                mask |= ChangeMask::QualityOrError | ChangeMask::QualityOrError2;
            if (mask == 0)
                return;
        }
        sub.delivered = true;
        sub.lastValue = outcome.value;
        sub.lastValueKey = std::move(key);
        sub.lastQuality = outcome.quality;
        sub.lastError = outcome.error;
        sub.lastTime = outcome.time;
        deliveries.push_back({sub.handle, mask, std::move(outcome.value), outcome.quality, outcome.error,
                              outcome.time});
    }

    void UpdateAll()
    {
        for (auto& [id, sub] : subs)
            Update(sub, Evaluate(sub));
    }

    template <typename Predicate>
    void UpdateReady(Predicate matches)
    {
        for (auto& [id, sub] : subs) {
            if (sub.ready && matches(sub))
                Update(sub, Evaluate(sub));
        }
    }

    void SetCondition(std::uint64_t quality, std::int32_t error)
    {
        condition = {quality, error};
        UpdateAll();
    }

    /// Sends SUBSCRIBE for `names` and a barrier that makes `ids` ready.
    void SendSubscribe(const std::vector<std::string>& names, const std::vector<std::uint64_t>& ids)
    {
        if (!names.empty()) {
            std::vector<char*> filters;
            for (const auto& name : names)
                filters.push_back(const_cast<char*>(name.c_str()));
            int mid = 0;
            if (mosquitto_subscribe_multiple(handle, &mid, static_cast<int>(filters.size()), filters.data(),
                                             kSubscribeQos, 0, nullptr)
                != MOSQ_ERR_SUCCESS) {
                FailSubscriptions(ids);
                return;
            }
            pendingSubscribes[mid] = names;
        }
        int mid = 0;
        if (mosquitto_unsubscribe(handle, &mid, kBarrierTopic) != MOSQ_ERR_SUCCESS) {
            FailSubscriptions(ids);
            return;
        }
        barriers[mid] = ids;
        for (const auto id : ids)
            subs.at(id).barrier = mid;
    }

    void FailSubscriptions(const std::vector<std::uint64_t>& ids)
    {
        for (const auto id : ids) {
            Outcome outcome;
            outcome.quality = QualityBits::SubscriptionFailure;
            outcome.error = ErrorCodes::SubscriptionFailed;
            outcome.keepLast = true;
            outcome.timeIsNow = true;
            Update(subs.at(id), outcome);
        }
    }

    /// Subscribes everything again on a new connection.
    void Resubscribe()
    {
        barriers.clear();
        pendingSubscribes.clear();
        std::vector<std::string> names;
        for (auto& [name, process] : processes) {
            const int refs = process.refs;
            process = Process{};
            process.refs = refs;
            names.push_back(proto::ProcessTopic(name, proto::TopicKind::State));
            names.push_back(proto::ProcessTopic(name, proto::TopicKind::Catalogue));
        }
        for (auto& [name, topic] : topics) {
            const int refs = topic.refs;
            topic = Topic{};
            topic.refs = refs;
            names.push_back(name);
        }
        std::vector<std::uint64_t> ids;
        for (auto& [id, sub] : subs) {
            sub.ready = false;
            ids.push_back(id);
        }
        if (!ids.empty())
            SendSubscribe(names, ids);
    }

    void OnMessage(const mosquitto_message& message)
    {
        proto::ParsedTopic parsed;
        try {
            parsed = proto::ParseTopic(message.topic);
        } catch (...) {
            return;
        }
        const std::string_view payload(static_cast<const char*>(message.payload),
                                       message.payload == nullptr ? 0 : static_cast<std::size_t>(message.payloadlen));
        if (parsed.kind == proto::TopicKind::Value) {
            auto found = topics.find(message.topic);
            if (found == topics.end())
                return;
            Topic& topic = found->second;
            topic.malformed = false;
            topic.message.reset();
            if (!payload.empty()) {
                try {
                    topic.message = proto::DecodeValueMessage(payload);
                } catch (...) {
                    topic.malformed = true;
                }
            }
            const std::string& name = found->first;
            UpdateReady([&](const Sub& sub) { return sub.valueTopic == name; });
            return;
        }
        auto found = processes.find(parsed.process);
        if (found == processes.end())
            return;
        Process& process = found->second;
        if (parsed.kind == proto::TopicKind::State) {
            process.state.reset();
            if (!payload.empty()) {
                try {
                    process.state = proto::DecodeProcessState(payload).state;
                } catch (...) {
                    // A state that cannot be read is a process that cannot be trusted.
                    process.state = proto::RunState::Failed;
                }
            }
        } else if (parsed.kind == proto::TopicKind::Catalogue) {
            process.catalogue.reset();
            process.malformed = false;
            if (!payload.empty()) {
                try {
                    std::map<std::string, Listed> variables;
                    for (const auto& variable : proto::DecodeCatalogue(payload).variables)
                        variables.emplace(variable.path, Listed{variable.access, variable.valued});
                    process.catalogue = std::move(variables);
                } catch (...) {
                    process.malformed = true;
                }
            }
        } else {
            return;
        }
        const std::string& name = found->first;
        UpdateReady([&](const Sub& sub) { return sub.process == name; });
    }

    void OnSubscribed(int mid, int count, const int* granted)
    {
        const auto found = pendingSubscribes.find(mid);
        if (found == pendingSubscribes.end())
            return;
        const auto names = std::move(found->second);
        pendingSubscribes.erase(found);
        for (int i = 0; i < count && i < static_cast<int>(names.size()); ++i) {
            if (granted[i] < 0x80)
                continue;
            if (auto topic = topics.find(names[i]); topic != topics.end()) {
                topic->second.denied = true;
                continue;
            }
            try {
                const auto parsed = proto::ParseTopic(names[i]);
                if (auto process = processes.find(parsed.process); process != processes.end())
                    process->second.denied = true;
            } catch (...) {
            }
        }
    }

    void OnBarrier(int mid)
    {
        const auto found = barriers.find(mid);
        if (found == barriers.end())
            return;
        const auto ids = std::move(found->second);
        barriers.erase(found);
        for (const auto id : ids) {
            const auto sub = subs.find(id);
            if (sub == subs.end() || sub->second.barrier != mid)
                continue;
            sub->second.barrier = 0;
            sub->second.ready = true;
            Update(sub->second, Evaluate(sub->second));
        }
    }

    /// Hands the queued changes to the receiver, outside `mutex`.
    void Flush(std::unique_lock<std::mutex>& lock)
    {
        if (deliveries.empty())
            return;
        std::vector<Delivery> batch;
        batch.swap(deliveries);
        lock.unlock();
        for (const auto& delivery : batch)
            receiver->Deliver(delivery.handle, delivery.mask, delivery.value, delivery.quality, delivery.error,
                              delivery.time);
        lock.lock();
    }

    /// Tells subscriptions added while not connected what the condition is.
    /// Once the connection is up they wait for their barrier instead: the
    /// condition of a connection is then "good", which says nothing yet about
    /// the variable.
    void TellFresh()
    {
        if (!freshPending)
            return;
        freshPending = false;
        if (connected)
            return;
        for (auto& [id, sub] : subs) {
            if (!sub.delivered)
                Update(sub, Evaluate(sub));
        }
    }
};

struct Connection::Callbacks {
    static void OnConnect(mosquitto*, void* context, int code) noexcept
    {
        auto* state = static_cast<State*>(context);
        try {
            std::lock_guard lock(state->mutex);
            if (code != 0) {
                // 4: bad user name or password; 5: not authorised.
                if (code == 4 || code == 5)
                    state->SetCondition(QualityBits::AccessDenied, ErrorCodes::AccessDenied);
                else
                    state->SetCondition(QualityBits::SubscriptionFailure, ErrorCodes::SubscriptionFailed);
                return;
            }
            state->connected = true;
            state->condition = {0, 0};
            state->Resubscribe();
        } catch (...) {
        }
    }

    static void OnMessage(mosquitto*, void* context, const mosquitto_message* message) noexcept
    {
        auto* state = static_cast<State*>(context);
        try {
            std::lock_guard lock(state->mutex);
            state->OnMessage(*message);
        } catch (...) {
        }
    }

    static void OnSubscribe(mosquitto*, void* context, int mid, int count, const int* granted) noexcept
    {
        auto* state = static_cast<State*>(context);
        try {
            std::lock_guard lock(state->mutex);
            state->OnSubscribed(mid, count, granted);
        } catch (...) {
        }
    }

    static void OnUnsubscribe(mosquitto*, void* context, int mid) noexcept
    {
        auto* state = static_cast<State*>(context);
        try {
            std::lock_guard lock(state->mutex);
            state->OnBarrier(mid);
        } catch (...) {
        }
    }
};

Connection::Connection(std::string host, std::uint16_t port, session::IOrvekSession* session,
                       std::shared_ptr<ReceiverLink> receiver)
    : state_(std::make_unique<State>())
{
    state_->host = std::move(host);
    state_->port = port;
    state_->session = session;
    if (session != nullptr)
        session->AddRef();
    state_->receiver = std::move(receiver);
    state_->clientId = "varoscope-" + std::to_string(getpid()) + "-" + std::to_string(++g_clientCounter);
}

Connection::~Connection()
{
    if (state_->handle != nullptr)
        mosquitto_destroy(state_->handle);
    if (state_->session != nullptr)
        state_->session->Release();
}

void Connection::Start()
{
    State& state = *state_;
    state.handle = mosquitto_new(state.clientId.c_str(), true, &state);
    if (state.handle == nullptr)
        throw std::bad_alloc();
    mosquitto_int_option(state.handle, MOSQ_OPT_PROTOCOL_VERSION, MQTT_PROTOCOL_V311);
    mosquitto_int_option(state.handle, MOSQ_OPT_TCP_NODELAY, 1);
    mosquitto_threaded_set(state.handle, true);
    mosquitto_connect_callback_set(state.handle, &Callbacks::OnConnect);
    mosquitto_message_callback_set(state.handle, &Callbacks::OnMessage);
    mosquitto_subscribe_callback_set(state.handle, &Callbacks::OnSubscribe);
    mosquitto_unsubscribe_callback_set(state.handle, &Callbacks::OnUnsubscribe);
    state.thread = std::thread([self = shared_from_this()] { self->Run(); });
}

void Connection::Stop()
{
    {
        std::lock_guard lock(state_->mutex);
        state_->stopping = true;
    }
    state_->wake.notify_all();
    if (!state_->thread.joinable())
        return;
    if (state_->thread.get_id() == std::this_thread::get_id())
        state_->thread.detach();
    else
        state_->thread.join();
}

std::uint64_t Connection::AddSubscription(std::int32_t handle, const std::string& process, const std::string& path)
{
    State& state = *state_;
    std::lock_guard lock(state.mutex);
    const std::uint64_t id = state.nextSubId++;
    State::Sub sub;
    sub.handle = handle;
    sub.process = process;
    sub.path = path;
    sub.valueTopic = proto::NamedTopic(process, proto::TopicKind::Value, path);
    std::vector<std::string> names;
    if (state.processes[process].refs++ == 0) {
        names.push_back(proto::ProcessTopic(process, proto::TopicKind::State));
        names.push_back(proto::ProcessTopic(process, proto::TopicKind::Catalogue));
    }
    if (state.topics[sub.valueTopic].refs++ == 0)
        names.push_back(sub.valueTopic);
    state.subs.emplace(id, std::move(sub));
    if (state.connected) {
        state.SendSubscribe(names, {id});
    } else {
        state.freshPending = true;
        state.wake.notify_all();
    }
    return id;
}

void Connection::RemoveSubscription(std::uint64_t id)
{
    State& state = *state_;
    std::lock_guard lock(state.mutex);
    const auto found = state.subs.find(id);
    if (found == state.subs.end())
        return;
    const State::Sub sub = std::move(found->second);
    state.subs.erase(found);
    std::vector<std::string> names;
    if (auto topic = state.topics.find(sub.valueTopic); topic != state.topics.end() && --topic->second.refs == 0) {
        state.topics.erase(topic);
        names.push_back(sub.valueTopic);
    }
    if (auto process = state.processes.find(sub.process);
        process != state.processes.end() && --process->second.refs == 0) {
        state.processes.erase(process);
        names.push_back(proto::ProcessTopic(sub.process, proto::TopicKind::State));
        names.push_back(proto::ProcessTopic(sub.process, proto::TopicKind::Catalogue));
    }
    if (state.connected && !names.empty()) {
        std::vector<char*> filters;
        for (const auto& name : names)
            filters.push_back(const_cast<char*>(name.c_str()));
        mosquitto_unsubscribe_multiple(state.handle, nullptr, static_cast<int>(filters.size()), filters.data(),
                                       nullptr);
    }
}

std::int32_t Connection::Write(std::uint64_t id, const value::VarData& value)
{
    State& state = *state_;
    std::lock_guard lock(state.mutex);
    const auto found = state.subs.find(id);
    if (found == state.subs.end())
        return ErrorCodes::SubscriptionFailed;
    if (!state.connected)
        return ErrorCodes::ConnectionLost;
    std::string payload;
    try {
        proto::WriteRequest request;
        request.id = state.clientId + "-" + std::to_string(state.nextWriteId++);
        request.user = state.credentials.user;
        request.value = value;
        payload = proto::EncodeWriteRequest(request);
    } catch (...) {
        return ErrorCodes::SubscriptionFailed;
    }
    const std::string topic = proto::NamedTopic(found->second.process, proto::TopicKind::Write, found->second.path);
    const int rc = mosquitto_publish(state.handle, nullptr, topic.c_str(), static_cast<int>(payload.size()),
                                     payload.data(), 1, false);
    return rc == MOSQ_ERR_SUCCESS ? 0 : ErrorCodes::SubscriptionFailed;
}

void Connection::Run()
{
    State& state = *state_;
    Clock::duration pause = kMinPause;
    std::unique_lock lock(state.mutex);

    // Waits up to `duration`, telling new subscriptions the condition as
    // they come; false once the connection is to stop.
    auto wait = [&](Clock::duration duration) {
        const auto until = Clock::now() + duration;
        while (!state.stopping) {
            state.TellFresh();
            state.Flush(lock);
            if (state.stopping || Clock::now() >= until)
                break;
            state.wake.wait_until(lock, until, [&] { return state.stopping || state.freshPending; });
        }
        return !state.stopping;
    };
    auto failed = [&](std::uint64_t quality, std::int32_t error) {
        state.SetCondition(quality, error);
        state.Flush(lock);
        const bool go = wait(pause);
        pause = std::min<Clock::duration>(pause * 2, kMaxPause);
        return go;
    };

    while (!state.stopping) {
        if (state.condition.quality == QualityBits::Disconnected)
            state.SetCondition(QualityBits::Connecting, 0);
        state.TellFresh();
        state.Flush(lock);

        lock.unlock();
        const auto address = AddressOfHost(state.host);
        auto credentials = session::GetSessionCredentials(state.session);
        lock.lock();
        if (state.stopping)
            break;
        if (!address) {
            if (!failed(QualityBits::DnsFailure, ErrorCodes::HostNotFound))
                break;
            continue;
        }
        state.credentials = credentials;
        session::ApplyCredentials(state.handle, credentials);

        lock.unlock();
        errno = 0;
        const int rc = mosquitto_connect(state.handle, address->c_str(), state.port, kKeepAliveSeconds);
        const int error = errno;
        lock.lock();
        if (rc != MOSQ_ERR_SUCCESS) {
            std::uint64_t quality = QualityBits::SubscriptionFailure;
            std::int32_t code = ErrorCodes::SubscriptionFailed;
            if (rc == MOSQ_ERR_ERRNO && error == ECONNREFUSED) {
                quality = QualityBits::ServiceLookupFailure;
                code = ErrorCodes::ConnectionRefused;
            } else if (rc == MOSQ_ERR_ERRNO
                       && (error == EHOSTUNREACH || error == ENETUNREACH || error == ETIMEDOUT
                           || error == EHOSTDOWN)) {
                quality = QualityBits::HostUnreachable;
                code = ErrorCodes::HostUnreachable;
            }
            if (!failed(quality, code))
                break;
            continue;
        }

        auto lastLoginCheck = Clock::now();
        bool loginChanged = false;
        while (!state.stopping) {
            state.TellFresh();
            state.Flush(lock);
            lock.unlock();
            const int loop = mosquitto_loop(state.handle, kLoopTimeoutMs, 1);
            lock.lock();
            state.Flush(lock);
            if (loop != MOSQ_ERR_SUCCESS)
                break;
            if (state.connected && Clock::now() - lastLoginCheck >= kLoginCheckInterval) {
                lastLoginCheck = Clock::now();
                lock.unlock();
                loginChanged = session::GetSessionCredentials(state.session) != state.credentials;
                lock.lock();
                if (loginChanged) {
                    // Connect again, so that the new login goes with the connection.
                    mosquitto_disconnect(state.handle);
                    break;
                }
            }
        }
        if (state.stopping)
            break;
        if (state.connected) {
            state.connected = false;
            pause = kMinPause;
            if (loginChanged) {
                state.condition = {QualityBits::Connecting, 0};
                continue;
            }
            state.SetCondition(QualityBits::Disconnected, ErrorCodes::ConnectionLost);
            state.Flush(lock);
            if (!wait(pause))
                break;
        } else if (!wait(pause)) {
            break;
        }
        pause = std::min<Clock::duration>(pause * 2, kMaxPause);
    }

    const bool wasConnected = state.connected;
    state.connected = false;
    // The receiver goes with the real-time object, even while subscriptions live on.
    state.receiver.reset();
    lock.unlock();
    if (wasConnected) {
        mosquitto_disconnect(state.handle);
        for (int turn = 0; turn < 5 && mosquitto_loop(state.handle, 20, 1) == MOSQ_ERR_SUCCESS; ++turn) {
        }
    }
}

} // namespace qv::network::realtime
