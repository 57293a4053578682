#include "fen/osdep/Daemon.h"
#include "fen/osdep/DaemonInternal.h"
#include "fen/osdep/OSException.h"

#include <new>

namespace qv::fen::osdep {
namespace {

std::int32_t StatusOfError(std::uint32_t code)
{
    return code > 0 ? static_cast<std::int32_t>(0x80070000u | (code & 0xFFFFu)) : static_cast<std::int32_t>(code);
}

/// Applies `action` to each dependent of `service` whose activity is
/// `active`, in stored order, and turns every failure into a status.
template <typename Action>
std::int32_t ForEachDependent(const WString& service, bool active, Action action)
{
    std::vector<std::string> chosen;
    try {
        for (const std::string& dependent : DependentServiceNames(NarrowName(service))) {
            const auto definition = LoadServiceDefinition(dependent);
            if (definition && (daemon::Query(*definition).state != kServiceStopped) == active)
                chosen.push_back(dependent);
        }
    } catch (const std::bad_alloc&) {
        return kDaemonOutOfMemory;
    } catch (const WinError& e) {
        return StatusOfError(e.GetOSErrorCode());
    } catch (...) {
        return kDaemonFailed;
    }
    for (const std::string& dependent : chosen) {
        try {
            action(WideName(dependent));
        } catch (...) {
            return kDaemonFailed;
        }
    }
    return kDaemonOk;
}

} // namespace

std::int32_t StartDependentDaemons(const WString& service, bool startDependents)
{
    return ForEachDependent(service, false,
                            [&](const WString& dependent) { StartDaemon(dependent, 0, nullptr, startDependents); });
}

std::int32_t StopDependentDaemons(const WString& service, bool killOnTimeout, std::uint32_t timeoutMs)
{
    return ForEachDependent(service, true,
                            [&](const WString& dependent) { StopDaemon(dependent, killOnTimeout, timeoutMs); });
}

} // namespace qv::fen::osdep

