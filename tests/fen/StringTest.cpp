#include "fen/BadAllocation.h"
#include "fen/SafeInteger.h"
#include "fen/String.h"

#include <gtest/gtest.h>

using namespace qv::fen;
using qv::fen::exception::OutOfRange;

namespace {

// Makes every allocation of at least `failFrom` bytes fail while it lives.
class FailLargeAllocations {
public:
    explicit FailLargeAllocations(std::size_t failFrom)
    {
        threshold = failFrom;
        previous_ = SetAllocationFailureHook([](std::size_t bytes) { return bytes >= threshold; });
    }
    ~FailLargeAllocations() { SetAllocationFailureHook(previous_); }

private:
    static inline std::size_t threshold = 0;
    AllocationFailureHook previous_;
};

} // namespace

TEST(String, EmptyStringsStillOwnANulTerminatedBuffer)
{
    WString wide;
    ASSERT_NE(wide.c_str(), nullptr);
    EXPECT_EQ(wide.c_str()[0], u'\0');
    EXPECT_EQ(wide.capacity(), 0u);

    String fromNull(static_cast<const char*>(nullptr));
    EXPECT_STREQ(fromNull.c_str(), "");
}

TEST(String, AssignShrinksOnlyBelowHalfTheCapacity)
{
    String s(100, 'x');
    ASSERT_EQ(s.capacity(), 100u);

    s.assign("abcdefghij" "abcdefghij" "abcdefghij" "abcdefghij" "abcdefghij" "abcdefghij", 60);
    EXPECT_EQ(s.capacity(), 100u);
    EXPECT_EQ(s.length(), 60u);

    s.assign("abc", 3);
    EXPECT_EQ(s.capacity(), 3u);
    EXPECT_STREQ(s.c_str(), "abc");

    s.assign(nullptr, 5);
    EXPECT_STREQ(s.c_str(), "");
}

TEST(String, AssignAndAppendFromItsOwnTextKeepTheText)
{
    String s("0123456789abcdefghij");
    s.assign(s.c_str() + 10, 3); // shrinks the buffer; the source lives in it
    EXPECT_STREQ(s.c_str(), "abc");

    s = s; // self-assignment changes nothing
    EXPECT_STREQ(s.c_str(), "abc");

    // Only characters before the end can be taken, not the spare room behind it.
    String t("0123456789");
    t.append("x");
    ASSERT_GT(t.capacity(), t.length() + 2);
    EXPECT_THROW(t.assign(t.c_str() + t.length() + 1, 2), OutOfRange);
    EXPECT_THROW(t.assign(t.c_str() + 8, 4), OutOfRange);
    EXPECT_STREQ(t.c_str(), "0123456789x");

    t.append(static_cast<const char*>(nullptr), 3); // like assign, null is the empty text
    EXPECT_STREQ(t.c_str(), "0123456789x");

    WString w(u"ab"); // appends that reallocate while the source lives in the old block
    w.append(w);
    w.append(w, 1, 2);
    EXPECT_EQ(w.View(), u"ababba");
}

TEST(String, AppendDoublesAndFallsBackToTheExactSize)
{
    String s("abcd");
    s.append("ef");
    EXPECT_EQ(s.capacity(), 12u); // 2 * (4 + 2)
    EXPECT_STREQ(s.c_str(), "abcdef");

    String t(10, 'a');
    {
        // 2 * 14 + 1 bytes cannot be had, 14 + 1 can.
        FailLargeAllocations failing(20);
        t.append(4, 'b');
    }
    EXPECT_EQ(t.capacity(), 14u);
    EXPECT_STREQ(t.c_str(), "aaaaaaaaaabbbb");
}

TEST(String, FailedGrowthLeavesTheStringAsItWas)
{
    String s("keep me");
    {
        FailLargeAllocations failing(1);
        EXPECT_THROW(s.append(" and more"), std::bad_alloc);
        try {
            String other("x");
            ADD_FAILURE() << "allocation should have failed";
        } catch (const std::bad_alloc& e) {
            EXPECT_STREQ(e.what(), "bad allocation");
        }
    }
    EXPECT_STREQ(s.c_str(), "keep me");

    // A length that 32 bits cannot count is refused before allocating.
    EXPECT_THROW(s.append(std::size_t{0x100000000}, 'x'), OutOfRange);
    EXPECT_THROW(WString(std::size_t{0x80000000}, u'x'), OutOfRange); // byte count overflows
    EXPECT_STREQ(s.c_str(), "keep me");
}

TEST(String, SearchAndSubstrings)
{
    WString s(u"a.b.c");
    EXPECT_EQ(s.find(u'.'), 1);
    EXPECT_EQ(s.find(u'.', 2), 3);
    EXPECT_EQ(s.find(u'.', s.length()), WString::npos);
    EXPECT_EQ(s.find(u'x'), WString::npos);

    EXPECT_EQ(s.rfind(WString(u".")), 3);
    EXPECT_EQ(s.rfind(WString(u"."), 2), 1);
    EXPECT_EQ(s.rfind(WString(u"a.b.c.d")), WString::npos);
    EXPECT_EQ(s.rfind(WString(u"b"), 0), WString::npos);

    EXPECT_EQ(s.substr(2, 100).View(), u"b.c");
    EXPECT_EQ(s.substr(5).View(), u"");
    EXPECT_THROW(s.substr(6), OutOfRange);
    EXPECT_THROW(s[5], OutOfRange);
    EXPECT_EQ(WString(s, 1, 3).View(), u".b.");
}

TEST(String, EqualityAndOrderIgnoreCase)
{
    EXPECT_EQ(String("LocalHost"), String("localhost"));
    EXPECT_LT(String("abc"), String("ABD"));
    EXPECT_GT(WString(u"b"), WString(u"A"));
    EXPECT_EQ(WString(u"\u00C4rger"), WString(u"\u00E4RGER")); // beyond ASCII too
    EXPECT_NE(String("abc"), String("abcd"));
}

TEST(String, ConvertsBetweenWidthsThroughTheLocaleCharset)
{
    WString wide(u"Gr\u00FC\u00DFe \u6E29\u5EA6");
    String narrow(wide);
    EXPECT_STREQ(narrow.c_str(), "Gr\xC3\xBC\xC3\x9F" "e \xE6\xB8\xA9\xE5\xBA\xA6");
    EXPECT_EQ(WString(narrow).View(), wide.View());
    EXPECT_EQ(WString("plain").View(), u"plain");
}

TEST(String, ConcatenationAndCopiesAreIndependent)
{
    String a("left");
    String b = a + "-" + String("right");
    a.append("!");
    EXPECT_STREQ(b.c_str(), "left-right");
    EXPECT_STREQ(a.c_str(), "left!");
}

TEST(SafeInteger, OverflowIsRefused)
{
    EXPECT_EQ((SafeInteger(0xFFFFFFFEu) + 1).Value(), 0xFFFFFFFFu);
    EXPECT_THROW(SafeInteger(0xFFFFFFFFu) + 1, OutOfRange);
    EXPECT_EQ((SafeInteger(0x10000u) * 0xFFFFu).Value(), 0xFFFF0000u);
    EXPECT_THROW(SafeInteger(0x10000u) * 0x10000u, OutOfRange);
    EXPECT_EQ(SafeInteger(0x7FFFFFFFu).Doubled().Value(), 0xFFFFFFFEu);
    EXPECT_THROW(SafeInteger(0x80000000u).Doubled(), OutOfRange);
    EXPECT_EQ(NumericCast<std::int32_t>(0x7FFFFFFFu), 0x7FFFFFFF);
    EXPECT_THROW(NumericCast<std::int32_t>(0x80000000u), OutOfRange);
}
