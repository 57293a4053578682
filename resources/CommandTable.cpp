#include "resources/CommandTable.h"

#include <array>

namespace qv::resources {
namespace {

constexpr std::array kCommands = {
    // Items and View menus of the main frame.
    ResourceEntry{32771, "&Add\tCtrl+A"},
    ResourceEntry{32772, "&Remove\tDel"},
    ResourceEntry{32773, "&Write"},
    ResourceEntry{32775, "&Refresh"},
    ResourceEntry{32776, "&Properties..."},

    // Watch list row menu.
    ResourceEntry{32780, "&Remove"},
    ResourceEntry{32781, "&Write..."},

    // Browser node menu.
    ResourceEntry{32782, "&Add"},
    ResourceEntry{32783, "&Properties..."},

    // View menu: the host to browse.
    ResourceEntry{32784, "&Go to Host..."},
    ResourceEntry{32785, "&Default"},

    // Options menu, and the node menu's refresh between them.
    ResourceEntry{32789, "&Autoload Last View"},
    ResourceEntry{32790, "&Refresh"},
    ResourceEntry{32791, "Set &Decimal Places..."},
    ResourceEntry{32792, "&XX For Bad Quality"},
    ResourceEntry{32793, "&Select Columns..."},
    ResourceEntry{32794, "&Type Mismatch "},
    ResourceEntry{32795, "Hex for &Raw Data"},

    // File and Help menus.
    ResourceEntry{57600, "&New\tCtrl+N"},
    ResourceEntry{57601, "&Open...\tCtrl+O"},
    ResourceEntry{57603, "&Save\tCtrl+S"},
    ResourceEntry{57604, "Save &As..."},
    ResourceEntry{57616, "Recent File"},
    ResourceEntry{57664, "&About Varnet Monitor..."},
    ResourceEntry{57665, "E&xit"},
    ResourceEntry{57670, "Help Topics"},

    // View menu: bar toggles.
    ResourceEntry{59392, "&Toolbar"},
    ResourceEntry{59393, "&Status Bar"},
};

static_assert(IsStrictlyIncreasing(kCommands), "command ids must be sorted and unique");

} // namespace

std::optional<std::string_view> FindCommandLabel(std::uint32_t id)
{
    return FindEntry(kCommands, id);
}

std::span<const ResourceEntry> CommandEntries()
{
    return kCommands;
}

} // namespace qv::resources
