#include "fen/AbsTime.h"
#include "fen/Exception.h"

#include <gtest/gtest.h>

using namespace qv::fen;

namespace {

constexpr std::uint64_t kHalf = std::uint64_t{1} << 63;

std::int64_t Count(const AbsTime& time, TimeUnit unit, Rounding rounding, std::int64_t epochOffset = 0)
{
    std::int64_t count = 0;
    EXPECT_EQ(AbsTimeToCount(time, epochOffset, unit, rounding, count), kTimeOk);
    return count;
}

} // namespace

TEST(AbsTime, ArithmeticCarriesBetweenHalves)
{
    const AbsTime a{kHalf + 1, 10};
    EXPECT_EQ((a + AbsTime{kHalf, 0}), (AbsTime{1, 11}));
    EXPECT_EQ((AbsTime{0, 0} - AbsTime{1, 0}), (AbsTime{~std::uint64_t{0}, -1}));

    EXPECT_LT((AbsTime{~std::uint64_t{0}, -1}), (AbsTime{0, 0}));
    EXPECT_LT((AbsTime{5, 3}), (AbsTime{0, 4}));
    EXPECT_LT(AbsTime::Earliest(), (AbsTime{0, -1}));
}

TEST(AbsTime, EpochsOfTheOperatingSystem)
{
    std::int64_t ticks = 0, seconds = 0;
    ASSERT_EQ(AbsTimeToFileTime(AbsTime{0, 0}, Rounding::Truncate, ticks), kTimeOk);
    EXPECT_EQ(ticks, kFileTimeEpochOffset * 10'000'000);
    ASSERT_EQ(AbsTimeToUnixSeconds(AbsTimeFromUnixSeconds(1'700'000'000), Rounding::Truncate, seconds), kTimeOk);
    EXPECT_EQ(seconds, 1'700'000'000);
    EXPECT_THROW(AbsTimeFromUnixSeconds(INT64_MAX), qv::fen::exception::OutOfRange);
}

TEST(AbsTime, RoundingTiesToEvenAndTruncationTowardThePastInEveryUnit)
{
    // 2.5 s and 3.5 s tie; -0.5 s ties to 0 and truncates to -1.
    EXPECT_EQ(Count({kHalf, 2}, TimeUnit::Seconds, Rounding::NearestEven), 2);
    EXPECT_EQ(Count({kHalf, 3}, TimeUnit::Seconds, Rounding::NearestEven), 4);
    EXPECT_EQ(Count({kHalf + 1, 2}, TimeUnit::Seconds, Rounding::NearestEven), 3);
    EXPECT_EQ(Count({kHalf, 2}, TimeUnit::Seconds, Rounding::Truncate), 2);
    EXPECT_EQ(Count({kHalf, -1}, TimeUnit::Seconds, Rounding::NearestEven), 0);
    EXPECT_EQ(Count({kHalf, -1}, TimeUnit::Seconds, Rounding::Truncate), -1);

    EXPECT_EQ(Count({kHalf, 0}, TimeUnit::Milliseconds, Rounding::Truncate), 500);
    EXPECT_EQ(Count({1, 0}, TimeUnit::Attoseconds, Rounding::Truncate), 0);
    EXPECT_EQ(Count({~std::uint64_t{0}, 0}, TimeUnit::Attoseconds, Rounding::NearestEven), 1'000'000'000'000'000'000);

    // Units longer than a second: 1.5 and 2.5 min tie, just over 2.5 does not.
    EXPECT_EQ(Count({0, 90}, TimeUnit::Minutes, Rounding::NearestEven), 2);
    EXPECT_EQ(Count({0, 150}, TimeUnit::Minutes, Rounding::NearestEven), 2);
    EXPECT_EQ(Count({1, 150}, TimeUnit::Minutes, Rounding::NearestEven), 3);
    EXPECT_EQ(Count({0, -1}, TimeUnit::Days, Rounding::Truncate), -1);
    EXPECT_EQ(Count({0, -1}, TimeUnit::Days, Rounding::NearestEven), 0);
    EXPECT_EQ(Count({0, 0}, TimeUnit::Days, Rounding::Truncate, kFileTimeEpochOffset), 110'667);
}

TEST(AbsTime, StatusesForUnknownUnitsAndOverflow)
{
    std::int64_t count = 42;
    EXPECT_EQ(AbsTimeToCount({0, 0}, 0, static_cast<TimeUnit>(99), Rounding::Truncate, count), kTimeUnknownUnit);
    EXPECT_EQ(AbsTimeToCount({0, 10}, 0, TimeUnit::Attoseconds, Rounding::Truncate, count), kTimeOverflow);
    EXPECT_EQ(AbsTimeToCount({0, INT64_MAX}, 1, TimeUnit::Seconds, Rounding::Truncate, count), kTimeOverflow);
    EXPECT_EQ(AbsTimeToFileTime(AbsTime::Earliest(), Rounding::NearestEven, count), kTimeOverflow);
    EXPECT_EQ(count, 42);

    // The largest representable counts still convert; rounding up past them overflows.
    EXPECT_EQ(AbsTimeToCount({0, INT64_MIN}, 0, TimeUnit::Seconds, Rounding::Truncate, count), kTimeOk);
    EXPECT_EQ(count, INT64_MIN);
    EXPECT_EQ(AbsTimeToCount({kHalf + 1, INT64_MAX}, 0, TimeUnit::Seconds, Rounding::Truncate, count), kTimeOk);
    EXPECT_EQ(count, INT64_MAX);
    EXPECT_EQ(AbsTimeToCount({kHalf + 1, INT64_MAX}, 0, TimeUnit::Seconds, Rounding::NearestEven, count),
              kTimeOverflow);
}

TEST(AbsTime, FractionOfSecond)
{
    EXPECT_EQ(FractionOfSecond(1, 4), std::uint64_t{1} << 62);
    EXPECT_EQ(FractionOfSecond(0, 3), 0u);
    EXPECT_EQ(FractionOfSecond(999'999'999'999'999'999, 1'000'000'000'000'000'000), 0xFFFFFFFFFFFFFFEEu);
    EXPECT_THROW(FractionOfSecond(5, 5), qv::fen::exception::InvalidArgument);
}
