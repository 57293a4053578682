// Data changes through the list's queue, and the display options that
// rewrite the cells they left.

#include "WatchListTestSupport.h"

#include "views/watchlist/WatchListObserver.h"

namespace qv::test {
namespace {

using value::VarData;
using views::Column::Quality;
using views::Column::Time;
using views::Column::Value;

constexpr std::uint64_t kSensorFailure = 0x2;

TEST_F(WatchListTest, ChangesWriteOnlyTheCellsTheMaskNames)
{
    const std::int32_t h = Add({"\\\\h\\p\\x"})[0];
    EXPECT_EQ(Change(h, kValueBit, VarData::MakeNumeric(2.5)), h);
    EXPECT_EQ(Cell(h, Value), "2.5");
    EXPECT_EQ(Cell(h, Time), "");
    EXPECT_EQ(Cell(h, Quality), "");

    Change(h, kQualityBit, VarData::MakeNumeric(99), 0, -5);
    EXPECT_EQ(Cell(h, Value), "2.5");
    EXPECT_EQ(Cell(h, Quality), "good; error code: -5");
    Change(h, 0x8, VarData(), 0x3, 0);
    EXPECT_EQ(Cell(h, Quality), "stale;sensor failure");
    EXPECT_EQ(list.Record(h)->qualityText, "stale;sensor failure");

    Change(h, kTimeBit, VarData());
    EXPECT_FALSE(Cell(h, Time).empty());

    // Packets without a row are taken off without effect.
    EXPECT_EQ(Change(-h, kAllBits, VarData::MakeNumeric(1)), std::nullopt);
    EXPECT_EQ(Change(h + 1, kAllBits, VarData::MakeNumeric(1)), std::nullopt);
    EXPECT_EQ(list.ApplyNextChange(), std::nullopt); // empty queue
    EXPECT_EQ(Cell(h, Value), "2.5");
    EXPECT_EQ(notifications.load(), 6);
    EXPECT_EQ(list.PendingChanges(), 0u);
}

TEST_F(WatchListTest, UnshowableTimeIsMarkedButStillStored)
{
    const std::int32_t h = Add({"\\\\h\\p\\x"})[0];
    const fen::AbsTime farFuture{0, 400'000'000'000};
    Change(h, kTimeBit | kValueBit, VarData::MakeNumeric(1), 0, 0, farFuture);
    EXPECT_EQ(Cell(h, Time), "Invalid Timestamp");
    EXPECT_EQ(list.Record(h)->timestamp, farFuture);
    EXPECT_EQ(Cell(h, Value), "1");
}

TEST_F(WatchListTest, MaskForBadQualityComesAndGoes)
{
    const std::int32_t h = Add({"\\\\h\\p\\x"})[0];
    list.ToggleXXForBadQuality();
    Change(h, kAllBits, VarData::MakeNumeric(7), kSensorFailure);
    EXPECT_EQ(Cell(h, Value), "XXXXX");

    // A value alone shows through the mask ...
    Change(h, kValueBit, VarData::MakeNumeric(8));
    EXPECT_EQ(Cell(h, Value), "8");
    // ... until the next bad quality.
    Change(h, kQualityBit, VarData(), kSensorFailure);
    EXPECT_EQ(Cell(h, Value), "XXXXX");
    // A good quality brings the last value text back.
    Change(h, kQualityBit, VarData(), 0);
    EXPECT_EQ(Cell(h, Value), "8");
}

TEST_F(WatchListTest, TogglingTheMaskRestoresTheLastText)
{
    const auto handles = Add({"\\\\h\\p\\x", "\\\\h\\p\\y"});
    const std::int32_t h = handles[0];
    const std::int32_t other = handles[1];
    Change(h, kAllBits, VarData::MakeNumeric(3.14159), kSensorFailure);
    Change(other, kAllBits, VarData::MakeNumeric(1.5), 0);

    list.ToggleXXForBadQuality();
    EXPECT_EQ(Cell(h, Value), "XXXXX");
    EXPECT_EQ(Cell(other, Value), "1.5");
    // Digits changed without rewriting the cells: turning the mask off
    // shows the stored text, not a new one.
    document::DisplayOptions options = list.Options();
    options.decimalDigits = 2;
    list.SetOptions(options);
    list.ToggleXXForBadQuality();
    EXPECT_EQ(Cell(h, Value), "3.14159");
}

TEST_F(WatchListTest, DecimalPlacesRewriteNumbersOnly)
{
    const std::int32_t number = Add({"\\\\h\\p\\n"})[0];
    const std::int32_t bits = Add({"\\\\h\\p\\b"})[0];
    Change(number, kValueBit, VarData::MakeNumeric(3.14159));
    Change(bits, kValueBit, VarData::MakeBitField(5));
    const std::string bitsText = Cell(bits, Value);

    list.SetDecimalPlaces(3);
    EXPECT_EQ(Cell(number, Value), "3.14");
    EXPECT_EQ(list.Record(number)->valueText, "3.14");
    EXPECT_EQ(Cell(bits, Value), bitsText);
    Change(number, kValueBit, VarData::MakeNumeric(2.71828));
    EXPECT_EQ(Cell(number, Value), "2.72");

    list.SetDecimalPlaces(12);
    EXPECT_EQ(Cell(number, Value), "2.71828");
}

TEST_F(WatchListTest, RawBytesInHexAndNeverWritable)
{
    const std::int32_t h = Add({"\\\\h\\p\\raw"}, value::TypeCode::RawBytes, 3)[0];
    EXPECT_EQ(Cell(h, views::Column::Access), "Read Only");
    EXPECT_FALSE(list.CanWrite(h));
    const std::uint8_t bytes[] = {0x0A, 0xFF};
    Change(h, kValueBit, VarData(bytes, 2));
    EXPECT_EQ(Cell(h, Value), std::string("\x0A\xFF"));
    list.ToggleHexForRawData();
    EXPECT_EQ(Cell(h, Value), "0AFF");
    Change(h, kValueBit, VarData(bytes, 1));
    EXPECT_EQ(Cell(h, Value), "0A");
}

struct RecordingObserver : views::WatchListObserver {
    void CellsChanged(int row, std::uint32_t columns) override { changes.emplace_back(row, columns); }
    void ColumnWidthChanged(int column, int width) override { widths.emplace_back(column, width); }
    std::vector<std::pair<int, std::uint32_t>> changes;
    std::vector<std::pair<int, int>> widths;
};

TEST_F(WatchListTest, ObserverHearsTheChangedCellsAndColumns)
{
    RecordingObserver observer;
    list.SetObserver(&observer);
    const auto handles = Add({"\\\\h\\p\\a", "\\\\h\\p\\b"});
    Change(handles[0], kValueBit | kTimeBit, VarData::MakeNumeric(1));
    ASSERT_EQ(observer.changes.size(), 1u);
    EXPECT_EQ(observer.changes[0], std::make_pair(1, (1u << Value) | (1u << Time)));

    // Hiding sets 0; showing again gives the default width, not the user's.
    list.SetColumnWidth(3, 240);
    list.ApplyColumnMask(0x3F & ~0x08 & ~0x01);
    EXPECT_EQ(list.ColumnWidth(3), 0);
    list.ApplyColumnMask(0x3F);
    EXPECT_EQ(list.ColumnWidth(3), 125);
    EXPECT_EQ(observer.widths, (std::vector<std::pair<int, int>>{{0, 0}, {3, 0}, {0, 175}, {3, 125}}));
    EXPECT_EQ(Cell(handles[0], Value), "1"); // hidden columns keep their texts
    list.SetObserver(nullptr);
}

} // namespace
} // namespace qv::test
