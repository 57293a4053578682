#pragma once
/// \file
/// What the real-time library reads from a session: the login that goes
/// with every broker connection. Internal to the network libraries.

#include "network/session/OrvekSession.h"

#include <string>

struct mosquitto;

namespace qv::network::session {

struct SessionCredentials {
    /// UTF-8; empty for an anonymous session.
    std::string user;
    std::string password;

    friend bool operator==(const SessionCredentials&, const SessionCredentials&) = default;
};

/// The current login of `session` (a session of this library); anonymous
/// for null or a foreign object.
SessionCredentials GetSessionCredentials(IOrvekSession* session);

/// Puts the login on a libmosquitto handle before it connects: the user
/// name and password, or none for an anonymous login.
void ApplyCredentials(::mosquitto* handle, const SessionCredentials& credentials);

} // namespace qv::network::session
