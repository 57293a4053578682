#include "fen/osdep/LocalePicture.h"
#include "fen/osdep/TimeText.h"

#include "ScopedPictureSource.h"
#include "support/TemporaryHome.h"

#include <gtest/gtest.h>

#include <ctime>
#include <memory>
#include <string>

using namespace qv::fen;
using namespace qv::fen::osdep;
using qv::fen::exception::InvalidArgument;
using qv::fen::exception::OutOfRange;

namespace {

/// The UTC time of a calendar date and time of day, plus `part` / `whole` s.
AbsTime Utc(int year, int month, int day, int hour = 0, int minute = 0, int second = 0, std::uint64_t part = 0,
            std::uint64_t whole = 1)
{
    std::tm tm{};
    tm.tm_year = year - 1900;
    tm.tm_mon = month - 1;
    tm.tm_mday = day;
    tm.tm_hour = hour;
    tm.tm_min = minute;
    tm.tm_sec = second;
    return AbsTimeFromUnixSeconds(timegm(&tm), FractionOfSecond(part, whole));
}

/// AbsTimeToString with explicit formats, date first, no suffix.
std::u16string Text(const AbsTime& time, const char16_t* date, const char16_t* timeOfDay, std::uint32_t digits,
                    std::int32_t zone, std::int32_t separator = kFullStopSeparator)
{
    return std::u16string(AbsTimeToString(time, date, timeOfDay, digits, zone, false, nullptr, separator).View());
}

class CommaPictures : public LocalePictureSource {
public:
    WString ShortDatePicture() const override { return WString(u"dd 'de' MMMM"); }
    WString TimePicture() const override { return WString(u"h:mm:ss tt"); }
    WString DecimalSeparator() const override { return WString(u","); }
};

} // namespace

TEST(TimeText, EarliestTimeIsEmptyButDigitsAreCheckedFirst)
{
    const AbsTime none = AbsTime::Earliest();
    EXPECT_EQ(Text(none, u"%Y", u"%H", 3, kShowUtc), u"");
    EXPECT_TRUE(AbsTimeToString(none, nullptr, nullptr, 0, kShowLocalTime, true, u"x", 0).empty());
    EXPECT_THROW(Text(none, u"%Y", u"%H", 7, kShowUtc), InvalidArgument);
    EXPECT_NO_THROW(Text(Utc(2024, 6, 6), u"%Y", u"%S", 6, kShowUtc));
}

TEST(TimeText, FractionThatRoundsUpShowsTheNextSecondInEveryZone)
{
    const AbsTime t = Utc(2024, 6, 6, 12, 0, 0, 9996, 10000);
    EXPECT_EQ(Text(t, u"", u"%H:%M:%S", 3, kShowLocalTime), u"12:00:01.000");

    // Close enough to the next second that the tick rounds up as well: the
    // second must still advance only once.
    const AbsTime nearly = Utc(2024, 6, 6, 12, 0, 0, 99999996, 100000000);
    EXPECT_EQ(Text(nearly, u"", u"%H:%M:%S", 3, kShowUtc), u"12:00:01.000");
    EXPECT_EQ(Text(nearly, u"", u"%H:%M:%S", 6, kShowFileTimeLocal), u"12:00:01.000000");
    EXPECT_EQ(Text({~std::uint64_t{0}, t.seconds}, u"", u"%S", 1, kShowLocalTime), u"01.0");
    EXPECT_EQ(Text(Utc(2024, 6, 6, 12, 0, 0, 9994, 10000), u"", u"%S", 3, kShowLocalTime), u"00.999");
}

TEST(TimeText, WithoutDigitsOnlyTheRuntimeZoneRounds)
{
    const AbsTime t = Utc(2024, 6, 6, 12, 0, 0, 6, 10);
    EXPECT_EQ(Text(t, u"", u"%H:%M:%S", 0, kShowLocalTime), u"12:00:01");
    EXPECT_EQ(Text(t, u"", u"%H:%M:%S", 0, 7), u"12:00:01");
    EXPECT_EQ(Text(t, u"", u"%H:%M:%S", 0, kShowUtc), u"12:00:00");
    EXPECT_EQ(Text(t, u"", u"%H:%M:%S", 0, kShowFileTimeLocal), u"12:00:00");
    EXPECT_EQ(Text(t, u"", u"%H:%M:%S", 3, kShowLocalTime), u"12:00:00.600");
}

TEST(TimeText, AssemblyOfDateTimeSuffixAndFraction)
{
    const AbsTime t = Utc(2024, 6, 6, 12, 0, 0, 6, 10);
    EXPECT_EQ(std::u16string(AbsTimeToString(t, u"%Y-%m-%d", u"%H:%M:%S", 2, kShowUtc, true, u"UTC",
                                             kCommaSeparator).View()),
              u"12:00:00,60 UTC 2024-06-06");
    // An empty time format takes neither suffix nor fraction, and no space.
    EXPECT_EQ(std::u16string(AbsTimeToString(t, u"%Y-%m-%d", u"", 3, kShowUtc, false, u"UTC", 1).View()),
              u"2024-06-06");
    EXPECT_EQ(std::u16string(AbsTimeToString(t, u"", u"%H", 0, kShowUtc, false, nullptr, 1).View()), u"12");
    // The fraction follows every seconds field, but not a literal "%S".
    EXPECT_EQ(Text(t, u"", u"%#S|%S|%%S|%#%S", 1, kShowUtc), u"0.6|00.6|%S|%S");
}

TEST(TimeText, HashFlagDropsLeadingZerosOnNumbersOnly)
{
    const AbsTime t = Utc(2024, 6, 2, 7, 5, 3);
    EXPECT_EQ(Text(t, u"%#d/%#m/%#y %#j", u"%#H:%#M:%#S %#I", 0, kShowUtc), u"2/6/24 154 7:5:3 7");
    EXPECT_EQ(Text(t, u"%#a %#B", u"%#p", 0, kShowUtc), u"Sun June AM");
}

TEST(TimeText, DayOfYearAndWeekdayOnTheFileTimePath)
{
    EXPECT_EQ(Text(Utc(2024, 3, 1), u"%j %w", u"", 0, kShowUtc), u"061 5");
    EXPECT_EQ(Text(Utc(2023, 3, 1), u"%j %w", u"", 0, kShowUtc), u"060 3");
    EXPECT_EQ(Text(Utc(2000, 12, 31), u"%j %w", u"", 0, kShowUtc), u"366 0");
    EXPECT_EQ(Text(Utc(1900, 3, 1), u"%j %w", u"", 0, kShowUtc), u"060 4");
    EXPECT_EQ(Text(Utc(1601, 1, 1), u"%Y-%m-%d %w", u"", 0, kShowFileTimeLocal), u"1601-01-01 1");
}

TEST(TimeText, TimesTheConversionsCannotShow)
{
    const AbsTime last = Utc(9999, 12, 31, 23, 59, 59);
    EXPECT_EQ(Text(last, u"%Y", u"", 0, kShowUtc), u"9999");
    EXPECT_EQ(Text(last, u"%Y", u"", 0, kShowLocalTime), u"9999");
    for (std::int32_t zone : {kShowUtc, kShowLocalTime, kShowFileTimeLocal}) {
        EXPECT_THROW(Text(Utc(10000, 1, 1), u"%Y", u"", 0, zone), OutOfRange) << zone;
        EXPECT_THROW(Text(Utc(1600, 12, 31), u"%Y", u"", 0, zone), OutOfRange) << zone;
        EXPECT_THROW(Text({1, INT64_MIN}, u"%Y", u"", 0, zone), OutOfRange) << zone;
    }
}

TEST(TimeText, LocalZonesUseTheOffsetOfTheInstant)
{
    {
        qv::test::ScopedEnvironment zone("TZ", "CET-1CEST,M3.5.0,M10.5.0/3");
        tzset();
        const AbsTime summer = Utc(2024, 6, 6, 12);
        const AbsTime winter = Utc(2024, 1, 15, 12);
        EXPECT_EQ(Text(summer, u"", u"%H:%M", 0, kShowLocalTime), u"14:00");
        EXPECT_EQ(Text(summer, u"", u"%H:%M", 0, kShowFileTimeLocal), u"14:00");
        EXPECT_EQ(Text(winter, u"", u"%H:%M", 0, kShowFileTimeLocal), u"13:00");
        EXPECT_EQ(Text(winter, u"", u"%H:%M", 0, kShowUtc), u"12:00");
        // Before 1970 and across midnight.
        const AbsTime eve = Utc(1960, 12, 31, 23, 30);
        EXPECT_EQ(Text(eve, u"%Y-%m-%d", u"%H:%M", 0, kShowLocalTime), u"1961-01-01 00:30");
        EXPECT_EQ(Text(eve, u"%Y-%m-%d", u"%H:%M", 0, kShowFileTimeLocal), u"1961-01-01 00:30");
    }
    tzset(); // the zone of the environment again
}

TEST(TimeText, LocaleFormatsAndSeparators)
{
    const AbsTime t = Utc(2024, 6, 6, 14, 5, 9, 25, 100);
    EXPECT_EQ(Text(t, nullptr, nullptr, 0, kShowUtc), u"06/06/24 14:05:09");
    EXPECT_EQ(Text(t, nullptr, nullptr, 2, kShowUtc, kLocaleSeparator), u"06/06/24 14:05:09.25");

    qv::test::ScopedPictureSource scope(std::make_shared<CommaPictures>());
    EXPECT_EQ(Text(t, nullptr, nullptr, 3, kShowUtc, kLocaleSeparator), u"06 de June 2:05:09,250 PM");
    EXPECT_EQ(Text(t, nullptr, nullptr, 3, kShowUtc, kFullStopSeparator), u"06 de June 2:05:09.250 PM");
}

TEST(TimeText, TextBeyondTheBufferIsEmptyAndWideCharactersSurvive)
{
    const AbsTime t = Utc(2024, 6, 6, 12);
    EXPECT_EQ(Text(t, std::u16string(511, u'x').c_str(), u"", 0, kShowUtc).size(), 511u);
    EXPECT_EQ(Text(t, std::u16string(512, u'x').c_str(), u"", 0, kShowUtc), u"");
    EXPECT_EQ(Text(t, u"\U0001F600 %d\u00E9", u"", 0, kShowUtc), u"\U0001F600 06\u00E9");
}
