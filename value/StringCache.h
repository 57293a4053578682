#pragma once
/// \file
/// A cache of string-table texts, each loaded once and kept.

#include "fen/String.h"
#include "value/StringModule.h"

#include <cstddef>
#include <cstdint>
#include <map>

namespace qv::value {

/// Loads texts from a string module on first use and keeps them for the
/// cache's lifetime; it is never trimmed. Not thread-safe: one owner uses it
/// from one thread.
class StringCache {
public:
    /// Loads from `module`, which must outlive the cache.
    explicit StringCache(const StringModule& module) : module_(module) {}

    StringCache(const StringCache&) = delete;
    StringCache& operator=(const StringCache&) = delete;

    /// The text of string `id`, valid as long as the cache. A string that is
    /// absent or empty gives a shared empty text and is not cached, so it is
    /// looked up again on the next call.
    const fen::String& Get(std::uint32_t id);

    /// Number of texts held.
    std::size_t Size() const noexcept { return texts_.size(); }

private:
    const StringModule& module_;
    std::map<std::uint32_t, fen::String> texts_;
};

} // namespace qv::value
