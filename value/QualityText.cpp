#include "value/QualityText.h"

#include <array>
#include <bit>
#include <cstring>

namespace qv::value {
namespace {

constexpr std::string_view kGood = "good";

// Text of each bit of the word, indexed by bit number (high half from 32);
// empty for bits without a text.
constexpr std::array<std::string_view, 64> kBitTexts = {
    "stale",
    "sensor failure",
    "device error",
    "server failure",
    "communication failure",
    "nonexistant",
    "no known value",
    "inactive",
    "forced",
    "low limited",
    "high limited",
    "constant",
    "sensor inaccurate",
    "engineering unit limits exceeded",
    "subnormal",
    "math exception",
    "communications link failure",
    "connecting",
    "DNS failure",
    "host unreachable",
    "service lookup failure",
    "disconnected",
    "process failure",
    "resolve URL failure",
    "access denied",
    "invalid URL",
    "app defined #1",
    "app defined #2",
    "app defined #3",
    "in alarm",
    "subscription failure",
    "",
    "client read buffer full",
    "client read buffer overflowed",
    "server write buffer full",
    "server write buffer overflowed",
    "network buffers full",
};

constexpr std::uint64_t kLowBitsWithText = 0x7FFFFFFFu;
constexpr std::uint64_t kHighBitsWithText = 0x1Fu;
constexpr std::uint64_t kBitsWithText = (kHighBitsWithText << 32) | kLowBitsWithText;

constexpr bool EveryTextedBitHasText()
{
    for (unsigned bit = 0; bit < 64; ++bit)
        if (kBitTexts[bit].empty() == (((kBitsWithText >> bit) & 1) != 0))
            return false;
    return true;
}
static_assert(EveryTextedBitHasText());

// Enough for every text of the word joined by a short separator, so the usual
// result costs a single allocation.
constexpr std::size_t kStackLength = 1024;

// Joins the texts of `bits` (all of them bits with a text) in bit order.
fen::String Join(std::uint64_t bits, std::string_view separator)
{
    std::size_t count = 0;
    std::size_t length = 0;
    for (std::uint64_t rest = bits; rest != 0; rest &= rest - 1) {
        length += kBitTexts[std::countr_zero(rest)].size();
        ++count;
    }
    if (count > 1)
        length += (count - 1) * separator.size();

    if (length <= kStackLength) {
        char buffer[kStackLength];
        char* out = buffer;
        for (std::uint64_t rest = bits; rest != 0; rest &= rest - 1) {
            if (rest != bits && !separator.empty()) {
                std::memcpy(out, separator.data(), separator.size());
                out += separator.size();
            }
            const std::string_view text = kBitTexts[std::countr_zero(rest)];
            std::memcpy(out, text.data(), text.size());
            out += text.size();
        }
        return fen::String(buffer, length);
    }

    fen::String result;
    for (std::uint64_t rest = bits; rest != 0; rest &= rest - 1) {
        if (rest != bits)
            result.append(separator.data(), separator.size());
        const std::string_view text = kBitTexts[std::countr_zero(rest)];
        result.append(text.data(), text.size());
    }
    return result;
}

} // namespace

fen::String QualityFlagText(std::uint32_t low, std::uint32_t high)
{
    if (low == 0 && high == 0)
        return fen::String(kGood.data(), kGood.size());
    std::uint64_t bits = (std::uint64_t{high} & kHighBitsWithText) << 32;
    if (std::has_single_bit(low))
        bits |= low & kLowBitsWithText;
    return Join(bits, {});
}

fen::String QualityText(std::uint32_t low, std::uint32_t high, std::string_view separator)
{
    const std::uint64_t word = (std::uint64_t{high} << 32) | low;
    if (word == 0)
        return fen::String(kGood.data(), kGood.size());
    return Join(word & kBitsWithText, separator);
}

} // namespace qv::value
