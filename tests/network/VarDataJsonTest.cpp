// Values through the value message: every type losslessly, the exact JSON
// of a few, and the inputs the decoder must refuse.

#include "network/protocol/ProtocolError.h"
#include "network/protocol/ValueMessage.h"
#include "network/protocol/VarDataJson.h"
#include "value/GutsAccess.h"
#include "value/dynamic/Interfaces.h"

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <bit>
#include <cmath>
#include <limits>
#include <string>

using namespace qv::network::protocol;
using qv::fen::AbsTime;
using qv::value::VarData;
namespace TypeCode = qv::value::TypeCode;
namespace dynamic = qv::value::dynamic;

namespace {

VarData Wrapped(const VarData& value)
{
    VarData flex = value;
    flex.ConvertTo(TypeCode::FlexData);
    return flex;
}

VarData Unwrapped(const VarData& flex)
{
    qv::value::Interface<dynamic::IFlexData> wrapped(flex.Guts(), dynamic::kIID_FlexData);
    VarData inner;
    bool success = false;
    wrapped->Unwrap(&inner, &success);
    EXPECT_TRUE(success);
    return inner;
}

AbsTime StoredTime(const VarData& value)
{
    AbsTime time{};
    static_cast<const dynamic::ITimeGuts*>(value.Guts())->GetTime(&time);
    return time;
}

/// Fails unless `b` holds exactly what `a` holds: the same type word, the
/// same bits of a number, the same bytes, elements, entries and times.
void ExpectIdentical(const VarData& a, const VarData& b)
{
    ASSERT_EQ(a.TypeWord(), b.TypeWord());
    ASSERT_EQ(a.Guts() == nullptr, b.Guts() == nullptr);
    switch (a.Code()) {
    case TypeCode::Logical: EXPECT_EQ(a.ToBool(), b.ToBool()); return;
    case TypeCode::Numeric:
        EXPECT_EQ(std::bit_cast<std::uint64_t>(a.ToDouble()), std::bit_cast<std::uint64_t>(b.ToDouble()));
        return;
    case TypeCode::Time:
    case TypeCode::UInt64: EXPECT_EQ(a.GetUInt64(), b.GetUInt64()); return;
    case TypeCode::Word32: EXPECT_EQ(a.GetWord32(), b.GetWord32()); return;
    default: break;
    }
    if (a.Guts() == nullptr)
        return;
    switch (a.Code()) {
    case TypeCode::AnsiString: EXPECT_EQ(a.GetString().View(), b.GetString().View()); return;
    case TypeCode::UnicodeString: EXPECT_EQ(a.GetWString().View(), b.GetWString().View()); return;
    case TypeCode::SSTimeValue:
    case TypeCode::SSTimeNumber: EXPECT_EQ(StoredTime(a), StoredTime(b)); return;
    case TypeCode::FlexData: ExpectIdentical(Unwrapped(a), Unwrapped(b)); return;
    case TypeCode::Vector:
        ASSERT_EQ(a.Size(), b.Size());
        for (std::uint32_t i = 0; i < a.Size(); ++i)
            ExpectIdentical(a.GetElement(i), b.GetElement(i));
        return;
    case TypeCode::Dictionary: {
        ASSERT_EQ(a.Size(), b.Size());
        for (auto i = a.Begin(), j = b.Begin(), end = a.End(); i != end; ++i, ++j) {
            ExpectIdentical(i.Key(), j.Key());
            ExpectIdentical(i.Value(), j.Value());
        }
        return;
    }
    default: EXPECT_EQ(VarData::Compare(a, b), 0); return; // bytes, foreign variants
    }
}

VarData RoundTrip(const VarData& value)
{
    return DecodeValueMessage(EncodeValueMessage(ValueMessage{value})).value;
}

VarData SubTyped(VarData value, std::uint16_t subType)
{
    // Decoding is the one way to give a non-numeric value a sub-type.
    nlohmann::json json = VarDataToJson(value);
    const std::uint32_t word = (std::uint32_t{subType} << 16) | value.Code();
    json["t"] = word;
    VarData typed = VarDataFromJson(json);
    EXPECT_EQ(typed.TypeWord(), word);
    EXPECT_EQ(VarData::Compare(typed, value), 0);
    return typed;
}

VarData DecodeText(const std::string& text)
{
    return VarDataFromJson(nlohmann::json::parse(text));
}

} // namespace

TEST(ProtocolValue, EveryTypeRoundTripsExactly)
{
    const std::uint8_t bytes[] = {0, 1, 0x7F, 0x80, 0xFE, 0xFF};
    const std::uint16_t descriptor[] = {0x0005, 0x0000};
    const std::uint8_t variantData[] = {1, 2, 3, 4, 5, 6, 7, 8};
    const double nanWithPayload = std::bit_cast<double>(std::uint64_t{0xFFF0000000000123});

    VarData nested = VarData::NewDictionary();
    nested[VarData("list")].SetElement(2, VarData::MakeNumeric(7));
    nested[VarData::MakeNumeric(-1, 3)] = VarData(u"x");
    nested[VarData::MakeLogical(true)] = VarData::NewDictionary();
    VarData deepVector = VarData::MakeNumeric(0);
    for (int level = 0; level < 5; ++level) {
        VarData outer;
        outer.SetElement(1, deepVector);
        deepVector = outer;
    }

    const struct {
        const char* name;
        VarData value;
    } cases[] = {
        {"empty", VarData()},
        {"null", VarData::MakeTyped(TypeCode::Null)},
        {"break", VarData::MakeTyped(TypeCode::CairnetBreak)},
        {"pulse", VarData::MakeTyped(TypeCode::LogicalPulse)},
        {"true", VarData::MakeLogical(true)},
        {"false", VarData::MakeLogical(false)},
        {"tenth", VarData::MakeNumeric(0.1)},
        {"float32 kind", VarData::MakeNumeric(1.5, 7)},
        {"bit field", VarData::MakeBitField(0xFFFFFFFF)},
        {"full sub-type", VarData::MakeNumeric(3, 0xFFFF)},
        {"negative zero", VarData::MakeNumeric(-0.0)},
        {"smallest subnormal", VarData::MakeNumeric(5e-324)},
        {"largest double", VarData::MakeNumeric(std::numeric_limits<double>::max())},
        {"2^53+1 rounded", VarData::MakeNumeric(9007199254740993.0)},
        {"nan", VarData::MakeNumeric(std::numeric_limits<double>::quiet_NaN())},
        {"nan with payload", VarData::MakeNumeric(nanWithPayload)},
        {"inf", VarData::MakeNumeric(std::numeric_limits<double>::infinity())},
        {"-inf", VarData::MakeNumeric(-std::numeric_limits<double>::infinity())},
        {"time count", VarData::MakeTime(std::numeric_limits<std::uint64_t>::max())},
        {"uint64 max", VarData::MakeUInt64(std::numeric_limits<std::uint64_t>::max())},
        {"ansi utf-8", VarData("Gr\xC3\xBC\xC3\x9F" "e \"quoted\" \\ /")},
        {"ansi not utf-8", VarData::MakeAnsi("\xFF\xFE\xC3", 3)},
        {"ansi with nul", VarData::MakeAnsi("a\0b", 3)},
        {"ansi empty", VarData("")},
        {"unicode", VarData(u"Gr\u00FC\u00DFe \u20AC \U0001F600")},
        {"unicode lone surrogates", VarData(qv::fen::WString(u"a\xD800z\xDC00", 4))},
        {"raw bytes", VarData(bytes, sizeof bytes)},
        {"raw none", VarData(bytes, 0)},
        {"vector", deepVector},
        {"vector without storage", VarData::MakeTyped(TypeCode::Vector)},
        {"dictionary", nested},
        {"dictionary empty", VarData::NewDictionary()},
        {"dictionary without storage", VarData::MakeTyped(TypeCode::Dictionary)},
        {"time value earliest", VarData(AbsTime::Earliest())},
        {"time value latest", VarData(AbsTime{~0ull, std::numeric_limits<std::int64_t>::max()})},
        {"time value without storage", VarData::MakeTyped(TypeCode::SSTimeValue)},
        {"time number", DecodeText(R"({"t":4112,"s":"-1","f":"13835058055282163712"})")},
        {"foreign variant", VarData::MakeFBVariant(descriptor, 2, variantData, sizeof variantData)},
        {"foreign variant without storage", VarData::MakeTyped(TypeCode::FBVariant)},
        {"flex numeric", Wrapped(VarData::MakeNumeric(2.5, 2))},
        {"flex without storage", VarData::MakeTyped(TypeCode::FlexData)},
        {"word32", DecodeText(R"({"t":13,"w":4294967295})")},
        {"unknown code", VarData::MakeTyped(0x77)},
        {"unknown storage code", VarData::MakeTyped(0xABCD1077)},
        {"logical with sub-type", SubTyped(VarData::MakeLogical(true), 5)},
        {"ansi with sub-type", SubTyped(VarData("abc"), 0x8001)},
        {"vector with sub-type", SubTyped(deepVector, 2)},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        ExpectIdentical(RoundTrip(c.value), c.value);
    }
}

TEST(ProtocolValue, TimeNumberAndWordHoldWhatTheJsonSays)
{
    const VarData number = DecodeText(R"({"t":4112,"s":"-1","f":"13835058055282163712"})");
    EXPECT_EQ(number.Code(), TypeCode::SSTimeNumber);
    EXPECT_EQ(StoredTime(number), (AbsTime{0xC000000000000000, -1}));
    EXPECT_DOUBLE_EQ(number.ToDouble(), -0.25);
    EXPECT_EQ(DecodeText(R"({"t":13,"w":3735928559})").GetWord32(), 0xDEADBEEFu);
}

TEST(ProtocolValue, GoldenJson)
{
    VarData vector;
    vector.SetElement(0, VarData("ok"));
    vector.SetElement(1, VarData::MakeUInt64(18446744073709551615ull));
    vector.SetElement(2, VarData::MakeAnsi("\xFF", 1));
    ValueMessage message{vector, 0x20000040ull, -3, AbsTime{0x8000000000000000, 3786912000}};
    EXPECT_EQ(EncodeValueMessage(message),
              R"({"error":-3,"quality":"0x0000000020000040","time":{"f":"9223372036854775808","s":"3786912000"},)"
              R"("v":1,"value":{"e":[{"a":"ok","t":4101},{"t":17,"u":"18446744073709551615"},)"
              R"({"a64":"/w==","t":4101}],"t":12295}})");

    const std::uint8_t raw[] = {0xDE, 0xAD};
    VarData dictionary = VarData::NewDictionary();
    dictionary[VarData::MakeNumeric(1)] = VarData(raw, 2);
    dictionary[VarData(u"\xD800")] = VarData::MakeNumeric(-0.0, 8);
    EXPECT_EQ(VarDataToJson(dictionary).dump(),
              R"({"d":[[{"n":1.0,"t":3},{"r":"3q0=","t":4105}],[{"t":4102,"u16w":[55296]},{"n":-0.0,"t":524291}]],)"
              R"("t":4108})");
    EXPECT_EQ(VarDataToJson(VarData::MakeNumeric(std::numeric_limits<double>::quiet_NaN())).dump(),
              R"({"n":"nan","t":3})");
    EXPECT_EQ(VarDataToJson(VarData::MakeNumeric(-std::numeric_limits<double>::quiet_NaN())).dump(),
              R"({"n":"nan:0xFFF8000000000000","t":3})");
}

TEST(ProtocolValue, EmptyContentMeansNoStorage)
{
    for (const char* text : {R"({"t":4101,"a":""})", R"({"t":4101,"a64":""})", R"({"t":4102,"u16":""})",
                             R"({"t":4102,"u16w":[]})", R"({"t":4105,"r":""})", R"({"t":12295,"e":[]})"}) {
        SCOPED_TRACE(text);
        const VarData value = DecodeText(text);
        EXPECT_EQ(value.Guts(), nullptr);
        EXPECT_EQ(VarDataToJson(value).size(), 1u);
    }
    EXPECT_NE(DecodeText(R"({"t":4108,"d":[]})").Guts(), nullptr);
}

TEST(ProtocolValue, DecoderRefusesMalformedValues)
{
    const struct {
        const char* name;
        const char* json;
    } cases[] = {
        {"not an object", R"([3])"},
        {"no type", R"({"n":1})"},
        {"type as text", R"({"t":"3","n":1})"},
        {"type fraction", R"({"t":3.0,"n":1})"},
        {"type too large", R"({"t":4294967296})"},
        {"type negative", R"({"t":-1})"},
        {"stray member", R"({"t":3,"n":1,"b":true})"},
        {"member of an empty type", R"({"t":0,"n":1})"},
        {"missing number", R"({"t":3})"},
        {"inexact integer", R"({"t":3,"n":9007199254740993})"},
        {"bad number text", R"({"t":3,"n":"NaN"})"},
        {"nan text not a nan", R"({"t":3,"n":"nan:0x7FF0000000000000"})"},
        {"logical as number", R"({"t":2,"b":1})"},
        {"count as number", R"({"t":17,"u":5})"},
        {"count with plus", R"({"t":17,"u":"+5"})"},
        {"count with leading zero", R"({"t":17,"u":"05"})"},
        {"count negative", R"({"t":4,"u":"-1"})"},
        {"count overflow", R"({"t":17,"u":"18446744073709551616"})"},
        {"word too large", R"({"t":13,"w":4294967296})"},
        {"both text forms", R"({"t":4101,"a":"x","a64":"eA=="})"},
        {"base64 alphabet", R"({"t":4105,"r":"ab-_"})"},
        {"code unit too large", R"({"t":4102,"u16w":[65536]})"},
        {"code unit negative", R"({"t":4102,"u16w":[-1]})"},
        {"seconds without fraction", R"({"t":4111,"s":"0"})"},
        {"seconds overflow", R"({"t":4111,"s":"9223372036854775808","f":"0"})"},
        {"negative zero seconds", R"({"t":4111,"s":"-0","f":"0"})"},
        {"descriptor without data", R"({"t":4114,"fd":[1]})"},
        {"elements not an array", R"({"t":12295,"e":{"t":0}})"},
        {"element not a value", R"({"t":12295,"e":[1]})"},
        {"entry not a pair", R"({"t":4108,"d":[[{"t":0}]]})"},
        {"key given twice", R"({"t":4108,"d":[[{"t":3,"n":1},{"t":0}],[{"t":3,"n":1},{"t":1}]]})"},
        {"flex around flex", R"({"t":4115,"x":{"t":4115}})"},
        {"flex around foreign", R"({"t":4115,"x":{"t":4114,"fd":[],"fx":""}})"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_THROW(DecodeText(c.json), ProtocolError);
    }
}

TEST(ProtocolValue, NestingLimitHoldsBothWays)
{
    auto nestedJson = [](int levels) {
        std::string text = R"({"t":0})";
        for (int i = 1; i < levels; ++i)
            text = R"({"t":12295,"e":[)" + text + "]}";
        return text;
    };
    const VarData deepest = DecodeText(nestedJson(kMaxValueDepth));
    EXPECT_THROW(DecodeText(nestedJson(kMaxValueDepth + 1)), ProtocolError);

    VarData tooDeep;
    tooDeep.SetElement(0, deepest);
    EXPECT_THROW(VarDataToJson(tooDeep), qv::fen::exception::InvalidArgument);
    EXPECT_THROW(DecodeValueMessage(std::string(100000, '[') + std::string(100000, ']')), ProtocolError);
}
