// Topic names, their escaping, the path of a variable, and the text codings
// underneath.

#include "network/protocol/ProtocolError.h"
#include "network/protocol/TextCoding.h"
#include "network/protocol/Topics.h"

#include <gtest/gtest.h>

#include <random>
#include <string>

using namespace qv::network::protocol;
using qv::fen::OrvekURL;

namespace {

OrvekURL Url(const char16_t* text) { return OrvekURL(text); }

} // namespace

TEST(ProtocolTopic, EscapingExamples)
{
    EXPECT_EQ(EscapeTopicLevel("drum.level"), "drum.level");
    EXPECT_EQ(EscapeTopicLevel("a/b+c#d%e f"), "a%2Fb%2Bc%23d%25e%20f");
    EXPECT_EQ(EscapeTopicLevel(std::string("\0\n", 2)), "%00%0A");
    EXPECT_EQ(EscapeTopicLevel("\xC3\xBC"), "%C3%BC");
    EXPECT_EQ(EscapeTopicLevel("a\\'x.y'"), "a%5C%27x.y%27");
    EXPECT_EQ(EscapeTopicLevel(""), "%");
    EXPECT_EQ(UnescapeTopicLevel("%"), "");
}

TEST(ProtocolTopic, EscapingIsReversibleOverGeneratedNames)
{
    // Reversible, hence also injective: no two names share a level.
    std::mt19937 random(20240101);
    const char letters[] = "aZ09._~-/+#%' \\$\0\x7F\x80\xC3\xFF";
    const std::string alphabet(letters, sizeof letters - 1);
    for (int i = 0; i < 20000; ++i) {
        std::string name;
        const int length = static_cast<int>(random() % 7);
        for (int k = 0; k < length; ++k)
            name += (random() % 4 == 0) ? static_cast<char>(random() % 256) : alphabet[random() % alphabet.size()];
        const std::string level = EscapeTopicLevel(name);
        ASSERT_EQ(UnescapeTopicLevel(level), name);
        ASSERT_EQ(level.find_first_of("/+#"), std::string::npos) << level;
        for (const char c : level)
            ASSERT_TRUE(c > 0x20 && c < 0x7F) << level;
    }
}

TEST(ProtocolTopic, UnescapeAcceptsOnlyTheEscapedForm)
{
    for (const char* level : {"", "a%2fb", "%41", "a%2", "a%G0", "a b", "a/b", "+", "%%", "\xC3\xBC", "%-"}) {
        SCOPED_TRACE(level);
        EXPECT_THROW(UnescapeTopicLevel(level), ProtocolError);
    }
}

TEST(ProtocolTopic, TopicsAndTheirParsing)
{
    EXPECT_EQ(ProcessTopic("boiler", TopicKind::State), "orvek/v1/boiler/state");
    EXPECT_EQ(NamedTopic("my proc", TopicKind::WriteResult, "a/b"), "orvek/v1/my%20proc/write-result/a%2Fb");
    EXPECT_EQ(NamedTopicFilter("boiler", TopicKind::Alarm), "orvek/v1/boiler/alarm/+");

    for (const TopicKind kind : {TopicKind::Value, TopicKind::Write, TopicKind::WriteResult, TopicKind::Alarm,
                                 TopicKind::AlarmAck}) {
        const ParsedTopic parsed = ParseTopic(NamedTopic("p/q", kind, ""));
        EXPECT_EQ(parsed.process, "p/q");
        EXPECT_EQ(parsed.kind, kind);
        EXPECT_EQ(parsed.name, "");
    }
    const ParsedTopic catalogue = ParseTopic("orvek/v1/%C3%BC/catalogue");
    EXPECT_EQ(catalogue.process, "\xC3\xBC");
    EXPECT_EQ(catalogue.kind, TopicKind::Catalogue);

    for (const char* topic : {"orvek/v2/p/state", "orvek/v1/p", "orvek/v1/p/status", "orvek/v1/p/state/x",
                              "orvek/v1/p/value", "orvek/v1/p/value/a/b", "orvek/v1//state", "orvek/v1/p/value/a%2f"}) {
        SCOPED_TRACE(topic);
        EXPECT_THROW(ParseTopic(topic), ProtocolError);
    }
}

TEST(ProtocolTopic, VariablePathIsThePrintedPathAfterTheProcess)
{
    EXPECT_EQ(ProcessName(Url(u"\\\\h\\boiler\\drum.level")), "boiler");
    EXPECT_EQ(VariablePath(Url(u"\\\\h\\boiler\\drum.level")), "drum.level");
    EXPECT_EQ(VariablePath(Url(u"\\\\h\\p\\a\\'x.y'")), "a\\'x.y'");
    EXPECT_EQ(VariablePath(Url(u"\\\\h\\p\\a b/c")), "a b/c");
    EXPECT_EQ(ValueTopic(Url(u"\\\\h\\p\\a\\'x.y'")), "orvek/v1/p/value/a%5C%27x.y%27");

    for (const char16_t* text : {u"\\\\h\\p", u"\\\\h", u"\\\\.\\p\\", u"a.b", u"\\a\\b"}) {
        SCOPED_TRACE(testing::PrintToString(std::u16string(text)));
        EXPECT_THROW(VariablePath(Url(text)), qv::fen::exception::InvalidArgument);
    }
    OrvekURL upward = Url(u"\\\\h\\p\\a");
    qv::fen::Vector<OrvekURL::Segment> segments = upward.GetSegments();
    segments.push_back(OrvekURL::Segment(u'\\'));
    upward.SetSegments(segments);
    EXPECT_THROW(VariablePath(upward), qv::fen::exception::InvalidArgument);
}

TEST(ProtocolTopic, EquivalentUrlsShareOneTopic)
{
    const std::pair<const char16_t*, const char16_t*> same[] = {
        {u"\\\\h\\p\\drum.level", u"\\\\other\\p\\'drum'.'level'"},
        {u"\\\\h\\p\\drum.level", u"\\\\.\\p\\drum.level\\"},
        {u"\\\\h\\'p'\\x", u"\\\\h\\p\\x"},
        {u"\\\\h\\p\\'x''y.z'", u"\\\\H\\p\\'x''y.z'\\"},
        {u"\\\\h\\p\\a.", u"\\\\h\\p\\'a.'"},
    };
    for (const auto& [a, b] : same)
        EXPECT_EQ(ValueTopic(Url(a)), ValueTopic(Url(b)));
    // The separators are part of the name: a.b and a\b are two variables.
    EXPECT_NE(ValueTopic(Url(u"\\\\h\\p\\a.b")), ValueTopic(Url(u"\\\\h\\p\\a\\b")));
    EXPECT_NE(ValueTopic(Url(u"\\\\h\\p\\a.b")), ValueTopic(Url(u"\\\\h\\p\\'a.b'")));
}

TEST(ProtocolTopic, CanonicalVariablePath)
{
    EXPECT_EQ(CanonicalVariablePath("drum.level"), "drum.level");
    EXPECT_EQ(CanonicalVariablePath("'drum'.level\\"), "drum.level");
    for (const char* path : {"", "a..b", "\\a", "..\\a", "'open", "a\r"}) {
        SCOPED_TRACE(path);
        EXPECT_THROW(CanonicalVariablePath(path), ProtocolError);
    }
}

TEST(ProtocolText, Utf16AndUtf8)
{
    const std::u16string texts[] = {u"", u"abc", u"\u00FC\u20AC\U0001F600", std::u16string(u"\xD800", 1),
                                    std::u16string(u"x\xDC00\xD800", 3)};
    for (const std::u16string& text : texts) {
        EXPECT_EQ(Utf16FromUtf8(Utf8FromUtf16(text)), text);
        EXPECT_EQ(IsValidUtf8(Utf8FromUtf16(text)), IsWellFormedUtf16(text));
    }
    for (const char* bad : {"\x80", "\xC0\xAF", "\xE0\x80\xAF", "\xF4\x90\x80\x80", "\xC3", "\xF8\x88\x80\x80\x80"}) {
        EXPECT_FALSE(IsValidUtf8(bad));
        EXPECT_THROW(Utf16FromUtf8(bad), ProtocolError);
    }
    EXPECT_FALSE(IsValidUtf8("\xED\xA0\x80")); // a surrogate code point
}

TEST(ProtocolText, Base64)
{
    const std::pair<std::string, std::string> vectors[] = {
        {"", ""}, {"f", "Zg=="}, {"fo", "Zm8="}, {"foo", "Zm9v"}, {"foob", "Zm9vYg=="}, {"fooba", "Zm9vYmE="},
        {"foobar", "Zm9vYmFy"}};
    for (const auto& [bytes, text] : vectors) {
        EXPECT_EQ(Base64Encode(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size()), text);
        const std::vector<std::uint8_t> decoded = Base64Decode(text);
        EXPECT_EQ(std::string(decoded.begin(), decoded.end()), bytes);
    }
    for (const char* bad : {"Zg=", "Zh==", "Zm9=", "Z===", "====", "Zg==Zg==", "Zm 9v", "Zm9v\n"})
        EXPECT_THROW(Base64Decode(bad), ProtocolError) << bad;
}
