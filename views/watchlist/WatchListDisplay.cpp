// Sorting and the display options: what changes the cells and columns
// without changing the items.

#include "views/watchlist/WatchList.h"

#include "fen/Exception.h"
#include "views/watchlist/BadQuality.h"
#include "views/watchlist/WatchListObserver.h"

#include <mutex>

namespace qv::views {

using document::ItemDataPacket;

void WatchList::SortByColumn(int column)
{
    if (column < 0 || column >= kColumnCount)
        return;
    sortState = SortStateBeforeSort(sortState, column);
    const SortData sortData{column, sortState};
    if (observer_ != nullptr)
        observer_->LayoutWillChange();
    {
        std::lock_guard items(itemLock);
        rows_.StableSort(
            [&](const Row& a, const Row& b) { return CompareRows(a.handle, b.handle, sortData) < 0; });
    }
    sortState = SortStateAfterSort(sortState, column);
    if (observer_ != nullptr)
        observer_->LayoutChanged();
}

int WatchList::CompareRows(std::int32_t handle1, std::int32_t handle2, const SortData& sortData) const
{
    std::lock_guard items(itemLock);
    const ItemDataPacket* a = FindRecord(handle1);
    const ItemDataPacket* b = FindRecord(handle2);
    if (a == nullptr || b == nullptr)
        return (a == nullptr) - (b == nullptr);
    const int result = CompareRecords(*a, *b, sortData.column);
    // Reversed by negation, so that equal rows stay equal and the order
    // stays consistent for the sort.
    return sortData.sortState == sortData.column ? -result : result;
}

void WatchList::SetOptions(const document::DisplayOptions& options)
{
    // The mask goes through ApplyColumnMask, which compares it with the
    // current one to find the columns to show or hide.
    const std::uint8_t currentMask = options_.columnMask;
    options_ = options;
    options_.columnMask = currentMask;
    ApplyColumnMask(options.columnMask);
}

template <typename Predicate>
void WatchList::RewriteValues(Predicate rewrite)
{
    std::lock_guard items(itemLock);
    for (int row = 0; row < RowCount(); ++row) {
        ItemDataPacket* record = FindRecord(rows_[row].handle);
        if (record == nullptr || !rewrite(*record))
            continue;
        try {
            std::string text = ValueText(record->value);
            rows_[row].cells[Column::Value] = text;
            // Kept as the last value text, so that the "XX" rule brings back
            // what the current options show.
            record->valueText = std::move(text);
            NotifyCells(row, 1u << Column::Value);
        } catch (const fen::exception::Exception&) {
            // The row keeps its text.
        }
    }
}

void WatchList::SetDecimalPlaces(std::uint32_t digits)
{
    options_.decimalDigits = digits;
    RewriteValues([](const ItemDataPacket& record) {
        return record.value.Code() == value::TypeCode::Numeric &&
               record.value.Kind() != value::NumericKind::BitField;
    });
}

void WatchList::ToggleHexForRawData()
{
    options_.hexForRawData = !options_.hexForRawData;
    RewriteValues([](const ItemDataPacket& record) { return record.value.Code() == value::TypeCode::RawBytes; });
}

void WatchList::ToggleXXForBadQuality()
{
    options_.xxForBadQuality = !options_.xxForBadQuality;
    std::lock_guard items(itemLock);
    for (int row = 0; row < RowCount(); ++row) {
        std::string& value = rows_[row].cells[Column::Value];
        if (options_.xxForBadQuality) {
            if (!IsBadQualityText(rows_[row].cells[Column::Quality]))
                continue;
            value = kMaskText;
        } else {
            const ItemDataPacket* record = FindRecord(rows_[row].handle);
            if (value != kMaskText || record == nullptr)
                continue;
            value = record->valueText;
        }
        NotifyCells(row, 1u << Column::Value);
    }
}

void WatchList::ApplyColumnMask(std::uint8_t mask)
{
    const std::uint8_t changed = mask ^ options_.columnMask;
    for (int column = 0; column < kColumnCount; ++column) {
        if ((changed & (1u << column)) == 0)
            continue;
        const std::size_t n = static_cast<std::size_t>(column);
        columnWidths_[n] = (mask & (1u << column)) != 0 ? kDefaultColumnWidths[n] : 0;
        if (observer_ != nullptr)
            observer_->ColumnWidthChanged(column, columnWidths_[n]);
    }
    options_.columnMask = mask;
}

int WatchList::ColumnWidth(int column) const
{
    return column >= 0 && column < kColumnCount ? columnWidths_[static_cast<std::size_t>(column)] : 0;
}

void WatchList::SetColumnWidth(int column, int width)
{
    if (column >= 0 && column < kColumnCount)
        columnWidths_[static_cast<std::size_t>(column)] = width;
}

} // namespace qv::views
