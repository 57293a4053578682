// Adding items: the duplicate filter, the "localhost" rewrite and the
// insertion of subscribed rows.

#include "views/watchlist/WatchList.h"

#include "fen/Exception.h"
#include "fen/osdep/MachineIdentity.h"
#include "fen/osdep/TextConversion.h"
#include "views/watchlist/WatchListHost.h"
#include "views/watchlist/WatchListObserver.h"

#include <mutex>

namespace qv::views {
namespace {

constexpr std::string_view kLocalHostUrl = "\\\\localhost";

/// Puts the local machine's name in place of a host that is exactly
/// "localhost", so that both spellings of a local item are one URL. Longer
/// host names that merely begin with "localhost" are other machines.
void RewriteLocalHost(std::string& url)
{
    if (!url.starts_with(kLocalHostUrl))
        return;
    if (url.size() > kLocalHostUrl.size() && url[kLocalHostUrl.size()] != '\\')
        return;
    try {
        const fen::String name = fen::osdep::ToAnsi(fen::osdep::GetCachedLocalHostName());
        url.replace(2, kLocalHostUrl.size() - 2, name.c_str(), name.length());
    } catch (const fen::exception::Exception&) {
        // Without the machine's name the URL stays as it was given.
    }
}

} // namespace

void WatchList::FilterNewItems(document::ItemBatch& records)
{
    std::lock_guard urls(urlLock);
    std::vector<bool> keep(records.size());
    // From the last record back, so that of a URL given twice the later
    // record stays.
    for (std::size_t i = records.size(); i-- > 0;) {
        RewriteLocalHost(records[i].url);
        keep[i] = urls_.insert(records[i].url).second;
    }
    std::size_t kept = 0;
    for (std::size_t i = 0; i < records.size(); ++i) {
        if (!keep[i])
            continue;
        if (kept != i)
            records[kept] = std::move(records[i]);
        ++kept;
    }
    records.erase(records.begin() + static_cast<std::ptrdiff_t>(kept), records.end());
}

void WatchList::InsertItems(document::ItemBatch& records)
{
    std::size_t kept = 0;
    for (std::size_t i = 0; i < records.size(); ++i) {
        if (!InsertOne(records[i]))
            continue;
        if (kept != i)
            records[kept] = std::move(records[i]);
        ++kept;
    }
    records.erase(records.begin() + static_cast<std::ptrdiff_t>(kept), records.end());
}

void WatchList::AddItems(document::ItemBatch& records)
{
    FilterNewItems(records);
    host_.SetModified(RowCount() > 0);
    InsertItems(records);
}

bool WatchList::InsertOne(document::ItemDataPacket& record)
{
    std::int32_t handle = 0;
    try {
        handle = host_.SubscribeItem(fen::osdep::ToWide(fen::String(record.url.c_str(), record.url.size())));
    } catch (const fen::exception::Exception&) {
        ForgetUrl(record.url);
        return false;
    }
    {
        std::lock_guard items(itemLock);
        // A reissued handle that another row still holds: that row keeps the
        // subscription, and this item is not listed.
        if (FindRecord(handle) != nullptr) {
            ForgetUrl(record.url);
            return false;
        }
        // Raw bytes cannot be written from the list; the record says so
        // from the start.
        if (record.dataType == value::TypeCode::RawBytes)
            record.access &= static_cast<std::uint16_t>(~document::AccessBits::Write);
        items_.emplace(handle, record);
    }

    Row row;
    row.handle = handle;
    row.icon = RowIcon(record.dataType);
    row.cells[Column::FullName] = record.url;
    row.cells[Column::ShortName] = ShortName(record.url);
    row.cells[Column::Access] = std::string(AccessText(record.access));
    if (observer_ != nullptr)
        observer_->RowWillBeInsertedAtTop();
    rows_.InsertAtTop(std::move(row));
    if (observer_ != nullptr)
        observer_->RowInsertedAtTop();
    host_.SetModified(true);
    return true;
}

void WatchList::ForgetUrl(const std::string& url)
{
    std::lock_guard urls(urlLock);
    urls_.erase(url);
}

} // namespace qv::views
