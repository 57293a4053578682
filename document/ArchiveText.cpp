#include "document/ArchiveText.h"

#include "fen/String.h"
#include "fen/osdep/TextConversion.h"

#include <algorithm>
#include <limits>

namespace qv::document {
namespace {

constexpr std::uint32_t kWideMarker = 0xFFFE;

void AppendLittleEndian(std::string& out, std::uint32_t value, std::size_t width)
{
    for (std::size_t i = 0; i < width; ++i)
        out.push_back(static_cast<char>((value >> (8 * i)) & 0xFF));
}

bool IsBlank(char c)
{
    return c == ' ' || c == '\t' || c == '\n' || c == '\v' || c == '\f' || c == '\r';
}

} // namespace

void AppendTextField(std::string& out, std::string_view text)
{
    const std::uint64_t n = text.size();
    if (n < 0xFF) {
        AppendLittleEndian(out, static_cast<std::uint32_t>(n), 1);
    } else if (n < 0xFFFE) {
        out.push_back('\xFF');
        AppendLittleEndian(out, static_cast<std::uint32_t>(n), 2);
    } else if (n < 0xFFFFFFFF) {
        out.push_back('\xFF');
        AppendLittleEndian(out, 0xFFFF, 2);
        AppendLittleEndian(out, static_cast<std::uint32_t>(n), 4);
    } else {
        // 0xFFFFFFFF itself announces a longer form that readers of the
        // format do not all know; refuse rather than write an unreadable file.
        QV_THROW(DocumentFormatError("A text of " + std::to_string(n) + " bytes is too long for a document file"));
    }
    out.append(text);
}

void AppendNumberField(std::string& out, std::int64_t value)
{
    AppendTextField(out, std::to_string(value));
}

std::uint64_t ArchiveReader::ReadUnsigned(std::size_t width, std::size_t fieldStart)
{
    const std::string_view bytes = Take(width, fieldStart);
    std::uint64_t value = 0;
    for (std::size_t i = 0; i < width; ++i)
        value |= static_cast<std::uint64_t>(static_cast<unsigned char>(bytes[i])) << (8 * i);
    return value;
}

std::string_view ArchiveReader::Take(std::uint64_t count, std::size_t fieldStart)
{
    const std::size_t remaining = bytes_.size() - offset_;
    if (count > remaining)
        QV_THROW(DocumentFormatError("The document file ends early: the field at byte " +
                                     std::to_string(fieldStart) + " needs " + std::to_string(count) +
                                     " more bytes at byte " + std::to_string(offset_) + ", but only " +
                                     std::to_string(remaining) + " remain"));
    const std::string_view taken = bytes_.substr(offset_, static_cast<std::size_t>(count));
    offset_ += static_cast<std::size_t>(count);
    return taken;
}

std::string ArchiveReader::ReadText()
{
    const std::size_t start = offset_;
    bool wide = false;
    std::uint64_t n = ReadUnsigned(1, start);
    if (n == 0xFF) {
        n = ReadUnsigned(2, start);
        if (n == kWideMarker) {
            // The marker is followed by a complete length of its own; after
            // it, 0xFFFE is an ordinary 16-bit length.
            wide = true;
            n = ReadUnsigned(1, start);
            if (n == 0xFF)
                n = ReadUnsigned(2, start);
        }
        if (n == 0xFFFF)
            n = ReadUnsigned(4, start);
    }
    if (!wide) {
        const std::string_view characters = Take(n, start);
        return std::string(characters);
    }

    // n and 2n both fit in 64 bits, and Take checks 2n against what remains
    // before anything is allocated.
    const std::string_view units = Take(2 * n, start);
    std::u16string text(units.size() / 2, u'\0');
    for (std::size_t i = 0; i < text.size(); ++i)
        text[i] = static_cast<char16_t>(static_cast<unsigned char>(units[2 * i]) |
                                        static_cast<unsigned char>(units[2 * i + 1]) << 8);
    const fen::String narrow = fen::osdep::ToAnsi(fen::WString(std::u16string_view(text)));
    return std::string(narrow.View());
}

std::int32_t ArchiveReader::ReadNumber()
{
    const std::string text = ReadText();
    std::size_t i = 0;
    while (i < text.size() && IsBlank(text[i]))
        ++i;
    bool negative = false;
    if (i < text.size() && (text[i] == '+' || text[i] == '-'))
        negative = text[i++] == '-';
    // Accumulate the magnitude, saturating well past the 32-bit range so that
    // any number of digits cannot overflow.
    constexpr std::int64_t kCap = std::int64_t{1} << 40;
    std::int64_t magnitude = 0;
    for (; i < text.size() && text[i] >= '0' && text[i] <= '9'; ++i)
        magnitude = std::min(kCap, magnitude * 10 + (text[i] - '0'));
    const std::int64_t value = negative ? -magnitude : magnitude;
    constexpr std::int64_t kMin = std::numeric_limits<std::int32_t>::min();
    constexpr std::int64_t kMax = std::numeric_limits<std::int32_t>::max();
    return static_cast<std::int32_t>(std::clamp(value, kMin, kMax));
}

} // namespace qv::document
