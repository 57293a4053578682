#pragma once
/// \file
/// Dialog and property page titles, by dialog resource id. The controls'
/// own texts live with each dialog's layout.

#include "resources/ResourceEntry.h"

#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

namespace qv::resources {

/// Title of dialog `id`; nothing for an unknown dialog.
std::optional<std::string_view> FindDialogTitle(std::uint32_t id);

/// Every dialog title, in increasing dialog id order.
std::span<const ResourceEntry> DialogEntries();

} // namespace qv::resources
