#include "fen/osdep/ServiceNotify.h"

#include <cerrno>
#include <charconv>
#include <cstdlib>
#include <cstring>
#include <string>
#include <unistd.h>

namespace qv::fen::osdep {

namespace {

int NotifyFd()
{
    const char* variable = std::getenv(kServiceNotifyVariable);
    if (variable == nullptr)
        return -1;
    int fd = -1;
    const char* end = variable + std::strlen(variable);
    if (std::from_chars(variable, end, fd).ptr != end || fd < 0)
        return -1;
    return fd;
}

} // namespace

void EndServiceNotify()
{
    if (const int fd = NotifyFd(); fd >= 0)
        ::close(fd);
    ::unsetenv(kServiceNotifyVariable);
}

bool NotifyServiceHost(std::string_view line)
{
    const int fd = NotifyFd();
    if (fd < 0)
        return false;
    std::string text(line);
    text += '\n';
    std::size_t done = 0;
    while (done < text.size()) {
        const ssize_t n = ::write(fd, text.data() + done, text.size() - done);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            return false;
        done += static_cast<std::size_t>(n);
    }
    return true;
}

} // namespace qv::fen::osdep
