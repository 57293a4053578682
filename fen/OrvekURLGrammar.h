#pragma once
/// \file
/// The item URL grammar: the whole-text check, the scanners it shares with
/// the tokenizer, and the tokenizer that cuts an accepted text into tokens.
/// Internal to OrvekURL; tests use it to pin down why a text is rejected.
///
/// Every function reads the text through UrlText, which answers NUL for any
/// position at or past the end, so no scan can run past the text.

#include <cstddef>
#include <string_view>

namespace qv::fen::detail {

inline constexpr char16_t kUrlNul = 0;
inline constexpr char16_t kUrlTab = 9;
inline constexpr char16_t kUrlLineFeed = 10;
inline constexpr char16_t kUrlCarriageReturn = 13;
inline constexpr char16_t kUrlSpace = 32;
inline constexpr char16_t kUrlApostrophe = 39;
inline constexpr char16_t kUrlFullStop = 46;
inline constexpr char16_t kUrlSlash = 47;
inline constexpr char16_t kUrlBackslash = 92;

/// Read-only view of URL text whose positions past the end read as NUL.
class UrlText {
public:
    explicit UrlText(std::u16string_view text) noexcept : text_(text) {}

    char16_t operator[](std::size_t index) const noexcept { return index < text_.size() ? text_[index] : kUrlNul; }
    std::size_t size() const noexcept { return text_.size(); }
    std::u16string_view View() const noexcept { return text_; }

private:
    std::u16string_view text_;
};

/// Outcome of the grammar check. Only the accepted outcomes let a text
/// become a URL; the numbers are stable so that tests can name them.
enum class UrlVerdict : int {
    Path = 0,               ///< accepted: a path is present
    NoPath = 2,             ///< accepted: host and process, or an empty path
    NetworkRoot = 3,        ///< accepted: two backslashes alone
    NoProcess = 4,          ///< accepted: a host with no process
    ThirdBackslash = 5,     ///< three backslashes at the start
    MissingHostEnd = 7,     ///< the host is not followed by a backslash
    DoubleSeparator = 8,    ///< a separator follows a separator
    BadProcess = 9,         ///< a slash or backslash in the process, or no backslash after it
    BadPath = 11,           ///< a stray full stop or text left over after the path
    EmptySegment = 12,      ///< a segment with no characters
    BadHostName = 13,       ///< the host name starts with a character it may not hold
    UnclosedQuote = 14,     ///< a quoted segment without its closing apostrophe
};

/// True for the verdicts that accept a text.
constexpr bool IsAccepted(UrlVerdict verdict) noexcept
{
    return verdict == UrlVerdict::Path || verdict == UrlVerdict::NoPath || verdict == UrlVerdict::NetworkRoot ||
           verdict == UrlVerdict::NoProcess;
}

/// Checks the whole text against the grammar.
UrlVerdict CheckUrlGrammar(UrlText text) noexcept;

/// End of the host name that starts at `from`: the first character of the
/// host stop set other than a full stop. The caller checks the first character.
std::size_t ScanHostName(UrlText text, std::size_t from) noexcept;

/// End of the segment that starts at `from`: past the closing apostrophe of
/// a quoted segment, or at the end of an unquoted run. `closed` tells whether
/// a quoted segment found its closing apostrophe (always true when unquoted).
std::size_t ScanSegment(UrlText text, std::size_t from, bool& closed) noexcept;

/// A token: the characters [begin, end) of the text.
struct UrlToken {
    std::size_t begin;
    std::size_t end;
};

/// The next token of an accepted text, starting the search at `from` (the
/// end of the previous token). An empty token means nothing is left.
UrlToken NextUrlToken(UrlText text, std::size_t from) noexcept;

} // namespace qv::fen::detail
