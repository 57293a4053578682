// Case-ignoring comparison of library strings in the current locale: both
// texts are decoded to wide characters, folded with towlower and collated.

#include "fen/String.h"

#include <cwchar>
#include <cwctype>
#include <string>

namespace qv::fen::detail {
namespace {

int CompareFolded(std::wstring& a, std::wstring& b)
{
    for (wchar_t& c : a)
        c = static_cast<wchar_t>(std::towlower(static_cast<wint_t>(c)));
    for (wchar_t& c : b)
        c = static_cast<wchar_t>(std::towlower(static_cast<wint_t>(c)));
    int result = std::wcscoll(a.c_str(), b.c_str());
    if (result == 0 && a != b)
        result = a.compare(b); // collation ties are broken by code point
    return result;
}

/// Decodes 8-bit text in the locale's charset; a byte that starts no valid
/// character stands for itself, so no text is ever lost.
std::wstring DecodeNarrow(std::string_view text)
{
    std::wstring wide;
    wide.reserve(text.size());
    std::mbstate_t state{};
    std::size_t i = 0;
    while (i < text.size()) {
        wchar_t c = 0;
        std::size_t n = std::mbrtowc(&c, text.data() + i, text.size() - i, &state);
        if (n == static_cast<std::size_t>(-1) || n == static_cast<std::size_t>(-2)) {
            state = std::mbstate_t{};
            c = static_cast<unsigned char>(text[i]);
            n = 1;
        } else if (n == 0) {
            n = 1; // an embedded NUL
        }
        wide.push_back(c);
        i += n;
    }
    return wide;
}

/// Decodes UTF-16; a lone surrogate stands for itself.
std::wstring DecodeWide(std::u16string_view text)
{
    std::wstring wide;
    wide.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        char32_t c = text[i];
        if (c >= 0xD800 && c < 0xDC00 && i + 1 < text.size() && text[i + 1] >= 0xDC00 && text[i + 1] < 0xE000) {
            c = 0x10000 + ((c - 0xD800) << 10) + (text[i + 1] - 0xDC00);
            ++i;
        }
        wide.push_back(static_cast<wchar_t>(c));
    }
    return wide;
}

} // namespace

int CompareIgnoringCase(std::string_view a, std::string_view b)
{
    std::wstring wa = DecodeNarrow(a);
    std::wstring wb = DecodeNarrow(b);
    return CompareFolded(wa, wb);
}

int CompareIgnoringCase(std::u16string_view a, std::u16string_view b)
{
    std::wstring wa = DecodeWide(a);
    std::wstring wb = DecodeWide(b);
    return CompareFolded(wa, wb);
}

} // namespace qv::fen::detail
