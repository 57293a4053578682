#include "fen/osdep/LocalePicture.h"

#include "fen/osdep/TextConversion.h"
#include "fen/osdep/UserLocalePictures.h"

#include <langinfo.h>
#include <mutex>
#include <string>

namespace qv::fen::osdep {
namespace {

bool IsAsciiLetter(char16_t c) { return (c >= u'a' && c <= u'z') || (c >= u'A' && c <= u'Z'); }

/// The format of a run of `count` picture letters `letter`; null when the
/// run means nothing.
const char16_t* FormatOfRun(char16_t letter, std::size_t count)
{
    static constexpr const char16_t* kDay[] = {u"%#d", u"%d", u"%a", u"%A"};
    static constexpr const char16_t* kMonth[] = {u"%#m", u"%m", u"%b", u"%B"};
    static constexpr const char16_t* kYear[] = {u"%#y", u"%y", nullptr, u"%Y"};
    auto pick = [count](const char16_t* const* table, std::size_t size) -> const char16_t* {
        return count <= size ? table[count - 1] : nullptr;
    };
    switch (letter) {
    case u'd': return pick(kDay, 4);
    case u'M': return pick(kMonth, 4);
    case u'y': return pick(kYear, 4);
    case u'h': return count == 1 ? u"%#I" : (count == 2 ? u"%I" : nullptr);
    case u'H': return count == 1 ? u"%#H" : (count == 2 ? u"%H" : nullptr);
    case u'm': return count == 1 ? u"%#M" : (count == 2 ? u"%M" : nullptr);
    case u's': return count == 1 ? u"%#S" : (count == 2 ? u"%S" : nullptr);
    case u't': return count <= 2 ? u"%p" : nullptr;
    default: return nullptr;
    }
}

bool IsRunLetter(char16_t c)
{
    switch (c) {
    case u'd': case u'M': case u'y': case u'h': case u'H': case u'm': case u's': case u't': return true;
    default: return false;
    }
}

/// Builds a picture, keeping apart what the picture scanner must not join.
class PictureWriter {
public:
    void Field(std::u16string_view run)
    {
        CloseQuote();
        // Two fields of one letter side by side would read as one longer
        // run; an empty literal keeps them apart.
        if (!text_.empty() && text_.back() == run.front())
            text_ += u"''";
        text_ += run;
    }

    void Literal(char16_t c)
    {
        if (c == u'\'')
            return;
        if (!IsAsciiLetter(c)) {
            CloseQuote();
        } else if (!quoted_) {
            text_ += u'\'';
            quoted_ = true;
        }
        text_ += c;
    }

    WString Finish()
    {
        CloseQuote();
        return WString(text_.data(), text_.size());
    }

private:
    void CloseQuote()
    {
        if (quoted_)
            text_ += u'\'';
        quoted_ = false;
    }

    std::u16string text_;
    bool quoted_ = false;
};

void AppendPicture(PictureWriter& out, std::u16string_view format, std::u16string_view twelveHourFormat, int depth)
{
    std::size_t i = 0;
    while (i < format.size()) {
        const char16_t c = format[i++];
        if (c != u'%') {
            out.Literal(c);
            continue;
        }
        bool unpadded = false;
        while (i < format.size() && std::u16string_view(u"_-0^#").find(format[i]) != std::u16string_view::npos)
            unpadded = format[i++] == u'-' || unpadded;
        while (i < format.size() && format[i] >= u'0' && format[i] <= u'9')
            ++i;
        if (i < format.size() && (format[i] == u'E' || format[i] == u'O'))
            ++i;
        if (i == format.size()) {
            out.Literal(u'%');
            break;
        }
        auto expand = [&](std::u16string_view inner) {
            // A twelve-hour format that itself names %r falls back to the default.
            if (depth < 2)
                AppendPicture(out, inner, u"%I:%M:%S %p", depth + 1);
        };
        switch (format[i++]) {
        case u'd': out.Field(unpadded ? u"d" : u"dd"); break;
        case u'e': out.Field(u"d"); break;
        case u'm': out.Field(unpadded ? u"M" : u"MM"); break;
        case u'y': out.Field(unpadded ? u"y" : u"yy"); break;
        case u'Y': out.Field(u"yyyy"); break;
        case u'b': case u'h': out.Field(u"MMM"); break;
        case u'B': out.Field(u"MMMM"); break;
        case u'a': out.Field(u"ddd"); break;
        case u'A': out.Field(u"dddd"); break;
        case u'H': out.Field(unpadded ? u"H" : u"HH"); break;
        case u'k': out.Field(u"H"); break;
        case u'I': out.Field(unpadded ? u"h" : u"hh"); break;
        case u'l': out.Field(u"h"); break;
        case u'M': out.Field(unpadded ? u"m" : u"mm"); break;
        case u'S': out.Field(unpadded ? u"s" : u"ss"); break;
        case u'p': case u'P': out.Field(u"tt"); break;
        case u'D': expand(u"%m/%d/%y"); break;
        case u'F': expand(u"%Y-%m-%d"); break;
        case u'T': expand(u"%H:%M:%S"); break;
        case u'R': expand(u"%H:%M"); break;
        case u'r': expand(twelveHourFormat.empty() ? u"%I:%M:%S %p" : twelveHourFormat); break;
        case u'n': case u't': out.Literal(u' '); break;
        case u'%': out.Literal(u'%'); break;
        default: break;
        }
    }
}

WString LanginfoText(nl_item item) { return ToWide(String(nl_langinfo(item))); }

/// The picture of one of the locale's strftime formats.
WString LanginfoPicture(nl_item item)
{
    const WString format = LanginfoText(item);
    // Only a format that may name %r needs the twelve-hour format.
    const WString twelveHour = format.find(u'r') != WString::npos ? LanginfoText(T_FMT_AMPM) : WString();
    return PictureFromStrftimeFormat(format.View(), twelveHour.View());
}

std::mutex sourceLock;
std::shared_ptr<const LocalePictureSource> currentSource;

} // namespace

WString PosixLocalePictureSource::ShortDatePicture() const
{
    return LanginfoPicture(D_FMT);
}

WString PosixLocalePictureSource::TimePicture() const
{
    return LanginfoPicture(T_FMT);
}

WString PosixLocalePictureSource::DecimalSeparator() const
{
    WString separator = LanginfoText(RADIXCHAR);
    return separator.empty() ? WString(u".") : separator;
}

std::shared_ptr<const LocalePictureSource> GetLocalePictureSource()
{
    std::lock_guard<std::mutex> guard(sourceLock);
    if (!currentSource)
        currentSource = std::make_shared<UserLocalePictureSource>();
    return currentSource;
}

std::shared_ptr<const LocalePictureSource> SetLocalePictureSource(std::shared_ptr<const LocalePictureSource> source)
{
    if (!source)
        source = std::make_shared<UserLocalePictureSource>();
    std::lock_guard<std::mutex> guard(sourceLock);
    currentSource.swap(source);
    return source;
}

WString PictureToTimeFormat(std::u16string_view picture)
{
    std::u16string format;
    std::size_t i = 0;
    while (i < picture.size()) {
        const char16_t c = picture[i];
        if (c == u'\'') {
            const std::size_t close = picture.find(u'\'', i + 1);
            const std::size_t end = close == std::u16string_view::npos ? picture.size() : close;
            for (char16_t literal : picture.substr(i + 1, end - i - 1))
                format += literal == u'%' ? std::u16string_view(u"%%") : std::u16string_view(&literal, 1);
            i = close == std::u16string_view::npos ? end : end + 1;
        } else if (IsRunLetter(c)) {
            std::size_t run = 1;
            while (i + run < picture.size() && picture[i + run] == c)
                ++run;
            if (const char16_t* field = FormatOfRun(c, run))
                format += field;
            i += run;
        } else {
            if (c == u'%')
                format += u"%%";
            else if (c != u'g')
                format += c;
            ++i;
        }
    }
    return WString(format.data(), format.size());
}

WString PictureFromStrftimeFormat(std::u16string_view format, std::u16string_view twelveHourFormat)
{
    PictureWriter out;
    AppendPicture(out, format, twelveHourFormat, 0);
    return out.Finish();
}

WString GetSystemDateFormat() { return PictureToTimeFormat(GetLocalePictureSource()->ShortDatePicture().View()); }

WString GetSystemTimeFormat() { return PictureToTimeFormat(GetLocalePictureSource()->TimePicture().View()); }

WString GetSystemDecimalSeparator() { return GetLocalePictureSource()->DecimalSeparator(); }

} // namespace qv::fen::osdep
