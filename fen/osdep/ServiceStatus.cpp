#include "fen/osdep/ServiceStatus.h"

#include "fen/Exception.h"
#include "fen/osdep/ServiceRuntime.h"

#include <charconv>
#include <fstream>
#include <sstream>
#include <string_view>

namespace qv::fen::osdep {
namespace {

template <typename T>
bool ParseNumber(std::string_view text, T& out)
{
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), out);
    return error == std::errc() && end == text.data() + text.size();
}

std::optional<std::string> ReadWholeFile(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    if (!in)
        return std::nullopt;
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

} // namespace

const char* ServiceStateName(std::uint32_t state) noexcept
{
    switch (state) {
    case kServiceStopped: return "stopped";
    case kServiceStartPending: return "start-pending";
    case kServiceStopPending: return "stop-pending";
    case kServiceRunning: return "running";
    default: return "unknown";
    }
}

std::optional<std::uint64_t> ProcessStartTime(int pid)
{
    if (pid <= 0)
        return std::nullopt;
    const auto text = ReadWholeFile("/proc/" + std::to_string(pid) + "/stat");
    if (!text)
        return std::nullopt;
    // The command name in parentheses may hold blanks; the fields after it
    // are state (3rd) ... starttime (22nd).
    const std::size_t close = text->rfind(')');
    if (close == std::string::npos)
        return std::nullopt;
    std::istringstream fields(text->substr(close + 1));
    std::string field;
    for (int index = 3; index <= 22 && fields >> field; ++index) {
        if (index == 3 && field == "Z")
            return std::nullopt;
        if (index == 22) {
            std::uint64_t start = 0;
            if (ParseNumber(field, start))
                return start;
        }
    }
    return std::nullopt;
}

void WriteServiceStatus(const std::string& name, const ServiceStatus& s)
{
    std::ostringstream text;
    text << "state=" << s.state << "\ncheckpoint=" << s.checkpoint << "\nwaithint=" << s.waitHint
         << "\nhost=" << s.hostPid << "\nhoststart=" << s.hostStart << "\npid=" << s.processId << "\n";
    ReplaceFile(StatusPath(name), text.str());
}

std::optional<ServiceStatus> ReadServiceStatusFile(const std::string& name)
{
    std::optional<std::string> text;
    try {
        text = ReadWholeFile(StatusPath(name));
    } catch (const fen::exception::Exception&) {
        return std::nullopt;
    }
    if (!text)
        return std::nullopt;
    ServiceStatus s;
    int seen = 0;
    std::istringstream lines(*text);
    std::string line;
    while (std::getline(lines, line)) {
        const std::size_t equals = line.find('=');
        if (equals == std::string::npos)
            continue;
        const std::string_view key(line.data(), equals);
        const std::string_view value(line.data() + equals + 1, line.size() - equals - 1);
        bool ok = true;
        if (key == "state")
            ok = ParseNumber(value, s.state);
        else if (key == "checkpoint")
            ok = ParseNumber(value, s.checkpoint);
        else if (key == "waithint")
            ok = ParseNumber(value, s.waitHint);
        else if (key == "host")
            ok = ParseNumber(value, s.hostPid);
        else if (key == "hoststart")
            ok = ParseNumber(value, s.hostStart);
        else if (key == "pid")
            ok = ParseNumber(value, s.processId);
        else
            continue;
        if (!ok)
            return std::nullopt;
        ++seen;
    }
    if (seen != 6)
        return std::nullopt;
    return s;
}

ServiceStatus QueryServiceStatus(const std::string& name, std::uint32_t waitHint)
{
    ServiceStatus result;
    result.waitHint = waitHint;
    if (!IsMarkHeld(name))
        return result;
    const auto reported = ReadServiceStatusFile(name);
    if (reported && reported->hostPid > 0 && ProcessStartTime(reported->hostPid) == reported->hostStart) {
        result = *reported;
        // The host writes "stopped" just before it exits and lets the mark go.
        if (result.state == kServiceStopped)
            result.state = kServiceStopPending;
        if (result.waitHint == 0)
            result.waitHint = waitHint;
        return result;
    }
    result.state = kServiceRunning;
    return result;
}

} // namespace qv::fen::osdep
