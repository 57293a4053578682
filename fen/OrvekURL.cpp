#include "fen/OrvekURL.h"

#include "fen/Exception.h"
#include "fen/OrvekURLGrammar.h"
#include "fen/SyntaxError.h"

namespace qv::fen {
namespace {

using detail::kUrlApostrophe;
using detail::kUrlBackslash;
using detail::kUrlFullStop;

void CheckSeparator(char16_t separator)
{
    if (separator != 0 && separator != kUrlFullStop && separator != kUrlBackslash)
        QV_THROW(exception::SyntaxError(WString(1, separator)));
}

/// The kind, read from how the text begins.
std::uint32_t KindOf(detail::UrlText text) noexcept
{
    if (text[0] == kUrlBackslash && text[1] == kUrlBackslash)
        return text[2] == kUrlFullStop ? OrvekURL::LocalForm : OrvekURL::HostForm;
    return text[0] == kUrlBackslash ? OrvekURL::RootForm : OrvekURL::RelativeForm;
}

/// The name a token starting with an apostrophe stands for: quotes are
/// dropped, a doubled apostrophe inside quotes is one apostrophe, and
/// characters outside quotes (a trailing full stop) are kept.
WString Unquote(std::u16string_view token)
{
    WString name;
    bool quoted = false;
    for (std::size_t i = 0; i < token.size(); ++i) {
        const char16_t c = token[i];
        if (c != kUrlApostrophe) {
            name += c;
        } else if (!quoted) {
            quoted = true;
        } else if (i + 1 < token.size() && token[i + 1] == kUrlApostrophe) {
            name += c;
            ++i;
        } else {
            quoted = false;
        }
    }
    return name;
}

} // namespace

OrvekURL::Segment::Segment(char16_t separator)
    : separator_(separator), isParent_(1), noSeparator_(separator == 0 ? 1 : 0)
{
    CheckSeparator(separator);
}

OrvekURL::Segment::Segment(char16_t separator, const WString& name)
    : separator_(separator), isParent_(0), noSeparator_(separator == 0 ? 1 : 0)
{
    CheckSeparator(separator);
    if (name.empty())
        QV_THROW(exception::SyntaxError());
    name_ = name;
}

const WString& OrvekURL::Segment::GetName() const
{
    if (IsParent())
        QV_THROW(exception::SyntaxError());
    return name_;
}

void OrvekURL::Segment::SetName(const WString& name)
{
    if (name.empty())
        QV_THROW(exception::SyntaxError());
    name_ = name;
    isParent_ = 0;
}

OrvekURL::OrvekURL(const char16_t* text)
{
    Parse(text == nullptr ? std::u16string_view() : std::u16string_view(text));
}

OrvekURL::OrvekURL(const WString& text)
{
    // The grammar ends a text at its first NUL; what followed would be lost.
    if (text.find(detail::kUrlNul) != WString::npos)
        QV_THROW(exception::SyntaxError(text));
    Parse(text.View());
}

void OrvekURL::SetKind(std::uint32_t kind)
{
    if (kind == 0)
        QV_THROW(exception::InvalidArgument());
    kind_ = kind;
}

void OrvekURL::Parse(std::u16string_view input)
{
    const detail::UrlText text(input);
    if (!detail::IsAccepted(detail::CheckUrlGrammar(text)))
        QV_THROW(exception::SyntaxError(WString(input)));
    kind_ = KindOf(text);

    // The grammar lets through a quoted empty name (''), which no segment
    // may have; it is reported like any other bad text, with the whole input.
    try {
        char16_t separator = 0;
        std::size_t pos = 0;
        for (;;) {
            const detail::UrlToken token = detail::NextUrlToken(text, pos);
            if (token.begin == token.end) {
                // Tokens cover every accepted text to its end; text left
                // before the end is refused rather than silently dropped.
                if (token.end != text.size())
                    QV_THROW(exception::SyntaxError());
                break;
            }
            pos = token.end;
            const std::u16string_view tokenText = input.substr(token.begin, token.end - token.begin);
            if (tokenText == u".")
                continue; // the local host: no segment, separator unchanged
            if (tokenText == u"..")
                segments_.emplace_back(separator);
            else if (tokenText[0] == kUrlApostrophe)
                segments_.emplace_back(separator, Unquote(tokenText));
            else
                segments_.emplace_back(separator, WString(tokenText));
            separator = text[token.end];
        }
    } catch (const exception::SyntaxError&) {
        QV_THROW(exception::SyntaxError(WString(input)));
    }
}

} // namespace qv::fen
