#include "views/watchlist/RowList.h"

namespace qv::views {

void RowList::InsertAtTop(Row row)
{
    const std::int32_t handle = row.handle;
    rows_.push_front(std::move(row));
    --topStamp_;
    // The new row is the first of its handle, as a scan would find it.
    if (!indexStale_)
        index_[handle] = topStamp_;
}

void RowList::Erase(int row)
{
    rows_.erase(rows_.begin() + row);
    indexStale_ = true;
}

void RowList::Clear()
{
    rows_.clear();
    index_.clear();
    topStamp_ = 0;
    indexStale_ = false;
}

std::optional<int> RowList::Find(std::int32_t handle) const
{
    if (indexStale_)
        RebuildIndex();
    const auto found = index_.find(handle);
    if (found == index_.end())
        return std::nullopt;
    return static_cast<int>(found->second - topStamp_);
}

std::vector<int> RowList::Selected() const
{
    std::vector<int> selected;
    for (int row = 0; row < Count(); ++row)
        if (rows_[static_cast<std::size_t>(row)].selected)
            selected.push_back(row);
    return selected;
}

void RowList::RebuildIndex() const
{
    index_.clear();
    topStamp_ = 0;
    // Bottom up, so that a handle listed twice keeps its first row.
    for (int row = Count() - 1; row >= 0; --row)
        index_[rows_[static_cast<std::size_t>(row)].handle] = row;
    indexStale_ = false;
}

} // namespace qv::views
