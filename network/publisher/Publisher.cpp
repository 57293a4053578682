// The publisher: one MQTT connection per process, the process's variables
// and alarms, and the service of writes and acknowledgements.

#include "network/publisher/Publisher.h"

#include "fen/osdep/OrvekPort.h"
#include "network/protocol/AlarmAck.h"
#include "network/protocol/AlarmMessage.h"
#include "network/protocol/Catalogue.h"
#include "network/protocol/ProcessState.h"
#include "network/protocol/ProtocolError.h"
#include "network/protocol/TextCoding.h"
#include "network/protocol/Topics.h"
#include "network/protocol/ValueMessage.h"
#include "network/protocol/WriteRequest.h"
#include "network/protocol/WriteResult.h"
#include "network/publisher/WriteConversion.h"

#include <mosquitto.h>
#include <nlohmann/json.hpp>

#include <cerrno>
#include <condition_variable>
#include <cstring>
#include <ctime>
#include <map>
#include <mutex>
#include <vector>
#include <unistd.h>

namespace qv::network::publisher {

namespace proto = protocol;
using value::VarData;

namespace {

/// libmosquitto is initialised once per program and never cleaned up, since
/// other parts of the program may use it too.
void InitialiseMosquitto()
{
    static std::once_flag once;
    std::call_once(once, [] { mosquitto_lib_init(); });
}

[[noreturn]] void ThrowInvalid() { QV_THROW(fen::exception::InvalidArgument()); }

std::string CheckedPath(std::string_view path)
{
    if (!proto::IsValidUtf8(path))
        ThrowInvalid();
    try {
        if (proto::CanonicalVariablePath(path) != path)
            ThrowInvalid();
    } catch (const proto::ProtocolError&) {
        ThrowInvalid();
    }
    return std::string(path);
}

/// The request id of a write request that could not be decoded, when its
/// payload still is a JSON object with a string "id"; otherwise empty.
std::string SalvagedId(std::string_view payload)
{
    const nlohmann::json json = nlohmann::json::parse(payload, nullptr, false);
    if (json.is_object()) {
        const auto id = json.find("id");
        if (id != json.end() && id->is_string() && proto::IsValidUtf8(id->get_ref<const std::string&>()))
            return id->get<std::string>();
    }
    return {};
}

std::string StatusText(std::int32_t status)
{
    switch (status) {
    case proto::WriteStatus::Written: return "written";
    case proto::WriteStatus::NotWritable: return "the variable is not writable";
    case proto::WriteStatus::AccessDenied: return "the user may not write the variable";
    case proto::WriteStatus::NoSuchVariable: return "no such variable";
    case proto::WriteStatus::BadValue: return "the value does not suit the variable";
    case proto::WriteStatus::BadRequest: return "the request could not be read";
    default: return "the write failed";
    }
}

} // namespace

fen::AbsTime CurrentTime()
{
    timespec now{};
    ::clock_gettime(CLOCK_REALTIME, &now);
    return fen::AbsTimeFromUnixSeconds(now.tv_sec,
                                       fen::FractionOfSecond(static_cast<std::uint64_t>(now.tv_nsec), 1000000000u));
}

struct Publisher::Impl {
    struct Variable {
        std::uint16_t type = 0;
        std::uint8_t kind = 0;
        std::uint32_t access = proto::Access::Read;
        bool hasValue = false;
        proto::ValueMessage latest;
    };
    struct Alarm {
        proto::CatalogueAlarm definition;
        /// Whether it has been raised at least once, so that it has a state.
        bool hasState = false;
        proto::AlarmMessage state;
    };

    Impl(std::string processName, PublisherOptions publisherOptions)
        : process(std::move(processName)), options(std::move(publisherOptions))
    {
    }

    const std::string process;
    const PublisherOptions options;

    mutable std::mutex mutex;
    std::condition_variable changed;
    std::map<std::string, Variable, std::less<>> variables;
    std::map<std::string, Alarm, std::less<>> alarms;
    WriteHandler writeHandler;
    AckHandler ackHandler;

    mosquitto* client = nullptr;
    bool connected = false;
    /// Set once the subscriptions of the current connection are acknowledged
    /// and "running" is published.
    bool serving = false;
    std::vector<int> pendingSubscriptions;
    /// Set while Shutdown() takes the connection down, so that nothing is sent any more.
    bool stopping = false;
    /// The broker's answer to the latest connection attempt; -1 while none came.
    int connackCode = -1;
    /// The message id of the "stopped" state while Stop() waits for it; 0 otherwise.
    int stoppedMessageId = 0;
    bool stoppedDelivered = false;
    fen::AbsTime runningSince = fen::AbsTime::Earliest();

    // --- Sending; each of these is called with `mutex` held, so that what
    // the broker retains is always the latest that was recorded.

    int Send(const std::string& topic, const std::string& payload, int qos, bool retain)
    {
        if (!connected)
            return 0;
        int messageId = 0;
        mosquitto_publish(client, &messageId, topic.c_str(), static_cast<int>(payload.size()), payload.data(), qos,
                          retain);
        // A failure means the connection is going; the next connection sends everything again.
        return messageId;
    }

    void SendCatalogue()
    {
        // Not built while unconnected: the connection sends it once anyway,
        // and building it per declaration made declaring n variables O(n²).
        if (!connected)
            return;
        proto::Catalogue catalogue;
        for (const auto& [path, variable] : variables)
            catalogue.variables.push_back({path, variable.type, variable.kind, variable.access, variable.hasValue});
        for (const auto& [id, alarm] : alarms)
            catalogue.alarms.push_back(alarm.definition);
        Send(proto::ProcessTopic(process, proto::TopicKind::Catalogue), proto::EncodeCatalogue(catalogue), 1, true);
    }

    void SendValue(const std::string& path, const Variable& variable)
    {
        if (variable.hasValue)
            Send(proto::NamedTopic(process, proto::TopicKind::Value, path),
                 proto::EncodeValueMessage(variable.latest), options.valueQos, true);
    }

    void SendAlarm(const std::string& id, const Alarm& alarm)
    {
        if (alarm.hasState)
            Send(proto::NamedTopic(process, proto::TopicKind::Alarm, id), proto::EncodeAlarmMessage(alarm.state), 1,
                 true);
    }

    /// With `mutex` held, after the variable's value has been sent: a first
    /// value makes the catalogue call the variable valued. Sent after the
    /// value, so that the broker holds the value before the catalogue says so.
    void MarkValued(Variable& variable)
    {
        if (variable.hasValue)
            return;
        variable.hasValue = true;
        SendCatalogue();
    }

    int SendState(proto::RunState state)
    {
        proto::ProcessState message;
        message.state = state;
        message.pid = static_cast<std::int32_t>(::getpid());
        message.since = state == proto::RunState::Running ? runningSince : CurrentTime();
        return Send(proto::ProcessTopic(process, proto::TopicKind::State), proto::EncodeProcessState(message), 1, true);
    }

    /// Sends what the broker retains for this process; "running" follows
    /// once the write and acknowledge subscriptions are in place. The values
    /// go ahead of the catalogue, so that the broker never holds a catalogue
    /// that calls a variable valued without holding its value too.
    void SendEverything()
    {
        for (const auto& [path, variable] : variables)
            SendValue(path, variable);
        SendCatalogue();
        for (const auto& [id, alarm] : alarms)
            SendAlarm(id, alarm);
    }

    // --- Network thread.

    void OnConnect(int code)
    {
        std::lock_guard lock(mutex);
        connackCode = code;
        serving = false;
        pendingSubscriptions.clear();
        if (code == 0 && !stopping) {
            connected = true;
            for (proto::TopicKind kind : {proto::TopicKind::Write, proto::TopicKind::AlarmAck}) {
                int messageId = 0;
                if (mosquitto_subscribe(client, &messageId, proto::NamedTopicFilter(process, kind).c_str(), 1) ==
                    MOSQ_ERR_SUCCESS)
                    pendingSubscriptions.push_back(messageId);
            }
            SendEverything();
        }
        changed.notify_all();
    }

    void OnSubscribe(int messageId)
    {
        std::lock_guard lock(mutex);
        std::erase(pendingSubscriptions, messageId);
        if (connected && !serving && pendingSubscriptions.empty()) {
            serving = true;
            SendState(proto::RunState::Running);
            changed.notify_all();
        }
    }

    void OnDisconnect()
    {
        std::lock_guard lock(mutex);
        connected = false;
        serving = false;
        changed.notify_all();
    }

    void OnPublish(int messageId)
    {
        std::lock_guard lock(mutex);
        if (messageId != 0 && messageId == stoppedMessageId) {
            stoppedDelivered = true;
            changed.notify_all();
        }
    }

    void OnMessage(const mosquitto_message& message)
    {
        if (message.topic == nullptr)
            return;
        proto::ParsedTopic topic;
        try {
            topic = proto::ParseTopic(message.topic);
        } catch (const proto::ProtocolError&) {
            return; // not a topic of ours: nobody to answer
        }
        // Requests are sent unretained; one the broker kept as retained would
        // otherwise be carried out again on every connection.
        if (topic.process != process || message.retain)
            return;
        const std::string_view payload(static_cast<const char*>(message.payload),
                                       message.payload == nullptr ? 0 : static_cast<std::size_t>(message.payloadlen));
        if (topic.kind == proto::TopicKind::Write)
            ServeWrite(topic.name, payload);
        else if (topic.kind == proto::TopicKind::AlarmAck)
            ServeAck(topic.name, payload);
    }

    void Answer(const std::string& path, proto::WriteResult result)
    {
        if (result.text.empty())
            result.text = StatusText(result.status);
        if (!proto::IsValidUtf8(result.text))
            result.text = StatusText(result.status);
        std::lock_guard lock(mutex);
        Send(proto::NamedTopic(process, proto::TopicKind::WriteResult, path), proto::EncodeWriteResult(result), 1,
             false);
    }

    void ServeWrite(const std::string& path, std::string_view payload)
    {
        proto::WriteRequest request;
        try {
            request = proto::DecodeWriteRequest(payload);
        } catch (const proto::ProtocolError& e) {
            Answer(path, {SalvagedId(payload), proto::WriteStatus::BadRequest, e.what()});
            return;
        }

        std::uint16_t type = 0;
        std::uint8_t kind = 0;
        std::int32_t refusal = proto::WriteStatus::Written;
        WriteHandler handler;
        {
            std::lock_guard lock(mutex);
            const auto found = variables.find(path);
            if (found == variables.end()) {
                refusal = proto::WriteStatus::NoSuchVariable;
            } else if ((found->second.access & proto::Access::Write) == 0) {
                refusal = proto::WriteStatus::NotWritable;
            } else {
                type = found->second.type;
                kind = found->second.kind;
                handler = writeHandler;
            }
        }
        if (refusal != proto::WriteStatus::Written) {
            Answer(path, {request.id, refusal, {}});
            return;
        }

        VarData converted;
        std::string why;
        if (!ConvertForWrite(request.value, type, kind, converted, why)) {
            Answer(path, {request.id, proto::WriteStatus::BadValue, why});
            return;
        }

        WriteDecision decision;
        if (handler) {
            try {
                decision = handler(WriteRequestInfo{path, request.user, request.id}, converted);
            } catch (const std::exception& e) {
                decision = {proto::WriteStatus::Failed, e.what()};
            } catch (...) {
                decision = {proto::WriteStatus::Failed, {}};
            }
        }
        if (decision.status == proto::WriteStatus::Written) {
            WriteDecision applied = Apply(path, type, kind, std::move(converted));
            if (applied.status != proto::WriteStatus::Written || decision.text.empty())
                decision = std::move(applied);
        }
        Answer(path, {request.id, decision.status, decision.text});
    }

    /// Stores and publishes a written value, unless the variable went away
    /// or changed its type while the handler ran.
    WriteDecision Apply(const std::string& path, std::uint16_t type, std::uint8_t kind, VarData value)
    {
        std::lock_guard lock(mutex);
        const auto found = variables.find(path);
        if (found == variables.end())
            return {proto::WriteStatus::NoSuchVariable, {}};
        Variable& variable = found->second;
        if (variable.type != type || variable.kind != kind)
            return {proto::WriteStatus::BadValue, "the variable changed its type"};
        if (value.Code() != type)
            return {proto::WriteStatus::Failed, "the process gave a value of another type"};
        if (type == value::TypeCode::Numeric)
            value.SetSubType(kind);
        proto::ValueMessage message{std::move(value), 0, 0, CurrentTime()};
        std::string payload;
        try {
            payload = proto::EncodeValueMessage(message);
        } catch (const fen::exception::Exception&) {
            return {proto::WriteStatus::BadValue, "the value cannot be published"};
        }
        variable.latest = std::move(message);
        Send(proto::NamedTopic(process, proto::TopicKind::Value, path), payload, options.valueQos, true);
        MarkValued(variable);
        return {proto::WriteStatus::Written, {}};
    }

    void ServeAck(const std::string& id, std::string_view payload)
    {
        proto::AlarmAck ack;
        try {
            ack = proto::DecodeAlarmAck(payload);
        } catch (const proto::ProtocolError&) {
            return; // an acknowledge request has no answer; a bad one changes nothing
        }
        AckHandler handler;
        {
            std::lock_guard lock(mutex);
            if (!Acknowledge(id, ack.user))
                return;
            handler = ackHandler;
        }
        if (handler) {
            try {
                handler(id, ack.user, ack.comment);
            } catch (...) {
                // The acknowledgement stands; a failing handler cannot take it back.
            }
        }
    }

    /// With `mutex` held: acknowledges a raised alarm that is not yet
    /// acknowledged and publishes it; false when nothing changed.
    bool Acknowledge(std::string_view id, std::string_view user)
    {
        const auto found = alarms.find(id);
        if (found == alarms.end() || !found->second.hasState || found->second.state.acknowledged)
            return false;
        found->second.state.acknowledged = true;
        found->second.state.user = user;
        found->second.state.time = CurrentTime();
        SendAlarm(found->first, found->second);
        return true;
    }

    // libmosquitto's callbacks; nothing thrown may cross them.
    static void ConnectCallback(mosquitto*, void* self, int code) noexcept
    {
        try {
            static_cast<Impl*>(self)->OnConnect(code);
        } catch (...) {
        }
    }
    static void DisconnectCallback(mosquitto*, void* self, int) noexcept
    {
        try {
            static_cast<Impl*>(self)->OnDisconnect();
        } catch (...) {
        }
    }
    static void SubscribeCallback(mosquitto*, void* self, int messageId, int, const int*) noexcept
    {
        try {
            static_cast<Impl*>(self)->OnSubscribe(messageId);
        } catch (...) {
        }
    }
    static void PublishCallback(mosquitto*, void* self, int messageId) noexcept
    {
        try {
            static_cast<Impl*>(self)->OnPublish(messageId);
        } catch (...) {
        }
    }
    static void MessageCallback(mosquitto*, void* self, const mosquitto_message* message) noexcept
    {
        try {
            if (message != nullptr)
                static_cast<Impl*>(self)->OnMessage(*message);
        } catch (...) {
        }
    }

    /// Ends the connection and the network thread and frees the client.
    void Shutdown() noexcept
    {
        if (client == nullptr)
            return;
        {
            std::lock_guard lock(mutex);
            stopping = true;
            connected = false;
            serving = false;
        }
        mosquitto_disconnect(client);
        mosquitto_loop_stop(client, false);
        mosquitto_destroy(client);
        std::lock_guard lock(mutex);
        client = nullptr;
        stopping = false;
    }
};

Publisher::Publisher(std::string process, PublisherOptions options)
{
    if (process.empty() || !proto::IsValidUtf8(process))
        ThrowInvalid();
    if (options.valueQos != 0 && options.valueQos != 1)
        ThrowInvalid();
    impl_ = std::make_unique<Impl>(std::move(process), std::move(options));
    InitialiseMosquitto();
}

Publisher::~Publisher() { Stop(); }

const std::string& Publisher::Process() const noexcept { return impl_->process; }

void Publisher::SetWriteHandler(WriteHandler handler)
{
    std::lock_guard lock(impl_->mutex);
    impl_->writeHandler = std::move(handler);
}

void Publisher::SetAckHandler(AckHandler handler)
{
    std::lock_guard lock(impl_->mutex);
    impl_->ackHandler = std::move(handler);
}

void Publisher::Start()
{
    Impl& impl = *impl_;
    if (impl.client != nullptr)
        return;
    const PublisherOptions& options = impl.options;
    const std::uint16_t port = options.port != 0 ? options.port : fen::osdep::GetOrvekDataPort();

    mosquitto* client = mosquitto_new(options.clientId.empty() ? nullptr : options.clientId.c_str(), true, &impl);
    if (client == nullptr)
        throw PublisherError("cannot create an MQTT client");
    {
        std::lock_guard lock(impl.mutex);
        impl.client = client;
        impl.connackCode = -1;
        impl.runningSince = CurrentTime();
    }
    auto fail = [&](const std::string& why) {
        impl.Shutdown();
        throw PublisherError(why);
    };
    mosquitto_int_option(client, MOSQ_OPT_TCP_NODELAY, 1);
    const std::string stateTopic = proto::ProcessTopic(impl.process, proto::TopicKind::State);
    const std::string will = proto::LastWillPayload();
    if (mosquitto_will_set(client, stateTopic.c_str(), static_cast<int>(will.size()), will.data(), 1, true) !=
        MOSQ_ERR_SUCCESS)
        fail("cannot set the Last Will");
    if (!options.user.empty() || !options.password.empty()) {
        if (mosquitto_username_pw_set(client, options.user.c_str(), options.password.c_str()) != MOSQ_ERR_SUCCESS)
            fail("cannot set the login");
    }
    mosquitto_reconnect_delay_set(client, 1, 10, true);
    mosquitto_connect_callback_set(client, &Impl::ConnectCallback);
    mosquitto_disconnect_callback_set(client, &Impl::DisconnectCallback);
    mosquitto_subscribe_callback_set(client, &Impl::SubscribeCallback);
    mosquitto_publish_callback_set(client, &Impl::PublishCallback);
    mosquitto_message_callback_set(client, &Impl::MessageCallback);

    const std::string where = options.host + ":" + std::to_string(port);
    const int code = mosquitto_connect_async(client, options.host.c_str(), port,
                                             static_cast<int>(options.keepAlive.count()));
    if (code != MOSQ_ERR_SUCCESS)
        fail("cannot connect to the data server at " + where + ": " +
             (code == MOSQ_ERR_ERRNO ? std::string(std::strerror(errno)) : std::string(mosquitto_strerror(code))));
    if (mosquitto_loop_start(client) != MOSQ_ERR_SUCCESS)
        fail("cannot start the network thread");

    std::unique_lock lock(impl.mutex);
    const bool answered = impl.changed.wait_for(lock, options.connectTimeout, [&] {
        return (impl.connackCode != -1 && impl.connackCode != 0) || impl.serving;
    });
    const int connack = impl.connackCode;
    lock.unlock();
    if (!answered)
        fail("no answer from the data server at " + where);
    if (connack != 0)
        fail("the data server at " + where + " refused the connection: " + mosquitto_connack_string(connack));
}

void Publisher::Stop() noexcept
{
    Impl& impl = *impl_;
    if (impl.client == nullptr)
        return;
    try {
        std::unique_lock lock(impl.mutex);
        impl.stoppedDelivered = false;
        impl.stoppedMessageId = impl.SendState(proto::RunState::Stopped);
        if (impl.stoppedMessageId != 0)
            impl.changed.wait_for(lock, std::chrono::seconds(2), [&] { return impl.stoppedDelivered; });
        impl.stoppedMessageId = 0;
    } catch (...) {
        // Stopping goes on: the broker then publishes the Last Will.
    }
    impl.Shutdown();
}

bool Publisher::IsConnected() const
{
    std::lock_guard lock(impl_->mutex);
    return impl_->connected;
}

void Publisher::DeclareVariable(std::string_view path, std::uint16_t type, std::uint8_t kind, std::uint32_t access)
{
    std::string key = CheckedPath(path);
    if (kind > 15)
        ThrowInvalid();
    std::lock_guard lock(impl_->mutex);
    auto [found, added] = impl_->variables.try_emplace(std::move(key));
    Impl::Variable& variable = found->second;
    if (!added && variable.type == type && variable.kind == kind && variable.access == access)
        return;
    // The old value no longer suits a variable whose type or kind changes.
    const bool dropValue = !added && (variable.type != type || variable.kind != kind);
    if (dropValue) {
        variable.hasValue = false;
        variable.latest = {};
    }
    variable.type = type;
    variable.kind = kind;
    variable.access = access;
    impl_->SendCatalogue();
    // Emptied after the catalogue stops calling the variable valued, so that
    // the value is never missing while the catalogue says it is there.
    if (dropValue)
        impl_->Send(proto::NamedTopic(impl_->process, proto::TopicKind::Value, found->first), {}, 1, true);
}

bool Publisher::RemoveVariable(std::string_view path)
{
    std::lock_guard lock(impl_->mutex);
    const auto found = impl_->variables.find(path);
    if (found == impl_->variables.end())
        return false;
    const std::string topic = proto::NamedTopic(impl_->process, proto::TopicKind::Value, found->first);
    impl_->variables.erase(found);
    impl_->SendCatalogue();
    impl_->Send(topic, {}, 1, true);
    return true;
}

void Publisher::Publish(std::string_view path, const VarData& value, std::uint64_t quality, std::int32_t error,
                        std::optional<fen::AbsTime> time)
{
    proto::ValueMessage message{value, quality, error, time ? *time : CurrentTime()};
    std::lock_guard lock(impl_->mutex);
    const auto found = impl_->variables.find(path);
    if (found == impl_->variables.end() || value.Code() != found->second.type)
        ThrowInvalid();
    if (value.Code() == value::TypeCode::Numeric)
        message.value.SetSubType(found->second.kind);
    const std::string payload = proto::EncodeValueMessage(message);
    found->second.latest = std::move(message);
    impl_->Send(proto::NamedTopic(impl_->process, proto::TopicKind::Value, found->first), payload,
                impl_->options.valueQos, true);
    impl_->MarkValued(found->second);
}

VarData Publisher::Value(std::string_view path) const
{
    std::lock_guard lock(impl_->mutex);
    const auto found = impl_->variables.find(path);
    if (found == impl_->variables.end())
        ThrowInvalid();
    return found->second.latest.value;
}

void Publisher::DeclareAlarm(std::string_view id, std::string_view text, std::uint16_t severity,
                             std::string_view path)
{
    if (id.empty() || severity > 1000 || !proto::IsValidUtf8(id) || !proto::IsValidUtf8(text))
        ThrowInvalid();
    if (!path.empty())
        CheckedPath(path);
    std::lock_guard lock(impl_->mutex);
    auto [found, added] = impl_->alarms.try_emplace(std::string(id));
    proto::CatalogueAlarm& definition = found->second.definition;
    if (!added && definition.text == text && definition.severity == severity && definition.path == path)
        return;
    definition = {std::string(id), std::string(text), severity, std::string(path)};
    impl_->SendCatalogue();
}

void Publisher::RaiseAlarm(std::string_view id, std::string_view text, std::uint16_t severity,
                           std::string_view path)
{
    DeclareAlarm(id, text, severity, path);
    std::lock_guard lock(impl_->mutex);
    const auto found = impl_->alarms.find(id);
    if (found == impl_->alarms.end())
        return; // removed by another thread meanwhile
    Impl::Alarm& alarm = found->second;
    alarm.hasState = true;
    alarm.state = {true, false, std::string(text), severity, CurrentTime(), {}};
    impl_->SendAlarm(found->first, alarm);
}

bool Publisher::ClearAlarm(std::string_view id)
{
    std::lock_guard lock(impl_->mutex);
    const auto found = impl_->alarms.find(id);
    if (found == impl_->alarms.end() || !found->second.hasState)
        return false;
    if (!found->second.state.raised)
        return true;
    found->second.state.raised = false;
    found->second.state.time = CurrentTime();
    impl_->SendAlarm(found->first, found->second);
    return true;
}

bool Publisher::AcknowledgeAlarm(std::string_view id, std::string_view user)
{
    if (!proto::IsValidUtf8(user))
        ThrowInvalid();
    std::lock_guard lock(impl_->mutex);
    const auto found = impl_->alarms.find(id);
    if (found == impl_->alarms.end() || !found->second.hasState)
        return false;
    impl_->Acknowledge(id, user);
    return true;
}

bool Publisher::RemoveAlarm(std::string_view id)
{
    std::lock_guard lock(impl_->mutex);
    const auto found = impl_->alarms.find(id);
    if (found == impl_->alarms.end())
        return false;
    const std::string topic = proto::NamedTopic(impl_->process, proto::TopicKind::Alarm, found->first);
    impl_->alarms.erase(found);
    impl_->SendCatalogue();
    impl_->Send(topic, {}, 1, true);
    return true;
}

} // namespace qv::network::publisher
