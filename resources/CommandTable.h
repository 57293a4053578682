#pragma once
/// \file
/// Menu entry labels, by command id. A command that appears in two menus
/// under different ids has one entry per id; "&" marks the mnemonic and a
/// tab separates the accelerator shown beside the label.

#include "resources/ResourceEntry.h"

#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

namespace qv::resources {

/// Label of the menu entry of command `id`; nothing for an unknown command.
std::optional<std::string_view> FindCommandLabel(std::uint32_t id);

/// Every menu entry label, in increasing command id order.
std::span<const ResourceEntry> CommandEntries();

} // namespace qv::resources
