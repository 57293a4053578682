#include "document/DropDecoding.h"

#include "fen/String.h"
#include "fen/osdep/TextConversion.h"

#include <optional>

namespace qv::document {
namespace {

void AppendLittleEndian(std::string& out, std::uint32_t value, std::size_t width)
{
    for (std::size_t i = 0; i < width; ++i)
        out.push_back(static_cast<char>((value >> (8 * i)) & 0xFF));
}

/// Reads little-endian integers from the block; every read fails softly, as
/// an empty optional, when the bytes it needs are not there.
class BlockReader {
public:
    explicit BlockReader(std::string_view block) : block_(block) {}

    std::optional<std::uint32_t> Unsigned(std::size_t width)
    {
        if (Remaining() < width)
            return std::nullopt;
        std::uint32_t value = 0;
        for (std::size_t i = 0; i < width; ++i)
            value |= static_cast<std::uint32_t>(static_cast<unsigned char>(block_[offset_ + i])) << (8 * i);
        offset_ += width;
        return value;
    }

    /// `units` UTF-16LE code units.
    std::optional<std::u16string> Utf16(std::uint32_t units)
    {
        if (Remaining() / 2 < units)
            return std::nullopt;
        std::u16string text(units, u'\0');
        for (std::size_t i = 0; i < text.size(); ++i, offset_ += 2)
            text[i] = static_cast<char16_t>(static_cast<unsigned char>(block_[offset_]) |
                                            static_cast<unsigned char>(block_[offset_ + 1]) << 8);
        return text;
    }

    std::size_t Remaining() const { return block_.size() - offset_; }

private:
    std::string_view block_;
    std::size_t offset_ = 0;
};

/// The smallest record: the fixed fields and an empty URL.
constexpr std::size_t kMinimumRecordSize = 12;

} // namespace

std::string EncodeDropBlock(std::span<const DropRecord> records)
{
    std::string out;
    AppendLittleEndian(out, static_cast<std::uint32_t>(records.size()), 4);
    for (const DropRecord& record : records) {
        AppendLittleEndian(out, record.access, 2);
        AppendLittleEndian(out, record.dataType, 2);
        AppendLittleEndian(out, record.kind, 4);
        AppendLittleEndian(out, static_cast<std::uint32_t>(record.url.size()), 4);
        for (const char16_t unit : record.url)
            AppendLittleEndian(out, unit, 2);
    }
    return out;
}

ItemBatch DecodeDropBlock(std::string_view block)
{
    BlockReader reader(block);
    const std::optional<std::uint32_t> count = reader.Unsigned(4);
    if (!count || *count > reader.Remaining() / kMinimumRecordSize)
        return {};
    ItemBatch batch;
    for (std::uint32_t i = 0; i < *count; ++i) {
        const auto access = reader.Unsigned(2);
        const auto dataType = reader.Unsigned(2);
        const auto kind = reader.Unsigned(4);
        const auto length = reader.Unsigned(4);
        if (!length)
            return {};
        const std::optional<std::u16string> url = reader.Utf16(*length);
        if (!url)
            return {};
        if (*kind != kDropVariableKind)
            continue;
        const fen::String narrow = fen::osdep::ToAnsi(fen::WString(std::u16string_view(*url)));
        batch.emplace_back(std::string(narrow.View()), static_cast<std::uint16_t>(*dataType),
                           static_cast<std::uint16_t>(*access));
    }
    if (reader.Remaining() != 0)
        return {};
    return batch;
}

} // namespace qv::document
