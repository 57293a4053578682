#include "fen/osdep/AtomicFile.h"

#include "fen/osdep/ErrnoMapping.h"
#include "fen/osdep/OSException.h"

#include <atomic>
#include <cerrno>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace qv::fen::osdep {
namespace {

[[noreturn]] void ThrowErrno(const char* action, const std::string& path, int errnoValue)
{
    char buffer[256];
    std::string message = std::string("Cannot ") + action + " " + path + ": " +
                          ErrnoText(errnoValue, buffer, sizeof buffer);
    QV_THROW(WinError(String(message.c_str()), Win32ErrorFromErrno(errnoValue)));
}

std::string DirectoryOf(const std::string& path)
{
    const std::size_t slash = path.rfind('/');
    if (slash == std::string::npos)
        return ".";
    return slash == 0 ? "/" : path.substr(0, slash);
}

/// Creates a fresh temporary file beside `path`; its name is unique within
/// the process through the counter and across processes through the pid.
int CreateTemporary(const std::string& path, std::string& temporary)
{
    static std::atomic<unsigned> counter{0};
    const std::size_t slash = path.rfind('/');
    const std::string directory = slash == std::string::npos ? std::string() : path.substr(0, slash + 1);
    const std::string base = slash == std::string::npos ? path : path.substr(slash + 1);
    for (;;) {
        temporary = directory + "." + base + "." + std::to_string(::getpid()) + "." +
                    std::to_string(counter.fetch_add(1)) + ".tmp";
        const int fd = ::open(temporary.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
        if (fd >= 0 || errno != EEXIST)
            return fd;
    }
}

bool WriteAll(int fd, std::string_view bytes)
{
    while (!bytes.empty()) {
        const ssize_t n = ::write(fd, bytes.data(), bytes.size());
        if (n < 0) {
            if (errno == EINTR)
                continue;
            return false;
        }
        bytes.remove_prefix(static_cast<std::size_t>(n));
    }
    return true;
}

} // namespace

void WriteFileAtomically(const std::string& path, std::string_view bytes)
{
    std::string temporary;
    const int fd = CreateTemporary(path, temporary);
    if (fd < 0)
        ThrowErrno("create a temporary file for", path, errno);

    struct stat existing {};
    bool ok = WriteAll(fd, bytes);
    if (ok && ::stat(path.c_str(), &existing) == 0)
        ok = ::fchmod(fd, existing.st_mode & 07777) == 0;
    if (ok)
        ok = ::fsync(fd) == 0;
    int error = errno;
    if (::close(fd) != 0 && ok) {
        ok = false;
        error = errno;
    }
    if (ok && ::rename(temporary.c_str(), path.c_str()) != 0) {
        ok = false;
        error = errno;
    }
    if (!ok) {
        ::unlink(temporary.c_str());
        ThrowErrno("write", path, error);
    }

    // The new contents are in place once the rename has returned; flushing
    // the directory only makes the rename itself durable. Some file systems
    // refuse to flush a directory, which must not turn a completed write
    // into a reported failure.
    const int directory = ::open(DirectoryOf(path).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (directory >= 0) {
        ::fsync(directory);
        ::close(directory);
    }
}

} // namespace qv::fen::osdep
