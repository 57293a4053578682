// VarData::ConvertTo: a value converted in place to another type code.

#include "value/VarData.h"

#include "fen/IntegerText.h"
#include "fen/osdep/TextConversion.h"
#include "fen/osdep/TimeText.h"
#include "value/FormatGeneral.h"
#include "value/GutsAccess.h"
#include "value/dynamic/DynamicData.h"
#include "value/wfstatic/FBVariantReader.h"
#include "value/wfstatic/FBVariantWriter.h"

#include <cmath>
#include <limits>
#include <memory>
#include <vector>

namespace qv::value {

using namespace dynamic;

namespace {

constexpr const char kTimeFailure[] = "Unable to display time value";

fen::String GeneralText(double number)
{
    char buffer[32];
    const std::size_t length = FormatGeneral(number, buffer, sizeof buffer);
    return fen::String(buffer, length);
}

fen::WString Widen(const fen::String& text) { return fen::osdep::ToWide(text); }
fen::String Narrow(const fen::WString& text) { return fen::osdep::ToAnsi(text); }

/// The display text of a time value: the locale's formats, milliseconds,
/// local time, or the failure text.
fen::WString TimeText(const VarData& value)
{
    fen::AbsTime time{};
    static_cast<const ITimeGuts*>(value.Guts())->GetTime(&time);
    try {
        return fen::osdep::AbsTimeToString(time, nullptr, nullptr, 3, fen::osdep::kShowLocalTime, false, nullptr,
                                           fen::osdep::kLocaleSeparator);
    } catch (const fen::exception::Exception&) {
        return fen::WString(u"Unable to display time value");
    }
}

fen::WString DictionaryText(const VarData& value)
{
    const auto* dictionary = static_cast<const IDictionaryGuts*>(value.Guts());
    if (dictionary == nullptr)
        return fen::WString();
    std::unique_ptr<char16_t, void (*)(void*)> text(dictionary->NewText(), wfd_free);
    return fen::WString(text.get());
}

fen::String RawText(const VarData& value)
{
    const std::uint8_t* data = nullptr;
    std::uint32_t count = 0;
    if (!value.GetRaw(data, count) || data == nullptr)
        return fen::String();
    return fen::String(reinterpret_cast<const char*>(data), count);
}

/// Text of the value's own type in 8 bits, or nothing when its text is
/// naturally wide (Unicode text, dictionaries, times).
bool NarrowText(const VarData& value, fen::String& text)
{
    switch (value.Code()) {
    case TypeCode::Logical: text = value.ToBool() ? "on" : "off"; return true;
    case TypeCode::Numeric:
        text = value.Kind() == NumericKind::BitField ? fen::HexText(ClampToUInt32(value.ToDouble()))
                                                     : GeneralText(value.ToDouble());
        return true;
    case TypeCode::UInt64: text = fen::HexText(value.GetUInt64()); return true;
    case TypeCode::AnsiString: text = value.GetString(); return true;
    case TypeCode::RawBytes: text = RawText(value); return true;
    case TypeCode::SSTimeNumber:
        text = GeneralText(value.Guts() == nullptr ? 0.0 : value.Guts()->ToDouble());
        return true;
    case TypeCode::UnicodeString:
    case TypeCode::Dictionary:
    case TypeCode::SSTimeValue: return false;
    default: text = fen::String(); return true;
    }
}

fen::WString WideTextOf(const VarData& value)
{
    switch (value.Code()) {
    case TypeCode::UnicodeString: return value.GetWString();
    case TypeCode::Dictionary: return DictionaryText(value);
    case TypeCode::SSTimeValue:
        return value.Guts() == nullptr ? fen::WString(u"Unable to display time value") : TimeText(value);
    default: {
        fen::String narrow;
        NarrowText(value, narrow);
        return Widen(narrow);
    }
    }
}

fen::String NarrowTextOf(const VarData& value)
{
    fen::String text;
    if (NarrowText(value, text))
        return text;
    if (value.Code() == TypeCode::SSTimeValue && value.Guts() == nullptr)
        return fen::String(kTimeFailure);
    return Narrow(WideTextOf(value));
}

/// Seconds since the time epoch as a time; beyond the range (infinities and
/// NaNs by their sign) it gives the latest or the earliest time.
fen::AbsTime TimeFromSeconds(double seconds)
{
    constexpr double kLimit = 9223372036854775808.0; // 2^63
    const bool negative = std::signbit(seconds);
    if (std::isnan(seconds) || seconds >= kLimit || seconds < -kLimit) {
        if (negative)
            return fen::AbsTime::Earliest();
        return fen::AbsTime{std::numeric_limits<std::uint64_t>::max(), std::numeric_limits<std::int64_t>::max()};
    }
    double whole = std::floor(seconds);
    // Exact in [0, 1) except for a tiny negative number, where 1 - tiny rounds
    // to 1: that time is the next whole second.
    double part = seconds - whole;
    if (part >= 1.0) {
        whole += 1.0;
        part = 0.0;
    }
    return fen::AbsTime{static_cast<std::uint64_t>(std::ldexp(part, 64)), static_cast<std::int64_t>(whole)};
}

VarData Flattened(const VarData& value)
{
    try {
        const wfstatic::FBVariantSizes sizes = wfstatic::MeasureFBVariant(value);
        std::vector<std::uint16_t> descriptor(sizes.descriptorWords, 0);
        std::vector<std::uint8_t> data(sizes.dataBytes, 0);
        wfstatic::WriteFBVariant(value, descriptor.data(), sizes.descriptorWords, data.data(), sizes.dataBytes);
        if (descriptor.size() > 0xFFFF)
            QV_THROW(fen::exception::UnableToConvert());
        return VarData::MakeFBVariant(descriptor.data(), static_cast<std::uint16_t>(descriptor.size()), data.data(),
                                      sizes.dataBytes);
    } catch (const fen::exception::UnableToConvert&) {
        const std::uint16_t emptyType[] = {0x0004, 0x0000};
        return VarData::MakeFBVariant(emptyType, 2, nullptr, 0);
    }
}

/// The plain value that a foreign variant or flex data wraps, if it can be had.
bool Unwrapped(const VarData& value, VarData& plain)
{
    if (value.Guts() == nullptr)
        return false;
    if (value.Code() == TypeCode::FBVariant) {
        try {
            const std::uint16_t* descriptor = nullptr;
            std::uint16_t words = 0;
            const std::uint8_t* data = nullptr;
            std::uint32_t bytes = 0;
            static_cast<const IFBVariantGuts*>(value.Guts())->GetContents(&descriptor, &words, &data, &bytes);
            plain = wfstatic::FBVariantToVarData(descriptor, descriptor + words, data, data + bytes);
            return true;
        } catch (const std::exception&) {
            return false;
        }
    }
    if (value.Code() == TypeCode::FlexData) {
        Interface<IFlexData> flex(value.Guts(), kIID_FlexData);
        bool success = false;
        if (flex)
            flex->Unwrap(&plain, &success);
        return success;
    }
    return false;
}

} // namespace

void VarData::ConvertTo(std::uint32_t target)
{
    const std::uint16_t code = static_cast<std::uint16_t>(target & 0xFFFF);
    // Callers skip same-code conversions; doing nothing keeps a value whose
    // own-code conversion would otherwise lose its contents. A number still
    // loses its numeric kind, as every conversion to a number does.
    if (Code() == code) {
        if (code == TypeCode::Numeric)
            SetSubType(0);
        return;
    }
    VarData plain;
    if (Unwrapped(*this, plain)) {
        Swap(plain);
        if (Code() == code)
            return;
    }

    VarData result;
    switch (code) {
    case TypeCode::Logical: result = MakeLogical(ToBool()); break;
    case TypeCode::Numeric: result = MakeNumeric(ToDouble()); break;
    case TypeCode::AnsiString: result = VarData(NarrowTextOf(*this)); break;
    case TypeCode::UnicodeString: result = VarData(WideTextOf(*this)); break;
    case TypeCode::RawBytes: {
        if (Code() == TypeCode::AnsiString || Code() == TypeCode::UnicodeString) {
            const fen::String text = Code() == TypeCode::AnsiString ? GetString() : Narrow(GetWString());
            result = VarData(reinterpret_cast<const std::uint8_t*>(text.c_str()),
                             static_cast<std::uint32_t>(text.length()));
        } else {
            result = MakeTyped(TypeCode::RawBytes);
        }
        break;
    }
    case TypeCode::Dictionary: result = NewDictionary(); break;
    case TypeCode::SSTimeValue:
    case TypeCode::SSTimeNumber: {
        const fen::AbsTime time = TimeFromSeconds(ToDouble());
        result = VarData(code, NewVarDataSSTimeValue(&time));
        break;
    }
    case TypeCode::FBVariant: result = Flattened(*this); break;
    case TypeCode::FlexData: result = VarData(TypeCode::FlexData, NewVarDataFlexDataFromVarData(this)); break;
    default: result = MakeTyped(code); break;
    }
    Swap(result);
}

} // namespace qv::value
