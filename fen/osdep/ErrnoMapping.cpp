#include "fen/osdep/ErrnoMapping.h"

#include <cerrno>
#include <cstddef>
#include <cstring>

namespace qv::fen::osdep {
namespace {

struct ErrnoPair {
    int errnoValue;
    std::uint32_t win32;
};

// The first row of a code wins in either direction.
constexpr ErrnoPair kPairs[] = {
    {0, 0},           // ERROR_SUCCESS
    {ENOENT, 2},      // ERROR_FILE_NOT_FOUND
    {ENOTDIR, 3},     // ERROR_PATH_NOT_FOUND
    {EMFILE, 4},      // ERROR_TOO_MANY_OPEN_FILES
    {ENFILE, 4},
    {EACCES, 5},      // ERROR_ACCESS_DENIED
    {EPERM, 5},
    {EISDIR, 5},
    {EBADF, 6},       // ERROR_INVALID_HANDLE
    {ENOMEM, 8},      // ERROR_NOT_ENOUGH_MEMORY
    {EFAULT, 487},    // ERROR_INVALID_ADDRESS
    {EROFS, 19},      // ERROR_WRITE_PROTECT
    {ENODEV, 20},     // ERROR_BAD_UNIT
    {ENXIO, 20},
    {EIO, 1117},      // ERROR_IO_DEVICE
    {EXDEV, 17},      // ERROR_NOT_SAME_DEVICE
    {EBUSY, 170},     // ERROR_BUSY
    {ETXTBSY, 32},    // ERROR_SHARING_VIOLATION
    {EDEADLK, 33},    // ERROR_LOCK_VIOLATION
    {ENOLCK, 36},     // ERROR_SHARING_BUFFER_EXCEEDED
    {EEXIST, 80},     // ERROR_FILE_EXISTS
    {EINVAL, 87},     // ERROR_INVALID_PARAMETER
    {EPIPE, 109},     // ERROR_BROKEN_PIPE
    {ENOSPC, 112},    // ERROR_DISK_FULL
    {ERANGE, 122},    // ERROR_INSUFFICIENT_BUFFER
    {E2BIG, 122},
    {ENAMETOOLONG, 206}, // ERROR_FILENAME_EXCED_RANGE
    {ENOTEMPTY, 145}, // ERROR_DIR_NOT_EMPTY
    {EAGAIN, 258},    // WAIT_TIMEOUT
    {EINTR, 995},     // ERROR_OPERATION_ABORTED
    {ECHILD, 128},    // ERROR_WAIT_NO_CHILDREN
    {ESRCH, 1062},    // ERROR_SERVICE_NOT_ACTIVE
    {ENOSYS, 50},     // ERROR_NOT_SUPPORTED
    {EOPNOTSUPP, 50},
    {EILSEQ, 1113},   // ERROR_NO_UNICODE_TRANSLATION
    {ETIMEDOUT, 1460}, // ERROR_TIMEOUT
    {ECONNREFUSED, 1225}, // ERROR_CONNECTION_REFUSED
    {EHOSTUNREACH, 1232}, // ERROR_HOST_UNREACHABLE
    {ENETUNREACH, 1231},  // ERROR_NETWORK_UNREACHABLE
    {ECONNRESET, 64}, // ERROR_NETNAME_DELETED
};

} // namespace

std::uint32_t Win32ErrorFromErrno(int errnoValue) noexcept
{
    for (const ErrnoPair& pair : kPairs)
        if (pair.errnoValue == errnoValue)
            return pair.win32;
    return kGenericWin32Error;
}

std::optional<int> ErrnoFromWin32Error(std::uint32_t win32Error) noexcept
{
    for (const ErrnoPair& pair : kPairs)
        if (pair.win32 == win32Error)
            return pair.errnoValue;
    return std::nullopt;
}

const char* ErrnoText(int errnoValue, char* buffer, std::size_t size) noexcept
{
    // The GNU strerror_r returns either a static text or `buffer`.
    return strerror_r(errnoValue, buffer, size);
}

} // namespace qv::fen::osdep
