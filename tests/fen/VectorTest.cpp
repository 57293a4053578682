#include "fen/String.h"
#include "fen/Vector.h"

#include <gtest/gtest.h>
#include <stdexcept>

using namespace qv::fen;

namespace {

// Counts live instances and throws on the copy chosen by the test.
struct Tracked {
    static inline int live = 0;
    static inline int copiesUntilThrow = -1;
    int value;
    explicit Tracked(int v) : value(v) { ++live; }
    Tracked(const Tracked& other) : value(other.value)
    {
        if (copiesUntilThrow == 0)
            throw std::runtime_error("copy failed");
        if (copiesUntilThrow > 0)
            --copiesUntilThrow;
        ++live;
    }
    ~Tracked() { --live; }
};

} // namespace

TEST(Vector, GrowsToTwiceAndOneAndChecksIndices)
{
    Vector<WString> v;
    v.push_back(WString(u"a"));
    EXPECT_EQ(v.capacity(), 1u);
    v.push_back(WString(u"b"));
    EXPECT_EQ(v.capacity(), 3u);
    v.push_back(WString(u"c"));
    v.push_back(WString(u"d"));
    EXPECT_EQ(v.capacity(), 7u);
    EXPECT_EQ(v[3].View(), u"d");
    EXPECT_THROW(v[4], exception::OutOfRange);

    // Appending one of its own elements while it moves to a new block.
    v.push_back(v[0]);
    v.push_back(v[4]);
    v.push_back(v[1]);
    v.push_back(v[2]);
    EXPECT_EQ(v[7].View(), u"c");
}

TEST(Vector, ElementsAreDestroyedAndCopiesAreDeep)
{
    {
        Vector<Tracked> v;
        for (int i = 0; i < 10; ++i)
            v.emplace_back(i);
        Vector<Tracked> copy(v);
        EXPECT_EQ(Tracked::live, 20);
        v.clear();
        EXPECT_EQ(copy[9].value, 9);
    }
    EXPECT_EQ(Tracked::live, 0);
}

TEST(Vector, FailedGrowthLeavesTheVectorAsItWas)
{
    {
        Vector<Tracked> v;
        for (int i = 0; i < 3; ++i)
            v.emplace_back(i);
        Tracked::copiesUntilThrow = 1; // the new element copies, the 2nd move fails
        EXPECT_THROW(v.push_back(Tracked(7)), std::runtime_error);
        Tracked::copiesUntilThrow = -1;
        ASSERT_EQ(v.size(), 3u);
        EXPECT_EQ(v[2].value, 2);
    }
    EXPECT_EQ(Tracked::live, 0);
}
