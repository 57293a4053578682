#include "fen/osdep/LocalePicture.h"
#include "fen/osdep/UserLocalePictures.h"

#include "ScopedPictureSource.h"

#include <gtest/gtest.h>

#include <string>

using namespace qv::fen;
using namespace qv::fen::osdep;

namespace {

struct Translation {
    const char* name;
    std::u16string input;
    std::u16string expected;
};

std::string RowName(const testing::TestParamInfo<Translation>& info) { return info.param.name; }

// Rows print as their names in test listings.
void PrintTo(const Translation& row, std::ostream* out) { *out << row.name; }

class PictureToFormat : public testing::TestWithParam<Translation> {};

TEST_P(PictureToFormat, Translates)
{
    EXPECT_EQ(PictureToTimeFormat(GetParam().input).View(), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(
    LocalePicture, PictureToFormat,
    testing::Values(
        Translation{"QuotedWord", u"dd 'de' MMMM", u"%d de %B"},
        Translation{"EveryRunLength", u"d dd ddd dddd M MM MMM MMMM y yy yyyy",
                    u"%#d %d %a %A %#m %m %b %B %#y %y %Y"},
        Translation{"HourMinuteSecondShapes", u"H HH h hh m mm s ss t tt", u"%#H %H %#I %I %#M %M %#S %S %p %p"},
        Translation{"TooLongRunsGiveNothing", u"[ddddd][MMMMM][yyy][yyyyy][hhh][HHH][mmm][sss][ttt]",
                    u"[][][][][][][][][]"},
        Translation{"EraLetterGivesNothing", u"gg yyyy", u" %Y"},
        Translation{"UnclosedQuoteRunsToTheEnd", u"HH 'h mm", u"%H h mm"},
        Translation{"EmptyQuoteSplitsARun", u"d''d", u"%#d%#d"},
        Translation{"PercentShowsItself", u"HH'%'mm%", u"%H%%%M%%"},
        Translation{"OtherCharactersCopied", u"yyyy\u5E74M\u6708d\u65E5 (x)", u"%Y\u5E74%#m\u6708%#d\u65E5 (x)"},
        Translation{"Empty", u"", u""}),
    RowName);

class StrftimeToPicture : public testing::TestWithParam<Translation> {};

TEST_P(StrftimeToPicture, Translates)
{
    EXPECT_EQ(PictureFromStrftimeFormat(GetParam().input, u"%I:%M:%S %p").View(), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(
    LocalePicture, StrftimeToPicture,
    testing::Values(
        Translation{"UsDate", u"%m/%d/%y", u"MM/dd/yy"},
        Translation{"Time", u"%H:%M:%S", u"HH:mm:ss"},
        Translation{"Composites", u"%D|%F|%T|%R", u"MM/dd/yy|yyyy-MM-dd|HH:mm:ss|HH:mm"},
        Translation{"TwelveHourComposite", u"%r", u"hh:mm:ss tt"},
        Translation{"Names", u"%a %A %b %h %B", u"ddd dddd MMM MMM MMMM"},
        Translation{"UnpaddedFields", u"%e %-d %-m %-y %-H %k %-I %l %-M %-S %P",
                    u"d d M y H H h h m s tt"},
        Translation{"ModifiersAndWidthsDropped", u"%Ey %Od %_5H", u"yy dd HH"},
        Translation{"LettersQuoted", u"%Y \u0433. %d de %B", u"yyyy \u0433. dd 'de' MMMM"},
        Translation{"WordBetweenFields", u"%dth%m", u"dd'th'MM"},
        Translation{"AdjacentSameLetterFieldsKeptApart", u"%d%a", u"dd''ddd"},
        Translation{"ApostropheDropped", u"%d'%m", u"ddMM"},
        Translation{"NoPictureFieldGivesNothing", u"%H:%M %Z%z", u"HH:mm "},
        Translation{"PercentAndTrailingPercent", u"%%%", u"%%"}),
    RowName);

/// The source in use while it lives; the previous one afterwards.
class FixedPictures : public LocalePictureSource {
public:
    WString ShortDatePicture() const override { return WString(u"dd 'de' MMMM 'de' yyyy"); }
    WString TimePicture() const override { return WString(u"h:mm tt"); }
    WString DecimalSeparator() const override { return WString(u","); }
};

} // namespace

TEST(LocalePicture, PosixLocaleGivesItsOwnFormatsAndAReplacedSourceIsUsedAndRestored)
{
    // The tests run in C.UTF-8.
    EXPECT_EQ(GetSystemDateFormat().View(), u"%m/%d/%y");
    EXPECT_EQ(GetSystemTimeFormat().View(), u"%H:%M:%S");
    EXPECT_EQ(GetSystemDecimalSeparator().View(), u".");
    {
        qv::test::ScopedPictureSource scope(std::make_shared<FixedPictures>());
        EXPECT_EQ(GetSystemDateFormat().View(), u"%d de %B de %Y");
        EXPECT_EQ(GetSystemTimeFormat().View(), u"%#I:%M %p");
        EXPECT_EQ(GetSystemDecimalSeparator().View(), u",");
    }
    EXPECT_EQ(GetSystemTimeFormat().View(), u"%H:%M:%S");
    SetLocalePictureSource(nullptr);
    EXPECT_NE(dynamic_cast<const UserLocalePictureSource*>(GetLocalePictureSource().get()), nullptr);
}
