#include "value/dynamic/TextReading.h"

#include <charconv>
#include <cmath>
#include <string>

namespace qv::value::dynamic {
namespace {

bool IsBlank(char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; }

std::string_view Trim(std::string_view text)
{
    while (!text.empty() && IsBlank(text.front()))
        text.remove_prefix(1);
    while (!text.empty() && IsBlank(text.back()))
        text.remove_suffix(1);
    return text;
}

bool ParseNumber(std::string_view text, double& value)
{
    text = Trim(text);
    // from_chars takes a minus sign only; a plus sign may stand in its place.
    const bool plus = !text.empty() && text.front() == '+';
    if (plus)
        text.remove_prefix(1);
    if (text.empty() || (plus && text.front() == '-'))
        return false;
    const char* last = text.data() + text.size();
    auto [end, error] = std::from_chars(text.data(), last, value);
    return error == std::errc() && end == last;
}

bool EqualsIgnoringAsciiCase(std::string_view a, std::string_view b)
{
    if (a.size() != b.size())
        return false;
    for (std::size_t i = 0; i < a.size(); ++i) {
        char c = a[i];
        if (c >= 'A' && c <= 'Z')
            c = static_cast<char>(c - 'A' + 'a');
        if (c != b[i])
            return false;
    }
    return true;
}

/// Numbers and words are ASCII; other characters make the text unreadable.
std::string AsciiOf(std::u16string_view text)
{
    std::string ascii;
    ascii.reserve(text.size());
    for (char16_t c : text)
        ascii.push_back(c < 0x80 ? static_cast<char>(c) : '\x7F');
    return ascii;
}

} // namespace

double TextToDouble(std::string_view text) noexcept
{
    double value = 0.0;
    return ParseNumber(text, value) ? value : 0.0;
}

bool TextToBool(std::string_view text) noexcept
{
    const std::string_view word = Trim(text);
    for (std::string_view yes : {"true", "on", "yes"})
        if (EqualsIgnoringAsciiCase(word, yes))
            return true;
    double value = 0.0;
    return ParseNumber(word, value) && value != 0.0;
}

double TextToDouble(std::u16string_view text) noexcept
{
    try {
        return TextToDouble(AsciiOf(text));
    } catch (...) {
        return 0.0;
    }
}

bool TextToBool(std::u16string_view text) noexcept
{
    try {
        return TextToBool(AsciiOf(text));
    } catch (...) {
        return false;
    }
}

} // namespace qv::value::dynamic
