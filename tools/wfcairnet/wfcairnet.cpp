// wfcairnet: the service "WfCairnetServer", this host's Orvek data server.
// Writes the broker's configuration into "<runtime>/cairnet/cairnet.conf"
// from the shipped template, with the data port and bind address of the
// registry store, tells the service host to count the service as running
// once the port accepts connections, and becomes the broker (exec), so the
// broker is the service process that the host stops and watches.
//
// The broker is /usr/sbin/mosquitto unless VAROSCOPE_MOSQUITTO names another.

#include "fen/osdep/OrvekPort.h"
#include "fen/osdep/ServiceNotify.h"
#include "fen/osdep/ServiceRuntime.h"
#include "fen/osdep/TextConversion.h"

#include <arpa/inet.h>
#include <cerrno>
#include <clocale>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <pwd.h>
#include <sstream>
#include <stdexcept>
#include <string>
#include <unistd.h>

namespace {

using namespace qv::fen::osdep;

bool IsAddress(const std::string& text)
{
    unsigned char buffer[sizeof(in6_addr)];
    return ::inet_pton(AF_INET, text.c_str(), buffer) == 1 || ::inet_pton(AF_INET6, text.c_str(), buffer) == 1;
}

/// The address a readiness probe connects to for a listener bound to `bind`.
std::string ProbeAddress(const std::string& bind)
{
    if (bind.empty() || bind == "0.0.0.0")
        return "127.0.0.1";
    if (bind == "::")
        return "::1";
    return bind;
}

std::string AccountName()
{
    if (::geteuid() == 0)
        return "root";
    if (const passwd* entry = ::getpwuid(::geteuid()); entry != nullptr && entry->pw_name != nullptr)
        return entry->pw_name;
    return "nobody";
}

/// A value that goes into a configuration line: one word, no line break.
std::string ConfigWord(const std::string& value, const char* what)
{
    if (value.find_first_of(" \t\r\n") != std::string::npos)
        throw std::runtime_error(std::string(what) + " holds a blank or a line break: " + value);
    return value;
}

std::string ReadFile(const std::string& path)
{
    std::ifstream in(path, std::ios::binary);
    if (!in)
        throw std::runtime_error("cannot read " + path);
    std::ostringstream text;
    text << in.rdbuf();
    return text.str();
}

void Replace(std::string& text, const std::string& placeholder, const std::string& value)
{
    for (std::size_t at = text.find(placeholder); at != std::string::npos;
         at = text.find(placeholder, at + value.size()))
        text.replace(at, placeholder.size(), value);
}

} // namespace

int main()
{
    std::setlocale(LC_ALL, "");
    try {
        const std::string port = std::to_string(GetOrvekDataPort());
        const std::string bind = ToAnsi(GetOrvekDataBindAddress()).c_str();
        if (!bind.empty() && !IsAddress(bind))
            throw std::runtime_error("DataBindAddress is not an IP address: " + bind);
        const std::string directory = RuntimeSubdirectory("cairnet");
        const std::string configuration = directory + "/cairnet.conf";

        std::string text = ReadFile(FindDataFile("cairnet.conf.in"));
        Replace(text, "@DATA_PORT@", port);
        Replace(text, "@BIND_ADDRESS@", bind);
        Replace(text, "@RUN_AS_USER@", ConfigWord(AccountName(), "the account name"));
        Replace(text, "@LOG_FILE@", ConfigWord(directory + "/broker.log", "the log path"));
        Replace(text, " \n", "\n"); // "listener PORT " when every interface is meant
        ReplaceFile(configuration, text);

        const char* broker = std::getenv("VAROSCOPE_MOSQUITTO");
        if (broker == nullptr || broker[0] == '\0')
            broker = "/usr/sbin/mosquitto";
        NotifyServiceHost("WAITPORT " + ProbeAddress(bind) + " " + port);
        EndServiceNotify();
        ::execl(broker, "mosquitto", "-c", configuration.c_str(), static_cast<char*>(nullptr));
        throw std::runtime_error(std::string("cannot run ") + broker + ": " + std::strerror(errno));
    } catch (const std::exception& e) {
        std::fprintf(stderr, "wfcairnet: %s\n", e.what());
        return 1;
    }
}
