// Adding, removing and releasing items, and the commands that depend on
// the selection.

#include "WatchListTestSupport.h"

#include "support/FixedHostName.h"
#include "support/TemporaryHome.h"

#include <thread>

namespace qv::test {
namespace {

using value::VarData;

/// The machine is called "plant7", with no name configured in the store.
struct FixedLocalHostName {
    TemporaryHome home;
    FixedHostName name{"plant7"};
};

document::ItemBatch Batch(std::initializer_list<const char*> urls)
{
    document::ItemBatch batch;
    for (const char* url : urls)
        batch.emplace_back(url, value::TypeCode::Numeric, 3);
    return batch;
}

std::vector<std::string> Urls(const document::ItemBatch& batch)
{
    std::vector<std::string> urls;
    for (const auto& record : batch)
        urls.push_back(record.url);
    return urls;
}

TEST_F(WatchListTest, DuplicatesAndLocalHostSpellingsAddOneRow)
{
    FixedLocalHostName machine;
    Add({"\\\\plant7\\p\\a"});
    document::ItemBatch batch = Batch({"\\\\localhost\\p\\a", "\\\\h\\p\\b", "\\\\localhost2\\p\\c",
                                       "\\\\h\\p\\b", "\\\\localhost\\p\\d", "x\\localhost\\e", "\\\\localhost"});
    list.AddItems(batch);
    // The batch is filtered in place: the first b goes (the later one stays),
    // and only a host that is exactly "localhost" is renamed.
    EXPECT_EQ(Urls(batch), (std::vector<std::string>{"\\\\localhost2\\p\\c", "\\\\h\\p\\b", "\\\\plant7\\p\\d",
                                                     "x\\localhost\\e", "\\\\plant7"}));
    EXPECT_EQ(list.RowCount(), 6);
    EXPECT_EQ(host.subscribed.back(), "\\\\plant7");
}

TEST_F(WatchListTest, NewRowsGoOnTopInReverseOrder)
{
    document::ItemBatch batch = Batch({"\\\\h\\p\\a", "\\\\h\\p\\b"});
    batch.emplace_back("\\\\h\\p\\c", value::TypeCode::Logical, 1);
    list.AddItems(batch);
    EXPECT_EQ(Order(), (std::vector<std::int32_t>{3, 2, 1}));
    EXPECT_EQ(host.subscribed, (std::vector<std::string>{"\\\\h\\p\\a", "\\\\h\\p\\b", "\\\\h\\p\\c"}));
    EXPECT_EQ(list.CellText(0, views::Column::ShortName), "c");
    EXPECT_EQ(list.CellText(0, views::Column::Access), "Read Only");
    EXPECT_EQ(list.IconAt(0), 2);
    EXPECT_EQ(list.CellText(2, views::Column::Access), "Read \\ Write");
    EXPECT_EQ(host.modified, true);

    const auto saved = list.SaveRows();
    ASSERT_EQ(saved.size(), 3u);
    EXPECT_EQ(saved[0].url, "\\\\h\\p\\c");
    EXPECT_EQ(saved[0].dataType, value::TypeCode::Logical);
    EXPECT_EQ(saved[2].url, "\\\\h\\p\\a");
}

TEST_F(WatchListTest, RefusedUrlsAndReusedHandlesAreLeftOut)
{
    document::ItemBatch batch = Batch({"\\\\h\\p\\a", "\\\\h\\p\\bad", "\\\\h\\p\\c"});
    list.AddItems(batch);
    EXPECT_EQ(Urls(batch), (std::vector<std::string>{"\\\\h\\p\\a", "\\\\h\\p\\c"}));
    EXPECT_EQ(Order(), (std::vector<std::int32_t>{2, 1}));
    // The refused URL is not remembered as listed: it is offered again.
    batch = Batch({"\\\\h\\p\\bad"});
    list.FilterNewItems(batch);
    EXPECT_EQ(batch.size(), 1u);

    // A handle that comes round again while its row still exists.
    host.nextHandleOverride = 1;
    batch = Batch({"\\\\h\\p\\e"});
    list.AddItems(batch);
    EXPECT_TRUE(batch.empty());
    EXPECT_EQ(list.RowCount(), 2);
    EXPECT_EQ(list.Record(1)->url, "\\\\h\\p\\a");
    EXPECT_TRUE(host.unsubscribed.empty());
    host.nextHandleOverride.reset();
    batch = Batch({"\\\\h\\p\\e"});
    list.FilterNewItems(batch);
    EXPECT_EQ(batch.size(), 1u);
}

TEST_F(WatchListTest, RemovingTellsTheHostWhileRecordsExist)
{
    const auto handles = Add({"\\\\h\\p\\a", "\\\\h\\p\\b", "\\\\h\\p\\c", "\\\\h\\p\\d"});
    std::vector<std::string> seenUrls;
    host.onRemoved = [&](const std::vector<std::int32_t>& removed) {
        for (std::int32_t h : removed)
            seenUrls.push_back(list.Record(h)->url);
    };
    host.modified = false;
    list.RemoveSelected(); // nothing selected
    EXPECT_TRUE(host.removalNotices.empty());

    list.SelectRow(0); // d
    list.SelectRow(2); // b
    list.RemoveSelected();
    EXPECT_EQ(host.removalNotices, (std::vector<std::vector<std::int32_t>>{{handles[3], handles[1]}}));
    EXPECT_EQ(seenUrls, (std::vector<std::string>{"\\\\h\\p\\d", "\\\\h\\p\\b"}));
    EXPECT_EQ(host.unsubscribed, (std::vector<std::int32_t>{handles[3], handles[1]}));
    EXPECT_EQ(Order(), (std::vector<std::int32_t>{handles[2], handles[0]}));
    EXPECT_FALSE(list.Record(handles[1]));
    EXPECT_EQ(host.modified, true);
    // A late packet for a removed item is dropped; the URL can come back.
    EXPECT_EQ(Change(handles[1], kAllBits, VarData::MakeNumeric(1)), std::nullopt);
    EXPECT_EQ(Add({"\\\\h\\p\\b"}).size(), 1u);
}

TEST_F(WatchListTest, RemoveAllAnswersTrueOnlyOnce)
{
    EXPECT_TRUE(list.RemoveAll());
    Add({"\\\\h\\p\\a", "\\\\h\\p\\b"});
    EXPECT_FALSE(list.RemoveAll());
    EXPECT_EQ(list.RowCount(), 0);
    EXPECT_EQ(host.unsubscribed.size(), 2u);
    EXPECT_FALSE(list.RemoveAll());
    EXPECT_TRUE(list.ClearedOnce());
}

TEST_F(WatchListTest, ShutdownReleasesEverythingQuietlyAndKeepsTheRows)
{
    const auto handles = Add({"\\\\h\\p\\a", "\\\\h\\p\\b"});
    Change(handles[0], kValueBit, VarData::MakeNumeric(4));
    std::size_t savedBeforeRelease = 0;
    list.Shutdown([&] { savedBeforeRelease = list.SaveRows().size(); });
    EXPECT_EQ(savedBeforeRelease, 2u);
    EXPECT_TRUE(list.IsClosing());
    EXPECT_EQ(host.unsubscribed, (std::vector<std::int32_t>{handles[1], handles[0]}));
    EXPECT_TRUE(host.removalNotices.empty());
    EXPECT_EQ(list.RowCount(), 2);
    EXPECT_TRUE(list.SaveRows().empty());

    EXPECT_EQ(Change(handles[0], kValueBit, VarData::MakeNumeric(5)), std::nullopt);
    EXPECT_EQ(list.PendingChanges(), 0u);
    EXPECT_EQ(Cell(handles[0], views::Column::Value), "4");
    // Nothing is ended twice.
    list.RemoveAll();
    EXPECT_EQ(host.unsubscribed.size(), 2u);
}

TEST_F(WatchListTest, WriteCommandsFollowSelectionAccessAndType)
{
    document::ItemBatch batch;
    batch.emplace_back("\\\\h\\p\\num", value::TypeCode::Numeric, 3);
    batch.emplace_back("\\\\h\\p\\ro", value::TypeCode::Numeric, 1);
    batch.emplace_back("\\\\h\\p\\dict", value::TypeCode::Dictionary, 3);
    list.AddItems(batch); // rows: dict (3), ro (2), num (1)

    EXPECT_FALSE(list.ItemsMenu().removeEnabled);
    EXPECT_FALSE(list.ItemsMenu().writeEnabled);
    list.SelectRow(2);
    EXPECT_TRUE(list.ItemsMenu().writeEnabled);
    EXPECT_EQ(list.WriteTarget(), 1);
    list.SelectRow(1);
    EXPECT_TRUE(list.ItemsMenu().removeEnabled);
    EXPECT_FALSE(list.ItemsMenu().writeEnabled);
    EXPECT_EQ(list.WriteTarget(), std::nullopt);

    list.ClearSelection();
    list.SelectRow(0);
    // The Items menu looks at access only; writing needs a writable type.
    EXPECT_TRUE(list.ItemsMenu().writeEnabled);
    EXPECT_EQ(list.WriteTarget(), std::nullopt);
    EXPECT_FALSE(list.RowMenu(0)->writeEnabled);
    EXPECT_TRUE(list.RowMenu(2)->writeEnabled);
    EXPECT_FALSE(list.RowMenu(3));

    list.ClearSelection();
    EXPECT_EQ(list.OpenRow(1), std::nullopt); // read only: not even selected
    EXPECT_FALSE(list.IsSelected(1));
    EXPECT_EQ(list.OpenRow(2), 1);
    EXPECT_TRUE(list.IsSelected(2));
}

// Packets arrive from another thread while this thread removes rows and
// applies; ThreadSanitizer checks the hand-over.
TEST_F(WatchListTest, RemovalWhileChangesArrive)
{
    document::ItemBatch batch;
    for (int i = 0; i < 40; ++i)
        batch.emplace_back("\\\\h\\p\\v" + std::to_string(i), value::TypeCode::AnsiString, 3);
    list.AddItems(batch);

    constexpr int kPackets = 4000;
    std::atomic<bool> done{false};
    std::thread producer([&] {
        fbfen::orvekclient::DataChangePacket packet;
        packet.changeMask = kAllBits;
        for (int i = 0; i < kPackets; ++i) {
            packet.handle = 1 + i % 40;
            packet.value = VarData(("text " + std::to_string(i)).c_str());
            packet.quality = static_cast<std::uint64_t>(i % 3);
            list.Queue()->Deliver(packet);
        }
        done = true;
    });
    int taken = 0;
    int applied = 0;
    while (!done || list.PendingChanges() > 0) {
        if (list.PendingChanges() == 0) {
            std::this_thread::yield();
            continue;
        }
        if (list.ApplyNextChange())
            ++applied;
        if (++taken % 200 == 0) {
            list.ClearSelection();
            list.SelectRow(list.RowCount() / 2);
            list.RemoveSelected();
        }
    }
    producer.join();
    EXPECT_EQ(notifications.load(), kPackets);
    EXPECT_EQ(taken, kPackets);
    EXPECT_GT(applied, kPackets / 2);
    EXPECT_EQ(list.RowCount(), 20);
    for (int row = 0; row < list.RowCount(); ++row)
        EXPECT_TRUE(list.Record(list.HandleAt(row)));
}

} // namespace
} // namespace qv::test
