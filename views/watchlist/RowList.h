#pragma once
/// \file
/// The watch list's rows in display order, with an index from item handle
/// to row.

#include "views/watchlist/CellText.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <deque>
#include <optional>
#include <string>
#include <unordered_map>
#include <vector>

namespace qv::views {

struct Row {
    /// Handle of the row's item.
    std::int32_t handle = 0;
    /// RowIcon of the item's type.
    int icon = 0;
    bool selected = false;
    std::array<std::string, kColumnCount> cells;
};

/// Rows, top first. Find answers from an index instead of a scan: inserting
/// at the top keeps the index valid; removing and sorting make it stale, and
/// the next Find rebuilds it once. Not thread-safe: one thread owns it.
class RowList {
public:
    int Count() const noexcept { return static_cast<int>(rows_.size()); }
    bool Contains(int row) const noexcept { return row >= 0 && row < Count(); }
    Row& operator[](int row) { return rows_[static_cast<std::size_t>(row)]; }
    const Row& operator[](int row) const { return rows_[static_cast<std::size_t>(row)]; }

    auto begin() { return rows_.begin(); }
    auto end() { return rows_.end(); }
    auto begin() const { return rows_.begin(); }
    auto end() const { return rows_.end(); }

    void InsertAtTop(Row row);
    void Erase(int row);
    void Clear();

    /// The first row of `handle`, the same answer a scan from the top gives.
    std::optional<int> Find(std::int32_t handle) const;

    /// Reorders the rows by `less`, keeping the order of equal rows.
    template <typename Less>
    void StableSort(Less less)
    {
        std::stable_sort(rows_.begin(), rows_.end(), less);
        indexStale_ = true;
    }

    /// Rows whose `selected` is set, in increasing order.
    std::vector<int> Selected() const;

private:
    void RebuildIndex() const;

    std::deque<Row> rows_;
    // Each handle maps to a stamp; its row is stamp - topStamp_. Inserting
    // at the top lowers topStamp_ by one, which moves every row down without
    // touching the index.
    mutable std::unordered_map<std::int32_t, std::int64_t> index_;
    mutable std::int64_t topStamp_ = 0;
    mutable bool indexStale_ = false;
};

} // namespace qv::views
