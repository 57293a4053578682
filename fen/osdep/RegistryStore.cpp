#include "fen/osdep/RegistryStore.h"

#include "fen/osdep/AtomicFile.h"
#include "fen/osdep/ConfigDirectory.h"
#include "fen/osdep/ErrnoMapping.h"
#include "fen/osdep/OSException.h"
#include "fen/osdep/RegistryFormat.h"

#include <cerrno>
#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

namespace qv::fen::osdep::registry {
namespace {

constexpr std::uint32_t kErrorInvalidHandle = 6;

std::string ErrnoMessage(const std::string& what, int errnoValue)
{
    char buffer[256];
    return what + ": " + ErrnoText(errnoValue, buffer, sizeof buffer);
}

/// A flock on the lock file beside a store file, released on destruction.
class StoreLock {
public:
    /// Takes the lock; when `shared` is set and the lock file cannot be made
    /// (a read-only directory), reads go ahead unlocked, which is safe since
    /// the store file is only ever replaced whole.
    StoreLock(const std::string& file, bool shared)
    {
        const std::string lockFile = file + ".lock";
        fd_ = ::open(lockFile.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600);
        if (fd_ < 0) {
            if (shared && (errno == EACCES || errno == EROFS))
                return;
            const int error = errno;
            QV_THROW(WinError(String(ErrnoMessage("Cannot open the registry lock file " + lockFile, error).c_str()),
                              Win32ErrorFromErrno(error)));
        }
        while (::flock(fd_, shared ? LOCK_SH : LOCK_EX) != 0) {
            if (errno == EINTR)
                continue;
            const int error = errno;
            ::close(fd_);
            QV_THROW(WinError(String(ErrnoMessage("Cannot lock the registry lock file " + lockFile, error).c_str()),
                              Win32ErrorFromErrno(error)));
        }
    }
    ~StoreLock()
    {
        if (fd_ >= 0)
            ::close(fd_); // closing the only descriptor releases the flock
    }
    StoreLock(const StoreLock&) = delete;
    StoreLock& operator=(const StoreLock&) = delete;

private:
    int fd_ = -1;
};

/// The bytes of `file`; false when it does not exist.
bool ReadFile(const std::string& file, std::string& bytes)
{
    const int fd = ::open(file.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0 && errno == ENOENT)
        return false;
    int error = fd < 0 ? errno : 0;
    if (fd >= 0) {
        char buffer[65536];
        for (;;) {
            const ssize_t n = ::read(fd, buffer, sizeof buffer);
            if (n > 0)
                bytes.append(buffer, static_cast<std::size_t>(n));
            else if (n == 0)
                break;
            else if (errno != EINTR) {
                error = errno;
                break;
            }
        }
        ::close(fd);
    }
    if (error != 0)
        QV_THROW(WinError(String(ErrnoMessage("Cannot read the registry store file " + file, error).c_str()),
                          kErrorCorruptStore));
    return true;
}

StoredKey ReadUnlocked(const std::string& file)
{
    std::string bytes;
    if (!ReadFile(file, bytes))
        return StoredKey();
    return ParseStore(bytes, file);
}

/// The root's name from the store file's name, for the file's heading.
std::string RootNameOfFile(const std::string& file)
{
    const std::size_t slash = file.rfind('/');
    std::string name = file.substr(slash == std::string::npos ? 0 : slash + 1);
    const std::size_t dot = name.rfind('.');
    return dot == std::string::npos ? name : name.substr(0, dot);
}

} // namespace

const char* RootName(std::uint32_t rootCode)
{
    switch (rootCode) {
    case kCurrentUser: return "HKEY_CURRENT_USER";
    case kLocalMachine:
    case kLocalMachine32:
    case kLocalMachine64: return "HKEY_LOCAL_MACHINE";
    case kClassesRoot: return "HKEY_CLASSES_ROOT";
    case kUsers: return "HKEY_USERS";
    default:
        QV_THROW(WinError(String(("Invalid registry root code " + std::to_string(rootCode)).c_str()),
                          kErrorInvalidHandle));
    }
}

std::string StoreFileOfRoot(std::uint32_t rootCode)
{
    const char* name = RootName(rootCode);
    return ConfigDirectory() + "/" + name + ".reg";
}

StoredKey ReadStore(const std::string& file)
{
    StoreLock lock(file, true);
    return ReadUnlocked(file);
}

void ChangeStore(const std::string& file, const std::function<bool(StoredKey& root)>& change)
{
    StoreLock lock(file, false);
    StoredKey root = ReadUnlocked(file);
    if (change(root))
        WriteFileAtomically(file, FormatStore(root, RootNameOfFile(file)));
}

} // namespace qv::fen::osdep::registry
