#include "fen/OrvekURL.h"

#include "fen/OrvekURLGrammar.h"

namespace qv::fen {
namespace {

using namespace detail;

bool NeedsQuotes(const WString& name) noexcept
{
    for (char16_t c : name)
        if (c == kUrlBackslash || c == kUrlFullStop || c == kUrlApostrophe || c == kUrlCarriageReturn ||
            c == kUrlLineFeed)
            return true;
    return false;
}

void AppendQuotedIfNeeded(WString& out, const WString& name)
{
    if (!NeedsQuotes(name)) {
        out += name;
        return;
    }
    out += kUrlApostrophe;
    for (char16_t c : name) {
        if (c == kUrlApostrophe)
            out += kUrlApostrophe;
        out += c;
    }
    out += kUrlApostrophe;
}

} // namespace

WString OrvekURL::ToString() const
{
    WString out;
    switch (kind_) {
    case HostForm: out = u"\\\\"; break;
    case LocalForm: out = u"\\\\.\\"; break;
    case RootForm: out = u"\\"; break;
    case RelativeForm: break;
    default: return WString(u"ERROR");
    }
    for (std::size_t i = 0; i < segments_.size(); ++i) {
        const Segment& segment = segments_[i];
        if (!segment.HasNoSeparator())
            out += segment.GetSeparator();
        if (segment.IsParent()) {
            out += u"..";
            // ".." must be followed by a backslash to read back as a parent.
            if (i + 1 == segments_.size())
                out += kUrlBackslash;
        } else if (segment.HasNoSeparator() && kind_ == HostForm) {
            out += segment.GetName(); // the host is never quoted
        } else {
            AppendQuotedIfNeeded(out, segment.GetName());
        }
    }
    return out;
}

} // namespace qv::fen
