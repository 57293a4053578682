#pragma once
/// \file
/// One numbered text of a resource table, and lookup in a table sorted by id.

#include <algorithm>
#include <cstdint>
#include <optional>
#include <span>
#include <string_view>

namespace qv::resources {

/// A resource number and its text.
struct ResourceEntry {
    std::uint32_t id;
    std::string_view text;
};

/// True when the ids of `table` strictly increase (sorted, no id twice).
constexpr bool IsStrictlyIncreasing(std::span<const ResourceEntry> table)
{
    for (std::size_t i = 1; i < table.size(); ++i)
        if (table[i - 1].id >= table[i].id)
            return false;
    return true;
}

/// The text of `id` in `table`, which must be strictly increasing by id;
/// nothing when the id is absent.
constexpr std::optional<std::string_view> FindEntry(std::span<const ResourceEntry> table, std::uint32_t id)
{
    auto it = std::lower_bound(table.begin(), table.end(), id,
                               [](const ResourceEntry& entry, std::uint32_t key) { return entry.id < key; });
    if (it == table.end() || it->id != id)
        return std::nullopt;
    return it->text;
}

} // namespace qv::resources
