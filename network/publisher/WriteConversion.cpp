#include "network/publisher/WriteConversion.h"

#include "value/TypeCodes.h"

#include <charconv>
#include <cmath>
#include <exception>
#include <limits>
#include <string_view>

namespace qv::network::publisher {
namespace {

using value::NumericKind;
namespace TypeCode = value::TypeCode;
using value::VarData;

std::string_view Trim(std::string_view text)
{
    constexpr std::string_view kBlanks = " \t\r\n";
    const auto first = text.find_first_not_of(kBlanks);
    if (first == std::string_view::npos)
        return {};
    return text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}

bool IsText(const VarData& value)
{
    return value.Code() == TypeCode::AnsiString || value.Code() == TypeCode::UnicodeString;
}

/// The text of a text value as ASCII; anything outside ASCII reads as a
/// character no number or word has, so such text never converts.
std::string AsciiText(const VarData& value)
{
    std::string ascii;
    if (value.Code() == TypeCode::AnsiString) {
        const fen::String text = value.GetString();
        ascii.assign(text.c_str(), text.length());
    } else {
        const fen::WString text = value.GetWString();
        for (std::size_t i = 0; i < text.length(); ++i)
            ascii.push_back(text.c_str()[i] < 0x80 ? static_cast<char>(text.c_str()[i]) : '\x7F');
    }
    return ascii;
}

bool ParseDouble(std::string_view text, double& number)
{
    text = Trim(text);
    if (!text.empty() && text.front() == '+')
        text.remove_prefix(1);
    if (text.empty())
        return false;
    const char* last = text.data() + text.size();
    const auto [end, error] = std::from_chars(text.data(), last, number);
    return error == std::errc() && end == last;
}

bool ParseBool(std::string_view text, bool& flag)
{
    text = Trim(text);
    std::string lower(text);
    for (char& c : lower)
        if (c >= 'A' && c <= 'Z')
            c = static_cast<char>(c - 'A' + 'a');
    for (std::string_view yes : {"true", "on", "yes"})
        if (lower == yes) {
            flag = true;
            return true;
        }
    for (std::string_view no : {"false", "off", "no"})
        if (lower == no) {
            flag = false;
            return true;
        }
    double number = 0.0;
    if (!ParseDouble(text, number) || std::isnan(number))
        return false;
    flag = number != 0.0;
    return true;
}

/// Whether `number` suits a Numeric variable of `kind`; a 32-bit float is
/// rounded to float precision in place.
bool FitKind(double& number, std::uint8_t kind, std::string& why)
{
    struct Range {
        double least;
        double most;
    };
    Range range{};
    switch (static_cast<NumericKind>(kind)) {
    case NumericKind::Int8: range = {-128.0, 127.0}; break;
    case NumericKind::Int16: range = {-32768.0, 32767.0}; break;
    case NumericKind::Int32: range = {-2147483648.0, 2147483647.0}; break;
    case NumericKind::UInt8: range = {0.0, 255.0}; break;
    case NumericKind::UInt16: range = {0.0, 65535.0}; break;
    case NumericKind::UInt32:
    case NumericKind::BitField: range = {0.0, 4294967295.0}; break;
    case NumericKind::Float32:
        if (std::isfinite(number) && std::fabs(number) > static_cast<double>(std::numeric_limits<float>::max())) {
            why = "the number is beyond the range of a 32-bit float";
            return false;
        }
        number = static_cast<double>(static_cast<float>(number));
        return true;
    default: return true; // 64-bit float and kinds without a range of their own
    }
    if (!std::isfinite(number) || number != std::floor(number) || number < range.least || number > range.most) {
        why = "the number is not a whole number in the range of the variable";
        return false;
    }
    if (number == 0.0)
        number = 0.0; // an integer kind has no negative zero
    return true;
}

bool ToNumber(const VarData& written, double& number, std::string& why)
{
    switch (written.Code()) {
    case TypeCode::Numeric:
    case TypeCode::Logical: number = written.ToDouble(); return true;
    case TypeCode::UInt64: {
        const std::uint64_t count = written.GetUInt64();
        number = static_cast<double>(count);
        if (number >= 18446744073709551616.0 || static_cast<std::uint64_t>(number) != count) {
            why = "the count cannot be held exactly by a number";
            return false;
        }
        return true;
    }
    default:
        if (IsText(written) && ParseDouble(AsciiText(written), number))
            return true;
        why = IsText(written) ? "the text is not a number" : "the value cannot be converted to a number";
        return false;
    }
}

bool ToUInt64(const VarData& written, std::uint64_t& count, std::string& why)
{
    if (written.Code() == TypeCode::Numeric) {
        const double number = written.ToDouble();
        if (std::isfinite(number) && number >= 0.0 && number < 18446744073709551616.0 && number == std::floor(number)) {
            count = static_cast<std::uint64_t>(number);
            return true;
        }
        why = "the number is not a whole number from 0 to 2^64 - 1";
        return false;
    }
    if (IsText(written)) {
        std::string text(Trim(AsciiText(written)));
        if (!text.empty() && text.front() == '+')
            text.erase(0, 1);
        const char* last = text.data() + text.size();
        const auto [end, error] = std::from_chars(text.data(), last, count);
        if (!text.empty() && error == std::errc() && end == last)
            return true;
        why = "the text is not a count from 0 to 2^64 - 1";
        return false;
    }
    why = "the value cannot be converted to a count";
    return false;
}

} // namespace

bool ConvertForWrite(const VarData& written, std::uint16_t type, std::uint8_t kind, VarData& result, std::string& why)
{
    try {
        switch (type) {
        case TypeCode::Numeric: {
            double number = 0.0;
            if (!ToNumber(written, number, why) || !FitKind(number, kind, why))
                return false;
            result = VarData::MakeNumeric(number, kind);
            return true;
        }
        case TypeCode::Logical: {
            bool flag = false;
            if (written.Code() == TypeCode::Logical) {
                flag = written.ToBool();
            } else if (written.Code() == TypeCode::Numeric && !std::isnan(written.ToDouble())) {
                flag = written.ToDouble() != 0.0;
            } else if (!(IsText(written) && ParseBool(AsciiText(written), flag))) {
                why = "the value cannot be converted to a logical";
                return false;
            }
            result = VarData::MakeLogical(flag);
            return true;
        }
        case TypeCode::UInt64: {
            if (written.Code() == TypeCode::UInt64) {
                result = written;
                return true;
            }
            std::uint64_t count = 0;
            if (!ToUInt64(written, count, why))
                return false;
            result = VarData::MakeUInt64(count);
            return true;
        }
        case TypeCode::AnsiString:
        case TypeCode::UnicodeString: {
            switch (written.Code()) {
            case TypeCode::AnsiString:
            case TypeCode::UnicodeString:
            case TypeCode::Logical:
            case TypeCode::Numeric:
            case TypeCode::UInt64: break;
            default: why = "the value cannot be converted to text"; return false;
            }
            VarData converted = written;
            converted.ConvertTo(type);
            result = std::move(converted);
            return true;
        }
        default:
            if (written.Code() != type) {
                why = "the value is not of the variable's type";
                return false;
            }
            result = written;
            return true;
        }
    } catch (const std::exception& e) {
        // The text conversions throw when a text cannot be represented.
        why = std::string("the value cannot be converted: ") + e.what();
        return false;
    }
}

} // namespace qv::network::publisher
