#pragma once
/// \file
/// Operating-system failures: the OS error code and the system's text.
///
/// On this platform the code is the Win32-equivalent of the errno (see
/// ErrnoMapping.h) and the text is strerror's for that errno.

#include "fen/Exception.h"
#include "fen/String.h"

#include <cstdint>

namespace qv::fen::osdep {

class OSException : public exception::Exception {
public:
    /// "Unknown error", code 0.
    OSException();
    OSException(const String& message, std::uint32_t osError);

    const char* what() const noexcept override { return message_.c_str(); }
    std::int32_t GetErrorCode() const noexcept override { return 42; }
    virtual std::uint32_t GetOSErrorCode() const noexcept { return osError_; }

protected:
    void SetMessage(const String& message) { message_ = message; }

private:
    String message_;
    std::uint32_t osError_;
};

/// An OSException whose code is a Win32 error code, with a status code
/// mapped from it.
class WinError : public OSException {
public:
    /// The calling thread's last OS error (errno), taken first thing, with
    /// the system's text for it.
    WinError();
    /// "Unknown error", replaced by the system's text for `osError` where
    /// the system has one.
    explicit WinError(std::uint32_t osError);
    /// The caller's own text.
    WinError(const String& message, std::uint32_t osError);

    std::int32_t GetErrorCode() const noexcept override;

private:
    struct LastError {
        int errnoValue;
    };
    explicit WinError(LastError error);
};

/// The status code of a Win32 error code; 42 for codes without one.
std::int32_t StatusOfWin32Error(std::uint32_t osError) noexcept;

} // namespace qv::fen::osdep
