#pragma once
/// \file
/// The URL text a subscription is made with.

#include "fen/String.h"

namespace qv::fen {
class OrvekURL;
}

namespace qv::fbfen::orvekclient {

/// `url` as the library is given it: a host of "localhost" (any letter
/// case, in the user's locale) and the local form "\\.\" both name this
/// machine by its name, so that one variable has one text however it was
/// written; any other host stays. Throws OCException with
/// kStatusInvalidArgument for a root or relative URL, which names no host.
fen::WString SubscriptionText(const fen::OrvekURL& url);

} // namespace qv::fbfen::orvekclient
