// Applying data changes from the queue to rows and records.

#include "views/watchlist/WatchList.h"

#include "fen/Exception.h"
#include "views/watchlist/BadQuality.h"

#include <mutex>

namespace qv::views {

namespace ChangeBits = fbfen::orvekclient::ChangeBits;
using fbfen::orvekclient::DataChangePacket;

std::optional<std::int32_t> WatchList::ApplyNextChange()
{
    std::lock_guard update(updateLock);
    std::optional<std::int32_t> changed;
    queue_->ApplyNext([&](const DataChangePacket& packet) {
        if (!closing && packet.handle >= 0)
            changed = ApplyPacket(packet);
    });
    return changed;
}

std::optional<std::int32_t> WatchList::ApplyPacket(const DataChangePacket& packet)
{
    // A packet may still come for an item that was just removed.
    const std::optional<int> found = rows_.Find(packet.handle);
    if (!found)
        return std::nullopt;
    const int row = *found;
    std::string* const cells = rows_[row].cells.data();
    std::uint32_t columns = 0;
    {
        std::lock_guard items(itemLock);
        document::ItemDataPacket* record = FindRecord(packet.handle);
        if (record == nullptr)
            return std::nullopt;
        if (record->dataType == value::TypeCode::RawBytes)
            record->access &= static_cast<std::uint16_t>(~document::AccessBits::Write);
        try {
            if (packet.changeMask & ChangeBits::Value) {
                std::string text = ValueText(packet.value);
                cells[Column::Value] = text;
                columns |= 1u << Column::Value;
                record->value = packet.value;
                record->valueText = std::move(text);
            }
            if (packet.changeMask & ChangeBits::Timestamp) {
                cells[Column::Time] = TimeCellText(packet.timestamp);
                columns |= 1u << Column::Time;
                record->timestamp = packet.timestamp;
            }
            if (packet.changeMask & ChangeBits::QualityOrError) {
                std::string text = QualityCellText(packet.quality, packet.errorCode);
                cells[Column::Quality] = text;
                columns |= 1u << Column::Quality;
                record->qualityText = std::move(text);
                if (options_.xxForBadQuality && IsBadQualityText(record->qualityText)) {
                    cells[Column::Value] = kMaskText;
                    columns |= 1u << Column::Value;
                } else if (cells[Column::Value] == kMaskText) {
                    cells[Column::Value] = record->valueText;
                    columns |= 1u << Column::Value;
                }
            }
        } catch (const fen::exception::Exception&) {
            // This packet ends here; what it already wrote stays.
        }
    }
    NotifyCells(row, columns);
    return packet.handle;
}

} // namespace qv::views
