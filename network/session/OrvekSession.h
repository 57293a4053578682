#pragma once
/// \file
/// The session library: start and stop of the network libraries, and the
/// session object that holds the operator's login.
///
/// Objects are reference-counted interfaces whose operations are declared in
/// their fixed slot order (0 QueryInterface, 1 AddRef, 2 Release, then the
/// object's own). A creator hands out one reference; the last Release
/// destroys the object. All operations may be called from any thread.
///
/// The login is the data server's own: Login checks the user name and
/// password against the data server of this machine, and afterwards every
/// broker connection made for the session (by the real-time library) carries
/// them. Without a login, connections are anonymous.

#include "value/dynamic/Guid.h"

#include <cstdint>

namespace qv::network::session {

using value::dynamic::Guid;

/// Statuses; negative is failure.
inline constexpr std::int32_t kStatusOk = 0;
/// The data server refused the user name or password.
inline constexpr std::int32_t kStatusAccessDenied = static_cast<std::int32_t>(0x80070005u);
/// No data server answered on this machine, so the login could not be checked.
inline constexpr std::int32_t kStatusNoDataServer = static_cast<std::int32_t>(0x800706BAu);
/// A null pointer where an object or result was required.
inline constexpr std::int32_t kStatusNullPointer = static_cast<std::int32_t>(0x80004003u);
/// The object was closed.
inline constexpr std::int32_t kStatusClosed = static_cast<std::int32_t>(0x8000FFFFu);
/// The operation is not offered.
inline constexpr std::int32_t kStatusNotImplemented = static_cast<std::int32_t>(0x80004001u);
/// Memory ran out.
inline constexpr std::int32_t kStatusOutOfMemory = static_cast<std::int32_t>(0x8007000Eu);

/// IUnknown's identifier, {00000000-0000-0000-C000-000000000046}.
inline constexpr Guid kIID_IUnknown{0x00000000, 0x0000, 0x0000, {0xC0, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x46}};

/// Who is logged in on a session; a snapshot taken by GetIdentity.
class IOrvekIdentity {
public:
    /// Slot 0.
    virtual std::int32_t QueryInterface(const Guid& iid, void** out) = 0;
    /// Slot 1.
    virtual std::uint32_t AddRef() = 0;
    /// Slot 2: the number of references left.
    virtual std::uint32_t Release() = 0;
    /// Slots 3 to 5: not offered; kStatusNotImplemented.
    virtual std::int32_t Reserved3() = 0;
    virtual std::int32_t Reserved4() = 0;
    virtual std::int32_t Reserved5() = 0;
    /// Slot 6: `*name` receives the logged-in user's name (empty without a
    /// login) as NUL-terminated UTF-16 that the caller frees with
    /// OrvekFreeString. kStatusNullPointer when `name` is null.
    virtual std::int32_t GetUserName(char16_t** name) = 0;

protected:
    ~IOrvekIdentity() = default;
};

class IOrvekSession {
public:
    /// Slot 0: answers IUnknown and kIID_IOrvekSession.
    virtual std::int32_t QueryInterface(const Guid& iid, void** out) = 0;
    /// Slot 1.
    virtual std::uint32_t AddRef() = 0;
    /// Slot 2: the number of references left.
    virtual std::uint32_t Release() = 0;
    /// Slot 3: logs `user` in with `password` (NUL-terminated UTF-16; null is
    /// empty; `reserved` must be null). The pair is checked by connecting to
    /// this machine's data server; it blocks for at most a few seconds.
    /// kStatusOk keeps the login for every later connection of the session;
    /// kStatusAccessDenied when the data server refuses it;
    /// kStatusNoDataServer when no data server answers. A failed login
    /// leaves the previous login in place.
    virtual std::int32_t Login(const char16_t* user, const char16_t* password, const void* reserved) = 0;
    /// Slot 4: kStatusOk when a user is logged in, 1 when the session is anonymous.
    virtual std::int32_t IsLoggedIn() = 0;
    /// Slot 5: forgets the login; later connections are anonymous.
    virtual std::int32_t ResetLogin() = 0;
    /// Slot 6: forgets the login and refuses further logins (kStatusClosed).
    virtual std::int32_t Close() = 0;
    /// Slot 7: `*identity` receives a new identity object (one reference)
    /// describing the login at the moment of the call.
    virtual std::int32_t GetIdentity(IOrvekIdentity** identity) = 0;

protected:
    ~IOrvekSession() = default;
};

/// {6B1E4C52-2F0A-4C83-9E51-7D3A1B64C0F2}
inline constexpr Guid kIID_IOrvekSession{0x6B1E4C52, 0x2F0A, 0x4C83, {0x9E, 0x51, 0x7D, 0x3A, 0x1B, 0x64, 0xC0, 0xF2}};

/// Creates a session (anonymous, one reference) in `*session`; false when
/// `session` is null or memory ran out.
bool NewOrvekSession(IOrvekSession** session);

/// Frees a text handed out by this library (GetUserName); null is ignored.
void OrvekFreeString(char16_t* text);

/// Starts the network libraries; every call must be matched by one
/// OrvekLibraryStop. Counted, so that several clients may live at once.
void OrvekLibraryStart();
/// Stops them once the last OrvekLibraryStart is matched.
void OrvekLibraryStop();

} // namespace qv::network::session
