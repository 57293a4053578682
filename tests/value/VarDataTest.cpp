#include "fen/TypeErrors.h"
#include "value/VarData.h"
#include "value/dynamic/Interfaces.h"

#include <cmath>
#include <gtest/gtest.h>
#include <limits>
#include <thread>
#include <vector>

using namespace qv::value;
using qv::fen::AbsTime;

namespace {

const double kNaN = std::numeric_limits<double>::quiet_NaN();

VarData Numeric(double value) { return VarData::MakeNumeric(value); }

} // namespace

TEST(VarData, DefaultAndEmptyTextValuesHoldNoStorage)
{
    VarData empty;
    EXPECT_EQ(empty.Code(), TypeCode::Empty);
    EXPECT_EQ(TypeNameId(empty.TypeWord()), 61290u);
    EXPECT_EQ(TypeName(empty.TypeWord()), "Undefined");
    EXPECT_EQ(TypeName(VarData::MakeNumeric(1, 8).TypeWord()), "Numeric"); // low 16 bits only
    EXPECT_EQ(TypeName(TypeCode::UInt64), "Undefined");
    EXPECT_EQ(empty.ToDouble(), 0.0);

    VarData text("");
    EXPECT_EQ(text.Code(), TypeCode::AnsiString);
    EXPECT_EQ(text.Guts(), nullptr);
    const char* chars = nullptr;
    ASSERT_TRUE(text.GetAnsiText(chars));
    EXPECT_STREQ(chars, "");

    VarData bytes(nullptr, 5);
    const std::uint8_t* data = reinterpret_cast<const std::uint8_t*>("x");
    std::uint32_t count = 9;
    ASSERT_TRUE(bytes.GetRaw(data, count));
    EXPECT_EQ(data, nullptr);
    EXPECT_EQ(count, 0u);
}

TEST(VarData, StoredContentsReadBack)
{
    VarData ansi(qv::fen::String("temp\0x", 6));
    EXPECT_EQ(ansi.GetString().length(), 6u);

    VarData wide(u"\u6E29\u5EA6");
    EXPECT_EQ(wide.GetWString().View(), u"\u6E29\u5EA6");
    EXPECT_EQ(TypeNameId(wide.TypeWord()), 61285u);

    const std::uint8_t raw[] = {1, 0, 255};
    VarData block(raw, 3);
    const std::uint8_t* data = nullptr;
    std::uint32_t count = 0;
    ASSERT_TRUE(block.GetRaw(data, count));
    EXPECT_EQ(std::vector<std::uint8_t>(data, data + count), std::vector<std::uint8_t>({1, 0, 255}));

    const AbsTime time{0x8000000000000000u, 3'000'000'000};
    VarData stamped(time);
    AbsTime back{};
    ASSERT_TRUE(stamped.GetTime(back));
    EXPECT_EQ(back, time);
    EXPECT_DOUBLE_EQ(stamped.ToDouble(), 3'000'000'000.5);
}

TEST(VarData, ThrowingAccessorsLeaveTheValueUnchanged)
{
    VarData number = VarData::MakeNumeric(4.5, 3);
    EXPECT_THROW(number.GetString(), TypeErrorException);
    EXPECT_THROW(number.GetWString(), TypeErrorException);
    EXPECT_THROW(number[VarData("k")], TypeErrorException);
    EXPECT_THROW(number.Find(VarData("k")), TypeErrorException);
    EXPECT_EQ(number.TypeWord(), 0x30003u);
    EXPECT_EQ(number.ToDouble(), 4.5);

    bool flag = false;
    EXPECT_FALSE(number.GetBool(flag));
    const char* text = nullptr;
    EXPECT_FALSE(number.GetAnsiText(text));
}

TEST(VarData, ReadingsAsNumberAndLogical)
{
    EXPECT_EQ(VarData::MakeTime(86'400'000'000'000u).ToDouble(), 1.0);
    EXPECT_TRUE(VarData::MakeTime(1).ToBool());
    EXPECT_EQ(VarData::MakeUInt64(1ull << 40).ToDouble(), 1099511627776.0);
    EXPECT_TRUE(Numeric(kNaN).ToBool());
    EXPECT_FALSE(Numeric(0.0).ToBool());
    EXPECT_EQ(VarData::MakeLogical(true).ToDouble(), 1.0);
    EXPECT_FALSE(VarData::MakeTyped(TypeCode::LogicalPulse).ToBool());

    EXPECT_EQ(VarData(u" -3e2 ").ToDouble(), -300.0);
    EXPECT_EQ(VarData("12 apples").ToDouble(), 0.0);
    EXPECT_TRUE(VarData("On").ToBool());
    EXPECT_TRUE(VarData(u"TRUE").ToBool());
    EXPECT_TRUE(VarData("0.5").ToBool());
    EXPECT_FALSE(VarData("off").ToBool());
    EXPECT_FALSE(VarData("0").ToBool());
    EXPECT_EQ(VarData("+4").ToDouble(), 4.0);
    EXPECT_EQ(VarData("+-4").ToDouble(), 0.0);
    EXPECT_FALSE(VarData::MakeTyped(TypeCode::AnsiString).ToBool());
}

TEST(VarData, CompareOrdersByCodeThenContent)
{
    EXPECT_EQ(VarData::Compare(Numeric(5), VarData("a")), 3 - 0x1005);
    EXPECT_EQ(VarData::Compare(Numeric(kNaN), Numeric(1.0)), 0);
    EXPECT_EQ(VarData::Compare(Numeric(2), Numeric(1)), 1);
    EXPECT_EQ(VarData::Compare(VarData::MakeLogical(false), VarData::MakeLogical(true)), -1);
    EXPECT_EQ(VarData::Compare(VarData::MakeUInt64(~0ull), VarData::MakeUInt64(1)), 1);
    EXPECT_EQ(VarData::Compare(VarData::MakeTyped(TypeCode::Null), VarData::MakeTyped(TypeCode::Null)), 0);

    EXPECT_EQ(VarData::Compare(VarData(""), VarData("a")), -1); // no storage sorts first
    EXPECT_EQ(VarData::Compare(VarData("a"), VarData("")), 1);
    EXPECT_LT(VarData::Compare(VarData("B"), VarData("a")), 0);  // texts by code unit
    EXPECT_LT(VarData::Compare(VarData("ab"), VarData("abc")), 0);
    VarData shared("same");
    VarData copy(shared);
    EXPECT_EQ(VarData::Compare(shared, copy), 0);
}

TEST(VarData, SetElementTurnsAValueIntoAVector)
{
    VarData value = Numeric(7.5);
    value.SetElement(2, VarData("x"));
    EXPECT_EQ(value.Code(), TypeCode::Vector);
    EXPECT_EQ(TypeNameId(value.TypeWord()), 603u);
    ASSERT_EQ(value.Size(), 3u);
    EXPECT_EQ(value.GetElement(0).ToDouble(), 7.5);
    EXPECT_EQ(value.GetElement(1).Code(), TypeCode::Empty);
    EXPECT_EQ(value.GetElement(2).GetString().View(), "x");
    EXPECT_EQ(Numeric(1).GetElement(0).Code(), TypeCode::Null);

    // A value set into itself is taken as it was, not as a cycle.
    value.SetElement(3, value);
    EXPECT_EQ(value.GetElement(3).Size(), 3u);
    VarData scalar = Numeric(1);
    scalar.SetElement(1, scalar);
    EXPECT_EQ(scalar.GetElement(1).Code(), TypeCode::Numeric);
}

TEST(VarData, VectorsCopyOnWrite)
{
    VarData original;
    original.SetElement(0, Numeric(1));
    original.SetElement(1, Numeric(2));
    VarData copy(original);
    EXPECT_EQ(copy.Guts(), original.Guts());
    copy.SetElement(1, Numeric(20));
    EXPECT_NE(copy.Guts(), original.Guts());
    EXPECT_EQ(original.GetElement(1).ToDouble(), 2.0);
    EXPECT_EQ(copy.GetElement(1).ToDouble(), 20.0);
    EXPECT_EQ(VarData::Compare(original, copy), -1);
}

TEST(VarData, DictionariesCopyOnWriteAndIterateInKeyOrder)
{
    VarData first = VarData::NewDictionary();
    first[VarData("b")] = Numeric(2);
    first[VarData("a")] = VarData::MakeLogical(true);
    VarData second(first);
    second[VarData("a")] = Numeric(99);
    second[VarData("c")] = Numeric(3);

    EXPECT_EQ(first.Size(), 2u);
    EXPECT_EQ(first.Find(VarData("a"))->Code(), TypeCode::Logical);
    EXPECT_EQ(first.Find(VarData("c")), nullptr);
    EXPECT_EQ(second.Size(), 3u);
    EXPECT_EQ(second.Find(VarData("a"))->ToDouble(), 99.0);

    std::vector<std::string> keys;
    for (DictionaryIterator it = second.Begin(); it != second.End(); ++it)
        keys.emplace_back(it.Key().GetString().View());
    EXPECT_EQ(keys, (std::vector<std::string>{"a", "b", "c"}));

    // An iterator keeps the entries it walks alive after the value changes.
    DictionaryIterator it = first.Begin();
    first = Numeric(0);
    EXPECT_EQ(it.Key().GetString().View(), "a");
    DictionaryIterator copy(it);
    ++copy;
    EXPECT_EQ(copy.Value().ToDouble(), 2.0);

    // Writing while walking: the walk covers the entries it started on and
    // still meets the End of the rewritten value.
    int visited = 0;
    for (DictionaryIterator entry = second.Begin(); entry != second.End(); ++entry, ++visited)
        second[entry.Key()] = Numeric(-1);
    EXPECT_EQ(visited, 3);
    EXPECT_EQ(second.Find(VarData("b"))->ToDouble(), -1.0);

    // A NaN key is a key of its own, not a match for every number.
    VarData numbers = VarData::NewDictionary();
    numbers[Numeric(2)] = VarData("two");
    numbers[Numeric(kNaN)] = VarData("nan");
    numbers[Numeric(1)] = VarData("one");
    EXPECT_EQ(numbers.Size(), 3u);
    EXPECT_EQ(numbers.Find(Numeric(2))->GetString().View(), "two");
    EXPECT_EQ(numbers.Find(Numeric(-kNaN))->GetString().View(), "nan");

    VarData typedOnly = VarData::MakeTyped(TypeCode::Dictionary);
    EXPECT_FALSE(typedOnly.Begin() != typedOnly.End());
    typedOnly[VarData("k")] = VarData("v");
    EXPECT_EQ(typedOnly.Size(), 1u);
}

TEST(VarData, AssignmentSharesAndReleasesStorage)
{
    VarData a("shared text");
    VarData b(a);
    a = b; // shares the same storage already
    a = a;
    EXPECT_EQ(a.GetString().View(), "shared text");
    b = "other";
    EXPECT_EQ(a.GetString().View(), "shared text");
    a = u"wide";
    a.SetBitField(0xFFu);
    EXPECT_EQ(a.TypeWord(), 0x80003u);
    EXPECT_EQ(a.ToDouble(), 255.0);
    a.Swap(b);
    EXPECT_EQ(a.GetString().View(), "other");
    EXPECT_EQ(b.Kind(), NumericKind::BitField);
}

TEST(VarData, CopiesOnManyThreadsCountReferencesExactly)
{
    VarData shared;
    shared.SetElement(0, VarData("payload"));
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t)
        threads.emplace_back([&shared] {
            for (int i = 0; i < 20000; ++i) {
                VarData copy(shared);
                VarData other = copy;
                other = VarData();
            }
        });
    for (std::thread& thread : threads)
        thread.join();
    VarData probe(shared);
    EXPECT_EQ(probe.GetElement(0).GetString().View(), "payload");
    // Exactly two references are left: `shared` and `probe`.
    probe.Guts()->AddRef();
    EXPECT_EQ(probe.Guts()->Release(), 2u);
}

TEST(VarData, WordsTimeNumbersAndSubTypes)
{
    VarData word = VarData::MakeWord32(0x80000001u);
    EXPECT_EQ(word.GetWord32(), 0x80000001u);
    EXPECT_TRUE(word.ToBool());

    VarData number = VarData::MakeTimeNumber(AbsTime{0x4000000000000000u, 10});
    EXPECT_EQ(number.ToDouble(), 10.25);
    AbsTime time{};
    EXPECT_FALSE(number.GetTime(time)); // a time number is not a time value

    VarData text("abc");
    text.SetSubType(7);
    EXPECT_EQ(text.TypeWord(), 0x71005u);
    EXPECT_EQ(text.GetString().View(), "abc");
}

TEST(VarData, ClampToUInt32)
{
    EXPECT_EQ(ClampToUInt32(-3.5), 0u);
    EXPECT_EQ(ClampToUInt32(1e12), 4294967295u);
    EXPECT_EQ(ClampToUInt32(41.9), 41u);
    EXPECT_EQ(ClampToUInt32(kNaN), 4294967295u);
    EXPECT_EQ(ClampToUInt32(4294967294.9), 4294967294u);
}
