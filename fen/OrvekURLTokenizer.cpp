#include "fen/OrvekURLGrammar.h"

namespace qv::fen::detail {

UrlToken NextUrlToken(UrlText text, std::size_t from) noexcept
{
    std::size_t pos = from;

    // The start of a host-form or local-form text: the host, or the "."
    // that stands for the local host.
    if (text[pos] == kUrlBackslash && text[pos + 1] == kUrlBackslash) {
        pos += 2;
        if (text[pos] == kUrlBackslash || text[pos] == kUrlNul)
            return {pos, pos};
        if (text[pos] == kUrlFullStop)
            return {pos, pos + 1};
        return {pos, ScanHostName(text, pos)};
    }

    const bool skippedBackslash = text[pos] == kUrlBackslash;
    if (skippedBackslash)
        ++pos;
    if (text[pos] == kUrlFullStop && text[pos + 1] == kUrlFullStop) {
        const char16_t after = text[pos + 2];
        if (after == kUrlBackslash || after == kUrlNul)
            return {pos, pos + 2};
        return {pos, pos};
    }
    if (!skippedBackslash && text[pos] == kUrlFullStop)
        ++pos;

    bool closed = true;
    std::size_t end = ScanSegment(text, pos, closed);
    if (end == pos)
        return {pos, pos};
    // A full stop that ends the text belongs to the last name.
    if (text[end] == kUrlFullStop && text[end + 1] == kUrlNul)
        ++end;
    return {pos, end};
}

} // namespace qv::fen::detail
