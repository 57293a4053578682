// JSON to VarData, strictly.

#include "network/protocol/VarDataJson.h"

#include "network/protocol/JsonFields.h"
#include "network/protocol/ProtocolError.h"
#include "network/protocol/TextCoding.h"

#include <bit>
#include <charconv>
#include <cmath>
#include <cstdio>
#include <initializer_list>
#include <limits>

namespace qv::network::protocol {

using detail::Json;
using value::VarData;
namespace TypeCode = value::TypeCode;

namespace {

[[noreturn]] void Fail(std::uint32_t word, const std::string& problem)
{
    char hex[16];
    std::snprintf(hex, sizeof hex, "0x%X", static_cast<unsigned>(word));
    throw ProtocolError("value of type " + std::string(hex) + ": " + problem);
}

/// Fails unless every member of `json` besides "t" is one of `allowed`.
void CheckMembers(const Json& json, std::uint32_t word, std::initializer_list<std::string_view> allowed)
{
    for (auto it = json.begin(); it != json.end(); ++it) {
        if (it.key() == "t")
            continue;
        bool known = false;
        for (const std::string_view name : allowed)
            known = known || it.key() == name;
        if (!known)
            Fail(word, "unexpected member \"" + it.key() + "\"");
    }
}

std::uint32_t CheckedCount(std::size_t count, std::uint32_t word)
{
    if (count > std::numeric_limits<std::uint32_t>::max())
        Fail(word, "content too long");
    return static_cast<std::uint32_t>(count);
}

double DecodeNumber(const Json& json, std::uint32_t word)
{
    if (json.is_number_float())
        return json.get<double>();
    if (json.is_number_integer()) {
        // Integers are taken when the double holds them exactly.
        constexpr double kTwo63 = 9223372036854775808.0;
        if (json.is_number_unsigned()) {
            const auto integer = json.get<std::uint64_t>();
            const auto number = static_cast<double>(integer);
            if (number < 2 * kTwo63 && static_cast<std::uint64_t>(number) == integer)
                return number;
        } else {
            const auto integer = json.get<std::int64_t>();
            const auto number = static_cast<double>(integer);
            if (number < kTwo63 && static_cast<std::int64_t>(number) == integer)
                return number;
        }
        Fail(word, "integer not exactly a double");
    }
    if (!json.is_string())
        Fail(word, "\"n\" is a number or \"nan\", \"inf\", \"-inf\"");
    const std::string& text = json.get_ref<const std::string&>();
    if (text == "nan")
        return std::numeric_limits<double>::quiet_NaN();
    if (text == "inf")
        return std::numeric_limits<double>::infinity();
    if (text == "-inf")
        return -std::numeric_limits<double>::infinity();
    std::uint64_t bits = 0;
    const std::string_view prefix = "nan:0x";
    if (text.size() == prefix.size() + 16 && text.compare(0, prefix.size(), prefix) == 0) {
        const char* end = text.data() + text.size();
        const auto [ptr, error] = std::from_chars(text.data() + prefix.size(), end, bits, 16);
        const double number = std::bit_cast<double>(bits);
        if (error == std::errc() && ptr == end && std::isnan(number))
            return number;
    }
    Fail(word, "bad number text \"" + text + "\"");
}

std::uint16_t CodeUnit(const Json& json, std::uint32_t word)
{
    if (!json.is_number_integer() || (!json.is_number_unsigned() && json.get<std::int64_t>() < 0) ||
        json.get<std::uint64_t>() > 0xFFFF)
        Fail(word, "expected a 16-bit unsigned integer");
    return static_cast<std::uint16_t>(json.get<std::uint64_t>());
}

const std::string& Utf8Member(const Json& json, std::string_view name, std::uint32_t word)
{
    const std::string& text = detail::AsString(json, name);
    if (!IsValidUtf8(text))
        Fail(word, "\"" + std::string(name) + "\" is not valid UTF-8");
    return text;
}

VarData Decode(const Json& json, int depth);

VarData DecodeText(const Json& json, std::uint32_t word)
{
    CheckMembers(json, word, {"a", "a64"});
    const Json* plain = detail::Member(json, "a");
    const Json* base64 = detail::Member(json, "a64");
    if (plain != nullptr && base64 != nullptr)
        Fail(word, "both \"a\" and \"a64\"");
    if (plain != nullptr) {
        const std::string& text = Utf8Member(*plain, "a", word);
        return VarData::MakeAnsi(text.data(), CheckedCount(text.size(), word));
    }
    if (base64 != nullptr) {
        const std::vector<std::uint8_t> bytes = Base64Decode(detail::AsString(*base64, "a64"));
        return VarData::MakeAnsi(reinterpret_cast<const char*>(bytes.data()), CheckedCount(bytes.size(), word));
    }
    return VarData::MakeTyped(TypeCode::AnsiString);
}

VarData DecodeWideText(const Json& json, std::uint32_t word)
{
    CheckMembers(json, word, {"u16", "u16w"});
    const Json* plain = detail::Member(json, "u16");
    const Json* units = detail::Member(json, "u16w");
    if (plain != nullptr && units != nullptr)
        Fail(word, "both \"u16\" and \"u16w\"");
    std::u16string text;
    if (plain != nullptr)
        text = Utf16FromUtf8(Utf8Member(*plain, "u16", word));
    if (units != nullptr)
        for (const Json& unit : detail::AsArray(*units, "u16w"))
            text += static_cast<char16_t>(CodeUnit(unit, word));
    CheckedCount(text.size(), word);
    return VarData(fen::WString(text.data(), text.size()));
}

VarData DecodeBytes(const Json& json, std::uint32_t word)
{
    CheckMembers(json, word, {"r"});
    const Json* base64 = detail::Member(json, "r");
    if (base64 == nullptr)
        return VarData::MakeTyped(TypeCode::RawBytes);
    const std::vector<std::uint8_t> bytes = Base64Decode(detail::AsString(*base64, "r"));
    return VarData(bytes.data(), CheckedCount(bytes.size(), word));
}

VarData DecodeVector(const Json& json, std::uint32_t word, int depth)
{
    CheckMembers(json, word, {"e"});
    VarData vector = VarData::MakeTyped(TypeCode::Vector);
    const Json* elements = detail::Member(json, "e");
    if (elements == nullptr)
        return vector;
    const Json& array = detail::AsArray(*elements, "e");
    const std::uint32_t count = CheckedCount(array.size(), word);
    for (std::uint32_t i = 0; i < count; ++i)
        vector.SetElement(i, Decode(array[i], depth + 1));
    return vector;
}

VarData DecodeDictionary(const Json& json, std::uint32_t word, int depth)
{
    CheckMembers(json, word, {"d"});
    const Json* entries = detail::Member(json, "d");
    if (entries == nullptr)
        return VarData::MakeTyped(TypeCode::Dictionary);
    VarData dictionary = VarData::NewDictionary();
    for (const Json& entry : detail::AsArray(*entries, "d")) {
        if (!entry.is_array() || entry.size() != 2)
            Fail(word, "a dictionary entry is an array of a key and a value");
        const VarData key = Decode(entry[0], depth + 1);
        VarData element = Decode(entry[1], depth + 1);
        if (dictionary.Find(key) != nullptr)
            Fail(word, "a key given twice");
        dictionary[key] = std::move(element);
    }
    return dictionary;
}

VarData DecodeTime(const Json& json, std::uint32_t word)
{
    CheckMembers(json, word, {"s", "f"});
    const Json* seconds = detail::Member(json, "s");
    const Json* fraction = detail::Member(json, "f");
    if ((seconds == nullptr) != (fraction == nullptr))
        Fail(word, "a time has both \"s\" and \"f\" or neither");
    if (seconds == nullptr)
        return VarData::MakeTyped(word & 0xFFFF);
    const fen::AbsTime time{detail::AsUnsignedText(*fraction, "f"), detail::AsSignedText(*seconds, "s")};
    return (word & 0xFFFF) == TypeCode::SSTimeNumber ? VarData::MakeTimeNumber(time) : VarData(time);
}

VarData DecodeForeign(const Json& json, std::uint32_t word)
{
    CheckMembers(json, word, {"fd", "fx"});
    const Json* descriptor = detail::Member(json, "fd");
    const Json* data = detail::Member(json, "fx");
    if ((descriptor == nullptr) != (data == nullptr))
        Fail(word, "a foreign variant has both \"fd\" and \"fx\" or neither");
    if (descriptor == nullptr)
        return VarData::MakeTyped(TypeCode::FBVariant);
    std::vector<std::uint16_t> words;
    for (const Json& unit : detail::AsArray(*descriptor, "fd"))
        words.push_back(CodeUnit(unit, word));
    if (words.size() > 0xFFFF)
        Fail(word, "descriptor longer than 65535 words");
    const std::vector<std::uint8_t> bytes = Base64Decode(detail::AsString(*data, "fx"));
    return VarData::MakeFBVariant(words.data(), static_cast<std::uint16_t>(words.size()), bytes.data(),
                                  CheckedCount(bytes.size(), word));
}

VarData DecodeFlex(const Json& json, std::uint32_t word, int depth)
{
    CheckMembers(json, word, {"x"});
    const Json* wrapped = detail::Member(json, "x");
    if (wrapped == nullptr)
        return VarData::MakeTyped(TypeCode::FlexData);
    VarData value = Decode(*wrapped, depth + 1);
    // Wrapping unwraps a foreign variant or flex data first, so flex data
    // never holds one.
    if (value.Code() == TypeCode::FlexData || (value.Code() == TypeCode::FBVariant && value.Guts() != nullptr))
        Fail(word, "flex data cannot wrap flex data or a foreign variant");
    value.ConvertTo(TypeCode::FlexData);
    return value;
}

/// A payload code's value, without its sub-type.
VarData DecodeSimple(const Json& json, std::uint32_t word)
{
    switch (word & 0xFFFF) {
    case TypeCode::Logical:
        CheckMembers(json, word, {"b"});
        return VarData::MakeLogical(detail::AsBool(detail::Required(json, "b"), "b"));
    case TypeCode::Numeric:
        CheckMembers(json, word, {"n"});
        return VarData::MakeNumeric(DecodeNumber(detail::Required(json, "n"), word),
                                    static_cast<std::uint16_t>(word >> 16));
    case TypeCode::Time:
        CheckMembers(json, word, {"u"});
        return VarData::MakeTime(detail::AsUnsignedText(detail::Required(json, "u"), "u"));
    case TypeCode::UInt64:
        CheckMembers(json, word, {"u"});
        return VarData::MakeUInt64(detail::AsUnsignedText(detail::Required(json, "u"), "u"));
    case TypeCode::Word32:
        CheckMembers(json, word, {"w"});
        return VarData::MakeWord32(static_cast<std::uint32_t>(
            detail::AsInteger(detail::Required(json, "w"), 0, std::numeric_limits<std::uint32_t>::max(), "w")));
    default: CheckMembers(json, word, {}); return VarData::MakeTyped(word);
    }
}

VarData Decode(const Json& json, int depth)
{
    if (depth > kMaxValueDepth)
        throw ProtocolError("value nested deeper than " + std::to_string(kMaxValueDepth) + " levels");
    detail::AsObject(json, "value");
    const auto word = static_cast<std::uint32_t>(
        detail::AsInteger(detail::Required(json, "t"), 0, std::numeric_limits<std::uint32_t>::max(), "t"));
    VarData value;
    switch (word & 0xFFFF) {
    case TypeCode::AnsiString: value = DecodeText(json, word); break;
    case TypeCode::UnicodeString: value = DecodeWideText(json, word); break;
    case TypeCode::RawBytes: value = DecodeBytes(json, word); break;
    case TypeCode::Vector: value = DecodeVector(json, word, depth); break;
    case TypeCode::Dictionary: value = DecodeDictionary(json, word, depth); break;
    case TypeCode::SSTimeValue:
    case TypeCode::SSTimeNumber: value = DecodeTime(json, word); break;
    case TypeCode::FBVariant: value = DecodeForeign(json, word); break;
    case TypeCode::FlexData: value = DecodeFlex(json, word, depth); break;
    default: value = DecodeSimple(json, word); break;
    }
    // Every decoder above builds the right code; the sub-type travels as is.
    value.SetSubType(static_cast<std::uint16_t>(word >> 16));
    return value;
}

} // namespace

VarData VarDataFromJson(const Json& json)
{
    return Decode(json, 1);
}

} // namespace qv::network::protocol
