#pragma once
// Comparison and description of parsed URLs for the URL tests. Names are
// compared code unit by code unit: WString's own equality ignores case.

#include "fen/OrvekURL.h"
#include "fen/OrvekURLGrammar.h"

#include <ostream>

#include <string>
#include <string_view>

namespace qv::fen::detail {

/// Verdicts print as their numbers in test failures.
inline void PrintTo(UrlVerdict verdict, std::ostream* out)
{
    *out << "verdict " << static_cast<int>(verdict);
}

} // namespace qv::fen::detail

namespace qv::fen::test {

/// Readable ASCII form of 16-bit text; other characters as \uXXXX.
inline std::string Printable(std::u16string_view text)
{
    static const char* const kHex = "0123456789ABCDEF";
    std::string out;
    for (char16_t c : text) {
        if (c >= 0x20 && c < 0x7F) {
            out += static_cast<char>(c);
        } else {
            out += "\\u";
            for (int shift = 12; shift >= 0; shift -= 4)
                out += kHex[(c >> shift) & 0xF];
        }
    }
    return out;
}

/// Kind and segments as one line, e.g. "1 [h] \[p] .[b] \..".
inline std::string Describe(const OrvekURL& url)
{
    std::string out = std::to_string(url.GetKind());
    for (const OrvekURL::Segment& segment : url.GetSegments()) {
        out += ' ';
        if (!segment.HasNoSeparator())
            out += static_cast<char>(segment.GetSeparator());
        out += segment.IsParent() ? std::string("..") : "[" + Printable(segment.GetName().View()) + "]";
    }
    return out;
}

/// Same kind and the same segments, names compared exactly.
inline bool SameUrl(const OrvekURL& a, const OrvekURL& b)
{
    if (a.GetKind() != b.GetKind() || a.GetSegmentCount() != b.GetSegmentCount())
        return false;
    for (std::size_t i = 0; i < a.GetSegmentCount(); ++i) {
        const OrvekURL::Segment& x = a.GetSegment(i);
        const OrvekURL::Segment& y = b.GetSegment(i);
        if (x.GetSeparator() != y.GetSeparator() || x.IsParent() != y.IsParent() ||
            x.HasNoSeparator() != y.HasNoSeparator())
            return false;
        if (!x.IsParent() && x.GetName().View() != y.GetName().View())
            return false;
    }
    return true;
}

} // namespace qv::fen::test
