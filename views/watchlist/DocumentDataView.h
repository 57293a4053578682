#pragma once
/// \file
/// A watch list as the data view of a monitor document: the document
/// subscribes its items, feeds its change queue and reads and writes its
/// rows in document files. The windows' list and the command-line watcher
/// both show one of these.

#include "document/DocumentViews.h"
#include "views/watchlist/WatchList.h"
#include "views/watchlist/WatchListHost.h"

#include <optional>

namespace qv::document {
class CMonitorDoc;
}

namespace qv::views {

class DocumentDataView final : public document::DocumentView, public document::DataView, private WatchListHost {
public:
    /// Registers with `document`, which must outlive the view. `notify` asks
    /// the owning thread to run ApplyNextChange once; it is called on library
    /// threads, once per change, and a change under way may call it just
    /// after the view is gone.
    DocumentDataView(document::CMonitorDoc& document, fbfen::orvekclient::ChangeQueue::Notifier notify);
    ~DocumentDataView() override;

    WatchList& List() noexcept { return list_; }

    /// Ends every subscription at exit; with `autoSave` the options file and
    /// the auto-load file are written first, while the records still exist.
    void Shutdown(bool autoSave);

    // document::DocumentView
    document::DataView* AsDataView() override { return this; }

    // document::DataView
    fbfen::orvekclient::ChangeQueuePtr Changes() override { return list_.Queue(); }
    bool HoldsHandle(std::int32_t handle) override { return list_.RowOf(handle).has_value(); }
    bool RemoveAll() override { return list_.RemoveAll(); }
    void FilterAndInsert(document::ItemBatch& batch) override;
    document::ItemBatch RowsToSave() override;
    /// Without a window, the placement last read from a file, so that
    /// saving keeps it.
    std::optional<document::WindowPlacement> Placement() override { return placement_; }
    void ApplyPlacement(const document::WindowPlacement& placement) override { placement_ = placement; }
    document::DisplayOptions Options() override { return list_.Options(); }
    void SetOptions(const document::DisplayOptions& options) override;

private:
    // WatchListHost
    std::int32_t SubscribeItem(const fen::WString& url) override;
    void Unsubscribe(std::int32_t handle) override;
    void SetModified(bool modified) override;
    void NotifyRemoved(const std::vector<std::int32_t>& handles) override;

    document::CMonitorDoc& document_;
    WatchList list_;
    std::optional<document::WindowPlacement> placement_;
};

} // namespace qv::views
