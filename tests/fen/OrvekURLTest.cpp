#include "fen/OrvekURL.h"
#include "fen/OrvekURLGrammar.h"
#include "fen/SyntaxError.h"
#include "OrvekURLTestSupport.h"

#include <gtest/gtest.h>

#include <string>

using namespace qv::fen;
using qv::fen::detail::CheckUrlGrammar;
using qv::fen::detail::UrlText;
using qv::fen::detail::UrlVerdict;
using qv::fen::exception::InvalidArgument;
using qv::fen::exception::OutOfRange;
using qv::fen::exception::SyntaxError;
using qv::fen::test::Describe;
using qv::fen::test::Printable;
using qv::fen::test::SameUrl;

namespace {

/// The text of the SyntaxError that `action` throws, or "(no error)".
template <typename Action>
std::string ErrorText(Action action)
{
    try {
        action();
    } catch (const SyntaxError& e) {
        return e.what();
    }
    return "(no error)";
}

// Rows describe segments as Describe() prints them: the kind, then per
// segment its separator (none for the first) and [name] or "..".
struct AcceptedRow {
    const char* name;
    std::u16string text;
    UrlVerdict verdict;
    std::string segments;
    std::u16string printed;
};

std::ostream& operator<<(std::ostream& out, const AcceptedRow& row)
{
    return out << Printable(row.text);
}

const AcceptedRow kAccepted[] = {
    {"Empty", u"", UrlVerdict::NoPath, "4", u""},
    {"NetworkRoot", u"\\\\", UrlVerdict::NetworkRoot, "1", u"\\\\"},
    {"LocalHostAlone", u"\\\\.", UrlVerdict::NoProcess, "2", u"\\\\.\\"},
    {"LocalHostBackslash", u"\\\\.\\", UrlVerdict::NoProcess, "2", u"\\\\.\\"},
    {"RootAlone", u"\\", UrlVerdict::NoPath, "3", u"\\"},
    {"HostAlone", u"\\\\h", UrlVerdict::NoProcess, "1 [h]", u"\\\\h"},
    {"HostTrailingBackslash", u"\\\\h\\", UrlVerdict::NoProcess, "1 [h]", u"\\\\h"},
    {"HostProcessTrailingBackslash", u"\\\\h\\p\\", UrlVerdict::NoPath, "1 [h] \\[p]", u"\\\\h\\p"},
    {"HostProcessPath", u"\\\\h\\p\\a.b", UrlVerdict::Path, "1 [h] \\[p] \\[a] .[b]", u"\\\\h\\p\\a.b"},
    {"LocalProcessPath", u"\\\\.\\p\\a", UrlVerdict::Path, "2 [p] \\[a]", u"\\\\.\\p\\a"},
    {"DottedHostStaysUnquotedAndCaseIsKept", u"\\\\Plant.example.com\\PROC\\Var", UrlVerdict::Path,
     "1 [Plant.example.com] \\[PROC] \\[Var]", u"\\\\Plant.example.com\\PROC\\Var"},
    {"QuotedProcessMayHoldFullStop", u"\\\\h\\'p.q'\\a", UrlVerdict::Path, "1 [h] \\[p.q] \\[a]",
     u"\\\\h\\'p.q'\\a"},
    {"QuotedProcessIsUnquotedWhenPrinted", u"\\\\h\\'pq'\\a", UrlVerdict::Path, "1 [h] \\[pq] \\[a]",
     u"\\\\h\\pq\\a"},
    {"DoubledApostropheInQuotes", u"\\\\h\\p\\'x''y.z'", UrlVerdict::Path, "1 [h] \\[p] \\[x'y.z]",
     u"\\\\h\\p\\'x''y.z'"},
    {"SpaceAndSlashNeedNoQuotes", u"\\\\h\\p\\a b/c\td", UrlVerdict::Path, "1 [h] \\[p] \\[a b/c\\u0009d]",
     u"\\\\h\\p\\a b/c\td"},
    {"QuotedBackslashAndLineEnds", u"'a\\b'.'c\r\nd'", UrlVerdict::Path, "4 [a\\b] .[c\\u000D\\u000Ad]",
     u"'a\\b'.'c\r\nd'"},
    {"TrailingBackslashIsDropped", u"a\\b\\", UrlVerdict::Path, "4 [a] \\[b]", u"a\\b"},
    {"TrailingFullStopJoinsName", u"\\\\h\\p\\a.", UrlVerdict::Path, "1 [h] \\[p] \\[a.]", u"\\\\h\\p\\'a.'"},
    {"TrailingFullStopAfterQuotes", u"x.'a'.", UrlVerdict::Path, "4 [x] .[a.]", u"x.'a.'"},
    {"ParentAlone", u"..\\", UrlVerdict::NoPath, "4 ..", u"..\\"},
    {"ParentChain", u"..\\..\\a.b", UrlVerdict::Path, "4 .. \\.. \\[a] .[b]", u"..\\..\\a.b"},
    {"RootParent", u"\\..\\a", UrlVerdict::Path, "3 .. \\[a]", u"\\..\\a"},
    {"QuotedParentLookalike", u"'..'", UrlVerdict::Path, "4 [..]", u"'..'"},
    {"LocalQuotedFullStop", u"\\\\.\\'.'", UrlVerdict::NoPath, "2 [.]", u"\\\\.\\'.'"},
    {"NonAsciiAndSurrogates", u"\\\\h\\proze\u00DF\\\xD800.\uFFFF", UrlVerdict::Path,
     "1 [h] \\[proze\\u00DF] \\[\\uD800] .[\\uFFFF]", u"\\\\h\\proze\u00DF\\\xD800.\uFFFF"},
};

class OrvekURLAccepted : public ::testing::TestWithParam<AcceptedRow> {};

TEST_P(OrvekURLAccepted, ParsesPrintsAndReadsBack)
{
    const AcceptedRow& row = GetParam();
    EXPECT_EQ(CheckUrlGrammar(UrlText(row.text)), row.verdict);

    const OrvekURL url(row.text.c_str());
    EXPECT_EQ(Describe(url), row.segments);
    const WString printed = url.ToString();
    EXPECT_EQ(Printable(printed.View()), Printable(row.printed));

    const OrvekURL again(printed);
    EXPECT_TRUE(SameUrl(url, again)) << Describe(url) << " read back as " << Describe(again);
}

INSTANTIATE_TEST_SUITE_P(Table, OrvekURLAccepted, ::testing::ValuesIn(kAccepted),
                         [](const auto& info) { return std::string(info.param.name); });

struct RejectedRow {
    const char* name;
    std::u16string text;
    UrlVerdict verdict; ///< an accepting verdict where only the segments fail
};

std::ostream& operator<<(std::ostream& out, const RejectedRow& row)
{
    return out << Printable(row.text);
}

const RejectedRow kRejected[] = {
    {"ThreeBackslashes", u"\\\\\\", UrlVerdict::ThirdBackslash},
    {"LocalHostWithoutBackslash", u"\\\\.p", UrlVerdict::MissingHostEnd},
    {"HostFollowedBySpace", u"\\\\h p\\q", UrlVerdict::MissingHostEnd},
    {"HostStartsWithApostrophe", u"\\\\'h'\\p", UrlVerdict::BadHostName},
    {"ProcessStartsWithBackslash", u"\\\\h\\\\p", UrlVerdict::DoubleSeparator},
    {"ProcessThenFullStop", u"\\\\h\\p.x", UrlVerdict::BadProcess},
    {"QuotesDoNotProtectProcess", u"\\\\h\\'a/b'\\x", UrlVerdict::BadProcess},
    {"ParentAfterProcess", u"\\\\h\\p\\..\\a", UrlVerdict::DoubleSeparator},
    {"EmptyProcessBeforeLineFeed", u"\\\\h\\\nx", UrlVerdict::EmptySegment},
    {"TwoFullStops", u"a..b", UrlVerdict::DoubleSeparator},
    {"LoneFullStop", u".", UrlVerdict::BadPath},
    {"ParentAtEnd", u"..", UrlVerdict::BadPath},
    {"ParentThenTwoBackslashes", u"..\\\\a", UrlVerdict::DoubleSeparator},
    {"RootSingleFullStop", u"\\.a", UrlVerdict::BadPath},
    {"RootSecondParent", u"\\..\\..\\a", UrlVerdict::DoubleSeparator},
    {"LeftoverAfterQuotes", u"'a'b", UrlVerdict::BadPath},
    {"LineFeedAfterSeparator", u"a.\n", UrlVerdict::EmptySegment},
    {"UnclosedQuote", u"'abc", UrlVerdict::UnclosedQuote},
    {"DoubledApostropheAtEnd", u"'abc''", UrlVerdict::UnclosedQuote},
    {"EmptyQuotedName", u"a.''", UrlVerdict::Path},
    {"EmptyQuotedProcess", u"\\\\h\\''", UrlVerdict::NoPath},
};

class OrvekURLRejected : public ::testing::TestWithParam<RejectedRow> {};

TEST_P(OrvekURLRejected, ThrowsSyntaxErrorNamingTheWholeText)
{
    const RejectedRow& row = GetParam();
    EXPECT_EQ(CheckUrlGrammar(UrlText(row.text)), row.verdict);
    // The rows are ASCII, which the locale charset keeps as it is.
    const std::string ascii(row.text.begin(), row.text.end());
    EXPECT_EQ(ErrorText([&] { OrvekURL url(row.text.c_str()); }), "SyntaxError: " + ascii);
}

INSTANTIATE_TEST_SUITE_P(Table, OrvekURLRejected, ::testing::ValuesIn(kRejected),
                         [](const auto& info) { return std::string(info.param.name); });

TEST(OrvekURL, NullIsTheEmptyTextAndEmbeddedNulIsRejected)
{
    const OrvekURL empty(static_cast<const char16_t*>(nullptr));
    EXPECT_EQ(Describe(empty), "4");

    const char16_t withNul[] = u"\\\\h\\p\0\\x";
    EXPECT_THROW(OrvekURL(WString(withNul, 8)), SyntaxError);
    // The pointer form stops at the NUL, as any NUL-terminated text does.
    EXPECT_EQ(Describe(OrvekURL(withNul)), "1 [h] \\[p]");
}

TEST(OrvekURLSegment, SeparatorIsCheckedBeforeTheName)
{
    EXPECT_TRUE(OrvekURL::Segment(0, u"a").HasNoSeparator());
    EXPECT_FALSE(OrvekURL::Segment(u'.', u"a").HasNoSeparator());
    EXPECT_EQ(OrvekURL::Segment(u'\\').GetSeparator(), u'\\');

    for (char16_t bad : {u'/', u'x', u' ', u'\''}) {
        const std::string expected = std::string("SyntaxError: ") + static_cast<char>(bad);
        EXPECT_EQ(ErrorText([&] { OrvekURL::Segment named(bad, u"a"); }), expected);
        EXPECT_EQ(ErrorText([&] { OrvekURL::Segment parent(bad); }), expected);
        EXPECT_EQ(ErrorText([&] { OrvekURL::Segment both(bad, u""); }), expected);
    }
    EXPECT_EQ(ErrorText([] { OrvekURL::Segment empty(u'.', u""); }), "SyntaxError");
}

TEST(OrvekURLSegment, ParentsHaveNoNameUntilOneIsSet)
{
    OrvekURL::Segment parent(u'\\');
    EXPECT_EQ(ErrorText([&] { parent.GetName(); }), "SyntaxError");
    EXPECT_EQ(ErrorText([&] { parent.SetName(u""); }), "SyntaxError");
    EXPECT_TRUE(parent.IsParent());

    parent.SetName(u"x");
    EXPECT_FALSE(parent.IsParent());
    EXPECT_EQ(parent.GetName().View(), u"x");

    OrvekURL::Segment named(0, u"keep");
    EXPECT_THROW(named.SetName(u""), SyntaxError);
    EXPECT_EQ(named.GetName().View(), u"keep");
}

TEST(OrvekURL, SegmentAccessIsBoundsCheckedAndCopiesAreIndependent)
{
    OrvekURL url(u"\\\\h\\p");
    EXPECT_EQ(url.GetSegment(1).GetName().View(), u"p");
    EXPECT_THROW(url.GetSegment(2), OutOfRange);
    EXPECT_THROW(static_cast<const OrvekURL&>(url).GetSegment(2), OutOfRange);

    OrvekURL copy(url);
    copy.GetSegment(1).SetName(u"b");
    copy.SetKind(OrvekURL::LocalForm);
    EXPECT_EQ(Describe(url), "1 [h] \\[p]");
}

TEST(OrvekURL, KindZeroIsRefusedAndUnknownKindsPrintError)
{
    OrvekURL url(u"\\\\h\\p");
    EXPECT_THROW(url.SetKind(0), InvalidArgument);
    EXPECT_EQ(url.GetKind(), OrvekURL::HostForm);

    url.SetKind(OrvekURL::RelativeForm);
    EXPECT_EQ(Printable(url.ToString().View()), "h\\p");
    url.SetKind(5);
    EXPECT_EQ(Printable(url.ToString().View()), "ERROR");
}

} // namespace
