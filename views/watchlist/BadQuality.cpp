#include "views/watchlist/BadQuality.h"

#include <algorithm>
#include <array>

namespace qv::views {
namespace {

constexpr std::array<std::string_view, 18> kBadFlags = {
    "sensor failure",
    "device error",
    "server failure",
    "process failure",
    "communication failure",
    "DNS failure",
    "host unreachable",
    "service lookup failure",
    "nonexistant",
    "resolve URL failure",
    "invalid URL",
    "no known value",
    "access denied",
    "math exception",
    "sensor inaccurate",
    "communications link failure",
    "disconnected",
    "subscription failure",
};
constexpr std::string_view kErrorCodeSuffix = "; error code: ";

bool IsBadFlag(std::string_view flag)
{
    return std::find(kBadFlags.begin(), kBadFlags.end(), flag) != kBadFlags.end();
}

} // namespace

bool IsBadQualityText(std::string_view cellText)
{
    if (cellText.find(kErrorCodeSuffix) != std::string_view::npos)
        return true;
    while (!cellText.empty()) {
        const std::size_t end = cellText.find(';');
        if (IsBadFlag(cellText.substr(0, end)))
            return true;
        if (end == std::string_view::npos)
            break;
        cellText.remove_prefix(end + 1);
    }
    return false;
}

} // namespace qv::views
