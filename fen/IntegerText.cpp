#include "fen/IntegerText.h"

namespace qv::fen {
namespace {

constexpr char kDigits[] = "0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZ";

WString Digits(std::uint64_t value, std::uint32_t radix)
{
    if (radix < 2 || radix > 36)
        QV_THROW(exception::UnableToConvert());
    char16_t places[64];
    char16_t* first = places + 64;
    do {
        *--first = static_cast<char16_t>(kDigits[value % radix]);
        value /= radix;
    } while (value != 0);
    return WString(first, static_cast<std::size_t>(places + 64 - first));
}

template <typename Text, typename Int>
Text Hex(Int value)
{
    constexpr int kDigitCount = sizeof(Int) * 2;
    typename Text::value_type text[2 + kDigitCount];
    text[0] = '0';
    text[1] = 'x';
    for (int i = kDigitCount - 1; i >= 0; --i) {
        text[2 + i] = static_cast<typename Text::value_type>(kDigits[value & 0xF]);
        value >>= 4;
    }
    return Text(text, 2 + kDigitCount);
}

} // namespace

WString IntegerToString(std::uint32_t value, std::uint32_t radix) { return Digits(value, radix); }
WString IntegerToString(std::uint64_t value, std::uint32_t radix) { return Digits(value, radix); }

String HexText(std::uint32_t value) { return Hex<String>(value); }
String HexText(std::uint64_t value) { return Hex<String>(value); }
WString WideHexText(std::uint32_t value) { return Hex<WString>(value); }
WString WideHexText(std::uint64_t value) { return Hex<WString>(value); }

} // namespace qv::fen
