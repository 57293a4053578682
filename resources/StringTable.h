#pragma once
/// \file
/// The program's string table: every user-visible or configuration text that
/// the program loads by number.
///
/// Every text is NUL-terminated in static storage, so `data()` of a returned
/// view may be handed to C interfaces.

#include "resources/ResourceEntry.h"

#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

namespace qv::resources {

/// Text of string `id`; nothing when the table has no such string.
std::optional<std::string_view> FindString(std::uint32_t id);

/// Every entry of the string table, in increasing id order.
std::span<const ResourceEntry> StringEntries();

} // namespace qv::resources
