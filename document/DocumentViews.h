#pragma once
/// \file
/// What the monitor document needs of its views. The windows implement
/// these; so do the command-line watcher and the tests. The document calls
/// every view on the user-interface thread only; library threads reach a
/// data view's change queue alone, which the document holds a share of.

#include "client/ChangeQueue.h"
#include "document/DisplayOptions.h"
#include "document/DocumentFile.h"
#include "document/ItemDataPacket.h"

#include <cstdint>
#include <optional>
#include <variant>
#include <vector>

namespace qv::document {

class CMonitorDoc;
class DocumentView;

/// One row the data view removed: the records still exist while the other
/// views are told.
struct RemovalEntry {
    CMonitorDoc* document;
    DocumentView* dataView;
    std::int32_t handle;
};
using RemovalList = std::vector<RemovalEntry>;

/// What an update-all-views notice carries: items to add (from the
/// browser) or rows that were removed (from the data view).
using UpdateHint = std::variant<const ItemBatch*, const RemovalList*>;

/// The watch list.
class DataView {
public:
    /// The queue the document's data callback appends to, from any thread.
    /// The document keeps a share of it while the view is registered, and
    /// a change under way may still reach it a little after that: its
    /// notifier must stay safe to call once the view is gone.
    virtual fbfen::orvekclient::ChangeQueuePtr Changes() = 0;
    /// Whether a row of the list holds `handle`.
    virtual bool HoldsHandle(std::int32_t handle) = 0;
    /// Empties the list; true only on the first call in the view's life.
    virtual bool RemoveAll() = 0;
    /// Takes out of `batch` what the list already holds (rewriting
    /// "localhost" in place), then lists and subscribes the rest.
    virtual void FilterAndInsert(ItemBatch& batch) = 0;
    /// The rows to save, top first.
    virtual ItemBatch RowsToSave() = 0;
    /// The main window's placement, when it can be read.
    virtual std::optional<WindowPlacement> Placement() = 0;
    virtual void ApplyPlacement(const WindowPlacement& placement) = 0;
    virtual DisplayOptions Options() = 0;
    /// Takes new options, applying the column mask.
    virtual void SetOptions(const DisplayOptions& options) = 0;

protected:
    ~DataView() = default;
};

/// The network browser.
class BrowserView {
public:
    /// Reads the tree of hosts and processes anew.
    virtual void RefreshTree() = 0;

protected:
    ~BrowserView() = default;
};

/// The alarm list.
class AlarmView {
public:
    /// Forgets every followed process and restarts the display.
    virtual void ForgetAll() = 0;
    /// Follows the processes of a loaded document's items.
    virtual void LoadItems(const ItemBatch& batch) = 0;
    /// Follows the processes of added items, in batch order.
    virtual void AddItems(const ItemBatch& batch) = 0;

protected:
    ~AlarmView() = default;
};

/// A view of the document; each answers the one role it plays.
class DocumentView {
public:
    virtual ~DocumentView() = default;
    virtual DataView* AsDataView() { return nullptr; }
    virtual BrowserView* AsBrowserView() { return nullptr; }
    virtual AlarmView* AsAlarmView() { return nullptr; }
    /// An update-all-views notice from `sender` (null: the document).
    virtual void OnUpdate(DocumentView* /*sender*/, const UpdateHint& /*hint*/) {}
};

} // namespace qv::document
