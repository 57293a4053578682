// Sorting by each column, and the handle-to-row index under every kind of
// row change.

#include "WatchListTestSupport.h"

#include <random>

namespace qv::test {
namespace {

using value::VarData;

// Three items whose plain order differs for every column.
class WatchListSort : public WatchListTest {
protected:
    void SetUp() override
    {
        document::ItemBatch batch;
        batch.emplace_back("\\\\h1\\p\\mid", value::TypeCode::Numeric, 2);
        batch.emplace_back("\\\\h2\\p\\alpha", value::TypeCode::Logical, 1);
        batch.emplace_back("\\\\h3\\p\\zulu", value::TypeCode::Numeric, 3);
        list.AddItems(batch);
        Change(1, kAllBits, VarData::MakeNumeric(5), 0x1, 0, fen::AbsTime{0, 300});
        Change(2, kAllBits, VarData::MakeLogical(true), 0, 0, fen::AbsTime{0, 100});
        Change(3, kAllBits, VarData::MakeNumeric(1), 0x200000, 0, fen::AbsTime{0, 200});
    }
};

TEST_F(WatchListSort, EachColumnAscendingThenDescending)
{
    const std::vector<std::vector<std::int32_t>> ascending = {
        {1, 2, 3}, // full name
        {2, 1, 3}, // short name
        {2, 3, 1}, // logical before numeric, then by value
        {1, 3, 2}, // newest first
        {3, 2, 1}, // "disconnected", "good", "stale"
        {3, 1, 2}, // larger access word first
    };
    for (int column = 0; column < views::kColumnCount; ++column) {
        SCOPED_TRACE(column);
        list.SortByColumn(column);
        EXPECT_EQ(Order(), ascending[column]);
        EXPECT_EQ(list.SortState(), column + 100);
        list.SortByColumn(column);
        EXPECT_EQ(Order(), std::vector<std::int32_t>(ascending[column].rbegin(), ascending[column].rend()));
        EXPECT_EQ(list.SortState(), column);
        list.SortByColumn(column);
        EXPECT_EQ(Order(), ascending[column]);
    }
}

TEST_F(WatchListSort, AnotherColumnStartsAscendingAndEqualRowsKeepTheirOrder)
{
    list.SortByColumn(3);
    list.SortByColumn(3); // descending on Time
    list.SortByColumn(5);
    EXPECT_EQ(list.SortState(), 105);

    // Equal keys, descending: equal rows stay in place.
    document::ItemBatch batch;
    batch.emplace_back("\\\\h4\\p\\x", value::TypeCode::Numeric, 3);
    list.AddItems(batch); // on top, same access as handle 3
    list.SortByColumn(1);
    list.SortByColumn(5);
    list.SortByColumn(5);
    EXPECT_EQ(Order(), (std::vector<std::int32_t>{2, 1, 4, 3}));
}

TEST_F(WatchListTest, RowIndexAgreesWithAScan)
{
    std::mt19937 random(20240611);
    auto pick = [&](int bound) { return static_cast<int>(random() % static_cast<unsigned>(bound)); };
    int nextUrl = 0;
    for (int step = 0; step < 400; ++step) {
        switch (pick(4)) {
        case 0: {
            document::ItemBatch batch;
            for (int n = pick(3) + 1; n > 0; --n)
                batch.emplace_back("\\\\h\\p\\v" + std::to_string(nextUrl++), value::TypeCode::Numeric, 3);
            list.AddItems(batch);
            break;
        }
        case 1:
            list.ClearSelection();
            for (int row = 0; row < list.RowCount(); ++row)
                list.SelectRow(row, pick(4) == 0);
            list.RemoveSelected();
            break;
        case 2: list.SortByColumn(pick(views::kColumnCount)); break;
        default:
            if (list.RowCount() > 0)
                Change(list.HandleAt(pick(list.RowCount())), kAllBits, VarData::MakeNumeric(pick(1000)), pick(2));
            break;
        }
        for (std::int32_t handle = 0; handle <= host.nextHandle; ++handle) {
            std::optional<int> scanned;
            for (int row = 0; row < list.RowCount() && !scanned; ++row)
                if (list.HandleAt(row) == handle)
                    scanned = row;
            ASSERT_EQ(list.RowOf(handle), scanned) << "step " << step << ", handle " << handle;
        }
    }
}

} // namespace
} // namespace qv::test
