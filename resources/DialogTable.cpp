#include "resources/DialogTable.h"

#include <array>

namespace qv::resources {
namespace {

constexpr std::array kDialogs = {
    ResourceEntry{100, "About Varnet Monitor"},
    // Property pages: writing typed text, a variable's properties.
    ResourceEntry{130, "Write Network Item"},
    ResourceEntry{135, "Variable Properties"},
    ResourceEntry{136, "Select Host"},
    ResourceEntry{143, "Select Value to Write"},
    ResourceEntry{151, "Set Digits"},
    ResourceEntry{152, "Select Columns"},
    ResourceEntry{153, "Warning"},
    // The bit array writer keeps its generic title.
    ResourceEntry{167, "Dialog"},
    ResourceEntry{169, "Varnet Monitor"},
};

static_assert(IsStrictlyIncreasing(kDialogs), "dialog ids must be sorted and unique");

} // namespace

std::optional<std::string_view> FindDialogTitle(std::uint32_t id)
{
    return FindEntry(kDialogs, id);
}

std::span<const ResourceEntry> DialogEntries()
{
    return kDialogs;
}

} // namespace qv::resources
