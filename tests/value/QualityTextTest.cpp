#include "value/QualityText.h"

#include <gtest/gtest.h>

#include <string>

using qv::value::QualityFlagText;
using qv::value::QualityText;

// Comparisons go through View(): the library string's == ignores case.

TEST(QualityText, GoodWordAndBitsWithoutText)
{
    EXPECT_EQ(QualityText(0, 0, ";").View(), "good");
    EXPECT_EQ(QualityFlagText(0, 0).View(), "good");
    // Bits without a text give the empty text, not "good"...
    EXPECT_EQ(QualityText(0x80000000, 0, ";").View(), "");
    EXPECT_EQ(QualityText(0x80000000, 0xFFFFFFE0, ";").View(), "");
    EXPECT_EQ(QualityFlagText(0x80000000, 0).View(), "");
    EXPECT_EQ(QualityFlagText(0, 0x80000000).View(), "");
    // ...and they add no separator next to texted bits.
    EXPECT_EQ(QualityText(0x80000001, 0x80000000, ";").View(), "stale");
}

TEST(QualityText, FlagTextOfSeveralBits)
{
    // The low half counts only as a single bit; high bits 0-4 follow directly.
    EXPECT_EQ(QualityFlagText(0x3, 0).View(), "");
    EXPECT_EQ(QualityFlagText(0x3, 0x3).View(), "client read buffer fullclient read buffer overflowed");
    EXPECT_EQ(QualityFlagText(0x2, 0x10).View(), "sensor failurenetwork buffers full");
    EXPECT_EQ(QualityFlagText(0x2, 0x20).View(), "sensor failure");
}

TEST(QualityText, WholeWordAndSeparatorsOfAnyLength)
{
    EXPECT_EQ(QualityText(0x20000020, 0x3, ", ").View(),
              "nonexistant, in alarm, client read buffer full, client read buffer overflowed");
    EXPECT_EQ(QualityText(0x3, 0, "").View(), "stalesensor failure");
    // Every text once, in bit order: the exact spelling matters to anyone
    // matching on these texts.
    const std::string all =
        "stale;sensor failure;device error;server failure;communication failure;nonexistant;"
        "no known value;inactive;forced;low limited;high limited;constant;sensor inaccurate;"
        "engineering unit limits exceeded;subnormal;math exception;communications link failure;"
        "connecting;DNS failure;host unreachable;service lookup failure;disconnected;"
        "process failure;resolve URL failure;access denied;invalid URL;app defined #1;"
        "app defined #2;app defined #3;in alarm;subscription failure;client read buffer full;"
        "client read buffer overflowed;server write buffer full;server write buffer overflowed;"
        "network buffers full";
    EXPECT_EQ(QualityText(0xFFFFFFFF, 0xFFFFFFFF, ";").View(), all);

    // A separator this long no longer fits the fast path's buffer.
    const std::string separator(100, '-');
    std::string joined;
    for (char c : all)
        joined += c == ';' ? separator : std::string(1, c);
    EXPECT_EQ(std::string(QualityText(0xFFFFFFFF, 0x1F, separator).View()), joined);
}
