#pragma once
/// \file
/// The text and byte encodings that the protocol's messages and topics use:
/// UTF-8 to and from UTF-16, and base64.

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace qv::network::protocol {

/// True when `text` is well-formed UTF-8 (no overlong forms, no surrogate
/// code points, nothing above U+10FFFF).
bool IsValidUtf8(std::string_view text) noexcept;

/// True when every surrogate of `text` is part of a pair.
bool IsWellFormedUtf16(std::u16string_view text) noexcept;

/// UTF-8 of `text`. A lone surrogate is written as the three bytes that its
/// code point would take, so that every UTF-16 text, well-formed or not,
/// has its own byte sequence; the result is valid UTF-8 exactly when `text`
/// is well-formed.
std::string Utf8FromUtf16(std::u16string_view text);

/// The inverse of Utf8FromUtf16: UTF-8, plus surrogate code points written
/// as three bytes. Anything else (overlong forms, stray or missing
/// continuation bytes, code points above U+10FFFF) throws ProtocolError.
std::u16string Utf16FromUtf8(std::string_view text);

/// Base64 of `bytes` (RFC 4648 alphabet, with "=" padding, no line breaks).
std::string Base64Encode(const std::uint8_t* bytes, std::size_t count);

/// The bytes of base64 `text`. Only the form that Base64Encode writes is
/// accepted: no white space, padding only at the end and only as needed,
/// unused bits zero; anything else throws ProtocolError.
std::vector<std::uint8_t> Base64Decode(std::string_view text);

} // namespace qv::network::protocol
