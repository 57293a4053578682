// Removing rows, and the release of every item at shutdown.

#include "views/watchlist/WatchList.h"

#include "views/watchlist/WatchListHost.h"
#include "views/watchlist/WatchListObserver.h"

#include <mutex>

namespace qv::views {

void WatchList::RemoveSelected() { RemoveRows(SelectedRows()); }

bool WatchList::RemoveAll()
{
    std::vector<int> rows(static_cast<std::size_t>(RowCount()));
    for (int row = 0; row < RowCount(); ++row)
        rows[static_cast<std::size_t>(row)] = row;
    RemoveRows(rows);
    if (clearedOnce)
        return false;
    clearedOnce = true;
    return true;
}

void WatchList::RemoveRows(const std::vector<int>& rows)
{
    if (rows.empty())
        return;
    std::vector<std::int32_t> handles;
    handles.reserve(rows.size());
    for (int row : rows)
        handles.push_back(rows_[row].handle);
    host_.SetModified(true);

    if (static_cast<int>(rows.size()) == RowCount()) {
        const int last = RowCount() - 1;
        if (observer_ != nullptr)
            observer_->RowsWillBeRemoved(0, last);
        rows_.Clear();
        if (observer_ != nullptr)
            observer_->RowsRemoved(0, last);
    } else {
        // From the bottom up, so that the rows still to go keep their numbers.
        for (auto row = rows.rbegin(); row != rows.rend(); ++row) {
            if (observer_ != nullptr)
                observer_->RowsWillBeRemoved(*row, *row);
            rows_.Erase(*row);
            if (observer_ != nullptr)
                observer_->RowsRemoved(*row, *row);
        }
    }

    host_.NotifyRemoved(handles);
    for (std::int32_t handle : handles)
        ReleaseItem(handle);
}

void WatchList::Shutdown(const std::function<void()>& beforeRelease)
{
    {
        std::lock_guard update(updateLock);
        closing = true;
    }
    if (beforeRelease)
        beforeRelease();
    std::lock_guard items(itemLock);
    for (const Row& row : rows_)
        ReleaseItem(row.handle);
    items_.clear();
}

void WatchList::ReleaseItem(std::int32_t handle)
{
    std::lock_guard items(itemLock);
    const auto found = items_.find(handle);
    // Only items still held have a subscription to end (after Shutdown the
    // rows stay without records).
    if (found == items_.end())
        return;
    host_.Unsubscribe(handle);
    {
        std::lock_guard urls(urlLock);
        urls_.erase(found->second.url);
    }
    items_.erase(found);
}

} // namespace qv::views
