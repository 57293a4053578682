// Construction, copying and the reading accessors of VarData.

#include "value/VarData.h"

#include "fen/TypeErrors.h"
#include "value/GutsAccess.h"
#include "value/dynamic/DynamicData.h"

#include <cmath>
#include <cstring>

namespace qv::value {

using namespace dynamic;

namespace {

bool IsEmptyText(const char* text) { return text == nullptr || *text == '\0'; }
bool IsEmptyText(const char16_t* text) { return text == nullptr || *text == u'\0'; }

IGuts* AnsiStorage(const char* text) { return IsEmptyText(text) ? nullptr : NewAnsiGuts(text); }
IGuts* UnicodeStorage(const char16_t* text) { return IsEmptyText(text) ? nullptr : NewUnicodeGuts(text); }

} // namespace

VarData::VarData(const char* text) : VarData(TypeCode::AnsiString, AnsiStorage(text)) {}

VarData::VarData(const fen::String& text)
    : VarData(TypeCode::AnsiString,
              text.empty() ? nullptr : NewAnsiGutsLen(text.c_str(), static_cast<std::uint32_t>(text.length())))
{
}

VarData::VarData(const char16_t* text) : VarData(TypeCode::UnicodeString, UnicodeStorage(text)) {}

VarData::VarData(const fen::WString& text)
    : VarData(TypeCode::UnicodeString,
              text.empty() ? nullptr : NewUnicodeGutsLen(text.c_str(), static_cast<std::uint32_t>(text.length())))
{
}

VarData::VarData(const std::uint8_t* bytes, std::uint32_t count)
    : VarData(TypeCode::RawBytes, bytes == nullptr || count == 0 ? nullptr : NewRawGuts(bytes, count))
{
}

VarData::VarData(const fen::AbsTime& time) : VarData(TypeCode::SSTimeValue, NewVarDataSSTimeValue(&time)) {}

VarData::VarData(const VarData& other) noexcept : type_(other.type_), payload_(other.payload_)
{
    if (IGuts* guts = Guts())
        guts->AddRef();
}

VarData& VarData::operator=(const VarData& other) noexcept
{
    if (this == &other)
        return *this;
    // The new storage gains its reference before the old one loses its own,
    // so assigning a value that shares our storage is safe.
    if (IGuts* guts = other.Guts())
        guts->AddRef();
    ReleaseStorage();
    type_ = other.type_;
    payload_ = other.payload_;
    return *this;
}

VarData& VarData::operator=(const char* text)
{
    IGuts* guts = AnsiStorage(text);
    ReleaseStorage();
    type_ = TypeCode::AnsiString;
    payload_.count = 0;
    payload_.guts = guts;
    return *this;
}

VarData& VarData::operator=(const char16_t* text)
{
    IGuts* guts = UnicodeStorage(text);
    ReleaseStorage();
    type_ = TypeCode::UnicodeString;
    payload_.count = 0;
    payload_.guts = guts;
    return *this;
}

VarData::~VarData()
{
    ReleaseStorage();
}

void VarData::ReleaseStorage() noexcept
{
    if (IGuts* guts = Guts())
        guts->Release();
    if (HasStorage())
        payload_.guts = nullptr;
}

VarData VarData::MakeLogical(bool value) noexcept
{
    VarData v = MakeTyped(TypeCode::Logical);
    v.payload_.logical = value ? 1 : 0;
    return v;
}

VarData VarData::MakeNumeric(double value, std::uint16_t subType) noexcept
{
    VarData v = MakeTyped((std::uint32_t{subType} << 16) | TypeCode::Numeric);
    v.payload_.number = value;
    return v;
}

VarData VarData::MakeBitField(std::uint32_t bits) noexcept
{
    return MakeNumeric(static_cast<double>(bits), static_cast<std::uint16_t>(NumericKind::BitField));
}

void VarData::SetBitField(std::uint32_t bits) noexcept
{
    ReleaseStorage();
    type_ = (static_cast<std::uint32_t>(NumericKind::BitField) << 16) | TypeCode::Numeric;
    payload_.number = static_cast<double>(bits);
}

VarData VarData::MakeUInt64(std::uint64_t value) noexcept
{
    VarData v = MakeTyped(TypeCode::UInt64);
    v.payload_.count = value;
    return v;
}

VarData VarData::MakeTime(std::uint64_t count) noexcept
{
    VarData v = MakeTyped(TypeCode::Time);
    v.payload_.count = count;
    return v;
}

VarData VarData::MakeTyped(std::uint32_t code) noexcept
{
    VarData v;
    v.type_ = code;
    return v;
}

VarData VarData::MakeWord32(std::uint32_t word) noexcept
{
    VarData v = MakeTyped(TypeCode::Word32);
    v.payload_.words[0] = word;
    return v;
}

VarData VarData::MakeTimeNumber(const fen::AbsTime& time)
{
    return VarData(TypeCode::SSTimeNumber, NewVarDataSSTimeValue(&time));
}

VarData VarData::MakeAnsi(const char* text, std::uint32_t count)
{
    return VarData(TypeCode::AnsiString, text == nullptr || count == 0 ? nullptr : NewAnsiGutsLen(text, count));
}

VarData VarData::NewDictionary()
{
    return VarData(TypeCode::Dictionary, NewVarDataDictionary());
}

VarData VarData::MakeFBVariant(const std::uint16_t* descriptor, std::uint16_t descriptorWords,
                               const std::uint8_t* data, std::uint32_t dataBytes)
{
    return VarData(TypeCode::FBVariant, NewVarDataFBVariant(descriptor, descriptorWords, data, dataBytes));
}

bool VarData::GetBool(bool& value) const noexcept
{
    if (Code() != TypeCode::Logical)
        return false;
    value = payload_.logical != 0;
    return true;
}

bool VarData::GetDouble(double& value) const noexcept
{
    if (Code() != TypeCode::Numeric)
        return false;
    value = payload_.number;
    return true;
}

bool VarData::GetRaw(const std::uint8_t*& data, std::uint32_t& count) const
{
    if (Code() != TypeCode::RawBytes)
        return false;
    if (payload_.guts == nullptr) {
        data = nullptr;
        count = 0;
        return true;
    }
    Interface<IRawBytes> bytes(payload_.guts, kIID_RawBytes);
    return bytes && bytes->GetBytes(&data, &count);
}

bool VarData::GetAnsiText(const char*& text) const
{
    if (Code() != TypeCode::AnsiString)
        return false;
    if (payload_.guts == nullptr) {
        text = "";
        return true;
    }
    Interface<IAnsiChars> chars(payload_.guts, kIID_AnsiChars);
    if (!chars)
        return false;
    text = chars->GetChars();
    return true;
}

bool VarData::GetTime(fen::AbsTime& time) const
{
    if (Code() != TypeCode::SSTimeValue || payload_.guts == nullptr)
        return false;
    static_cast<const ITimeGuts*>(payload_.guts)->GetTime(&time);
    return true;
}

fen::String VarData::GetString() const
{
    if (Code() != TypeCode::AnsiString)
        throw TypeErrorException();
    if (payload_.guts == nullptr)
        return fen::String();
    const auto* text = static_cast<const IAnsiTextGuts*>(payload_.guts);
    return fen::String(text->Chars(), text->Length());
}

fen::WString VarData::GetWString() const
{
    if (Code() != TypeCode::UnicodeString)
        throw TypeErrorException();
    if (payload_.guts == nullptr)
        return fen::WString();
    const auto* text = static_cast<const IUnicodeTextGuts*>(payload_.guts);
    return fen::WString(text->Chars(), text->Length());
}

std::uint32_t VarData::Size() const
{
    IGuts* guts = Guts();
    if (guts == nullptr)
        return 0;
    switch (Code()) {
    case TypeCode::Vector: return static_cast<IVectorGuts*>(guts)->Count();
    case TypeCode::AnsiString: return static_cast<IAnsiTextGuts*>(guts)->Length();
    case TypeCode::UnicodeString: return static_cast<IUnicodeTextGuts*>(guts)->Length();
    case TypeCode::Dictionary: return static_cast<IDictionaryGuts*>(guts)->Count();
    case TypeCode::RawBytes: {
        const std::uint8_t* data = nullptr;
        std::uint32_t count = 0;
        return GetRaw(data, count) ? count : 0;
    }
    default: return 0;
    }
}

double VarData::ToDouble() const
{
    switch (Code()) {
    case TypeCode::Logical: return payload_.logical != 0 ? 1.0 : 0.0;
    case TypeCode::Numeric: return payload_.number;
    case TypeCode::Time: return static_cast<double>(payload_.count) / 86'400'000'000'000.0;
    case TypeCode::UInt64: return static_cast<double>(payload_.count);
    default: break;
    }
    if (!HasStorage())
        return 0.0;
    return payload_.guts == nullptr ? 0.0 : payload_.guts->ToDouble();
}

bool VarData::ToBool() const
{
    switch (Code()) {
    case TypeCode::Logical: return payload_.logical != 0;
    case TypeCode::Numeric: return payload_.number != 0.0; // NaN counts as true
    case TypeCode::Time:
    case TypeCode::UInt64: return payload_.count != 0;
    case TypeCode::Word32: return payload_.words[0] != 0 || payload_.words[1] != 0;
    default: break;
    }
    if (!HasStorage())
        return false;
    return payload_.guts != nullptr && payload_.guts->ToBool();
}

std::uint32_t ClampToUInt32(double value) noexcept
{
    if (std::isnan(value) || value >= 4294967295.0)
        return 4294967295u;
    if (value <= 0.0)
        return 0;
    return static_cast<std::uint32_t>(value);
}

} // namespace qv::value
