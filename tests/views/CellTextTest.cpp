#include "views/watchlist/BadQuality.h"
#include "views/watchlist/CellText.h"

#include <gtest/gtest.h>

#include <cmath>

namespace qv::test {
namespace {

using views::FormatValueText;
using value::VarData;

// The texts come from the real quality rule, so the mapping is checked
// against what the list actually shows.
bool Bad(std::uint64_t quality, std::int32_t errorCode = 0)
{
    return views::IsBadQualityText(views::QualityCellText(quality, errorCode));
}

TEST(WatchListCellText, BadQualityMapping)
{
    for (std::uint64_t bad : {0x2ull, 0x4ull, 0x8ull, 0x10ull, 0x20ull, 0x40ull, 0x1000ull, 0x10000ull, 0x40000ull,
                              0x200000ull, 0x400000ull, 0x40000000ull, 0x1ull | 0x200000ull})
        EXPECT_TRUE(Bad(bad)) << views::QualityCellText(bad, 0);
    for (std::uint64_t fine : {0x0ull, 0x1ull, 0x200ull | 0x400ull | 0x2000ull, 0x20000ull, 0x20000000ull,
                               0x1Full << 32})
        EXPECT_FALSE(Bad(fine)) << views::QualityCellText(fine, 0);
    EXPECT_TRUE(Bad(0, -1));
    EXPECT_FALSE(views::IsBadQualityText("sensor failures"));
    EXPECT_FALSE(views::IsBadQualityText("Sensor Failure "));
}

TEST(WatchListCellText, ValueTextOfEachKind)
{
    EXPECT_EQ(FormatValueText(VarData::MakeLogical(false), 12, false), "False");
    EXPECT_EQ(FormatValueText(VarData::MakeNumeric(1e20), 12, false), "1E+20");
    EXPECT_EQ(FormatValueText(VarData::MakeNumeric(std::nan("")), 12, false), "NAN");
    // More digits than a double holds are not printed.
    EXPECT_EQ(FormatValueText(VarData::MakeNumeric(-2.0 / 3.0), 40, false), "-0.66666666666666663");
    // Bit fields go through the value model's conversion.
    EXPECT_EQ(FormatValueText(VarData::MakeBitField(0x1F), 3, false), "0x0000001F");
    EXPECT_EQ(FormatValueText(VarData(u"wide"), 12, false), "wide");
    EXPECT_EQ(FormatValueText(VarData(static_cast<const std::uint8_t*>(nullptr), 0), 12, true), "");
}

} // namespace
} // namespace qv::test
