#pragma once
/// \file
/// What the watch list needs from the document that holds it.

#include "fen/String.h"

#include <cstdint>
#include <vector>

namespace qv::views {

/// The document side of a watch list. Every call comes from the thread that
/// drives the watch list.
class WatchListHost {
public:
    virtual ~WatchListHost() = default;

    /// Subscribes `url` and returns the item's new handle. Throws a library
    /// exception (SyntaxError for a URL the grammar rejects) when no handle
    /// was issued; the watch list then leaves the item out.
    virtual std::int32_t SubscribeItem(const fen::WString& url) = 0;

    /// Ends the subscription of `handle`.
    virtual void Unsubscribe(std::int32_t handle) = 0;

    /// Sets or clears the document's modified mark.
    virtual void SetModified(bool modified) = 0;

    /// Tells the other views that the rows of `handles` were removed. Their
    /// records can still be read from the watch list during this call; they
    /// are destroyed right after it.
    virtual void NotifyRemoved(const std::vector<std::int32_t>& handles) = 0;
};

} // namespace qv::views
