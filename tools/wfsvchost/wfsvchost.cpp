// wfsvchost: the service host. Runs one service defined in the registry
// store, marks it as running by holding its lock for as long as it runs,
// and reports its state for the service-control functions to read.
//
// Usage: wfsvchost [--handshake-fd FD] NAME [ARG...]
// With FD, one line reports how the start went: "started <pid>", "running"
// (someone holds the mark already) or "error <text>".
// Exit codes: 0 the service ran and stopped, 1 it could not be started,
// 2 bad usage, 3 the service was marked as running already.

#include "ServiceHost.h"

#include <clocale>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

int main(int argc, char** argv)
{
    std::setlocale(LC_ALL, "");
    int handshakeFd = -1;
    int at = 1;
    if (at + 1 < argc && std::strcmp(argv[at], "--handshake-fd") == 0) {
        char* end = nullptr;
        const long fd = std::strtol(argv[at + 1], &end, 10);
        if (end == argv[at + 1] || *end != '\0' || fd < 0 || fd > 1024) {
            std::fprintf(stderr, "wfsvchost: bad descriptor %s\n", argv[at + 1]);
            return qv::tools::kHostUsage;
        }
        handshakeFd = static_cast<int>(fd);
        at += 2;
    }
    if (at >= argc) {
        std::fprintf(stderr, "usage: wfsvchost [--handshake-fd FD] NAME [ARG...]\n");
        return qv::tools::kHostUsage;
    }
    const std::string name = argv[at];
    const std::vector<std::string> arguments(argv + at + 1, argv + argc);
    return qv::tools::RunServiceHost(name, arguments, handshakeFd);
}
