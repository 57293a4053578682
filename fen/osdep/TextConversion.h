#pragma once
/// \file
/// Conversion between 16-bit text and 8-bit text in a code page.
///
/// The library knows three code-page names, compared exactly: "" is the
/// system code page (the current locale's charset), "US-ASCII" and "cp932";
/// any other name throws InvalidLocale. A character the target cannot
/// represent becomes '?' in 8-bit text and U+FFFD in 16-bit text, so that
/// text is never refused for its content. A failure of the converter itself
/// throws WinError.

#include "fen/String.h"

#include <cstddef>
#include <cstdint>

namespace qv::fen::osdep {

inline constexpr std::uint32_t kSystemCodePage = 0;
inline constexpr std::uint32_t kUsAsciiCodePage = 20127;
inline constexpr std::uint32_t kJapaneseCodePage = 932;

/// The code page of `name`: 0, 20127 or 932; anything else throws InvalidLocale.
std::uint32_t CodePageFromName(const char* name);

/// Converts [begin, end) to a NUL-terminated buffer from new[]; the caller
/// releases it with delete[]. An empty input gives a buffer holding only NUL.
char* WideToAnsi(const char16_t* begin, const char16_t* end, const char* codePageName = "");

/// Converts at most `maxLength` bytes of `text`, stopping early at a NUL,
/// to a NUL-terminated buffer from new[].
char16_t* AnsiToWide(const char* text, std::size_t maxLength, const char* codePageName = "");

/// Converts into the caller's buffer of `capacity` bytes and returns the
/// number written, without a NUL. Output that does not fit throws WinError
/// with the insufficient-buffer code (122).
std::size_t WideToAnsi(const char16_t* begin, const char16_t* end, char* out, std::size_t capacity,
                       const char* codePageName = "");
/// The same in the other direction; `capacity` counts 16-bit characters.
std::size_t AnsiToWide(const char* begin, const char* end, char16_t* out, std::size_t capacity,
                       const char* codePageName = "");

/// Library-string forms.
String ToAnsi(const WString& text, const char* codePageName = "");
WString ToWide(const String& text, const char* codePageName = "");

} // namespace qv::fen::osdep
