#include "fen/osdep/TimeText.h"

#include "fen/Exception.h"
#include "fen/osdep/LocalePicture.h"

#include <ctime>
#include <cwchar>
#include <string>
#include <string_view>

namespace qv::fen::osdep {
namespace {

using exception::OutOfRange;

constexpr std::uint32_t kMaxFractionDigits = 6;
constexpr std::size_t kTextCapacity = 512;
constexpr std::int64_t kTicksPerSecond = 10'000'000;
constexpr std::int64_t kSecondsPerDay = 86'400;
/// Seconds from the file-time epoch (1601) to the C runtime's (1970).
constexpr std::int64_t kFileTimeToUnixSeconds = kFileTimeEpochOffset + kUnixEpochOffset;
/// Days from 1970-01-01 to 1601-01-01.
constexpr std::int64_t kUnixDaysOfFileTimeEpoch = -kFileTimeToUnixSeconds / kSecondsPerDay;
constexpr int kLastYear = 9999;

bool IsLeapYear(std::int64_t year) { return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0); }

/// Broken-down time of file-time ticks, without the part below the second.
std::tm TmFromFileTime(std::int64_t ticks)
{
    if (ticks < 0)
        QV_THROW(OutOfRange());
    const std::int64_t seconds = ticks / kTicksPerSecond;
    const std::int64_t days = seconds / kSecondsPerDay;
    const std::int64_t secondOfDay = seconds % kSecondsPerDay;

    // Gregorian date of a day count, in 400-year eras starting on 1 March.
    const std::int64_t z = days + kUnixDaysOfFileTimeEpoch + 719'468;
    const std::int64_t era = z / 146'097;
    const std::int64_t dayOfEra = z - era * 146'097;
    const std::int64_t yearOfEra = (dayOfEra - dayOfEra / 1'460 + dayOfEra / 36'524 - dayOfEra / 146'096) / 365;
    const std::int64_t dayOfYear = dayOfEra - (365 * yearOfEra + yearOfEra / 4 - yearOfEra / 100);
    const std::int64_t shiftedMonth = (5 * dayOfYear + 2) / 153;
    const std::int64_t day = dayOfYear - (153 * shiftedMonth + 2) / 5 + 1;
    const std::int64_t month = shiftedMonth < 10 ? shiftedMonth + 3 : shiftedMonth - 9;
    const std::int64_t year = yearOfEra + era * 400 + (month <= 2 ? 1 : 0);
    if (year > kLastYear)
        QV_THROW(OutOfRange());

    static constexpr int kDaysBeforeMonth[] = {0, 31, 59, 90, 120, 151, 181, 212, 243, 273, 304, 334};
    std::tm tm{};
    tm.tm_sec = static_cast<int>(secondOfDay % 60);
    tm.tm_min = static_cast<int>(secondOfDay / 60 % 60);
    tm.tm_hour = static_cast<int>(secondOfDay / 3'600);
    tm.tm_mday = static_cast<int>(day);
    tm.tm_mon = static_cast<int>(month - 1);
    tm.tm_year = static_cast<int>(year - 1900);
    tm.tm_wday = static_cast<int>((days + 1) % 7); // 1601-01-01 was a Monday
    tm.tm_yday = kDaysBeforeMonth[month - 1] + static_cast<int>(day) - 1 + (month > 2 && IsLeapYear(year) ? 1 : 0);
    tm.tm_isdst = -1;
    return tm;
}

std::int64_t NearestFileTime(const AbsTime& time)
{
    std::int64_t ticks;
    if (AbsTimeToFileTime(time, Rounding::NearestEven, ticks) != kTimeOk)
        QV_THROW(OutOfRange());
    return ticks;
}

std::tm UtcTm(const AbsTime& time)
{
    std::tm tm = TmFromFileTime(NearestFileTime(time));
    tm.tm_zone = "UTC";
    return tm;
}

/// Local time on the file-time path: the ticks shifted by the zone's offset
/// from UTC at that instant.
std::tm FileTimeLocalTm(const AbsTime& time)
{
    const std::int64_t ticks = NearestFileTime(time);
    if (ticks < 0)
        QV_THROW(OutOfRange());
    const std::time_t unixSeconds = ticks / kTicksPerSecond - kFileTimeToUnixSeconds;
    std::tm zone;
    if (localtime_r(&unixSeconds, &zone) == nullptr)
        QV_THROW(OutOfRange());
    std::int64_t localTicks;
    if (__builtin_add_overflow(ticks, zone.tm_gmtoff * kTicksPerSecond, &localTicks))
        QV_THROW(OutOfRange());
    std::tm tm = TmFromFileTime(localTicks);
    tm.tm_gmtoff = zone.tm_gmtoff;
    tm.tm_zone = zone.tm_zone;
    return tm;
}

/// Local time through the C runtime, on whole C-runtime seconds. It keeps
/// to the range of the file-time path, so that every zone shows the same times.
std::tm RuntimeLocalTm(const AbsTime& time, Rounding rounding)
{
    std::int64_t seconds;
    if (AbsTimeToUnixSeconds(time, rounding, seconds) != kTimeOk || seconds < -kFileTimeToUnixSeconds)
        QV_THROW(OutOfRange());
    const std::time_t unixSeconds = seconds;
    std::tm tm;
    if (localtime_r(&unixSeconds, &tm) == nullptr || tm.tm_year > kLastYear - 1900)
        QV_THROW(OutOfRange());
    return tm;
}

std::tm BrokenDownTime(const AbsTime& time, std::int32_t zone, std::uint32_t fractionDigits)
{
    if (zone == kShowUtc)
        return UtcTm(time);
    if (zone == kShowFileTimeLocal)
        return FileTimeLocalTm(time);
    try {
        return RuntimeLocalTm(time, fractionDigits == 0 ? Rounding::NearestEven : Rounding::Truncate);
    } catch (const OutOfRange&) {
        return FileTimeLocalTm(time);
    }
}

WString SeparatorText(std::int32_t decimalSeparator)
{
    switch (decimalSeparator) {
    case kFullStopSeparator: return WString(u".");
    case kCommaSeparator: return WString(u",");
    default: return GetSystemDecimalSeparator();
    }
}

/// The separator and `digits` digits of the time's fraction, rounded half
/// up. A fraction that rounds up to a whole second moves `time` to the start
/// of the next second, so that every zone then shows that second.
WString FractionText(AbsTime& time, std::uint32_t digits, std::int32_t decimalSeparator)
{
    std::uint64_t scale = 1;
    for (std::uint32_t i = 0; i < digits; ++i)
        scale *= 10;
    const auto rounded = (static_cast<unsigned __int128>(time.fraction) * scale + (std::uint64_t{1} << 63)) >> 64;
    auto n = static_cast<std::uint64_t>(rounded);
    if (n >= scale) {
        if (__builtin_add_overflow(time.seconds, 1, &time.seconds))
            QV_THROW(OutOfRange());
        time.fraction = 0;
        n = 0;
    }
    char16_t number[kMaxFractionDigits];
    for (std::uint32_t i = digits; i-- > 0; n /= 10)
        number[i] = static_cast<char16_t>(u'0' + n % 10);
    WString text = SeparatorText(decimalSeparator);
    text.append(number, digits);
    return text;
}

/// `format` with `fraction` after each seconds field ("%S" or "%#S").
WString WithFraction(const WString& format, const WString& fraction)
{
    WString result;
    const std::size_t length = format.length();
    const char16_t* text = format.c_str();
    std::size_t i = 0;
    while (i < length) {
        if (text[i] != u'%') {
            result += text[i++];
            continue;
        }
        // One whole conversion, so that "%%S" stays a literal "%S".
        std::size_t end = i + 1;
        if (end < length && text[end] == u'#')
            ++end;
        const bool seconds = end < length && text[end] == u'S';
        if (end < length)
            ++end;
        result.append(text + i, end - i);
        if (seconds)
            result += fraction;
        i = end;
    }
    return result;
}

/// Whether glibc's '-' flag gives the field that the '#' flag gives here:
/// the number without leading zeros.
bool IsNumericField(wchar_t c) { return std::wstring_view(L"dHIjmMSUwWyY").find(c) != std::wstring_view::npos; }

/// The format as wchar_t text for glibc: UTF-16 decoded, and the '#' flag
/// rewritten to '-' on numeric fields and dropped elsewhere (where it
/// changes nothing here but would change letter case in glibc).
std::wstring GlibcFormat(const WString& format)
{
    std::wstring decoded;
    decoded.reserve(format.length());
    const char16_t* text = format.c_str();
    const std::size_t length = format.length();
    for (std::size_t i = 0; i < length; ++i) {
        const char32_t c = text[i];
        if (c >= 0xD800 && c <= 0xDBFF && i + 1 < length && text[i + 1] >= 0xDC00 && text[i + 1] <= 0xDFFF) {
            decoded += static_cast<wchar_t>(0x10000 + ((c - 0xD800) << 10) + (text[i + 1] - 0xDC00));
            ++i;
        } else if (c >= 0xD800 && c <= 0xDFFF) {
            decoded += L'\uFFFD';
        } else {
            decoded += static_cast<wchar_t>(c);
        }
    }

    std::wstring result;
    result.reserve(decoded.size());
    for (std::size_t i = 0; i < decoded.size(); ++i) {
        result += decoded[i];
        if (decoded[i] != L'%' || i + 1 == decoded.size())
            continue;
        if (decoded[i + 1] == L'#' && i + 2 < decoded.size()) {
            const wchar_t field = decoded[i + 2];
            if (IsNumericField(field))
                result += L'-';
            result += field;
            i += 2;
        } else {
            result += decoded[++i];
        }
    }
    return result;
}

WString FromWchar(const wchar_t* text, std::size_t length)
{
    std::u16string encoded;
    encoded.reserve(length);
    for (std::size_t i = 0; i < length; ++i) {
        const auto c = static_cast<char32_t>(text[i]);
        if (c >= 0x10000 && c <= 0x10FFFF) {
            encoded += static_cast<char16_t>(0xD800 + ((c - 0x10000) >> 10));
            encoded += static_cast<char16_t>(0xDC00 + ((c - 0x10000) & 0x3FF));
        } else if (c > 0x10FFFF || (c >= 0xD800 && c <= 0xDFFF)) {
            encoded += u'\uFFFD';
        } else {
            encoded += static_cast<char16_t>(c);
        }
    }
    return WString(encoded.data(), encoded.size());
}

} // namespace

WString AbsTimeToString(const AbsTime& time, const char16_t* dateFormat, const char16_t* timeFormat,
                        std::uint32_t fractionDigits, std::int32_t zone, bool timeFirst, const char16_t* suffix,
                        std::int32_t decimalSeparator)
{
    if (fractionDigits > kMaxFractionDigits)
        QV_THROW(exception::InvalidArgument());
    if (time.IsEarliest())
        return WString();

    const WString date = dateFormat != nullptr ? WString(dateFormat) : GetSystemDateFormat();
    WString timeOfDay = timeFormat != nullptr ? WString(timeFormat) : GetSystemTimeFormat();
    if (suffix != nullptr && *suffix != 0 && !timeOfDay.empty()) {
        timeOfDay += u' ';
        timeOfDay += suffix;
    }

    AbsTime shown = time;
    if (fractionDigits > 0 && !timeOfDay.empty())
        timeOfDay = WithFraction(timeOfDay, FractionText(shown, fractionDigits, decimalSeparator));

    const WString& first = timeFirst ? timeOfDay : date;
    const WString& second = timeFirst ? date : timeOfDay;
    WString format = first;
    if (!first.empty() && !second.empty())
        format += u' ';
    format += second;

    const std::tm tm = BrokenDownTime(shown, zone, fractionDigits);

    wchar_t text[kTextCapacity];
    const std::size_t length = std::wcsftime(text, kTextCapacity, GlibcFormat(format).c_str(), &tm);
    return FromWchar(text, length);
}

} // namespace qv::fen::osdep
