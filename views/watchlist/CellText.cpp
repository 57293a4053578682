#include "views/watchlist/CellText.h"

#include "document/ItemDataPacket.h"
#include "fen/Exception.h"
#include "fen/osdep/TextConversion.h"
#include "fen/osdep/TimeText.h"
#include "resources/StringTable.h"
#include "value/QualityText.h"

#include <algorithm>
#include <cctype>
#include <charconv>

namespace qv::views {
namespace {

constexpr std::uint32_t kInvalidTimestamp = 61294;
constexpr std::array<std::uint32_t, kColumnCount> kHeaderIds = {61318, 61317, 61315, 61316, 61450, 61319};

// Beyond 17 significant digits a double has nothing more to show.
constexpr std::uint32_t kMaxDigits = 17;

std::string_view StringText(std::uint32_t id) { return resources::FindString(id).value_or(std::string_view()); }

std::string ToStd(const fen::String& text) { return std::string(text.c_str(), text.length()); }

/// "%.*G" of `number`, but with a full stop whatever the locale.
std::string NumberText(double number, std::uint32_t digits)
{
    char buffer[64];
    const auto result = std::to_chars(buffer, buffer + sizeof buffer, number, std::chars_format::general,
                                      static_cast<int>(std::min(digits, kMaxDigits)));
    std::string text(buffer, result.ptr);
    // to_chars writes "e", "inf" and "nan" where "%G" writes capitals.
    std::transform(text.begin(), text.end(), text.begin(),
                   [](unsigned char c) { return static_cast<char>(std::toupper(c)); });
    return text;
}

std::string RawBytesText(const value::VarData& value, bool hex)
{
    const std::uint8_t* data = nullptr;
    std::uint32_t count = 0;
    if (!value.GetRaw(data, count) || data == nullptr)
        return std::string();
    if (!hex)
        return std::string(reinterpret_cast<const char*>(data), count);
    static constexpr char kDigits[] = "0123456789ABCDEF";
    std::string text;
    text.reserve(std::size_t{count} * 2);
    for (std::uint32_t i = 0; i < count; ++i) {
        text.push_back(kDigits[data[i] >> 4]);
        text.push_back(kDigits[data[i] & 0xF]);
    }
    return text;
}

} // namespace

std::string_view ColumnHeader(int column)
{
    if (column < 0 || column >= kColumnCount)
        return {};
    return StringText(kHeaderIds[static_cast<std::size_t>(column)]);
}

std::size_t ShortNameStart(std::string_view url) noexcept
{
    const std::size_t slash = url.rfind('\\');
    return slash == std::string_view::npos ? 0 : slash + 1;
}

std::string ShortName(std::string_view url) { return std::string(url.substr(ShortNameStart(url))); }

std::string FormatValueText(const value::VarData& value, std::uint32_t decimalDigits, bool hexForRawData)
{
    using value::TypeCode::AnsiString;
    switch (value.Code()) {
    case value::TypeCode::Logical: return value.ToBool() ? "True" : "False";
    case value::TypeCode::Numeric:
        if (value.Kind() != value::NumericKind::BitField)
            return NumberText(value.ToDouble(), decimalDigits);
        break;
    case value::TypeCode::RawBytes: return RawBytesText(value, hexForRawData);
    default: break;
    }
    // Converted on a copy: the caller's value stays as it was received.
    value::VarData text(value);
    if (text.Code() != AnsiString)
        text.ConvertTo(AnsiString);
    return ToStd(text.GetString());
}

std::string TimeCellText(const fen::AbsTime& time)
{
    try {
        return ToStd(fen::osdep::ToAnsi(fen::osdep::AbsTimeToString(
            time, nullptr, nullptr, 0, fen::osdep::kShowLocalTime, false, nullptr, fen::osdep::kLocaleSeparator)));
    } catch (const fen::exception::Exception&) {
        return std::string(StringText(kInvalidTimestamp));
    }
}

std::string QualityCellText(std::uint64_t quality, std::int32_t errorCode)
{
    std::string text = ToStd(value::QualityText(static_cast<std::uint32_t>(quality),
                                                static_cast<std::uint32_t>(quality >> 32), ";"));
    if (errorCode < 0)
        text += "; error code: " + std::to_string(errorCode);
    return text;
}

std::string_view AccessText(std::uint16_t access)
{
    const bool read = (access & document::AccessBits::Read) != 0;
    const bool write = (access & document::AccessBits::Write) != 0;
    if (read && write)
        return StringText(61635);
    if (read)
        return StringText(61637);
    if (write)
        return StringText(61636);
    return StringText(61630);
}

int RowIcon(std::uint16_t dataType) noexcept
{
    switch (dataType) {
    case value::TypeCode::Numeric: return 1;
    case value::TypeCode::Logical: return 2;
    case value::TypeCode::AnsiString:
    case value::TypeCode::UnicodeString: return 3;
    default: return 0;
    }
}

} // namespace qv::views
