#include "network/realtime/HostResolver.h"

#include "fen/osdep/MachineIdentity.h"
#include "network/protocol/TextCoding.h"

#include <arpa/inet.h>
#include <mutex>
#include <netdb.h>
#include <strings.h>
#include <sys/socket.h>

namespace qv::network::realtime {
namespace {

std::mutex g_resolverMutex;

std::shared_ptr<const HostResolver>& CurrentResolver()
{
    static std::shared_ptr<const HostResolver> resolver = std::make_shared<SystemHostResolver>();
    return resolver;
}

bool IsAddress(const std::string& text)
{
    unsigned char buffer[sizeof(in6_addr)];
    return inet_pton(AF_INET, text.c_str(), buffer) == 1 || inet_pton(AF_INET6, text.c_str(), buffer) == 1;
}

bool IsLocalName(const std::string& host)
{
    if (host.empty() || strcasecmp(host.c_str(), "localhost") == 0)
        return true;
    try {
        const auto& local = fen::osdep::GetCachedLocalHostName();
        const std::string name = protocol::Utf8FromUtf16(std::u16string_view(local.c_str(), local.length()));
        return !name.empty() && strcasecmp(host.c_str(), name.c_str()) == 0;
    } catch (...) {
        return false;
    }
}

} // namespace

std::optional<std::string> SystemHostResolver::Resolve(const std::string& host) const
{
    addrinfo hints{};
    hints.ai_family = AF_UNSPEC;
    hints.ai_socktype = SOCK_STREAM;
    addrinfo* found = nullptr;
    if (getaddrinfo(host.c_str(), nullptr, &hints, &found) != 0 || found == nullptr)
        return std::nullopt;
    std::optional<std::string> address;
    char text[INET6_ADDRSTRLEN] = {};
    for (const addrinfo* entry = found; entry != nullptr && !address; entry = entry->ai_next) {
        if (entry->ai_family == AF_INET
            && inet_ntop(AF_INET, &reinterpret_cast<const sockaddr_in*>(entry->ai_addr)->sin_addr, text, sizeof text))
            address = text;
    }
    for (const addrinfo* entry = found; entry != nullptr && !address; entry = entry->ai_next) {
        if (entry->ai_family == AF_INET6
            && inet_ntop(AF_INET6, &reinterpret_cast<const sockaddr_in6*>(entry->ai_addr)->sin6_addr, text,
                         sizeof text))
            address = text;
    }
    freeaddrinfo(found);
    return address;
}

std::shared_ptr<const HostResolver> SetHostResolver(std::shared_ptr<const HostResolver> resolver)
{
    if (!resolver)
        resolver = std::make_shared<SystemHostResolver>();
    std::lock_guard lock(g_resolverMutex);
    CurrentResolver().swap(resolver);
    return resolver;
}

std::optional<std::string> AddressOfHost(const std::string& host)
{
    if (IsLocalName(host))
        return std::string("127.0.0.1");
    if (IsAddress(host))
        return host;
    std::shared_ptr<const HostResolver> resolver;
    {
        std::lock_guard lock(g_resolverMutex);
        resolver = CurrentResolver();
    }
    return resolver->Resolve(host);
}

} // namespace qv::network::realtime
