#include "fen/osdep/ServiceRuntime.h"

#include "fen/osdep/ErrnoMapping.h"
#include "fen/osdep/OSException.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#ifndef QV_BUILD_BIN_DIR
#define QV_BUILD_BIN_DIR ""
#endif

namespace qv::fen::osdep {
namespace {

[[noreturn]] void ThrowErrno(const std::string& what, int errnoValue)
{
    char buffer[256];
    const std::string message = what + ": " + ErrnoText(errnoValue, buffer, sizeof buffer);
    QV_THROW(WinError(String(message.c_str()), Win32ErrorFromErrno(errnoValue)));
}

/// Creates `path` as a private folder of ours, or checks that the existing
/// one is: a real directory, owned by this user, closed to everyone else.
void MakePrivateDirectory(const std::string& path)
{
    if (::mkdir(path.c_str(), 0700) != 0 && errno != EEXIST)
        ThrowErrno("Cannot create " + path, errno);
    struct stat info {};
    if (::lstat(path.c_str(), &info) != 0)
        ThrowErrno("Cannot examine " + path, errno);
    if (!S_ISDIR(info.st_mode))
        ThrowErrno("Not a private directory " + path, ENOTDIR);
    if (info.st_uid != ::geteuid() || (info.st_mode & 077) != 0)
        ThrowErrno("Not a private directory " + path, EACCES);
}

bool IsExecutable(const std::string& path)
{
    struct stat info {};
    return ::stat(path.c_str(), &info) == 0 && S_ISREG(info.st_mode) && ::access(path.c_str(), X_OK) == 0;
}

std::string OwnProgramDirectory()
{
    char buffer[PATH_MAX];
    const ssize_t length = ::readlink("/proc/self/exe", buffer, sizeof buffer - 1);
    if (length <= 0)
        return {};
    std::string path(buffer, static_cast<std::size_t>(length));
    const std::size_t slash = path.rfind('/');
    return slash == std::string::npos ? std::string() : path.substr(0, slash);
}

} // namespace

bool IsValidServiceName(const std::string& name) noexcept
{
    if (name.empty() || name.size() > 256 || name == "." || name == "..")
        return false;
    for (char c : name)
        if (c == '/' || c == '\\' || c == '\0' || c == '\n')
            return false;
    return true;
}

std::string RuntimeDirectory()
{
    const char* runtime = std::getenv("XDG_RUNTIME_DIR");
    std::string directory;
    if (runtime != nullptr && runtime[0] == '/') {
        directory = runtime;
        while (directory.size() > 1 && directory.back() == '/')
            directory.pop_back();
        directory += "/varoscope";
    } else {
        directory = "/tmp/varoscope-" + std::to_string(::geteuid());
    }
    MakePrivateDirectory(directory);
    return directory;
}

std::string RuntimeSubdirectory(const char* name)
{
    const std::string directory = RuntimeDirectory() + "/" + name;
    MakePrivateDirectory(directory);
    return directory;
}

std::string MarkPath(const std::string& name) { return RuntimeSubdirectory("Global") + "/" + name; }
std::string StatusPath(const std::string& name) { return RuntimeSubdirectory("status") + "/" + name; }
std::string LogPath(const std::string& name) { return RuntimeSubdirectory("log") + "/" + name + ".log"; }

bool IsMarkHeld(const std::string& name)
{
    const std::string path = MarkPath(name);
    const int fd = ::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW);
    if (fd < 0) {
        if (errno == ENOENT)
            return false;
        ThrowErrno("Cannot open " + path, errno);
    }
    // A shared lock is refused exactly while someone holds the exclusive
    // mark; testers never block one another.
    bool held = false;
    if (::flock(fd, LOCK_SH | LOCK_NB) == 0) {
        ::flock(fd, LOCK_UN);
    } else if (errno == EWOULDBLOCK) {
        held = true;
    } else {
        const int error = errno;
        ::close(fd);
        ThrowErrno("Cannot test " + path, error);
    }
    ::close(fd);
    return held;
}

std::string BinDirectory()
{
    if (const char* own = std::getenv("VAROSCOPE_BIN_DIR"); own != nullptr && own[0] == '/')
        return own;
    if (std::string here = OwnProgramDirectory(); !here.empty() && IsExecutable(here + "/wfsvchost"))
        return here;
    return QV_BUILD_BIN_DIR;
}

std::string FindProgram(const char* program)
{
    const std::string path = BinDirectory() + "/" + program;
    if (!IsExecutable(path))
        QV_THROW(WinError(String(("Cannot find the program " + path).c_str()), 2));
    return path;
}

std::string FindDataFile(const char* name)
{
    const std::string path = BinDirectory() + "/../share/varoscope/" + name;
    if (::access(path.c_str(), R_OK) != 0)
        QV_THROW(WinError(String(("Cannot find the data file " + path).c_str()), 2));
    return path;
}

void ReplaceFile(const std::string& path, const std::string& bytes)
{
    const std::string temporary = path + ".tmp." + std::to_string(::getpid());
    const int fd = ::open(temporary.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC | O_NOFOLLOW, 0600);
    if (fd < 0)
        ThrowErrno("Cannot write " + temporary, errno);
    std::size_t done = 0;
    while (done < bytes.size()) {
        const ssize_t n = ::write(fd, bytes.data() + done, bytes.size() - done);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0) {
            const int error = n < 0 ? errno : EIO;
            ::close(fd);
            ::unlink(temporary.c_str());
            ThrowErrno("Cannot write " + temporary, error);
        }
        done += static_cast<std::size_t>(n);
    }
    if (::close(fd) != 0 || ::rename(temporary.c_str(), path.c_str()) != 0) {
        const int error = errno;
        ::unlink(temporary.c_str());
        ThrowErrno("Cannot replace " + path, error);
    }
}

} // namespace qv::fen::osdep
