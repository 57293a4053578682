#include "views/watchlist/WatchList.h"

#include "views/watchlist/WatchListHost.h"
#include "views/watchlist/WatchListObserver.h"

#include <boost/make_shared.hpp>

#include <mutex>

namespace qv::views {

using document::AccessBits::Write;
using document::ItemDataPacket;

WatchList::WatchList(WatchListHost& host, ChangeQueue::Notifier notifier)
    : host_(host), queue_(boost::make_shared<ChangeQueue>(std::move(notifier)))
{
}

// Out of line: the destructor releases this list's share of the queue; the
// document may hold the other share a little longer.
WatchList::~WatchList() = default;

std::string WatchList::ValueText(const value::VarData& value) const
{
    return FormatValueText(value, options_.decimalDigits, options_.hexForRawData);
}

bool WatchList::IsClosing() const
{
    std::lock_guard update(updateLock);
    return closing;
}

std::int32_t WatchList::HandleAt(int row) const { return rows_.Contains(row) ? rows_[row].handle : -1; }

const std::string& WatchList::CellText(int row, int column) const
{
    static const std::string kNone;
    if (!rows_.Contains(row) || column < 0 || column >= kColumnCount)
        return kNone;
    return rows_[row].cells[static_cast<std::size_t>(column)];
}

int WatchList::IconAt(int row) const { return rows_.Contains(row) ? rows_[row].icon : 0; }

std::optional<int> WatchList::RowOf(std::int32_t handle) const { return rows_.Find(handle); }

std::optional<ItemDataPacket> WatchList::Record(std::int32_t handle) const
{
    std::lock_guard items(itemLock);
    const ItemDataPacket* record = FindRecord(handle);
    if (record == nullptr)
        return std::nullopt;
    return *record;
}

std::vector<SavedRow> WatchList::SaveRows() const
{
    std::lock_guard items(itemLock);
    std::vector<SavedRow> saved;
    saved.reserve(items_.size());
    for (const Row& row : rows_)
        if (const ItemDataPacket* record = FindRecord(row.handle))
            saved.push_back(SavedRow{record->url, record->access, record->dataType});
    return saved;
}

void WatchList::SelectRow(int row, bool selected)
{
    if (rows_.Contains(row))
        rows_[row].selected = selected;
}

void WatchList::ClearSelection()
{
    for (Row& row : rows_)
        row.selected = false;
}

bool WatchList::IsSelected(int row) const { return rows_.Contains(row) && rows_[row].selected; }

ItemsMenuState WatchList::ItemsMenu() const
{
    ItemsMenuState state;
    const std::vector<int> selected = SelectedRows();
    if (selected.empty())
        return state;
    state.removeEnabled = true;
    if (selected.size() == 1) {
        std::lock_guard items(itemLock);
        const ItemDataPacket* record = FindRecord(rows_[selected.front()].handle);
        state.writeEnabled = record != nullptr && (record->access & Write) != 0;
    }
    return state;
}

std::optional<ItemsMenuState> WatchList::RowMenu(int row) const
{
    if (!rows_.Contains(row))
        return std::nullopt;
    const std::int32_t handle = rows_[row].handle;
    {
        std::lock_guard items(itemLock);
        if (FindRecord(handle) == nullptr)
            return std::nullopt;
    }
    return ItemsMenuState{true, CanWrite(handle)};
}

bool WatchList::CanWrite(std::int32_t handle) const
{
    std::lock_guard items(itemLock);
    const ItemDataPacket* record = FindRecord(handle);
    if (record == nullptr || (record->access & Write) == 0)
        return false;
    switch (record->dataType) {
    case value::TypeCode::Logical:
    case value::TypeCode::Numeric:
    case value::TypeCode::AnsiString:
    case value::TypeCode::UnicodeString: return true;
    default: return false;
    }
}

std::optional<std::int32_t> WatchList::WriteTarget() const
{
    const std::vector<int> selected = SelectedRows();
    if (selected.size() != 1)
        return std::nullopt;
    const std::int32_t handle = rows_[selected.front()].handle;
    if (!CanWrite(handle))
        return std::nullopt;
    return handle;
}

std::optional<std::int32_t> WatchList::OpenRow(int row)
{
    if (!rows_.Contains(row))
        return std::nullopt;
    {
        std::lock_guard items(itemLock);
        const ItemDataPacket* record = FindRecord(rows_[row].handle);
        if (record == nullptr || (record->access & Write) == 0)
            return std::nullopt;
    }
    SelectRow(row);
    return WriteTarget();
}

const ItemDataPacket* WatchList::FindRecord(std::int32_t handle) const
{
    const auto found = items_.find(handle);
    return found == items_.end() ? nullptr : &found->second;
}

ItemDataPacket* WatchList::FindRecord(std::int32_t handle)
{
    const auto found = items_.find(handle);
    return found == items_.end() ? nullptr : &found->second;
}

void WatchList::NotifyCells(int row, std::uint32_t columns)
{
    if (observer_ != nullptr && columns != 0)
        observer_->CellsChanged(row, columns);
}

} // namespace qv::views
