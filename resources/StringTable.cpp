#include "resources/StringTable.h"

#include <array>

namespace qv::resources {
namespace {

constexpr std::array kStrings = {
    // Document template: window title, document name, new-document name,
    // file filter name, extension, file type id and file type name.
    ResourceEntry{128, "Quorvane Varnet Monitor\n\nUntitled\nVariable Monitor Documents (*vsd)\n.vsd\nvsd\n"
                       "Variable Monitor Document"},

    // Registering computers and the browser's node types.
    ResourceEntry{200, "SOFTWARE\\Quorvane\\Wayfarer\\4.0\\Machines"},
    ResourceEntry{201, "Can't create key to represent host.\n"
                       "Do you have access to add subkeys to this computer's system registry?"},
    ResourceEntry{202, "Error Registering Host!"},
    ResourceEntry{203, "QV Network Real Time Point"},
    ResourceEntry{204, "QV Network Real Time Point Range"},
    ResourceEntry{205, "Network Neighborhood"},
    ResourceEntry{206, "Network Host"},

    // Type name of Null.
    ResourceEntry{497, "NULL"},

    // Browser node menu additions, the local host's name, the installation key.
    ResourceEntry{500, "Register Computer..."},
    ResourceEntry{501, "Unregister Computer"},
    ResourceEntry{502, "localhost"},
    ResourceEntry{503, "SOFTWARE\\Quorvane\\Varoscope"},

    // Type names of Time and Vector.
    ResourceEntry{600, "Time"},
    ResourceEntry{603, "Vector"},

    // Application title (profile name of the settings store).
    ResourceEntry{57344, "Varnet Monitor"},

    // Status bar indicators.
    ResourceEntry{59137, "CAP"},
    ResourceEntry{59138, "NUM"},
    ResourceEntry{59139, "SCRL"},

    // Type names; 61290 also names every code without a name of its own.
    ResourceEntry{61280, "Numeric"},
    ResourceEntry{61281, "Logical"},
    ResourceEntry{61284, "ANSI String"},
    ResourceEntry{61285, "UNICODE String"},
    ResourceEntry{61287, "Cairnet Break"},
    ResourceEntry{61288, "Raw Byte Data"},
    ResourceEntry{61289, "Logical Pulse"},
    ResourceEntry{61290, "Undefined"},

    // Watch list cell texts and the properties sheet's caption.
    ResourceEntry{61294, "Invalid Timestamp"},
    ResourceEntry{61296, "Orvek Properties"},
    ResourceEntry{61312, "True"},

    // Watch list column headers.
    ResourceEntry{61315, "Value"},
    ResourceEntry{61316, "Time"},
    ResourceEntry{61317, "Varnet Name"},
    ResourceEntry{61318, "Full Name"},
    ResourceEntry{61319, "Read/Write"},
    ResourceEntry{61450, "Quality"},

    // Bad-quality conditions (each with its trailing space).
    ResourceEntry{61602, "Sensor Failure "},
    ResourceEntry{61603, "Device Failure "},
    ResourceEntry{61604, "Server Failure "},
    ResourceEntry{61605, "Network Failure "},
    ResourceEntry{61606, "Nonexistant Point "},
    ResourceEntry{61610, "Bad "},
    ResourceEntry{61615, "Sensor Inaccurate "},
    ResourceEntry{61618, "Comm Link Failure "},
    ResourceEntry{61623, "Disconnected from Server "},
    ResourceEntry{61627, "Unspecified Failure "},

    // Access texts.
    ResourceEntry{61630, "No Access"},
    ResourceEntry{61635, "Read \\ Write"},
    ResourceEntry{61636, "Write Only"},
    ResourceEntry{61637, "Read Only"},
};

static_assert(IsStrictlyIncreasing(kStrings), "string ids must be sorted and unique");

} // namespace

std::optional<std::string_view> FindString(std::uint32_t id)
{
    return FindEntry(kStrings, id);
}

std::span<const ResourceEntry> StringEntries()
{
    return kStrings;
}

} // namespace qv::resources
