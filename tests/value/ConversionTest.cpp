#include "value/FormatGeneral.h"
#include "value/VarData.h"
#include "value/dynamic/Interfaces.h"

#include <cmath>
#include <cstring>
#include <gtest/gtest.h>
#include <limits>
#include <string>
#include <utility>
#include <vector>

using namespace qv::value;
using qv::fen::AbsTime;

namespace {

std::string AnsiText(VarData value)
{
    if (value.Code() != TypeCode::AnsiString)
        value.ConvertTo(TypeCode::AnsiString);
    return std::string(value.GetString().View());
}

std::u16string WideText(VarData value)
{
    value.ConvertTo(TypeCode::UnicodeString);
    return std::u16string(value.GetWString().View());
}

AbsTime TimeOf(double seconds)
{
    VarData value = VarData::MakeNumeric(seconds);
    value.ConvertTo(TypeCode::SSTimeValue);
    AbsTime time{};
    EXPECT_TRUE(value.GetTime(time));
    return time;
}

} // namespace

TEST(Conversion, TextOfSimpleValues)
{
    EXPECT_EQ(AnsiText(VarData::MakeLogical(true)), "on");
    EXPECT_EQ(AnsiText(VarData::MakeLogical(false)), "off");
    EXPECT_EQ(AnsiText(VarData::MakeBitField(255)), "0x000000FF");
    EXPECT_EQ(AnsiText(VarData::MakeNumeric(-1, 8)), "0x00000000");
    EXPECT_EQ(AnsiText(VarData::MakeNumeric(5e9, 8)), "0xFFFFFFFF");
    EXPECT_EQ(WideText(VarData::MakeUInt64(0xABCDEF)), u"0x0000000000ABCDEF");
    for (std::uint32_t code : {TypeCode::Empty, TypeCode::Null, TypeCode::Time, TypeCode::Vector, TypeCode::Word32})
        EXPECT_EQ(AnsiText(VarData::MakeTyped(code)), "") << code;
    VarData blank = VarData::MakeTyped(TypeCode::Null);
    blank.ConvertTo(TypeCode::AnsiString);
    EXPECT_EQ(blank.Guts(), nullptr); // an empty text holds no storage
}

TEST(Conversion, GeneralNumberText)
{
    struct Row {
        double value;
        const char* text;
    };
    const Row rows[] = {
        {1000000, "1E+06"}, {123456, "123456"}, {0.0001, "0.0001"}, {0.00001, "1E-05"}, {3.14159265, "3.14159"},
        {-2.5, "-2.5"},     {0, "0"},           {1e100, "1E+100"},  {std::numeric_limits<double>::infinity(), "INF"},
    };
    for (const Row& row : rows) {
        EXPECT_EQ(AnsiText(VarData::MakeNumeric(row.value, 3)), row.text) << row.value;
        char buffer[32];
        EXPECT_EQ(FormatGeneral(row.value, buffer, sizeof buffer), std::strlen(row.text));
    }
}

TEST(Conversion, FormatGeneralFillsWhatDoesNotFitWithStars)
{
    char buffer[32];
    EXPECT_EQ(FormatGeneral(123456, buffer, 6), 5u);
    EXPECT_STREQ(buffer, "*****");
    EXPECT_EQ(FormatGeneral(123456, buffer, 7), 6u);
    EXPECT_STREQ(buffer, "123456");
    EXPECT_EQ(FormatGeneral(-1.23457e-100, buffer, 32), 13u); // the longest General text
    EXPECT_EQ(FormatGeneral(-1.23457e-100, buffer, 13), 12u);
    EXPECT_STREQ(buffer, "************");
    EXPECT_EQ(FormatGeneral(1, buffer, 0), 0u);
    EXPECT_EQ(FormatGeneral(1, nullptr, 8), 0u);
}

TEST(Conversion, TextBetweenWidthsAndRawBytes)
{
    EXPECT_EQ(AnsiText(VarData(u"Gr\u00FC\u00DFe")), "Gr\xC3\xBC\xC3\x9F" "e");
    EXPECT_EQ(WideText(VarData("\xE6\xB8\xA9")), u"\u6E29");

    const std::uint8_t abc[] = {0x41, 0x42, 0x43};
    VarData raw(abc, 3);
    EXPECT_EQ(AnsiText(raw), "ABC");
    VarData text("ABC");
    text.ConvertTo(TypeCode::RawBytes);
    const std::uint8_t* data = nullptr;
    std::uint32_t count = 0;
    ASSERT_TRUE(text.GetRaw(data, count));
    EXPECT_EQ(std::string(reinterpret_cast<const char*>(data), count), "ABC");

    VarData number = VarData::MakeNumeric(3);
    number.ConvertTo(TypeCode::RawBytes);
    EXPECT_EQ(number.Code(), TypeCode::RawBytes);
    EXPECT_EQ(number.Size(), 0u);

    // Converting to the value's own code keeps it.
    raw.ConvertTo(TypeCode::RawBytes);
    EXPECT_EQ(raw.Size(), 3u);
}

TEST(Conversion, NumbersAndPlainCodes)
{
    VarData kind6 = VarData::MakeNumeric(7, 6);
    kind6.ConvertTo(TypeCode::Numeric); // a conversion to a number drops the kind
    EXPECT_EQ(kind6.TypeWord(), TypeCode::Numeric);
    EXPECT_EQ(kind6.ToDouble(), 7.0);

    VarData anything("some text");
    anything.ConvertTo(TypeCode::Time);
    EXPECT_EQ(anything.Code(), TypeCode::Time);
    EXPECT_EQ(anything.GetUInt64(), 0u);
    anything = VarData("x");
    anything.ConvertTo(0x12345); // only the low 16 bits count
    EXPECT_EQ(anything.TypeWord(), 0x2345u);
    EXPECT_EQ(anything.Guts(), nullptr);

    VarData dictionary = VarData::NewDictionary();
    dictionary[VarData("k")] = VarData("v");
    dictionary.ConvertTo(TypeCode::AnsiString);
    EXPECT_EQ(dictionary.GetString().View(), "{k: v}");
}

TEST(Conversion, NumbersToTimes)
{
    const AbsTime oneAndHalf = TimeOf(1.5);
    EXPECT_EQ(oneAndHalf.seconds, 1);
    EXPECT_EQ(oneAndHalf.fraction, 0x8000000000000000u);
    const AbsTime before = TimeOf(-0.25);
    EXPECT_EQ(before.seconds, -1);
    EXPECT_EQ(before.fraction, 0xC000000000000000u);
    // Just below zero the fraction would round up to a whole second.
    EXPECT_EQ(TimeOf(-1e-17), (AbsTime{0, 0}));
    EXPECT_EQ(TimeOf(-1e-300), (AbsTime{0, 0}));

    const AbsTime latest{~0ull, std::numeric_limits<std::int64_t>::max()};
    const double inf = std::numeric_limits<double>::infinity();
    EXPECT_EQ(TimeOf(inf), latest);
    EXPECT_EQ(TimeOf(-inf), AbsTime::Earliest());
    EXPECT_EQ(TimeOf(std::numeric_limits<double>::quiet_NaN()), latest);
    EXPECT_EQ(TimeOf(-std::numeric_limits<double>::quiet_NaN()), AbsTime::Earliest());

    VarData number = VarData::MakeNumeric(42.25);
    number.ConvertTo(TypeCode::SSTimeNumber);
    EXPECT_EQ(AnsiText(number), "42.25");
}

TEST(Conversion, TimeText)
{
    // ctest runs in UTC with the C.UTF-8 locale: 1.5 s after 1904-01-01.
    VarData time(AbsTime{0x8000000000000000u, 1});
    const std::string text = AnsiText(time);
    EXPECT_NE(text.find("00:00:01.500"), std::string::npos) << text;
    EXPECT_NE(text.find("04"), std::string::npos) << text;

    VarData tooLate(AbsTime{0, std::numeric_limits<std::int64_t>::max()});
    EXPECT_EQ(AnsiText(tooLate), "Unable to display time value");
    EXPECT_EQ(AnsiText(VarData(AbsTime::Earliest())), "");
}

TEST(Conversion, WrappersFlattenAndUnwrap)
{
    VarData flex = VarData::MakeNumeric(2.5);
    flex.ConvertTo(TypeCode::FlexData);
    EXPECT_EQ(flex.Code(), TypeCode::FlexData);
    EXPECT_EQ(flex.ToDouble(), 2.5);
    EXPECT_EQ(AnsiText(flex), "2.5");
    VarData wrapped("text");
    wrapped.ConvertTo(TypeCode::FlexData);
    wrapped.ConvertTo(TypeCode::AnsiString); // unwrapping alone reaches the target
    EXPECT_EQ(wrapped.GetString().View(), "text");

    const auto contents = [](const VarData& value) {
        const std::uint16_t* descriptor = nullptr;
        std::uint16_t words = 0;
        const std::uint8_t* data = nullptr;
        std::uint32_t bytes = 0;
        static_cast<const qv::value::dynamic::IFBVariantGuts*>(value.Guts())
            ->GetContents(&descriptor, &words, &data, &bytes);
        return std::pair(std::vector<std::uint16_t>(descriptor, descriptor + words),
                         std::vector<std::uint8_t>(data, data + bytes));
    };
    using Contents = std::pair<std::vector<std::uint16_t>, std::vector<std::uint8_t>>;

    VarData number = VarData::MakeNumeric(-2, 3);
    number.ConvertTo(TypeCode::FBVariant);
    ASSERT_EQ(number.Code(), TypeCode::FBVariant);
    EXPECT_EQ(contents(number), (Contents{{4, 0x03}, {0xFF, 0xFF, 0xFF, 0xFE}}));
    EXPECT_EQ(number.ToDouble(), -2.0);
    EXPECT_EQ(AnsiText(number), "-2");
    VarData unwrapped = number;
    unwrapped.ConvertTo(TypeCode::Numeric); // unwrapping reaches the target and keeps the kind
    EXPECT_EQ(unwrapped.TypeWord(), 0x30003u);

    // What cannot be flattened becomes the empty type.
    VarData dictionary = VarData::NewDictionary();
    dictionary.ConvertTo(TypeCode::FBVariant);
    EXPECT_EQ(contents(dictionary), (Contents{{4, 0x00}, {}}));
    EXPECT_EQ(AnsiText(dictionary), "");

    // A variant that cannot be read stays as it is and has the empty text.
    const std::uint16_t broken[] = {0, 0x03};
    const std::uint8_t data[] = {0, 0, 0, 1};
    VarData foreign = VarData::MakeFBVariant(broken, 2, data, 4);
    EXPECT_EQ(foreign.ToDouble(), 0.0);
    EXPECT_EQ(AnsiText(foreign), "");
    foreign.ConvertTo(TypeCode::Logical);
    EXPECT_EQ(foreign.TypeWord(), TypeCode::Logical);
    EXPECT_FALSE(foreign.ToBool());
}
