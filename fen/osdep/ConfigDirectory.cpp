#include "fen/osdep/ConfigDirectory.h"

#include "fen/osdep/ErrnoMapping.h"
#include "fen/osdep/OSException.h"

#include <cerrno>
#include <cstdlib>
#include <pwd.h>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

namespace qv::fen::osdep {
namespace {

[[noreturn]] void ThrowErrno(const std::string& path, int errnoValue)
{
    char buffer[256];
    std::string message = "Cannot create the configuration directory " + path + ": " +
                          ErrnoText(errnoValue, buffer, sizeof buffer);
    QV_THROW(WinError(String(message.c_str()), Win32ErrorFromErrno(errnoValue)));
}

const char* Variable(const char* name)
{
    const char* value = std::getenv(name);
    return value != nullptr && value[0] != '\0' ? value : nullptr;
}

std::string WithoutTrailingSlashes(std::string path)
{
    while (path.size() > 1 && path.back() == '/')
        path.pop_back();
    return path;
}

std::string HomeDirectory()
{
    if (const char* home = Variable("HOME"))
        return home;
    std::vector<char> buffer(16384);
    passwd entry{};
    passwd* found = nullptr;
    if (::getpwuid_r(::getuid(), &entry, buffer.data(), buffer.size(), &found) == 0 && found != nullptr &&
        found->pw_dir != nullptr && found->pw_dir[0] != '\0')
        return found->pw_dir;
    QV_THROW(WinError(String("Cannot find the configuration directory: no home directory"), 3));
}

/// Creates `path` and its missing parents, each with mode 0700.
void MakeDirectories(const std::string& path)
{
    for (std::size_t end = path.find('/', 1);; end = path.find('/', end + 1)) {
        const std::string part = path.substr(0, end);
        if (::mkdir(part.c_str(), 0700) != 0 && errno != EEXIST)
            ThrowErrno(part, errno);
        if (end == std::string::npos)
            break;
    }
    struct stat info {};
    if (::stat(path.c_str(), &info) != 0)
        ThrowErrno(path, errno);
    if (!S_ISDIR(info.st_mode))
        ThrowErrno(path, ENOTDIR);
}

} // namespace

std::string ConfigDirectory()
{
    std::string directory;
    if (const char* own = Variable("VAROSCOPE_HOME"))
        directory = WithoutTrailingSlashes(own);
    else if (const char* config = Variable("XDG_CONFIG_HOME"); config != nullptr && config[0] == '/')
        directory = WithoutTrailingSlashes(config) + "/varoscope";
    else
        directory = WithoutTrailingSlashes(HomeDirectory()) + "/.config/varoscope";
    MakeDirectories(directory);
    return directory;
}

} // namespace qv::fen::osdep
