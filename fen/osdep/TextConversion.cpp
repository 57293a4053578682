#include "fen/osdep/TextConversion.h"

#include "fen/osdep/OSException.h"

#include <algorithm>
#include <bit>
#include <cerrno>
#include <cstring>
#include <iconv.h>
#include <langinfo.h>
#include <memory>
#include <string>

namespace qv::fen::osdep {
namespace {

constexpr const char* kUtf16 = (std::endian::native == std::endian::little) ? "UTF-16LE" : "UTF-16BE";
constexpr std::uint32_t kInsufficientBuffer = 122;

const char* CharsetOf(std::uint32_t codePage)
{
    switch (codePage) {
    case kUsAsciiCodePage: return "US-ASCII";
    case kJapaneseCodePage: return "CP932";
    default: return nl_langinfo(CODESET);
    }
}

/// An iconv descriptor for one direction and charset, reused by its thread
/// while the charset stays the same (opening one costs more than most texts).
class Converter {
public:
    iconv_t Get(const char* to, const char* from)
    {
        if (handle_ != kNone && to_ == to && from_ == from) {
            iconv(handle_, nullptr, nullptr, nullptr, nullptr);
            return handle_;
        }
        Close();
        iconv_t handle = iconv_open(to, from);
        if (handle == kNone)
            QV_THROW(WinError());
        handle_ = handle;
        to_ = to;
        from_ = from;
        return handle_;
    }
    ~Converter() { Close(); }

private:
    static inline const iconv_t kNone = reinterpret_cast<iconv_t>(-1);
    void Close()
    {
        if (handle_ != kNone)
            iconv_close(handle_);
        handle_ = kNone;
    }
    iconv_t handle_ = kNone;
    std::string to_;
    std::string from_;
};

thread_local Converter toNarrow;
thread_local Converter toWide;

/// Runs `cd` over the whole input into `out`, replacing what cannot be
/// converted. `unit` is the input's character size; `replacement` holds the
/// target's replacement character; the output goes to `sink` in chunks.
template <typename Sink>
void RunConversion(iconv_t cd, const char* input, std::size_t inputBytes, std::size_t unit,
                   const char* replacement, std::size_t replacementBytes, Sink&& sink)
{
    char chunk[1024];
    char* in = const_cast<char*>(input);
    std::size_t inLeft = inputBytes;
    for (;;) {
        char* out = chunk;
        std::size_t outLeft = sizeof chunk;
        std::size_t result = inLeft == 0 ? iconv(cd, nullptr, nullptr, &out, &outLeft)
                                         : iconv(cd, &in, &inLeft, &out, &outLeft);
        const int error = (result == static_cast<std::size_t>(-1)) ? errno : 0;
        sink(chunk, static_cast<std::size_t>(out - chunk));
        if (error == E2BIG)
            continue;
        if (error == EILSEQ || error == EINVAL) {
            // An invalid or incomplete character: substitute and step over it.
            sink(replacement, replacementBytes);
            std::size_t skip = std::min(unit, inLeft);
            in += skip;
            inLeft -= skip;
            continue;
        }
        if (error != 0) {
            errno = error; // the sink may have changed it since
            QV_THROW(WinError());
        }
        if (inLeft == 0 && result != static_cast<std::size_t>(-1))
            return;
    }
}

/// Converts 16-bit text to 8-bit, handing the bytes to `sink`.
template <typename Sink>
void Narrow(const char16_t* begin, const char16_t* end, std::uint32_t codePage, Sink&& sink)
{
    iconv_t cd = toNarrow.Get(CharsetOf(codePage), kUtf16);
    RunConversion(cd, reinterpret_cast<const char*>(begin), static_cast<std::size_t>(end - begin) * 2, 2, "?", 1,
                  sink);
}

template <typename Sink>
void Widen(const char* begin, const char* end, std::uint32_t codePage, Sink&& sink)
{
    static const char16_t kReplacement = u'\uFFFD';
    iconv_t cd = toWide.Get(kUtf16, CharsetOf(codePage));
    RunConversion(cd, begin, static_cast<std::size_t>(end - begin), 1, reinterpret_cast<const char*>(&kReplacement),
                  2, sink);
}

std::string NarrowToStd(const char16_t* begin, const char16_t* end, std::uint32_t codePage)
{
    std::string bytes;
    if (begin != end)
        Narrow(begin, end, codePage, [&](const char* p, std::size_t n) { bytes.append(p, n); });
    return bytes;
}

std::u16string WidenToStd(const char* begin, const char* end, std::uint32_t codePage)
{
    std::string bytes;
    if (begin != end)
        Widen(begin, end, codePage, [&](const char* p, std::size_t n) { bytes.append(p, n); });
    std::u16string text(bytes.size() / 2, u'\0');
    std::memcpy(text.data(), bytes.data(), text.size() * 2);
    return text;
}

} // namespace

std::uint32_t CodePageFromName(const char* name)
{
    if (name == nullptr || name[0] == '\0')
        return kSystemCodePage;
    if (std::strcmp(name, "US-ASCII") == 0)
        return kUsAsciiCodePage;
    if (std::strcmp(name, "cp932") == 0)
        return kJapaneseCodePage;
    QV_THROW(exception::InvalidLocale());
}

char* WideToAnsi(const char16_t* begin, const char16_t* end, const char* codePageName)
{
    const std::string bytes = NarrowToStd(begin, end, CodePageFromName(codePageName));
    const std::size_t size = (SafeInteger::FromSize(bytes.size()) + 1).Value();
    char* buffer = new char[size];
    std::memcpy(buffer, bytes.data(), bytes.size());
    buffer[bytes.size()] = '\0';
    return buffer;
}

char16_t* AnsiToWide(const char* text, std::size_t maxLength, const char* codePageName)
{
    const std::uint32_t codePage = CodePageFromName(codePageName);
    const std::size_t n = text == nullptr ? 0 : strnlen(text, maxLength);
    const std::u16string wide = WidenToStd(text, text + n, codePage);
    const std::size_t size = (SafeInteger::FromSize(wide.size()) + 1).Value();
    char16_t* buffer = new char16_t[size];
    std::memcpy(buffer, wide.data(), wide.size() * 2);
    buffer[wide.size()] = u'\0';
    return buffer;
}

std::size_t WideToAnsi(const char16_t* begin, const char16_t* end, char* out, std::size_t capacity,
                       const char* codePageName)
{
    const std::string bytes = NarrowToStd(begin, end, CodePageFromName(codePageName));
    if (bytes.size() > capacity)
        QV_THROW(WinError(kInsufficientBuffer));
    // `out` may be null when the caller has no room and expects nothing.
    if (!bytes.empty())
        std::memcpy(out, bytes.data(), bytes.size());
    return bytes.size();
}

std::size_t AnsiToWide(const char* begin, const char* end, char16_t* out, std::size_t capacity,
                       const char* codePageName)
{
    const std::u16string wide = WidenToStd(begin, end, CodePageFromName(codePageName));
    if (wide.size() > capacity)
        QV_THROW(WinError(kInsufficientBuffer));
    if (!wide.empty())
        std::memcpy(out, wide.data(), wide.size() * 2);
    return wide.size();
}

String ToAnsi(const WString& text, const char* codePageName)
{
    const std::string bytes = NarrowToStd(text.begin(), text.end(), CodePageFromName(codePageName));
    return String(bytes.data(), bytes.size());
}

WString ToWide(const String& text, const char* codePageName)
{
    const std::u16string wide = WidenToStd(text.begin(), text.end(), CodePageFromName(codePageName));
    return WString(wide.data(), wide.size());
}

} // namespace qv::fen::osdep

namespace qv::fen::detail {

String NarrowFromWide(const char16_t* begin, const char16_t* end)
{
    const std::string bytes = osdep::NarrowToStd(begin, end, osdep::kSystemCodePage);
    return String(bytes.data(), bytes.size());
}

WString WideFromNarrow(const char* begin, const char* end)
{
    const std::u16string wide = osdep::WidenToStd(begin, end, osdep::kSystemCodePage);
    return WString(wide.data(), wide.size());
}

} // namespace qv::fen::detail
