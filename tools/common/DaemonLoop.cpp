#include "DaemonLoop.h"

#include "fen/osdep/ServiceNotify.h"

#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <exception>

namespace qv::tools {

int RunPeriodicService(const char* program, std::chrono::milliseconds interval, const std::function<void()>& work,
                       const std::function<void()>& onStop)
{
    sigset_t stops;
    sigemptyset(&stops);
    sigaddset(&stops, SIGTERM);
    sigaddset(&stops, SIGINT);
    ::sigprocmask(SIG_BLOCK, &stops, nullptr);
    try {
        work();
    } catch (const std::exception& e) {
        std::fprintf(stderr, "%s: %s\n", program, e.what());
        return 1;
    }
    fen::osdep::NotifyServiceHost("READY");
    const timespec wait{static_cast<time_t>(interval.count() / 1000),
                        static_cast<long>(interval.count() % 1000) * 1000000L};
    for (;;) {
        const int signal = ::sigtimedwait(&stops, nullptr, &wait);
        if (signal == SIGTERM || signal == SIGINT)
            break;
        if (signal < 0 && errno != EAGAIN && errno != EINTR) {
            std::fprintf(stderr, "%s: sigtimedwait: %s\n", program, std::strerror(errno));
            break;
        }
        if (signal < 0 && errno == EINTR)
            continue;
        try {
            work();
        } catch (const std::exception& e) {
            std::fprintf(stderr, "%s: %s\n", program, e.what());
        }
    }
    if (onStop)
        onStop();
    return 0;
}

std::string JsonString(std::string_view text)
{
    std::string out = "\"";
    for (const char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        if (c == '"' || c == '\\') {
            out += '\\';
            out += c;
        } else if (byte < 0x20) {
            char escaped[8];
            std::snprintf(escaped, sizeof escaped, "\\u%04x", byte);
            out += escaped;
        } else {
            out += c;
        }
    }
    return out + "\"";
}

std::string UtcTimeText()
{
    const std::time_t now = std::time(nullptr);
    std::tm parts{};
    ::gmtime_r(&now, &parts);
    char text[32];
    std::strftime(text, sizeof text, "%Y-%m-%dT%H:%M:%SZ", &parts);
    return text;
}

std::chrono::milliseconds IntervalOption(int argc, char** argv, std::chrono::milliseconds fallback)
{
    for (int i = 1; i < argc; ++i) {
        if (std::strcmp(argv[i], "--interval") != 0)
            continue;
        char* end = nullptr;
        const long value = i + 1 < argc ? std::strtol(argv[i + 1], &end, 10) : 0;
        if (i + 1 >= argc || end == argv[i + 1] || *end != '\0' || value < 100 || value > 3600000) {
            std::fprintf(stderr, "%s: --interval needs a number of milliseconds from 100 to 3600000\n", argv[0]);
            std::exit(2);
        }
        return std::chrono::milliseconds(value);
    }
    return fallback;
}

} // namespace qv::tools
