#include "fen/Exception.h"
#include "fen/osdep/ServiceCommandLine.h"

#include <gtest/gtest.h>
#include <map>

using qv::fen::osdep::SplitCommandLine;

namespace {

struct SplitCase {
    const char* name;
    const char* commandLine;
    std::vector<std::string> words;
};

void PrintTo(const SplitCase& c, std::ostream* out) { *out << c.name; }

std::optional<std::string> Lookup(const std::string& name)
{
    static const std::map<std::string, std::string> variables{
        {"BIN", "/opt/var o/bin"}, {"EMPTY", ""}, {"Q", "a\"b"}};
    const auto found = variables.find(name);
    return found == variables.end() ? std::nullopt : std::optional<std::string>(found->second);
}

class SplitCommandLineTest : public ::testing::TestWithParam<SplitCase> {};

} // namespace

TEST_P(SplitCommandLineTest, GivesTheArguments)
{
    EXPECT_EQ(SplitCommandLine(GetParam().commandLine, Lookup), GetParam().words);
}

INSTANTIATE_TEST_SUITE_P(
    Cases, SplitCommandLineTest,
    ::testing::Values(
        SplitCase{"Blanks", "  a \t b\n c  ", {"a", "b", "c"}},
        SplitCase{"Empty", "   ", {}},
        SplitCase{"DoubleQuotes", R"("/a b/c" "x\"y\\z" "")", {"/a b/c", R"(x"y\z)", ""}},
        SplitCase{"SingleQuotesAreLiteral", R"('${BIN} \n' x)", {R"(${BIN} \n)", "x"}},
        SplitCase{"BackslashOutsideQuotes", R"(a\ b c\"d)", {"a b", "c\"d"}},
        SplitCase{"BracedVariableStaysOneWord", "${BIN}/prog --x", {"/opt/var o/bin/prog", "--x"}},
        SplitCase{"PercentVariable", "%BIN%/prog", {"/opt/var o/bin/prog"}},
        SplitCase{"UnsetBracedIsEmpty", "a${NOPE}b ${EMPTY}", {"ab", ""}},
        SplitCase{"UnsetPercentStays", "%NOPE% 100% %", {"%NOPE%", "100%", "%"}},
        SplitCase{"ExpandedQuoteIsText", "${Q} \"${Q}\"", {"a\"b", "a\"b"}},
        SplitCase{"EscapedDollar", R"("\${BIN}")", {"${BIN}"}}),
    [](const auto& info) { return std::string(info.param.name); });

TEST(SplitCommandLine, UnclosedQuotesAndReferencesAreRefused)
{
    for (const char* bad : {"\"open", "'open", "${OPEN", "a \"b\" \"c"})
        EXPECT_THROW(SplitCommandLine(bad, Lookup), qv::fen::exception::InvalidArgument) << bad;
}
