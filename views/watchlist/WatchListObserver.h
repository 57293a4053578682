#pragma once
/// \file
/// Notices of the watch list's row and column changes, for an item model
/// that shows the list.

#include <cstdint>

namespace qv::views {

/// Every notice comes on the thread that drives the watch list, from inside
/// the operation that makes the change; the observer may read the watch
/// list during it. The "Will" notices come before the change, the others
/// after it. Default implementations ignore the notice.
class WatchListObserver {
public:
    virtual ~WatchListObserver() = default;

    /// One row is about to be inserted at row 0.
    virtual void RowWillBeInsertedAtTop() {}
    /// One row was inserted at row 0; its cells are already filled.
    virtual void RowInsertedAtTop() {}

    /// Rows `first` to `last` (inclusive) are about to be removed.
    virtual void RowsWillBeRemoved(int /*first*/, int /*last*/) {}
    /// Rows `first` to `last` were removed; the rows after them moved up.
    virtual void RowsRemoved(int /*first*/, int /*last*/) {}

    /// Cells of `row` changed; bit n of `columns` set for column n.
    virtual void CellsChanged(int /*row*/, std::uint32_t /*columns*/) {}

    /// The rows are about to be reordered (sorting); none is added or removed.
    virtual void LayoutWillChange() {}
    /// The rows were reordered.
    virtual void LayoutChanged() {}

    /// The watch list changed the width of `column` (showing or hiding it).
    virtual void ColumnWidthChanged(int /*column*/, int /*width*/) {}
};

} // namespace qv::views
