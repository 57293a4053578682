#include "fen/osdep/OSException.h"
#include "fen/osdep/TextConversion.h"

#include <gtest/gtest.h>
#include <memory>

using namespace qv::fen;
using namespace qv::fen::osdep;

TEST(TextConversion, CodePageNamesAreExact)
{
    EXPECT_EQ(CodePageFromName(""), 0u);
    EXPECT_EQ(CodePageFromName("US-ASCII"), 20127u);
    EXPECT_EQ(CodePageFromName("cp932"), 932u);
    EXPECT_THROW(CodePageFromName("us-ascii"), exception::InvalidLocale);
    EXPECT_THROW(CodePageFromName("UTF-8"), exception::InvalidLocale);
    const char16_t text[] = u"x";
    EXPECT_THROW(delete[] WideToAnsi(text, text + 1, "latin1"), exception::InvalidLocale);
}

TEST(TextConversion, RawBuffersRoundTripInEveryCodePage)
{
    struct Row {
        const char* codePage;
        std::u16string_view wide;
        std::string_view narrow;
    };
    const Row rows[] = {
        {"", u"Temp \u00B0C \u6E29", "Temp \xC2\xB0" "C \xE6\xB8\xA9"},
        {"US-ASCII", u"plain text", "plain text"},
        {"cp932", u"\u6E29\u5EA6 ok", "\x89\xB7\x93\x78 ok"},
    };
    for (const Row& row : rows) {
        std::unique_ptr<char[]> narrow(WideToAnsi(row.wide.data(), row.wide.data() + row.wide.size(), row.codePage));
        EXPECT_EQ(std::string_view(narrow.get()), row.narrow) << row.codePage;
        std::unique_ptr<char16_t[]> wide(AnsiToWide(row.narrow.data(), row.narrow.size(), row.codePage));
        EXPECT_EQ(std::u16string_view(wide.get()), row.wide) << row.codePage;
    }
}

TEST(TextConversion, EmptyInputGivesAnEmptyBufferAndAnsiToWideStopsAtMaxLengthOrNul)
{
    std::unique_ptr<char[]> narrow(WideToAnsi(nullptr, nullptr));
    EXPECT_EQ(narrow[0], '\0');
    std::unique_ptr<char16_t[]> wide(AnsiToWide("", 10));
    EXPECT_EQ(wide[0], u'\0');
    std::unique_ptr<char16_t[]> clipped(AnsiToWide("abcdef", 3));
    EXPECT_EQ(std::u16string_view(clipped.get()), u"abc");
    std::unique_ptr<char16_t[]> early(AnsiToWide("ab\0cd", 5));
    EXPECT_EQ(std::u16string_view(early.get()), u"ab");
}

TEST(TextConversion, UnrepresentableTextIsReplacedNotLost)
{
    const std::u16string_view accented = u"na\u00EFve";
    std::unique_ptr<char[]> ascii(WideToAnsi(accented.data(), accented.data() + accented.size(), "US-ASCII"));
    EXPECT_STREQ(ascii.get(), "na?ve");

    // A byte that is not UTF-8 becomes U+FFFD; the rest survives.
    EXPECT_EQ(ToWide(String("ok\xFFok")).View(), u"ok\uFFFDok");
    // A text cut inside a multi-byte character.
    EXPECT_EQ(ToWide(String("x\xE6\xB8")).View(), u"x\uFFFD\uFFFD");
}

TEST(TextConversion, CallerBuffersReportCountAndOverflow)
{
    const std::u16string_view wide = u"\u00E9t\u00E9";
    char out[8];
    EXPECT_EQ(WideToAnsi(wide.data(), wide.data() + wide.size(), out, sizeof out), 5u);
    EXPECT_EQ(std::string_view(out, 5), "\xC3\xA9t\xC3\xA9");
    try {
        WideToAnsi(wide.data(), wide.data() + wide.size(), out, 4);
        ADD_FAILURE() << "expected an insufficient-buffer error";
    } catch (const WinError& e) {
        EXPECT_EQ(e.GetOSErrorCode(), 122u);
    }
    char16_t back[3];
    EXPECT_EQ(AnsiToWide(out, out + 5, back, 3), 3u);
    EXPECT_EQ(std::u16string_view(back, 3), wide);

    // No room and nothing to write: no buffer is needed.
    EXPECT_EQ(WideToAnsi(wide.data(), wide.data(), nullptr, 0), 0u);
    EXPECT_EQ(AnsiToWide(out, out, nullptr, 0), 0u);
}
