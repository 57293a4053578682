#include "fen/osdep/OSException.h"

#include "fen/osdep/ErrnoMapping.h"

#include <cerrno>

namespace qv::fen::osdep {
namespace {

String SystemTextOfErrno(int errnoValue)
{
    char buffer[256];
    return String(ErrnoText(errnoValue, buffer, sizeof buffer));
}

} // namespace

OSException::OSException() : message_("Unknown error"), osError_(0) {}

OSException::OSException(const String& message, std::uint32_t osError)
    : message_(message), osError_(osError)
{
}

// The errno is read before anything else can change it.
WinError::WinError() : WinError(LastError{errno}) {}

WinError::WinError(LastError error)
    : OSException(SystemTextOfErrno(error.errnoValue), Win32ErrorFromErrno(error.errnoValue))
{
}

WinError::WinError(std::uint32_t osError) : OSException("Unknown error", osError)
{
    if (std::optional<int> errnoValue = ErrnoFromWin32Error(osError))
        SetMessage(SystemTextOfErrno(*errnoValue));
}

WinError::WinError(const String& message, std::uint32_t osError) : OSException(message, osError) {}

std::int32_t WinError::GetErrorCode() const noexcept
{
    return StatusOfWin32Error(GetOSErrorCode());
}

std::int32_t StatusOfWin32Error(std::uint32_t osError) noexcept
{
    switch (osError) {
    case 0: return 0;
    case 2: case 3: case 15: return 7;
    case 4: return 11;
    case 5: return static_cast<std::int32_t>(0x80070005u);
    case 6: case 87: return 1;
    case 8: case 14: return 2;
    case 11: return 23;
    case 16: case 19: case 32: case 33: return 8;
    case 20: return 37;
    case 23: return -508;
    case 38: return 4;
    case 39: return 9;
    case 80: return -98;
    default: return 42;
    }
}

} // namespace qv::fen::osdep
