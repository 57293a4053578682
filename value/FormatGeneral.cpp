#include "value/FormatGeneral.h"

#include <algorithm>
#include <charconv>
#include <cstring>

namespace qv::value {

std::size_t FormatGeneral(double value, char* buffer, std::size_t size) noexcept
{
    if (buffer == nullptr || size == 0)
        return 0;
    // to_chars is locale-independent; its general form with precision 6 is
    // "%g", upper-cased below to give "%G".
    char text[64];
    auto [end, error] = std::to_chars(text, text + sizeof text, value, std::chars_format::general, 6);
    std::size_t length = error == std::errc() ? static_cast<std::size_t>(end - text) : sizeof text;
    if (length + 1 > size) {
        const std::size_t stars = std::min<std::size_t>(size, 16) - 1;
        std::memset(buffer, '*', stars);
        buffer[stars] = '\0';
        return stars;
    }
    for (std::size_t i = 0; i < length; ++i)
        buffer[i] = (text[i] >= 'a' && text[i] <= 'z') ? static_cast<char>(text[i] - 'a' + 'A') : text[i];
    buffer[length] = '\0';
    return length;
}

} // namespace qv::value
