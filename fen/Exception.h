#pragma once
/// \file
/// The root of the library's exception tree and its field-less classes.
///
/// Every failure inside the base library, the value model and the client is
/// thrown by value as one of these classes, stamped with the throw site's
/// source file and line (QV_THROW), and caught by reference.

#include <cstdint>
#include <exception>

namespace qv::fen::exception {

/// Root of the tree: "unspecified exception", status -1.
class Exception : public std::exception {
public:
    Exception() noexcept = default;
    Exception(const Exception&) noexcept = default;
    Exception& operator=(const Exception&) noexcept = default;
    ~Exception() override = default;

    const char* what() const noexcept override { return "unspecified exception"; }
    /// Status code fixed for the class; negative for failures.
    virtual std::int32_t GetErrorCode() const noexcept { return -1; }

    /// Source line of the throw site; 0 when the exception was not located.
    std::int32_t GetLine() const noexcept { return line_; }
    /// Source file of the throw site, a static text that is never copied;
    /// null when the exception was not located.
    const char* GetFile() const noexcept { return file_; }

    void SetSourceLocation(const char* file, std::int32_t line) noexcept
    {
        file_ = file;
        line_ = line;
    }

private:
    std::int32_t line_ = 0;
    const char* file_ = nullptr;
};

/// Declares a class of the tree that has no fields of its own.
#define QV_DECLARE_EXCEPTION(Name, Text, Code)                                  \
    class Name : public Exception {                                             \
    public:                                                                     \
        const char* what() const noexcept override { return Text; }             \
        std::int32_t GetErrorCode() const noexcept override                     \
        {                                                                       \
            return static_cast<std::int32_t>(Code);                             \
        }                                                                       \
    }

QV_DECLARE_EXCEPTION(InvalidLocale, "Invalid locale", 0x8ABC7024u);
QV_DECLARE_EXCEPTION(OutOfRange, "Out of range", 0x8ABC7007u);
QV_DECLARE_EXCEPTION(InvalidArgument, "Invalid argument(s)", 0x8ABC700Fu);
QV_DECLARE_EXCEPTION(InvalidOperation, "Invalid operation", 0x8ABC700Eu);
QV_DECLARE_EXCEPTION(BufferOverflow, "Buffer overflowed", 0x8ABC7017u);
QV_DECLARE_EXCEPTION(BadGuidString, "Badly formatted Guid string.", 0x8ABC7032u);
QV_DECLARE_EXCEPTION(ServiceFailure, "Unable to start service", 0x8ABC7006u);
QV_DECLARE_EXCEPTION(UnableToConvert, "Unable to convert.", 0x8ABC7034u);

#undef QV_DECLARE_EXCEPTION

/// Returns a copy of `e` stamped with the throw site; that copy is what is thrown.
template <typename E>
E WithSourceLocation(E e, const char* file, std::int32_t line) noexcept
{
    e.SetSourceLocation(file, line);
    return e;
}

} // namespace qv::fen::exception

/// Throws `e` stamped with the current source file and line.
#define QV_THROW(e) throw ::qv::fen::exception::WithSourceLocation((e), __FILE__, __LINE__)
