#pragma once
/// \file
/// The real-time library: subscriptions to variables of the Orvek network,
/// delivered as data changes to the caller's receiver, and writes.
///
/// Objects are reference-counted interfaces declared in their fixed slot
/// order (0 QueryInterface, 1 AddRef, 2 Release, then their own).
///
/// Connections. A subscription's URL names a host; the library keeps one
/// broker connection per host's data server (the host, on the Orvek data
/// port of the registry store), shared by every subscription of that host.
/// The local machine's own name (any letter case), "localhost" and the
/// local form "\\.\" go to 127.0.0.1 without a lookup; an IPv4 or IPv6
/// address is used as it is; every other name goes through the resolver of
/// HostResolver.h. Each connection carries the login of the session, runs on
/// its own thread of the library, reconnects by itself (the pause grows from
/// a tenth of a second to two seconds) and subscribes again.
///
/// Data changes. A new subscription first receives the variable's current
/// state as soon as the data server has handed over what it holds (its
/// retained value), then one call per change. The quality word says what
/// really happened (QualityBits below); the bits that the publishing process
/// sets pass through unchanged when its value is delivered.
///
/// Threads: OnDataChange is called on a thread of the library, never inside
/// a call that the caller makes into the library. Calls for the
/// subscriptions of one host come from one thread, in order; calls for
/// different hosts may come at the same time from different threads. The
/// receiver must not block for long: it holds up every subscription of its
/// host. It may call into the library (Write, Release, Subscribe). After a
/// subscription's last Release, at most one call already under way may
/// still arrive for its handle. Exceptions thrown by the receiver are
/// swallowed at the library's edge.

#include "network/session/OrvekSession.h"
#include "value/dynamic/Guid.h"

#include <cstdint>

namespace qv::fen {
struct AbsTime;
}
namespace qv::value {
class VarData;
}

namespace qv::network::realtime {

using value::dynamic::Guid;

/// Bits of the change mask of OnDataChange.
namespace ChangeMask {
inline constexpr std::uint32_t Value = 0x1;
/// Set together with QualityOrError2.
inline constexpr std::uint32_t QualityOrError = 0x2;
inline constexpr std::uint32_t Timestamp = 0x4;
inline constexpr std::uint32_t QualityOrError2 = 0x8;
/// A subscription's first change: everything.
inline constexpr std::uint32_t All = 0xF;
} // namespace ChangeMask

/// The quality bits this library sets from what it observes.
namespace QualityBits {
inline constexpr std::uint64_t Nonexistant = 0x20;            ///< no such process or variable
inline constexpr std::uint64_t NoKnownValue = 0x40;           ///< listed, but no value published yet
inline constexpr std::uint64_t Connecting = 0x20000;          ///< the connection is being made
inline constexpr std::uint64_t DnsFailure = 0x40000;          ///< the host name does not resolve
inline constexpr std::uint64_t HostUnreachable = 0x80000;     ///< no route to the host, or no answer
inline constexpr std::uint64_t ServiceLookupFailure = 0x100000; ///< no data server on the host
inline constexpr std::uint64_t Disconnected = 0x200000;       ///< the connection was lost
inline constexpr std::uint64_t ProcessFailure = 0x400000;     ///< the process failed or stopped
inline constexpr std::uint64_t AccessDenied = 0x1000000;      ///< the login may not read it
inline constexpr std::uint64_t InvalidURL = 0x2000000;        ///< the URL names no variable
inline constexpr std::uint64_t SubscriptionFailure = 0x40000000; ///< any other failure
} // namespace QualityBits

/// Error codes that go with the library's quality bits; negative means an error.
namespace ErrorCodes {
inline constexpr std::int32_t HostNotFound = static_cast<std::int32_t>(0x80072AF9u);
inline constexpr std::int32_t HostUnreachable = static_cast<std::int32_t>(0x80072751u);
inline constexpr std::int32_t ConnectionRefused = static_cast<std::int32_t>(0x8007274Du);
inline constexpr std::int32_t ConnectionLost = static_cast<std::int32_t>(0x80072746u);
inline constexpr std::int32_t AccessDenied = static_cast<std::int32_t>(0x80070005u);
inline constexpr std::int32_t ProcessFailed = static_cast<std::int32_t>(0x8ABC7101u);
inline constexpr std::int32_t NoSuchVariable = static_cast<std::int32_t>(0x8ABC7102u);
inline constexpr std::int32_t InvalidURL = static_cast<std::int32_t>(0x8ABC7103u);
inline constexpr std::int32_t SubscriptionFailed = static_cast<std::int32_t>(0x8ABC7104u);
/// A message from the data server that does not follow the protocol.
inline constexpr std::int32_t ProtocolViolation = static_cast<std::int32_t>(0x8ABC7040u);
} // namespace ErrorCodes

/// {090FF7B4-FFA4-11D0-AA93-00A0249EA99A}
inline constexpr Guid kIID_IOrvekRealTimeReceiver{0x090FF7B4, 0xFFA4, 0x11D0, {0xAA, 0x93, 0x00, 0xA0, 0x24, 0x9E, 0xA9, 0x9A}};
/// {75D367BA-8890-4169-BA8B-ACFC7E82A0E6}
inline constexpr Guid kIID_IOrvekRealTimeReceiver3{0x75D367BA, 0x8890, 0x4169, {0xBA, 0x8B, 0xAC, 0xFC, 0x7E, 0x82, 0xA0, 0xE6}};

/// What the caller implements to receive data changes. The library holds
/// one reference from NewOrvekRealTime until the real-time object is gone.
class IOrvekRealTimeReceiver {
public:
    /// Slot 0.
    virtual std::int32_t QueryInterface(const Guid& iid, void** out) = 0;
    /// Slot 1.
    virtual std::uint32_t AddRef() = 0;
    /// Slot 2.
    virtual std::uint32_t Release() = 0;
    /// Slots 3 to 6: notifications that this library never sends.
    virtual void Notification3() = 0;
    virtual void Notification4() = 0;
    virtual void Notification5() = 0;
    virtual void Notification6() = 0;
    /// Slot 7: one change of the subscription `handle`. `changeMask` holds
    /// ChangeMask bits; `value` and `timestamp` are valid only during the
    /// call (copy what you keep); `quality` is the 64-bit quality word and
    /// `errorCode` negative for an error. See the thread contract above.
    virtual void OnDataChange(std::int32_t handle, std::uint32_t changeMask, const value::VarData* value,
                              std::uint64_t quality, std::int32_t errorCode, const fen::AbsTime* timestamp) = 0;

protected:
    ~IOrvekRealTimeReceiver() = default;
};

/// The same table; a receiver that serialises its own calls.
class IOrvekRealTimeReceiverSync : public IOrvekRealTimeReceiver {
protected:
    ~IOrvekRealTimeReceiverSync() = default;
};

/// The same table; the receiver interface the client implements.
class IOrvekRealTimeReceiver3 : public IOrvekRealTimeReceiverSync {
protected:
    ~IOrvekRealTimeReceiver3() = default;
};

/// The options record of Subscribe. This library accepts and ignores it.
struct SubscribeOptions {
    std::uint32_t mask = 0x0D;
    std::uint16_t flags = 0x000F;
    std::uint8_t unused[2] = {};
    std::uint32_t reserved[2] = {};
    std::uint32_t optionA = 0;
    std::uint32_t optionB = 0;
};
static_assert(sizeof(SubscribeOptions) == 24);

/// One subscription; its last Release ends it.
class ISubscription {
public:
    /// Slot 0.
    virtual std::int32_t QueryInterface(const Guid& iid, void** out) = 0;
    /// Slot 1.
    virtual std::uint32_t AddRef() = 0;
    /// Slot 2: at zero the subscription ends and no more changes are
    /// delivered for it (but see the thread contract).
    virtual std::uint32_t Release() = 0;
    /// Slot 3: sends `value` to the variable as a write request carrying the
    /// session's user. 0 once it is handed to the connection; negative when
    /// the subscription's URL is invalid, the host is not connected or the
    /// value cannot be encoded. Whether the process accepts it is not reported.
    virtual std::int32_t Write(const value::VarData& value) = 0;

protected:
    ~ISubscription() = default;
};

class IOrvekRealTime {
public:
    /// Slot 0.
    virtual std::int32_t QueryInterface(const Guid& iid, void** out) = 0;
    /// Slot 1.
    virtual std::uint32_t AddRef() = 0;
    /// Slot 2: at zero every connection is closed and the receiver released;
    /// subscriptions still held stay valid objects that deliver nothing.
    virtual std::uint32_t Release() = 0;
    /// Slot 3: subscribes to the variable that `url` (NUL-terminated UTF-16)
    /// names and reports its changes under `handle`. `options` may be null.
    /// `*subscription` receives the subscription (one reference) and 0 is
    /// returned, also for a URL that names no variable: that subscription
    /// delivers one change with QualityBits::InvalidURL. Negative (and a
    /// null `*subscription`) for a null `url` or `subscription`.
    virtual std::int32_t Subscribe(const char16_t* url, std::int32_t handle, const SubscribeOptions* options,
                                   ISubscription** subscription) = 0;

protected:
    ~IOrvekRealTime() = default;
};

/// Creates a real-time object in `*realTime` (one reference) whose
/// connections carry the login of `session` (null: anonymous) and whose
/// changes go to `receiver` (which must not be null; the object adds a
/// reference). True on success; on failure `*realTime` is null.
bool NewOrvekRealTime(session::IOrvekSession* session, IOrvekRealTimeReceiver* receiver,
                      IOrvekRealTime** realTime);

} // namespace qv::network::realtime
