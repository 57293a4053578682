// wfsc: lists, starts and stops this machine's network services.
//
//   wfsc list                                  every defined service
//   wfsc status NAME                           one service; exit 0 running, 3 not
//   wfsc start NAME [ARG...]                   start and wait until it runs
//   wfsc stop NAME [--kill] [--timeout MS]     stop it (and its dependents)
//   wfsc ensure                                start the services the monitor needs
//
// Exit codes: 0 done, 1 the operation failed, 2 bad usage, 3 (status) not running.

#include "fen/Exception.h"
#include "fen/osdep/Daemon.h"
#include "fen/osdep/ServiceDefinition.h"
#include "fen/osdep/ServiceRuntime.h"
#include "fen/osdep/ServiceStatus.h"
#include "fen/osdep/TextConversion.h"

#include <clocale>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

namespace {

using namespace qv::fen::osdep;

constexpr int kOk = 0;
constexpr int kFailed = 1;
constexpr int kUsage = 2;
constexpr int kNotRunning = 3;

int Usage()
{
    std::fprintf(stderr, "usage: wfsc list\n"
                         "       wfsc status NAME\n"
                         "       wfsc start NAME [ARG...]\n"
                         "       wfsc stop NAME [--kill] [--timeout MS]\n"
                         "       wfsc ensure\n");
    return kUsage;
}

std::string LogHint(const std::string& name)
{
    try {
        return " (see " + LogPath(name) + ")";
    } catch (const std::exception&) {
        return {};
    }
}

int List()
{
    // The required services are listed even before anything started them:
    // loading a definition writes its default when it is absent.
    for (const std::string& name : RequiredServiceNames())
        LoadServiceDefinition(name);
    std::printf("%-20s %-10s %-14s %s\n", "NAME", "PID", "STATE", "DISPLAY NAME");
    for (const std::string& name : ListServiceNames()) {
        const auto definition = LoadServiceDefinition(name);
        if (!definition)
            continue;
        const ServiceStatus status = QueryServiceStatus(name, definition->waitHint);
        const std::string pid = status.processId > 0 ? std::to_string(status.processId) : "-";
        std::printf("%-20s %-10s %-14s %s\n", name.c_str(), pid.c_str(), ServiceStateName(status.state),
                    definition->displayName.c_str());
    }
    return kOk;
}

int Status(const std::string& name)
{
    const auto definition = LoadServiceDefinition(name);
    if (!definition) {
        std::fprintf(stderr, "wfsc: no service named %s\n", name.c_str());
        return kFailed;
    }
    const ServiceStatus status = QueryServiceStatus(definition->name, definition->waitHint);
    std::printf("name:         %s\n", definition->name.c_str());
    std::printf("display name: %s\n", definition->displayName.c_str());
    std::printf("command:      %s\n", definition->imagePath.c_str());
    std::string depends;
    for (const std::string& dependency : definition->dependOnService)
        depends += (depends.empty() ? "" : ", ") + dependency;
    std::printf("depends on:   %s\n", depends.empty() ? "-" : depends.c_str());
    std::printf("state:        %s\n", ServiceStateName(status.state));
    if (status.state != kServiceStopped) {
        std::printf("pid:          %d\n", status.processId);
        std::printf("host pid:     %d%s\n", status.hostPid, status.hostPid == 0 ? " (marked by another process)" : "");
    }
    std::printf("log:          %s\n", LogPath(definition->name).c_str());
    return status.state == kServiceStopped ? kNotRunning : kOk;
}

int Start(const std::string& name, const std::vector<std::string>& arguments)
{
    if (!LoadServiceDefinition(name)) {
        std::fprintf(stderr, "wfsc: no service named %s\n", name.c_str());
        return kFailed;
    }
    std::vector<qv::fen::WString> wide;
    for (const std::string& argument : arguments)
        wide.push_back(ToWide(qv::fen::String(argument.c_str())));
    std::vector<const char16_t*> argv;
    for (const auto& argument : wide)
        argv.push_back(argument.c_str());
    try {
        StartDaemon(WideName(name), static_cast<std::uint32_t>(argv.size()), argv.data(), false);
    } catch (const qv::fen::exception::Exception& e) {
        std::fprintf(stderr, "wfsc: %s: %s%s\n", name.c_str(), e.what(), LogHint(name).c_str());
        return kFailed;
    }
    std::printf("%s is running\n", name.c_str());
    return kOk;
}

int Stop(const std::string& name, int argc, char** argv)
{
    bool kill = false;
    std::uint32_t timeout = 30000;
    for (int i = 0; i < argc; ++i) {
        if (std::strcmp(argv[i], "--kill") == 0) {
            kill = true;
        } else if (std::strcmp(argv[i], "--timeout") == 0 && i + 1 < argc) {
            char* end = nullptr;
            const unsigned long value = std::strtoul(argv[++i], &end, 10);
            if (end == argv[i] || *end != '\0' || value == 0 || value > 3600000)
                return Usage();
            timeout = static_cast<std::uint32_t>(value);
        } else {
            return Usage();
        }
    }
    if (!LoadServiceDefinition(name)) {
        std::fprintf(stderr, "wfsc: no service named %s\n", name.c_str());
        return kFailed;
    }
    try {
        StopDaemon(WideName(name), kill, timeout);
    } catch (const qv::fen::exception::Exception&) {
        std::fprintf(stderr, "wfsc: %s: could not be stopped within %u ms%s%s\n", name.c_str(), timeout,
                     kill ? " and was killed" : "", LogHint(name).c_str());
        return kFailed;
    }
    std::printf("%s is stopped\n", name.c_str());
    return kOk;
}

int Ensure()
{
    try {
        EnsureRequiredDaemons();
    } catch (const qv::fen::exception::Exception& e) {
        std::fprintf(stderr, "wfsc: %s\n", e.what());
        return kFailed;
    }
    for (const std::string& name : RequiredServiceNames())
        std::printf("%s is running\n", name.c_str());
    return kOk;
}

} // namespace

int main(int argc, char** argv)
{
    std::setlocale(LC_ALL, "");
    if (argc < 2)
        return Usage();
    const std::string command = argv[1];
    try {
        if (command == "list" && argc == 2)
            return List();
        if (command == "ensure" && argc == 2)
            return Ensure();
        if (command == "status" && argc == 3)
            return Status(argv[2]);
        if (command == "start" && argc >= 3)
            return Start(argv[2], std::vector<std::string>(argv + 3, argv + argc));
        if (command == "stop" && argc >= 3)
            return Stop(argv[2], argc - 3, argv + 3);
    } catch (const std::exception& e) {
        std::fprintf(stderr, "wfsc: %s\n", e.what());
        return kFailed;
    }
    return Usage();
}
