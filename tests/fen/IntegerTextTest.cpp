#include "fen/FileName.h"
#include "fen/IntegerText.h"

#include <gtest/gtest.h>

using namespace qv::fen;

TEST(IntegerText, DigitsInEveryRadixAndZeroPaddedHex)
{
    EXPECT_EQ(IntegerToString(0u, 2).View(), u"0");
    EXPECT_EQ(IntegerToString(35u, 36).View(), u"Z");
    EXPECT_EQ(IntegerToString(~std::uint64_t{0}, 2).View(), std::u16string(64, u'1'));
    EXPECT_EQ(IntegerToString(std::uint64_t{18446744073709551615u}, 10).View(), u"18446744073709551615");
    for (std::uint32_t bad : {0u, 1u, 37u})
        EXPECT_THROW(IntegerToString(10u, bad), exception::UnableToConvert) << bad;

    EXPECT_STREQ(HexText(255u).c_str(), "0x000000FF");
    EXPECT_STREQ(HexText(std::uint64_t{0xABCDEF0123456789u}).c_str(), "0xABCDEF0123456789");
    EXPECT_EQ(WideHexText(std::uint64_t{1}).View(), u"0x0000000000000001");
}

TEST(FileName, PartAfterTheLastBackslash)
{
    EXPECT_EQ(FileNamePart(WString(u"dir\\name.dll")).View(), u"name.dll");
    EXPECT_EQ(FileNamePart(WString(u"C:\\a\\b\\")).View(), u"");
    EXPECT_EQ(FileNamePart(WString(u"plain")).View(), u"plain");
    EXPECT_EQ(FileNamePart(WString(u"C:")).View(), u"");
    EXPECT_EQ(FileNamePart(WString(u"ab:")).View(), u"");
    EXPECT_EQ(FileNamePart(WString(u"C:name")).View(), u"C:name");
}
