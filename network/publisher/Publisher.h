#pragma once
/// \file
/// The library a process uses to publish its variables and alarms on the
/// Orvek network: one Publisher per process, connected to the data server of
/// its own host.
///
/// Lifecycle: construct, declare variables (and alarms) and set the handlers,
/// Start(), publish values for as long as the process runs, Stop(). The
/// broker holds a Last Will that marks the process "failed" when it vanishes
/// without Stop(); Stop() publishes "stopped" and leaves every other retained
/// topic (catalogue, values, alarms) in place.
///
/// Threads: every member function may be called from any thread, except that
/// Start(), Stop() and the destructor must not overlap one another. The write
/// and acknowledge handlers are called on the library's network thread, one
/// call at a time, with no lock of the Publisher held, so a handler may call
/// Publish() and the other members; it must not call Stop() or destroy the
/// Publisher. No exception leaves the network thread: one thrown by a
/// handler refuses the write (status Failed) or is dropped.
///
/// Connection: Start() connects and returns once the broker has accepted
/// the login and the process serves writes. A lost connection is retried by
/// itself (1 to 10 s apart); on every (re)connection the catalogue, the
/// latest value of every variable and the state of every alarm are published
/// again, so a restarted broker learns everything back, and "running" follows
/// as soon as the write and acknowledge topics are subscribed. While disconnected, Publish()
/// and the alarm calls only record what they are given.

#include "fen/AbsTime.h"
#include "fen/Exception.h"
#include "value/VarData.h"

#include <chrono>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

namespace qv::network::publisher {

/// A failure of the publisher itself: no connection, a login the broker
/// refused, an MQTT error. Misuse by the caller (an undeclared variable, a
/// path not in its printed form) throws fen::exception::InvalidArgument.
class PublisherError : public fen::exception::Exception {
public:
    explicit PublisherError(std::string detail)
        : message_(std::make_shared<const std::string>("publisher: " + std::move(detail)))
    {
    }
    const char* what() const noexcept override { return message_->c_str(); }
    std::int32_t GetErrorCode() const noexcept override { return static_cast<std::int32_t>(0x8ABC7041u); }

private:
    // Shared, so that copying the exception cannot fail.
    std::shared_ptr<const std::string> message_;
};

struct PublisherOptions {
    /// The data server's address; a publisher normally uses its own host's.
    std::string host = "127.0.0.1";
    /// 0 takes the Orvek data port from the registry store (GetOrvekDataPort).
    std::uint16_t port = 0;
    /// The broker login; both empty for none.
    std::string user;
    std::string password;
    /// The MQTT client id; empty lets the library choose a unique one.
    std::string clientId;
    /// How long Start() waits for the broker's answer.
    std::chrono::milliseconds connectTimeout{5000};
    /// MQTT keep-alive; a dead connection is noticed within about 1.5 times it.
    std::chrono::seconds keepAlive{10};
    /// QoS of value messages (0 or 1). Value topics are retained, so with
    /// QoS 0 a lost intermediate value still leaves the latest one in place.
    int valueQos = 1;
};

/// What a write handler decides about a write request.
struct WriteDecision {
    /// A status of protocol::WriteStatus: Written applies the value; any
    /// other refuses it, leaving the variable unchanged.
    std::int32_t status = 0;
    /// Returned to the writer; empty gives a standard text.
    std::string text;
};

/// A write request that passed the access and type checks.
struct WriteRequestInfo {
    /// The variable's path as declared.
    std::string path;
    /// The user the writer gave; empty without a login.
    std::string user;
    /// The writer's request id.
    std::string id;
};

/// Called on the network thread for each write to a writable variable, with
/// `value` already converted to the variable's type (and numeric kind). The
/// handler may change `value` (for example to clamp it) before accepting;
/// the value it leaves there is stored and published with good quality and
/// the current time.
using WriteHandler = std::function<WriteDecision(const WriteRequestInfo& request, value::VarData& value)>;

/// Called on the network thread after an acknowledge request from the
/// network has acknowledged alarm `id` (already published).
using AckHandler = std::function<void(const std::string& id, const std::string& user, const std::string& comment)>;

/// The current time as an AbsTime.
fen::AbsTime CurrentTime();

class Publisher {
public:
    /// A publisher for the process `process` (UTF-8, any characters). Nothing
    /// is connected yet. Throws PublisherError when the MQTT library cannot
    /// make a client.
    explicit Publisher(std::string process, PublisherOptions options = {});
    /// Stop()s the publisher if it is running.
    ~Publisher();
    Publisher(const Publisher&) = delete;
    Publisher& operator=(const Publisher&) = delete;

    const std::string& Process() const noexcept;

    /// Sets the handler of writes; without one every write that passes the
    /// checks is applied. Takes effect for the next request.
    void SetWriteHandler(WriteHandler handler);
    /// Sets the handler told of acknowledgements from the network.
    void SetAckHandler(AckHandler handler);

    /// Connects, publishes catalogue, values and alarms, subscribes to this
    /// process's write and acknowledge topics and, once the broker has
    /// confirmed them, publishes "running" and returns.
    /// Throws PublisherError when the broker cannot be reached or refuses the
    /// login within connectTimeout; the publisher is then stopped again.
    /// Calling it while running does nothing.
    void Start();

    /// Publishes "stopped", waits (at most 2 s) for the broker to take it,
    /// disconnects and joins the network thread. Retained catalogue, values
    /// and alarms stay. Does nothing when not running. Never throws.
    void Stop() noexcept;

    /// True while connected to the broker.
    bool IsConnected() const;

    /// Declares (or redeclares) the variable `path`, which must be in its
    /// printed form (protocol::CanonicalVariablePath), with the type code
    /// `type`, numeric kind `kind` (0 to 15) and access bits (protocol::Access).
    /// The catalogue is published again when it changed. A redeclared
    /// variable keeps its value only if its type and kind stay the same.
    /// A bad path or kind throws InvalidArgument.
    void DeclareVariable(std::string_view path, std::uint16_t type, std::uint8_t kind, std::uint32_t access);

    /// Removes the variable: its value topic is emptied and the catalogue
    /// published again. Returns false when there is no such variable.
    bool RemoveVariable(std::string_view path);

    /// Publishes a new value of the declared variable `path` (retained).
    /// The value's type code must be the declared one; a Numeric value takes
    /// the variable's numeric kind. `time` defaults to now. An undeclared
    /// variable, another type or a value the encoding refuses throws
    /// InvalidArgument.
    void Publish(std::string_view path, const value::VarData& value, std::uint64_t quality = 0,
                 std::int32_t error = 0, std::optional<fen::AbsTime> time = std::nullopt);

    /// The latest value of `path` as published (Empty before the first one).
    /// An undeclared variable throws InvalidArgument.
    value::VarData Value(std::string_view path) const;

    /// Lists the alarm `id` in the catalogue without raising it (text,
    /// severity 0 to 1000 and watched variable path, possibly empty). An
    /// empty id or a severity above 1000 throws InvalidArgument.
    void DeclareAlarm(std::string_view id, std::string_view text, std::uint16_t severity,
                      std::string_view path = {});
    /// Raises the alarm, declaring it first when it is new; raising resets
    /// the acknowledgement. Publishes its state (retained).
    void RaiseAlarm(std::string_view id, std::string_view text, std::uint16_t severity,
                    std::string_view path = {});
    /// Marks the alarm as cleared; false when it was never raised.
    bool ClearAlarm(std::string_view id);
    /// Acknowledges the alarm as `user`; false when it was never raised.
    /// Acknowledging an acknowledged alarm changes nothing.
    bool AcknowledgeAlarm(std::string_view id, std::string_view user);
    /// Removes the alarm: its topic is emptied and the catalogue published
    /// again; false when there is no such alarm.
    bool RemoveAlarm(std::string_view id);

private:
    struct Impl;
    std::unique_ptr<Impl> impl_;
};

} // namespace qv::network::publisher
