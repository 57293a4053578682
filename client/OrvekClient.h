#pragma once
/// \file
/// The program's one connection to the real-time network: a session, a
/// real-time object and the receiver that the library calls back.
///
/// Callers pick their own subscription handles; the client maps each to
/// the library's subscription through the receiver's table. Subscribe runs
/// on one thread at a time (it holds `lock`, library call included); Write,
/// Unsubscribe and UnsubscribeAll may run on any thread. Data changes
/// arrive on library threads through the data callback, which never takes
/// `lock`. The client does not reconnect: the library reports connection
/// trouble in the quality words of the changes.

#include "client/DataCallback.h"
#include "fen/Noncopyable.h"
#include "fen/String.h"
#include "fen/osdep/Mutex.h"

#include <cstdint>

namespace qv::fen {
class OrvekURL;
}
namespace qv::network::realtime {
class IOrvekRealTime;
}
namespace qv::network::session {
class IOrvekSession;
}

namespace qv::fbfen::orvekclient {

class Receiver;

class OrvekClient : private fen::Noncopyable {
public:
    /// Uses `session` when given (the caller keeps its reference and its
    /// life), else creates and owns one.
    explicit OrvekClient(network::session::IOrvekSession* session);
    /// Ends every subscription, closes an owned session, releases the
    /// library objects and stops the libraries, in that order.
    virtual ~OrvekClient();

    /// Logs the session in; the domain is not used by this network. The
    /// session's status, negative for a refusal (after which the session is
    /// anonymous again), or kStatusUnspecifiedFailure without a session.
    std::int32_t Login(fen::WString user, fen::WString password, fen::WString domain);

    /// The pointer handed back as the first argument of every data callback.
    /// Set before the first Subscribe.
    void SetCallbackContext(void* context);
    /// Set before the first Subscribe.
    void SetDataCallback(DataCallback callback);

    /// Subscribes `url` under `handle`. "localhost" as host (any letter
    /// case) and the local form both become this machine's name. Throws
    /// OCException: kStatusInvalidArgument for a handle in use or a root or
    /// relative URL, the library's status when it refuses; nothing is
    /// subscribed then. Options are 0 when not given.
    void Subscribe(std::int32_t handle, const fen::OrvekURL& url, std::uint32_t optionA, std::uint32_t optionB);
    /// Sends `value` to the variable of `handle`; nothing for an unknown
    /// handle. Whether the process takes it is not reported.
    void Write(std::int32_t handle, const value::VarData& value);
    /// Ends the subscription of `handle`; nothing for an unknown handle.
    void Unsubscribe(std::int32_t handle);
    /// Ends every subscription.
    void UnsubscribeAll();
    /// Whether a subscription is held under `handle`.
    bool IsSubscribed(std::int32_t handle) const;

    /// The session, for callers that hand it on (the network browser).
    network::session::IOrvekSession* GetSession() const noexcept { return session; }

private:
    Receiver* receiver;
    network::realtime::IOrvekRealTime* realTime = nullptr;
    fen::osdep::Mutex lock;
    network::session::IOrvekSession* session;
    bool ownsSession = false;
};

} // namespace qv::fbfen::orvekclient
