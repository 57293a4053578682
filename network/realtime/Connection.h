#pragma once
/// \file
/// One broker connection of the real-time library: the data server of one
/// host, shared by every subscription to that host's variables, with its own
/// thread. Internal to the library.

#include "network/realtime/OrvekRealTime.h"
#include "network/session/SessionCredentials.h"
#include "value/VarData.h"

#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <string>

namespace qv::network::realtime {

/// The receiver, shared by the real-time object and its connection threads,
/// so that it lives as long as any thread may still call it.
class ReceiverLink {
public:
    explicit ReceiverLink(IOrvekRealTimeReceiver* receiver) : receiver_(receiver) { receiver_->AddRef(); }
    ~ReceiverLink() { receiver_->Release(); }
    ReceiverLink(const ReceiverLink&) = delete;
    ReceiverLink& operator=(const ReceiverLink&) = delete;

    /// Calls OnDataChange unless the link is closed; swallows every exception.
    void Deliver(std::int32_t handle, std::uint32_t mask, const value::VarData& value, std::uint64_t quality,
                 std::int32_t error, const fen::AbsTime& time) noexcept;
    /// No more deliveries after this returns (except one already under way).
    void Close() noexcept { open_ = false; }

private:
    IOrvekRealTimeReceiver* receiver_;
    std::atomic<bool> open_{true};
};

/// The current time.
fen::AbsTime CurrentTime() noexcept;

class Connection : public std::enable_shared_from_this<Connection> {
public:
    /// `host` is the URL's host (UTF-8), `session` may be null.
    Connection(std::string host, std::uint16_t port, session::IOrvekSession* session,
               std::shared_ptr<ReceiverLink> receiver);
    ~Connection();
    Connection(const Connection&) = delete;
    Connection& operator=(const Connection&) = delete;

    /// Starts the connection's thread; throws on failure.
    void Start();
    /// Ends the thread and closes the connection. From the connection's own
    /// thread it only asks the thread to end.
    void Stop();

    /// Adds a subscription to the variable `path` (printed form, UTF-8) of
    /// `process`; its first change follows on the connection's thread.
    /// Returns the subscription's id on this connection.
    std::uint64_t AddSubscription(std::int32_t handle, const std::string& process, const std::string& path);
    /// Ends a subscription; no more changes are computed for it.
    void RemoveSubscription(std::uint64_t id);
    /// Publishes a write request for the variable of subscription `id`.
    std::int32_t Write(std::uint64_t id, const value::VarData& value);

    /// Broker callbacks; public only for the C trampolines.
    struct Callbacks;

private:
    struct State;
    void Run();

    std::unique_ptr<State> state_;
};

} // namespace qv::network::realtime
