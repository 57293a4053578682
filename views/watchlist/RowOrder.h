#pragma once
/// \file
/// The order of the watch list's rows when sorted by a column.

#include "document/ItemDataPacket.h"

#include <cstdint>

namespace qv::views {

/// `sortState` before any sort.
inline constexpr std::int32_t kNotSorted = -1;
/// `sortState` is column + kAscendingOffset after an ascending sort, the
/// column itself after a descending one.
inline constexpr std::int32_t kAscendingOffset = 100;

/// What one sort compares by.
struct SortData {
    int column = 0;
    /// The watch list's `sortState` during the sort: equal to `column` for a
    /// descending sort.
    std::int32_t sortState = kNotSorted;
};

/// Compares two records in the plain (ascending) order of `column`:
/// negative, 0 or positive. Texts compare case-sensitively in the current
/// locale's collation; column 2 by type code, then by the value model's
/// comparison of the values; column 3 newest first by whole seconds;
/// column 5 by access word, larger first.
int CompareRecords(const document::ItemDataPacket& a, const document::ItemDataPacket& b, int column);

/// `sortState` before a sort by `column`: the column itself when it was last
/// sorted ascending (this sort is descending), otherwise kNotSorted.
std::int32_t SortStateBeforeSort(std::int32_t sortState, int column) noexcept;
/// `sortState` after the sort.
std::int32_t SortStateAfterSort(std::int32_t sortState, int column) noexcept;

} // namespace qv::views
