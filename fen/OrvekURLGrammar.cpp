#include "fen/OrvekURLGrammar.h"

#include <optional>

namespace qv::fen::detail {
namespace {

bool InSegmentStopSet(char16_t c) noexcept
{
    return c == kUrlBackslash || c == kUrlFullStop || c == kUrlApostrophe || c == kUrlCarriageReturn ||
           c == kUrlLineFeed || c == kUrlNul;
}

bool InHostStopSet(char16_t c) noexcept
{
    return InSegmentStopSet(c) || c == kUrlSlash || c == kUrlSpace || c == kUrlTab;
}

bool IsSeparator(char16_t c) noexcept
{
    return c == kUrlBackslash || c == kUrlFullStop;
}

/// Takes one segment at `pos`: moves `pos` past it and returns nothing, or
/// returns the verdict that rejects it.
std::optional<UrlVerdict> TakeSegment(UrlText text, std::size_t& pos) noexcept
{
    bool closed = true;
    const std::size_t end = ScanSegment(text, pos, closed);
    if (!closed)
        return UrlVerdict::UnclosedQuote;
    if (end == pos)
        return UrlVerdict::EmptySegment;
    pos = end;
    return std::nullopt;
}

/// Leading parent steps, then segments joined by single separators.
UrlVerdict CheckPath(UrlText text, std::size_t pos) noexcept
{
    while (text[pos] == kUrlFullStop) {
        if (text[pos + 1] != kUrlFullStop || text[pos + 2] != kUrlBackslash)
            return UrlVerdict::BadPath;
        pos += 3;
        if (text[pos] == kUrlBackslash)
            return UrlVerdict::DoubleSeparator;
    }
    if (text[pos] == kUrlNul)
        return UrlVerdict::NoPath;
    if (auto rejected = TakeSegment(text, pos))
        return *rejected;
    for (;;) {
        if (text[pos] == kUrlNul)
            return UrlVerdict::Path;
        if (!IsSeparator(text[pos]))
            return UrlVerdict::BadPath;
        ++pos;
        // A separator may end the text; it is simply not printed again.
        if (text[pos] == kUrlNul)
            return UrlVerdict::Path;
        if (IsSeparator(text[pos]))
            return UrlVerdict::DoubleSeparator;
        if (auto rejected = TakeSegment(text, pos))
            return *rejected;
    }
}

/// Everything after the host of a host-form or local-form text: the
/// backslash, the process and the path. `pos` is just past the host.
UrlVerdict CheckAfterHost(UrlText text, std::size_t pos) noexcept
{
    if (text[pos] == kUrlNul)
        return UrlVerdict::NoProcess;
    if (text[pos] != kUrlBackslash)
        return UrlVerdict::MissingHostEnd;
    ++pos;
    if (IsSeparator(text[pos]))
        return UrlVerdict::DoubleSeparator;

    bool closed = true;
    const std::size_t end = ScanSegment(text, pos, closed);
    if (!closed)
        return UrlVerdict::UnclosedQuote;
    if (end == pos) {
        // Only the end of the text may follow an empty process: a carriage
        // return or line feed there would leave text that no token covers.
        return text[pos] == kUrlNul ? UrlVerdict::NoProcess : UrlVerdict::EmptySegment;
    }
    // Quotes do not protect the process: its raw text may hold neither.
    for (std::size_t i = pos; i < end; ++i)
        if (text[i] == kUrlBackslash || text[i] == kUrlSlash)
            return UrlVerdict::BadProcess;
    pos = end;

    if (text[pos] == kUrlNul)
        return UrlVerdict::NoPath;
    if (text[pos] != kUrlBackslash)
        return UrlVerdict::BadProcess;
    ++pos;
    if (IsSeparator(text[pos]))
        return UrlVerdict::DoubleSeparator;
    return CheckPath(text, pos);
}

UrlVerdict CheckRootForm(UrlText text) noexcept
{
    if (text[1] == kUrlFullStop) {
        if (text[2] != kUrlFullStop || text[3] != kUrlBackslash)
            return UrlVerdict::BadPath;
        if (IsSeparator(text[4]))
            return UrlVerdict::DoubleSeparator;
    }
    return CheckPath(text, 1);
}

} // namespace

std::size_t ScanHostName(UrlText text, std::size_t from) noexcept
{
    std::size_t i = from;
    while (!InHostStopSet(text[i]) || text[i] == kUrlFullStop)
        ++i;
    return i;
}

std::size_t ScanSegment(UrlText text, std::size_t from, bool& closed) noexcept
{
    closed = true;
    std::size_t i = from;
    if (text[i] != kUrlApostrophe) {
        while (!InSegmentStopSet(text[i]))
            ++i;
        return i;
    }
    for (++i;; ++i) {
        if (text[i] == kUrlNul) {
            closed = false;
            return i;
        }
        if (text[i] == kUrlApostrophe) {
            if (text[i + 1] != kUrlApostrophe)
                return i + 1;
            ++i; // a doubled apostrophe stands for one and does not close
        }
    }
}

UrlVerdict CheckUrlGrammar(UrlText text) noexcept
{
    if (text[0] == kUrlBackslash && text[1] == kUrlBackslash) {
        const char16_t first = text[2];
        if (first == kUrlNul)
            return UrlVerdict::NetworkRoot;
        if (first == kUrlBackslash)
            return UrlVerdict::ThirdBackslash;
        if (first == kUrlFullStop)
            return CheckAfterHost(text, 3);
        if (InHostStopSet(first))
            return UrlVerdict::BadHostName;
        return CheckAfterHost(text, ScanHostName(text, 2));
    }
    if (text[0] == kUrlBackslash)
        return CheckRootForm(text);
    return CheckPath(text, 0);
}

} // namespace qv::fen::detail
