#pragma once
// A document stand-in for the watch list, and a fixture that adds items and
// delivers data changes through the list's own queue.

#include "fen/SyntaxError.h"
#include "fen/osdep/TextConversion.h"
#include "views/watchlist/WatchList.h"
#include "views/watchlist/WatchListHost.h"

#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <initializer_list>
#include <optional>
#include <string>
#include <vector>

namespace qv::test {

/// Issues handles from 1 and records every call. A URL containing "bad"
/// is refused as the URL grammar would refuse it.
class FakeWatchListHost : public views::WatchListHost {
public:
    std::int32_t SubscribeItem(const fen::WString& url) override
    {
        const fen::String narrow = fen::osdep::ToAnsi(url);
        const std::string text(narrow.c_str(), narrow.length());
        if (text.find("bad") != std::string::npos)
            QV_THROW(fen::exception::SyntaxError(url));
        subscribed.push_back(text);
        if (nextHandleOverride)
            return *nextHandleOverride;
        return nextHandle++;
    }
    void Unsubscribe(std::int32_t handle) override { unsubscribed.push_back(handle); }
    void SetModified(bool value) override { modified = value; }
    void NotifyRemoved(const std::vector<std::int32_t>& handles) override
    {
        removalNotices.push_back(handles);
        if (onRemoved)
            onRemoved(handles);
    }

    std::int32_t nextHandle = 1;
    std::optional<std::int32_t> nextHandleOverride;
    std::vector<std::string> subscribed;
    std::vector<std::int32_t> unsubscribed;
    std::optional<bool> modified;
    std::vector<std::vector<std::int32_t>> removalNotices;
    std::function<void(const std::vector<std::int32_t>&)> onRemoved;
};

class WatchListTest : public ::testing::Test {
protected:
    /// Adds one item per URL as the browser does; returns the handles in
    /// the order of `urls`.
    std::vector<std::int32_t> Add(std::initializer_list<const char*> urls,
                                  std::uint16_t dataType = value::TypeCode::Numeric, std::uint16_t access = 3)
    {
        document::ItemBatch batch;
        for (const char* url : urls)
            batch.emplace_back(url, dataType, access);
        const std::int32_t first = host.nextHandle;
        list.AddItems(batch);
        std::vector<std::int32_t> handles;
        for (std::int32_t h = first; h < host.nextHandle; ++h)
            handles.push_back(h);
        return handles;
    }

    /// Delivers one packet and applies it.
    std::optional<std::int32_t> Change(std::int32_t handle, std::uint32_t mask, const value::VarData& value,
                                       std::uint64_t quality = 0, std::int32_t errorCode = 0,
                                       fen::AbsTime time = fen::AbsTime{0, 3'800'000'000})
    {
        fbfen::orvekclient::DataChangePacket packet;
        packet.handle = handle;
        packet.changeMask = mask;
        packet.value = value;
        packet.quality = quality;
        packet.errorCode = errorCode;
        packet.timestamp = time;
        list.Queue()->Deliver(packet);
        return list.ApplyNextChange();
    }

    const std::string& Cell(std::int32_t handle, int column) { return list.CellText(*list.RowOf(handle), column); }

    /// Handles of the rows, top first.
    std::vector<std::int32_t> Order() const
    {
        std::vector<std::int32_t> order;
        for (int row = 0; row < list.RowCount(); ++row)
            order.push_back(list.HandleAt(row));
        return order;
    }

    FakeWatchListHost host;
    std::atomic<int> notifications{0};
    views::WatchList list{host, [this] { ++notifications; }};
};

inline constexpr std::uint32_t kValueBit = 0x1;
inline constexpr std::uint32_t kTimeBit = 0x4;
inline constexpr std::uint32_t kQualityBit = 0x2;
inline constexpr std::uint32_t kAllBits = 0xF;

} // namespace qv::test
