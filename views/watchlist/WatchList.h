#pragma once
/// \file
/// The watch list without its widget: the monitored items, their rows and
/// cell texts, the application of data changes, sorting and the display
/// options.
///
/// Threads: every member function runs on one thread, the one that owns the
/// list (the user-interface thread). The only exception is the change queue
/// (Queue()), whose Deliver any thread may call; its notifier then asks the
/// owning thread to run ApplyNextChange once per packet.
///
/// Locks, recursive, taken as the operations need them: `updateLock` around
/// each whole ApplyNextChange and when `closing` is set; `itemLock` around
/// the item table; `urlLock` around the URL set; the queue's own lock around
/// the queue. When nested: `itemLock` before `urlLock`, `updateLock` before
/// the queue's lock.

#include "client/ChangeQueue.h"
#include "document/DisplayOptions.h"
#include "document/ItemDataPacket.h"
#include "fen/Noncopyable.h"
#include "fen/osdep/Mutex.h"
#include "views/watchlist/CellText.h"
#include "views/watchlist/RowList.h"
#include "views/watchlist/RowOrder.h"

#include <array>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <unordered_map>
#include <unordered_set>
#include <vector>

namespace qv::views {

class WatchListHost;
class WatchListObserver;

/// What the document file keeps of one row.
struct SavedRow {
    std::string url;
    std::uint16_t access = 0;
    std::uint16_t dataType = 0;
};

/// Enabled state of the two row commands.
struct ItemsMenuState {
    bool removeEnabled = false;
    bool writeEnabled = false;
};

class WatchList : private fen::Noncopyable {
public:
    using ChangeQueue = fbfen::orvekclient::ChangeQueue;
    using ChangeQueuePtr = fbfen::orvekclient::ChangeQueuePtr;

    /// `notifier` is the queue's: called on the delivering thread once per
    /// packet, it must make the owning thread call ApplyNextChange.
    WatchList(WatchListHost& host, ChangeQueue::Notifier notifier);
    ~WatchList();

    /// The queue that the document delivers this list's data changes to.
    const ChangeQueuePtr& Queue() const noexcept { return queue_; }
    /// Packets waiting for ApplyNextChange.
    std::size_t PendingChanges() const { return queue_->Size(); }

    /// Sets the one observer (null for none); it must outlive the list or be
    /// replaced first.
    void SetObserver(WatchListObserver* observer) noexcept { observer_ = observer; }

    // ---- Adding items -------------------------------------------------

    /// Walks `records` from the last to the first: a URL whose host is
    /// exactly "localhost" gets the local machine's name instead (in the
    /// batch itself); a URL already listed, or already met in the batch, is
    /// taken out of the batch; every other URL joins the URL set.
    void FilterNewItems(document::ItemBatch& records);

    /// Subscribes and lists every record of a batch that FilterNewItems
    /// left, in batch order, each new row at the top. Raw-bytes records lose
    /// their write bit, in the batch too. A record whose URL the host
    /// refuses, or whose handle is already listed (handles wrap around), is
    /// left out of the list and taken out of the batch, and its URL leaves
    /// the URL set; no subscription is ended for it.
    void InsertItems(document::ItemBatch& records);

    /// FilterNewItems, the document's modified mark set when the list has
    /// rows and cleared when it has none, then InsertItems.
    void AddItems(document::ItemBatch& records);

    // ---- Data changes -------------------------------------------------

    /// Applies the oldest queued packet, exactly one, and takes it off the
    /// queue. Returns the handle whose row changed; nothing when the queue
    /// was empty or the packet was dropped (list closing, negative or
    /// unknown handle). A library exception while computing a text ends the
    /// packet; the cells written before it stay.
    std::optional<std::int32_t> ApplyNextChange();

    /// FormatValueText with this list's digits and hex option.
    std::string ValueText(const value::VarData& value) const;

    // ---- Removing -----------------------------------------------------

    /// Removes the selected rows: the rows go, the host is told (records
    /// still readable), then each subscription ends and its record and URL
    /// go. Nothing happens without a selection.
    void RemoveSelected();

    /// Removes every row as RemoveSelected does. True only on the first call
    /// in the list's life.
    bool RemoveAll();

    /// Sets `closing`, runs `beforeRelease` (which may still read the
    /// records, to save the list), then ends every subscription and destroys
    /// every record without telling the host. The rows stay; later packets
    /// are taken off the queue without effect.
    void Shutdown(const std::function<void()>& beforeRelease = {});
    bool IsClosing() const;
    bool ClearedOnce() const noexcept { return clearedOnce; }

    // ---- Reading rows and records -------------------------------------

    int RowCount() const noexcept { return rows_.Count(); }
    /// Handle of `row`; -1 for a row that does not exist.
    std::int32_t HandleAt(int row) const;
    /// Text of a cell; empty for a cell that does not exist.
    const std::string& CellText(int row, int column) const;
    /// RowIcon of `row`; 0 for a row that does not exist.
    int IconAt(int row) const;
    /// Row of `handle`, found without scanning the list.
    std::optional<int> RowOf(std::int32_t handle) const;
    /// A copy of the record of `handle` (its value shares storage).
    std::optional<document::ItemDataPacket> Record(std::int32_t handle) const;
    /// The rows that have a record, top first, for the document file.
    std::vector<SavedRow> SaveRows() const;

    // ---- Selection ----------------------------------------------------

    void SelectRow(int row, bool selected = true);
    void ClearSelection();
    bool IsSelected(int row) const;
    /// Selected rows in increasing order.
    std::vector<int> SelectedRows() const { return rows_.Selected(); }

    // ---- Commands on rows ---------------------------------------------

    /// Items menu: Remove with any selection; Write with exactly one
    /// selected row whose record has write access.
    ItemsMenuState ItemsMenu() const;
    /// The row menu of `row`: nothing when the row or its record is
    /// missing; otherwise Remove, and Write when CanWrite.
    std::optional<ItemsMenuState> RowMenu(int row) const;
    /// The item exists, has write access and a type that can be written
    /// (logical, numeric, 8-bit or wide text).
    bool CanWrite(std::int32_t handle) const;
    /// The item to write: the one selected row, if CanWrite.
    std::optional<std::int32_t> WriteTarget() const;
    /// Double click on `row`: when its record has write access the row is
    /// selected and WriteTarget answers.
    std::optional<std::int32_t> OpenRow(int row);

    // ---- Sorting ------------------------------------------------------

    /// Sorts by `column`: ascending, or descending when the last sort was
    /// ascending on the same column. Rows are not re-sorted later.
    void SortByColumn(int column);
    /// CompareRecords of the two items, reversed for a descending sort.
    /// Rows without a record come after all others.
    int CompareRows(std::int32_t handle1, std::int32_t handle2, const SortData& sortData) const;
    std::int32_t SortState() const noexcept { return sortState; }

    // ---- Display options ----------------------------------------------

    const document::DisplayOptions& Options() const noexcept { return options_; }
    /// Takes loaded options: the flags and digits as they are, the column
    /// mask through ApplyColumnMask. Cells are not rewritten, so this is
    /// meant for a list that has no rows yet.
    void SetOptions(const document::DisplayOptions& options);
    /// Stores the new digits and rewrites the value of every numeric row
    /// (bit fields excepted), replacing an "XXXXX" mask too.
    void SetDecimalPlaces(std::uint32_t digits);
    /// Off: rows showing "XXXXX" get their last value text back. On: rows
    /// whose quality is bad show "XXXXX".
    void ToggleXXForBadQuality();
    /// Rewrites the value of every raw-bytes row.
    void ToggleHexForRawData();
    void SetTypeMismatchWarning(bool on) noexcept { options_.typeMismatchWarning = on; }
    void SetAutoloadLastView(bool on) noexcept { options_.autoloadLastView = on; }

    /// Each column whose bit changed gets its default width when now shown,
    /// 0 when now hidden; then the mask is stored. Cell texts stay.
    void ApplyColumnMask(std::uint8_t mask);
    int ColumnWidth(int column) const;
    /// Records a width the user gave the column; no observer notice, since
    /// the user's widget made the change.
    void SetColumnWidth(int column, int width);

private:
    bool InsertOne(document::ItemDataPacket& record);
    void ForgetUrl(const std::string& url);
    std::optional<std::int32_t> ApplyPacket(const fbfen::orvekclient::DataChangePacket& packet);
    /// Removes `rows` (increasing), tells the host, ends the subscriptions.
    void RemoveRows(const std::vector<int>& rows);
    /// Ends the subscription of `handle` and forgets its record and URL.
    void ReleaseItem(std::int32_t handle);
    const document::ItemDataPacket* FindRecord(std::int32_t handle) const;
    document::ItemDataPacket* FindRecord(std::int32_t handle);
    /// Rewrites the Value cell of each row for which `rewrite` holds.
    template <typename Predicate>
    void RewriteValues(Predicate rewrite);
    void NotifyCells(int row, std::uint32_t columns);

    WatchListHost& host_;
    WatchListObserver* observer_ = nullptr;

    mutable fen::osdep::Mutex updateLock;
    mutable fen::osdep::Mutex itemLock;
    mutable fen::osdep::Mutex urlLock;

    std::unordered_map<std::int32_t, document::ItemDataPacket> items_;
    std::unordered_set<std::string> urls_;
    RowList rows_;
    std::array<int, kColumnCount> columnWidths_ = kDefaultColumnWidths;
    document::DisplayOptions options_;
    std::int32_t sortState = kNotSorted;
    bool clearedOnce = false;
    bool closing = false;
    ChangeQueuePtr queue_;
};

} // namespace qv::views
