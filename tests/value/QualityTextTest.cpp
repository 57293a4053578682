#include "value/QualityText.h"

#include <gtest/gtest.h>

#include <random>
#include <string>

using qv::value::QualityFlagText;
using qv::value::QualityText;

namespace {

// The walk over the word as the monitor has always done it: every set bit
// from the lowest up, each as the flag text of that single bit.
std::string ReferenceQualityText(std::uint32_t low, std::uint32_t high, const std::string& separator)
{
    const std::uint64_t word = (std::uint64_t{high} << 32) | low;
    if (word == 0)
        return "good";
    std::string result;
    for (std::uint64_t mask = 1; mask != 0 && mask <= word; mask <<= 1) {
        if ((word & mask) == 0)
            continue;
        const std::string text(QualityFlagText(static_cast<std::uint32_t>(mask),
                                               static_cast<std::uint32_t>(mask >> 32))
                                   .View());
        if (text.empty())
            continue;
        if (!result.empty())
            result += separator;
        result += text;
    }
    return result;
}

} // namespace

// Comparisons go through View(): the library string's == ignores case.

TEST(QualityText, GoodWordAndSingleBits)
{
    EXPECT_EQ(QualityText(0, 0, ";").View(), "good");
    EXPECT_EQ(QualityFlagText(0, 0).View(), "good");
    EXPECT_EQ(QualityText(0x1, 0, ";").View(), "stale");
    EXPECT_EQ(QualityText(0x40, 0, ";").View(), "no known value");
    EXPECT_EQ(QualityText(0x40000, 0, ";").View(), "DNS failure");
    EXPECT_EQ(QualityText(0x2000000, 0, ";").View(), "invalid URL");
    EXPECT_EQ(QualityText(0x40000000, 0, ";").View(), "subscription failure");
    EXPECT_EQ(QualityText(0, 0x1, ";").View(), "client read buffer full");
    EXPECT_EQ(QualityText(0, 0x10, ";").View(), "network buffers full");
}

TEST(QualityText, BitsWithoutTextGiveEmptyTextNotGood)
{
    EXPECT_EQ(QualityText(0x80000000, 0, ";").View(), "");
    EXPECT_EQ(QualityText(0, 0x20, ";").View(), "");
    EXPECT_EQ(QualityText(0x80000000, 0xFFFFFFE0, ";").View(), "");
    EXPECT_EQ(QualityFlagText(0x80000000, 0).View(), "");
    EXPECT_EQ(QualityFlagText(0, 0x80000000).View(), "");
    // ...and they add no separator next to texted bits.
    EXPECT_EQ(QualityText(0x80000001, 0x80000000, ";").View(), "stale");
}

TEST(QualityText, JoinsLowBitsThenHighBitsWithTheSeparator)
{
    EXPECT_EQ(QualityText(0x3, 0, ";").View(), "stale;sensor failure");
    EXPECT_EQ(QualityText(0x1, 0x10, ";").View(), "stale;network buffers full");
    EXPECT_EQ(QualityText(0x20000020, 0x3, ", ").View(),
              "nonexistant, in alarm, client read buffer full, client read buffer overflowed");
    EXPECT_EQ(QualityText(0x3, 0, "").View(), "stalesensor failure");
}

TEST(QualityText, FlagTextOfSeveralBits)
{
    // The low half counts only as a single bit; high bits 0-4 follow directly.
    EXPECT_EQ(QualityFlagText(0x3, 0).View(), "");
    EXPECT_EQ(QualityFlagText(0x3, 0x3).View(), "client read buffer fullclient read buffer overflowed");
    EXPECT_EQ(QualityFlagText(0x2, 0x10).View(), "sensor failurenetwork buffers full");
    EXPECT_EQ(QualityFlagText(0x2, 0x20).View(), "sensor failure");
}

TEST(QualityText, WholeWordAndLongSeparator)
{
    // Every text once, in bit order: the exact spelling matters to anyone
    // matching on these texts.
    EXPECT_EQ(QualityText(0xFFFFFFFF, 0xFFFFFFFF, ";").View(),
              "stale;sensor failure;device error;server failure;communication failure;nonexistant;"
              "no known value;inactive;forced;low limited;high limited;constant;sensor inaccurate;"
              "engineering unit limits exceeded;subnormal;math exception;communications link failure;"
              "connecting;DNS failure;host unreachable;service lookup failure;disconnected;"
              "process failure;resolve URL failure;access denied;invalid URL;app defined #1;"
              "app defined #2;app defined #3;in alarm;subscription failure;client read buffer full;"
              "client read buffer overflowed;server write buffer full;server write buffer overflowed;"
              "network buffers full");

    // A separator this long no longer fits the fast path's buffer.
    const std::string separator(100, '-');
    const qv::fen::String joined = QualityText(0xFFFFFFFF, 0x1F, separator);
    EXPECT_GT(joined.length(), 3500u);
    EXPECT_EQ(std::string(joined.View()), ReferenceQualityText(0xFFFFFFFF, 0x1F, separator));
}

TEST(QualityText, AgreesWithTheBitWalkOnRandomWords)
{
    std::mt19937_64 random(20240611);
    for (int i = 0; i < 5000; ++i) {
        const std::uint64_t bits = random() & random(); // sparse words as well as dense
        const auto low = static_cast<std::uint32_t>(bits);
        const auto high = static_cast<std::uint32_t>(bits >> (i % 2 == 0 ? 32 : 59));
        ASSERT_EQ(std::string(QualityText(low, high, ";").View()), ReferenceQualityText(low, high, ";"))
            << std::hex << low << " " << high;
    }
}
