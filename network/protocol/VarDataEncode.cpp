// VarData to JSON.

#include "network/protocol/VarDataJson.h"

#include "fen/Exception.h"
#include "network/protocol/JsonFields.h"
#include "network/protocol/TextCoding.h"
#include "value/GutsAccess.h"
#include "value/dynamic/Interfaces.h"

#include <bit>
#include <cmath>
#include <cstdio>
#include <cstring>

namespace qv::network::protocol {

using detail::Json;
using value::VarData;
namespace TypeCode = value::TypeCode;

namespace {

/// The canonical quiet NaN, written as plain "nan"; every other NaN keeps its bits.
constexpr std::uint64_t kPlainNaN = 0x7FF8000000000000;

Json NumberJson(double number)
{
    if (std::isinf(number))
        return number > 0 ? "inf" : "-inf";
    if (std::isnan(number)) {
        const auto bits = std::bit_cast<std::uint64_t>(number);
        if (bits == kPlainNaN)
            return "nan";
        char text[32];
        std::snprintf(text, sizeof text, "nan:0x%016llX", static_cast<unsigned long long>(bits));
        return text;
    }
    return number;
}

Json Base64Json(const std::uint8_t* bytes, std::size_t count)
{
    return Base64Encode(bytes, count);
}

fen::AbsTime StoredTime(const VarData& value)
{
    fen::AbsTime time{};
    static_cast<const value::dynamic::ITimeGuts*>(value.Guts())->GetTime(&time);
    return time;
}

Json Encode(const VarData& value, int depth);

void EncodeContent(const VarData& value, int depth, Json& json)
{
    switch (value.Code()) {
    case TypeCode::Logical: {
        bool logical = false;
        value.GetBool(logical);
        json["b"] = logical;
        return;
    }
    case TypeCode::Numeric: json["n"] = NumberJson(value.ToDouble()); return;
    case TypeCode::Time:
    case TypeCode::UInt64: json["u"] = detail::UnsignedText(value.GetUInt64()); return;
    case TypeCode::Word32: json["w"] = value.GetWord32(); return;
    default: break;
    }
    if (value.Guts() == nullptr)
        return;
    switch (value.Code()) {
    case TypeCode::AnsiString: {
        const fen::String text = value.GetString();
        if (IsValidUtf8(text.View()))
            json["a"] = std::string(text.View());
        else
            json["a64"] = Base64Json(reinterpret_cast<const std::uint8_t*>(text.data()), text.length());
        return;
    }
    case TypeCode::UnicodeString: {
        const fen::WString text = value.GetWString();
        if (IsWellFormedUtf16(text.View())) {
            json["u16"] = Utf8FromUtf16(text.View());
        } else {
            Json units = Json::array();
            for (const char16_t unit : text)
                units.push_back(static_cast<std::uint16_t>(unit));
            json["u16w"] = std::move(units);
        }
        return;
    }
    case TypeCode::RawBytes: {
        const std::uint8_t* bytes = nullptr;
        std::uint32_t count = 0;
        if (!value.GetRaw(bytes, count))
            QV_THROW(fen::exception::InvalidArgument());
        json["r"] = Base64Json(bytes, count);
        return;
    }
    case TypeCode::Vector: {
        Json elements = Json::array();
        const std::uint32_t count = value.Size();
        for (std::uint32_t i = 0; i < count; ++i)
            elements.push_back(Encode(value.GetElement(i), depth + 1));
        json["e"] = std::move(elements);
        return;
    }
    case TypeCode::Dictionary: {
        Json entries = Json::array();
        for (auto it = value.Begin(), end = value.End(); it != end; ++it)
            entries.push_back(Json::array({Encode(it.Key(), depth + 1), Encode(it.Value(), depth + 1)}));
        json["d"] = std::move(entries);
        return;
    }
    case TypeCode::SSTimeValue:
    case TypeCode::SSTimeNumber: {
        const fen::AbsTime time = StoredTime(value);
        json["s"] = detail::SignedText(time.seconds);
        json["f"] = detail::UnsignedText(time.fraction);
        return;
    }
    case TypeCode::FBVariant: {
        const std::uint16_t* descriptor = nullptr;
        std::uint16_t words = 0;
        const std::uint8_t* data = nullptr;
        std::uint32_t bytes = 0;
        static_cast<const value::dynamic::IFBVariantGuts*>(value.Guts())
            ->GetContents(&descriptor, &words, &data, &bytes);
        json["fd"] = Json(std::vector<std::uint16_t>(descriptor, descriptor + words));
        json["fx"] = Base64Json(data, bytes);
        return;
    }
    case TypeCode::FlexData: {
        value::Interface<value::dynamic::IFlexData> flex(value.Guts(), value::dynamic::kIID_FlexData);
        VarData wrapped;
        bool success = false;
        if (flex)
            flex->Unwrap(&wrapped, &success);
        if (!success)
            QV_THROW(fen::exception::InvalidArgument());
        json["x"] = Encode(wrapped, depth + 1);
        return;
    }
    default: return; // an unknown code: its type word alone
    }
}

Json Encode(const VarData& value, int depth)
{
    if (depth > kMaxValueDepth)
        QV_THROW(fen::exception::InvalidArgument());
    Json json = Json::object();
    json["t"] = value.TypeWord();
    EncodeContent(value, depth, json);
    return json;
}

} // namespace

Json VarDataToJson(const VarData& value)
{
    return Encode(value, 1);
}

} // namespace qv::network::protocol
