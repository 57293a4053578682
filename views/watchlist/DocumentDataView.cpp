#include "views/watchlist/DocumentDataView.h"

#include "document/MonitorDoc.h"

namespace qv::views {

DocumentDataView::DocumentDataView(document::CMonitorDoc& document, fbfen::orvekclient::ChangeQueue::Notifier notify)
    : document_(document), list_(*this, std::move(notify))
{
    document_.AddView(this);
}

DocumentDataView::~DocumentDataView()
{
    document_.RemoveView(this);
}

void DocumentDataView::Shutdown(bool autoSave)
{
    list_.Shutdown([&] {
        if (autoSave)
            document_.AutoSave();
    });
}

void DocumentDataView::FilterAndInsert(document::ItemBatch& batch)
{
    list_.FilterNewItems(batch);
    if (!batch.empty())
        list_.InsertItems(batch);
}

document::ItemBatch DocumentDataView::RowsToSave()
{
    document::ItemBatch rows;
    for (SavedRow& row : list_.SaveRows())
        rows.emplace_back(std::move(row.url), row.dataType, row.access);
    return rows;
}

void DocumentDataView::SetOptions(const document::DisplayOptions& options)
{
    list_.SetOptions(options);
}

std::int32_t DocumentDataView::SubscribeItem(const fen::WString& url)
{
    return document_.SubscribeItem(url);
}

void DocumentDataView::Unsubscribe(std::int32_t handle)
{
    document_.UnsubscribeItem(handle);
}

void DocumentDataView::SetModified(bool modified)
{
    document_.SetModifiedFlag(modified);
}

void DocumentDataView::NotifyRemoved(const std::vector<std::int32_t>& handles)
{
    document::RemovalList removed;
    removed.reserve(handles.size());
    for (std::int32_t handle : handles)
        removed.push_back({&document_, this, handle});
    document_.UpdateAllViews(this, &removed);
}

} // namespace qv::views
