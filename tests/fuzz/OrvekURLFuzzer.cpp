// Fuzz target for the item URL parser: the input bytes are read as 16-bit
// characters (little-endian pairs, an odd last byte dropped). The parser may
// only reject with SyntaxError; an accepted URL must print to a text that
// reads back as the same URL. Anything else aborts.

#include "fen/OrvekURL.h"
#include "fen/SyntaxError.h"

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <new>
#include <vector>

namespace {

using qv::fen::OrvekURL;
using qv::fen::WString;

[[noreturn]] void Fail(const char* what)
{
    std::fprintf(stderr, "OrvekURL fuzz failure: %s\n", what);
    std::abort();
}

bool SameUrl(const OrvekURL& a, const OrvekURL& b)
{
    if (a.GetKind() != b.GetKind() || a.GetSegmentCount() != b.GetSegmentCount())
        return false;
    for (std::size_t i = 0; i < a.GetSegmentCount(); ++i) {
        const OrvekURL::Segment& x = a.GetSegment(i);
        const OrvekURL::Segment& y = b.GetSegment(i);
        if (x.GetSeparator() != y.GetSeparator() || x.IsParent() != y.IsParent())
            return false;
        if (!x.IsParent() && x.GetName().View() != y.GetName().View())
            return false;
    }
    return true;
}

void CheckRoundTrip(const OrvekURL& url)
{
    const WString printed = url.ToString();
    try {
        const OrvekURL again(printed);
        if (!SameUrl(url, again))
            Fail("printed text reads back as a different URL");
        if (again.ToString().View() != printed.View())
            Fail("printing is not stable");
    } catch (const qv::fen::exception::SyntaxError&) {
        Fail("printed text is rejected");
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    // An exactly sized buffer, so that reading past the NUL is caught.
    std::vector<char16_t> text(size / 2 + 1);
    for (std::size_t i = 0; i + 1 < size; i += 2)
        text[i / 2] = static_cast<char16_t>(data[i] | (data[i + 1] << 8));
    text.back() = 0;

    try {
        const OrvekURL url(text.data());
        CheckRoundTrip(url);
    } catch (const qv::fen::exception::SyntaxError&) {
    } catch (const std::bad_alloc&) {
    } catch (const std::exception& e) {
        Fail(e.what());
    } catch (...) {
        Fail("unknown exception");
    }

    // The string form sees the whole input, NULs included.
    try {
        const OrvekURL url(WString(text.data(), text.size() - 1));
        CheckRoundTrip(url);
    } catch (const qv::fen::exception::SyntaxError&) {
    } catch (const std::bad_alloc&) {
    } catch (const std::exception& e) {
        Fail(e.what());
    }
    return 0;
}
