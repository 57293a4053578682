#pragma once
/// \file
/// Correspondence between POSIX errno values and Win32 error codes.

#include <cstddef>
#include <cstdint>
#include <optional>

namespace qv::fen::osdep {

/// Win32 code for a failure that has no closer equivalent (ERROR_GEN_FAILURE).
inline constexpr std::uint32_t kGenericWin32Error = 31;

/// The Win32-equivalent code of `errnoValue`; kGenericWin32Error when none.
std::uint32_t Win32ErrorFromErrno(int errnoValue) noexcept;

/// The errno whose Win32 equivalent is `win32Error`, if there is one.
std::optional<int> ErrnoFromWin32Error(std::uint32_t win32Error) noexcept;

/// strerror's text for `errnoValue`, safe to call from any thread.
const char* ErrnoText(int errnoValue, char* buffer, std::size_t size) noexcept;

} // namespace qv::fen::osdep
