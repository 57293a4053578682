#include "fen/osdep/MachineIdentity.h"

#include "fen/osdep/Mutex.h"
#include "fen/osdep/RegKey.h"

#include <atomic>
#include <fstream>
#include <mutex>
#include <sstream>
#include <sys/utsname.h>
#include <unistd.h>

namespace qv::fen::osdep {
namespace {

std::mutex sourceLock;
std::shared_ptr<const HostNameSource> currentSource;

std::shared_ptr<const HostNameSource> Source()
{
    std::lock_guard lock(sourceLock);
    if (!currentSource)
        currentSource = std::make_shared<HostNameSource>();
    return currentSource;
}

/// Skips leading blanks and ends the name at the next blank.
std::string Trimmed(const std::string& raw)
{
    const std::size_t first = raw.find_first_not_of(" \t");
    if (first == std::string::npos)
        return std::string();
    const std::size_t last = raw.find_first_of(" \t", first);
    return raw.substr(first, last == std::string::npos ? std::string::npos : last - first);
}

std::optional<WString> ConfiguredMachineName()
{
    try {
        RegKey key(kLocalMachine, WString(u"Orvek"), true, false);
        return key.GetStringValue(WString(u"MachineName"));
    } catch (const exception::Exception&) {
        return std::nullopt;
    }
}

std::optional<WString> ConfiguredDomain()
{
    try {
        RegKey key(kLocalMachine, WString(u"SYSTEM\\CurrentControlSet\\Services\\Tcpip\\Parameters"), true, false,
                   u"");
        return key.GetStringValue(WString(u"Domain"));
    } catch (const exception::Exception&) {
        return std::nullopt;
    }
}

Mutex cacheLock;
std::atomic<bool> cacheFilled{false};
WString& CachedName()
{
    static WString name;
    return name;
}

} // namespace

std::optional<std::string> HostNameSource::HostName() const
{
    char buffer[261] = {};
    if (gethostname(buffer, sizeof buffer - 1) != 0)
        return std::nullopt;
    return std::string(buffer);
}

std::optional<std::string> HostNameSource::ComputerName() const
{
    utsname names{};
    if (uname(&names) != 0)
        return std::nullopt;
    return std::string(names.nodename).substr(0, 15);
}

std::optional<std::string> HostNameSource::ResolverDomain() const
{
    std::ifstream file("/etc/resolv.conf");
    std::string line;
    std::optional<std::string> search;
    while (std::getline(file, line)) {
        std::istringstream words(line);
        std::string keyword, value;
        if (!(words >> keyword >> value))
            continue;
        if (keyword == "domain")
            return value;
        if (keyword == "search" && !search)
            search = value;
    }
    return search;
}

std::shared_ptr<const HostNameSource> SetHostNameSource(std::shared_ptr<const HostNameSource> source)
{
    if (!source)
        source = std::make_shared<HostNameSource>();
    std::lock_guard lock(sourceLock);
    currentSource.swap(source);
    return source;
}

WString CompleteWithDomain(const WString& name)
{
    if (name.find(u'.') != WString::npos)
        return name;
    WString domain;
    if (std::optional<WString> configured = ConfiguredDomain()) {
        domain = *configured;
    } else {
        std::optional<std::string> resolver;
        try {
            resolver = Source()->ResolverDomain();
        } catch (...) {
        }
        if (!resolver || resolver->empty())
            return name;
        domain = WString(resolver->c_str());
    }
    if (!domain.empty() && domain[0] == u'.')
        return name + domain;
    return name + u"." + domain;
}

WString GetLocalHostName(bool fullyQualified)
{
    try {
        if (std::optional<WString> configured = ConfiguredMachineName())
            return fullyQualified ? CompleteWithDomain(*configured) : *configured;

        const std::shared_ptr<const HostNameSource> source = Source();
        // A name that is only blanks counts as no name.
        std::optional<std::string> host = source->HostName();
        if (host && !Trimmed(*host).empty()) {
            const WString name(Trimmed(*host).c_str());
            return fullyQualified ? CompleteWithDomain(name) : name;
        }
        std::optional<std::string> computer = source->ComputerName();
        if (computer && !Trimmed(*computer).empty())
            return WString(Trimmed(*computer).c_str());
    } catch (...) {
        // Nothing about the machine's names is worth failing for.
    }
    return WString(u"localhost");
}

const WString& GetCachedLocalHostName()
{
    if (cacheFilled.load(std::memory_order_acquire))
        return CachedName();
    std::lock_guard lock(cacheLock);
    if (!cacheFilled.load(std::memory_order_relaxed)) {
        CachedName() = GetLocalHostName(false);
        cacheFilled.store(true, std::memory_order_release);
    }
    return CachedName();
}

void ResetCachedLocalHostNameForTesting()
{
    std::lock_guard lock(cacheLock);
    cacheFilled.store(false, std::memory_order_release);
}

} // namespace qv::fen::osdep
