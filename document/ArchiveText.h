#pragma once
/// \file
/// The field encoding of document files: a file is a sequence of text
/// fields, and numbers are text fields holding their decimal form.
///
/// A text field is a length followed by that many characters, no terminator:
///
///     n < 255             1 byte n
///     255 <= n < 0xFFFE   0xFF, then n as 16-bit little-endian
///     n >= 0xFFFE         0xFF, 0xFFFF, then n as 32-bit little-endian
///
/// Fields written here always hold 8-bit characters in the system code page.
/// A wide field, as older files may hold, starts with 0xFF and the 16-bit
/// marker 0xFFFE, then a length coded as above, then n 16-bit little-endian
/// characters; the reader converts it to 8-bit text in the system code page.

#include "fen/Exception.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace qv::document {

/// A document file (or another saved file of the document layer) whose bytes
/// do not form what they should: it ends early or holds an impossible value.
/// The message says what is wrong and at which byte offset.
class DocumentFormatError : public fen::exception::Exception {
public:
    explicit DocumentFormatError(std::string message) : message_(std::move(message)) {}
    const char* what() const noexcept override { return message_.c_str(); }

private:
    std::string message_;
};

/// Appends `text` as an 8-bit text field, with the shortest length form.
/// A text of 0xFFFFFFFF bytes or more has no length form and throws
/// DocumentFormatError.
void AppendTextField(std::string& out, std::string_view text);

/// Appends `value` as a text field holding its signed decimal form (a minus
/// sign for negative values, no leading zeros or blanks).
void AppendNumberField(std::string& out, std::int64_t value);

/// Reads fields one after the other from bytes that the caller keeps alive.
/// Every read checks that the bytes it needs remain before it takes or
/// allocates anything; when they do not, it throws DocumentFormatError.
class ArchiveReader {
public:
    explicit ArchiveReader(std::string_view bytes) noexcept : bytes_(bytes) {}

    /// The next text field as 8-bit text; a wide field is converted from
    /// UTF-16 to the system code page.
    std::string ReadText();

    /// The next text field read as a number, as the standard decimal
    /// conversion reads it: leading blanks skipped, an optional sign, then
    /// digits up to the first character that is not one; no digits give 0,
    /// and values beyond the signed 32-bit range give its nearest limit.
    std::int32_t ReadNumber();

    /// Byte offset of the next field.
    std::size_t Offset() const noexcept { return offset_; }
    /// True when no bytes remain.
    bool AtEnd() const noexcept { return offset_ == bytes_.size(); }

private:
    std::uint64_t ReadUnsigned(std::size_t width, std::size_t fieldStart);
    std::string_view Take(std::uint64_t count, std::size_t fieldStart);

    std::string_view bytes_;
    std::size_t offset_ = 0;
};

} // namespace qv::document
