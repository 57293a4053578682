// The document with views that record what it asks of them, its client on a
// real broker of the test's own.

#include "network/RealTimeTestSupport.h"

#include "document/DropDecoding.h"
#include "client/OrvekClient.h"
#include "document/MonitorDoc.h"
#include "document/OptionsFile.h"
#include "fen/SyntaxError.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>

#include <atomic>
#include <fstream>
#include <thread>
#include <set>

namespace qv::test {
namespace {

using namespace document;

class FakeDataView final : public DocumentView, public DataView {
public:
    explicit FakeDataView(CMonitorDoc& document) : document_(document) {}
    DataView* AsDataView() override { return this; }
    fbfen::orvekclient::ChangeQueuePtr Changes() override { return queue; }
    bool HoldsHandle(std::int32_t handle) override { return handles.contains(handle); }
    bool RemoveAll() override
    {
        log.push_back("RemoveAll");
        rows.clear();
        return !std::exchange(cleared_, true);
    }
    void FilterAndInsert(ItemBatch& batch) override
    {
        // Drops what is listed already, as the watch list does.
        std::erase_if(batch, [&](const ItemDataPacket& r) {
            return std::any_of(rows.begin(), rows.end(), [&](const auto& row) { return row.url == r.url; });
        });
        for (const ItemDataPacket& record : batch) {
            rows.insert(rows.begin(), record);
            document_.SetModifiedFlag(true);
        }
    }
    ItemBatch RowsToSave() override { return rows; }
    std::optional<WindowPlacement> Placement() override { return placement; }
    void ApplyPlacement(const WindowPlacement& p) override { placement = p; }
    DisplayOptions Options() override { return options; }
    void SetOptions(const DisplayOptions& o) override { options = o; }

    fbfen::orvekclient::ChangeQueuePtr queue = boost::make_shared<fbfen::orvekclient::ChangeQueue>(nullptr);
    std::set<std::int32_t> handles;
    ItemBatch rows;
    std::optional<WindowPlacement> placement;
    DisplayOptions options;
    std::vector<std::string> log;

private:
    CMonitorDoc& document_;
    bool cleared_ = false;
};

class FakeAlarmView final : public DocumentView, public AlarmView {
public:
    AlarmView* AsAlarmView() override { return this; }
    void ForgetAll() override { ++forgotten; }
    void LoadItems(const ItemBatch& batch) override { loaded = batch.size(); }
    void AddItems(const ItemBatch& batch) override
    {
        for (const auto& record : batch)
            added.push_back(record.url);
    }
    int forgotten = 0;
    std::size_t loaded = 0;
    std::vector<std::string> added;
};

TestBrokerOptions WithOperator()
{
    TestBrokerOptions options;
    options.users = {{"operator", "secret"}};
    return options;
}

class MonitorDocTest : public ::testing::Test {
protected:
    MonitorDocTest() { SetDataPort(broker_.Port()); }

    TemporaryHome home_;
    TestBroker broker_{WithOperator()};
    CMonitorDoc document_{false};
    FakeDataView dataView_{document_};
    FakeAlarmView alarmView_;
};

TEST_F(MonitorDocTest, IssuesHandlesInTurnWrapsAfterTheLastAndChargesRefusedItems)
{
    document_.AddView(&dataView_);
    CMonitorDoc::SetNextHandleForTesting(1);
    EXPECT_EQ(document_.SubscribeItem(fen::WString(u"\\\\localhost\\p\\a")), 1);
    EXPECT_EQ(document_.SubscribeItem(fen::WString(u"\\\\localhost\\p\\a")), 2);
    // A URL without a host is refused by the client but still uses a handle.
    EXPECT_EQ(document_.SubscribeItem(fen::WString(u"p.a")), 3);
    // A syntax error issues none.
    EXPECT_THROW(document_.SubscribeItem(fen::WString(u"\\\\h\\'open")), fen::exception::SyntaxError);
    CMonitorDoc::SetNextHandleForTesting(CMonitorDoc::kLastHandle);
    EXPECT_EQ(document_.SubscribeItem(fen::WString(u"\\\\localhost\\p\\b")), CMonitorDoc::kLastHandle);
    // After the wrap, handles still held are passed over: 1 and 2 by
    // subscriptions, 3 by a row whose subscription was refused.
    dataView_.handles = {3};
    EXPECT_EQ(document_.SubscribeItem(fen::WString(u"\\\\localhost\\p\\c")), 4);
    document_.GetClient()->Unsubscribe(1);
    CMonitorDoc::SetNextHandleForTesting(CMonitorDoc::kLastHandle - 1);
    EXPECT_EQ(document_.SubscribeItem(fen::WString(u"\\\\localhost\\p\\d")), CMonitorDoc::kLastHandle - 1);
    EXPECT_EQ(document_.SubscribeItem(fen::WString(u"\\\\localhost\\p\\e")), 1);
    document_.RemoveView(&dataView_);
}

TEST_F(MonitorDocTest, EveryDataViewGetsItsOwnCopyOfEachChange)
{
    FakeDataView second(document_);
    document_.AddView(&dataView_);
    document_.AddView(&alarmView_);
    document_.AddView(&second);
    fbfen::orvekclient::DataChangePacket packet;
    packet.handle = 7;
    packet.value = value::VarData("level");
    document_.DispatchDataChange(packet);
    for (FakeDataView* view : {&dataView_, &second}) {
        ASSERT_EQ(view->queue->Size(), 1u);
        view->queue->ApplyNext([](const auto& p) { EXPECT_EQ(p.handle, 7); });
    }
    // A view that went gets nothing more.
    document_.RemoveView(&second);
    document_.DispatchDataChange(packet);
    EXPECT_EQ(dataView_.queue->Size(), 1u);
    EXPECT_EQ(second.queue->Size(), 0u);
}

TEST_F(MonitorDocTest, DataViewsComeAndGoWhileChangesArrive)
{
    // A library thread dispatches all along; the view that stays receives
    // every change in order, and a view that goes is never touched after.
    document_.AddView(&dataView_);
    std::atomic<bool> done{false};
    std::thread library([&] {
        fbfen::orvekclient::DataChangePacket packet;
        for (packet.handle = 0; packet.handle < 20000; ++packet.handle)
            document_.DispatchDataChange(packet);
        done = true;
    });
    while (!done) {
        auto passing = std::make_unique<FakeDataView>(document_);
        document_.AddView(passing.get());
        document_.RemoveView(passing.get());
    }
    library.join();
    std::int32_t expected = 0;
    while (dataView_.queue->ApplyNext([&](const auto& p) { EXPECT_EQ(p.handle, expected); }))
        ++expected;
    EXPECT_EQ(expected, 20000);
}

TEST_F(MonitorDocTest, ReportsTheSessionsUserOnceLoggedIn)
{
    EXPECT_EQ(document_.GetUserName(), "(nobody)");
    document_.Login(fen::WString(u"operator"), fen::WString(u"secret"), fen::WString(u"plant"));
    EXPECT_EQ(document_.GetUserName(), "operator");
    document_.Login(fen::WString(u"operator"), fen::WString(u"wrong"), fen::WString());
    EXPECT_EQ(document_.GetUserName(), "") << "a refused login leaves the session anonymous";
}

TEST_F(MonitorDocTest, FirstNewDocumentAutoLoadsAndLaterOnesDoNot)
{
    document_.AddView(&dataView_);
    document_.AddView(&alarmView_);
    DisplayOptions options;
    options.autoloadLastView = true;
    options.decimalDigits = 5;
    WriteOptionsFile(OptionsFilePath(), options);
    const ItemBatch saved{{"\\\\h\\p\\a", 3, 1}, {"\\\\h\\p\\b", 2, 3}};
    document::SaveDocument(AutoLoadFilePath(), saved, WindowPlacement{});

    EXPECT_TRUE(document_.OnNewDocument());
    EXPECT_EQ(dataView_.options, options);
    EXPECT_EQ(dataView_.rows.size(), 2u);
    EXPECT_EQ(dataView_.rows[0].url, "\\\\h\\p\\b") << "rows read back in reverse order";
    EXPECT_EQ(alarmView_.loaded, 2u);
    EXPECT_EQ(document_.GetTitle(), "AutoLoad");
    EXPECT_TRUE(document_.IsModified());

    EXPECT_TRUE(document_.OnNewDocument());
    EXPECT_TRUE(dataView_.rows.empty()) << "File > New empties the list and loads nothing";
    EXPECT_FALSE(document_.IsModified());
    EXPECT_EQ(document_.GetTitle(), CMonitorDoc::kUntitled);
    EXPECT_EQ(alarmView_.forgotten, 2);
}

TEST_F(MonitorDocTest, DamagedFileChangesNothingAndSavedFileOpensAgain)
{
    document_.AddView(&dataView_);
    dataView_.rows = {{"\\\\h\\p\\kept", 3, 1}};
    const std::string path = (home_.Home() / "list.vsd").string();
    std::ofstream(path) << "\x02\x31";
    EXPECT_THROW(document_.OpenDocument(path), fen::exception::Exception);
    ASSERT_EQ(dataView_.rows.size(), 1u);
    EXPECT_TRUE(dataView_.log.empty());

    dataView_.placement = WindowPlacement{.normalBottom = 600, .normalRight = 800};
    document_.SaveDocument(path);
    EXPECT_EQ(document_.GetTitle(), "list");
    dataView_.rows.clear();
    EXPECT_TRUE(document_.OpenDocument(path).empty());
    ASSERT_EQ(dataView_.rows.size(), 1u);
    EXPECT_EQ(dataView_.rows[0].url, "\\\\h\\p\\kept");
    EXPECT_EQ(dataView_.placement->normalRight, 800);
}

TEST_F(MonitorDocTest, DroppedItemsGoToTheDataViewThenTheAlarmViewFiltered)
{
    document_.AddView(&dataView_);
    document_.AddView(&alarmView_);
    dataView_.rows = {{"\\\\h\\p\\a", 3, 1}};
    const DropRecord records[] = {{1, 3, 5, u"\\\\h\\p\\a"}, {1, 3, 4, u"\\\\h\\p\\x"}, {3, 2, 5, u"\\\\h\\p\\b"}};
    document_.OnDropItems(EncodeDropBlock(records));
    EXPECT_EQ(dataView_.rows.size(), 2u);
    EXPECT_EQ(alarmView_.added, (std::vector<std::string>{"\\\\h\\p\\b"}));
    document_.OnDropItems("\x05\x00");
    EXPECT_EQ(dataView_.rows.size(), 2u);
}

} // namespace
} // namespace qv::test
