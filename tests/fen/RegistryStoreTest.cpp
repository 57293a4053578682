#include "fen/osdep/OSException.h"
#include "fen/osdep/RegistryFormat.h"

#include "OsdepTestSupport.h"


#include <gtest/gtest.h>

using namespace qv::fen::osdep;
using namespace qv::fen::osdep::registry;

namespace {

StoredKey& Key(StoredKey& root, std::vector<std::u16string> path)
{
    bool created = false;
    return root.Obtain(path, created);
}

void ExpectSameTree(const StoredKey& a, const StoredKey& b)
{
    EXPECT_EQ(a.Name(), b.Name());
    ASSERT_EQ(a.Values().size(), b.Values().size());
    for (std::size_t i = 0; i < a.Values().size(); ++i) {
        EXPECT_EQ(a.Values()[i].name, b.Values()[i].name);
        EXPECT_EQ(a.Values()[i].value, b.Values()[i].value);
    }
    ASSERT_EQ(a.Subkeys().size(), b.Subkeys().size());
    for (std::size_t i = 0; i < a.Subkeys().size(); ++i)
        ExpectSameTree(a.Subkeys()[i], b.Subkeys()[i]);
}

} // namespace

TEST(RegistryStore, EveryTypeAndAwkwardTextRoundTrip)
{
    StoredKey root;
    root.SetValue(u"at root", Sz(u"x"));
    StoredKey& key = Key(root, {u"Software", u"Quorvane", u"Varoscope"});
    key.SetValue(u"", Sz(u"default value"));
    key.SetValue(u"quotes \"and\" \\ = ;", Sz(u"a \"b\" c\\d\ne\rf\tg"));
    key.SetValue(u"nul", Sz(std::u16string(u"before\0after", 12)));
    key.SetValue(u"controls", Sz(u"\x01\x1F\x7F"));
    key.SetValue(u"unicode \u00E9", Sz(u"\u00B0C \u6E29 \U0001F600"));
    key.SetValue(u"lone surrogates", Sz(u"\xD800x\xDC00"));
    key.SetValue(u"expand", Sz(u"%HOME%\\data", kRegExpandSz));
    key.SetValue(u"no strings", MultiSz({}));
    key.SetValue(u"one empty string", MultiSz({u""}));
    key.SetValue(u"list", MultiSz({u"a,b", u"\"c\"", u"d\ne"}));
    key.SetValue(u"dword", Number(kRegDword, 0xFFFFFFFFu));
    key.SetValue(u"qword", Number(kRegQword, UINT64_MAX));
    key.SetValue(u"no bytes", Bytes(kRegBinary, {}));
    key.SetValue(u"none", Bytes(kRegNone, {0x01}));
    key.SetValue(u"highest type", Bytes(0xFFFFFFFFu, {0xAB, 0x00}));
    Key(root, {u"Software", u"Empty leaf"});
    Key(root, {u"Odd [names] ] here", u"  spaced  ", u"\u6E29\u5EA6"}).SetValue(u"v", Number(kRegDword, 0));

    ExpectSameTree(root, ParseStore(FormatStore(root, "HKEY_CURRENT_USER"), "test.reg"));
}

TEST(RegistryStore, TextIsPlainAndStable)
{
    // Stored files are read back by later versions and edited by hand, so
    // the exact text is pinned here.
    StoredKey root;
    StoredKey& key = Key(root, {u"Software", u"Quorvane"});
    key.SetValue(u"Name", Sz(u"say \"hi\"\\\n"));
    key.SetValue(u"Path", Sz(u"%HOME%", kRegExpandSz));
    key.SetValue(u"List", MultiSz({u"a", u"b"}));
    key.SetValue(u"Count", Number(kRegDword, 42));
    key.SetValue(u"Total", Number(kRegQword, 68719476736));
    key.SetValue(u"Blob", Bytes(kRegBinary, {0x00, 0xFF, 0x10}));
    key.SetValue(u"Odd", Bytes(5, {1, 0}));
    Key(root, {u"Software", u"Quorvane", u"Empty"});
    EXPECT_EQ(FormatStore(root, "HKEY_CURRENT_USER"),
              "; Varoscope registry store, HKEY_CURRENT_USER: a [key path] section per key, "
              "a \"name\"=type:data line per value, UTF-8.\n\n"
              "[Software\\Quorvane]\n"
              "\"Name\"=sz:\"say \\\"hi\\\"\\\\\\n\"\n"
              "\"Path\"=expand_sz:\"%HOME%\"\n"
              "\"List\"=multi_sz:\"a\",\"b\"\n"
              "\"Count\"=dword:42\n"
              "\"Total\"=qword:68719476736\n"
              "\"Blob\"=binary:00 ff 10\n"
              "\"Odd\"=hex(5):01 00\n\n"
              "[Software\\Quorvane\\Empty]\n");
}

TEST(RegistryStore, HandEditedTextIsAccepted)
{
    const StoredKey root = ParseStore("\xEF\xBB\xBF# written by hand\r\n\r\n"
                                      "  [Software\\Quorvane\\App]  \r\n"
                                      "  \"Count\" = dword: 0x2A\r\n"
                                      "\"List\"=multi_sz: \"a\" , \"b\"\r\n"
                                      "\"Bytes\"=binary:0aff 01\r\n"
                                      "[software\\QUORVANE]\r\n"
                                      "\"Top\"=sz:\"t\"\r\n"
                                      "[]\n"
                                      "\"Root\"=sz:\"r\"",
                                      "hand.reg");
    const StoredKey* app = root.Find({u"SOFTWARE", u"Quorvane", u"APP"});
    ASSERT_NE(app, nullptr);
    EXPECT_EQ(*app->FindValue(u"count"), Number(kRegDword, 42));
    EXPECT_EQ(*app->FindValue(u"List"), MultiSz({u"a", u"b"}));
    EXPECT_EQ(*app->FindValue(u"Bytes"), Bytes(kRegBinary, {0x0A, 0xFF, 0x01}));
    // A key keeps the spelling of the section that first named it.
    EXPECT_EQ(root.Subkeys()[0].Subkeys()[0].Name(), u"Quorvane");
    EXPECT_EQ(root.Find({u"Software", u"Quorvane"})->FindValue(u"top")->text, u"t");
    EXPECT_EQ(root.FindValue(u"Root")->text, u"r");
}

TEST(RegistryStore, FaultsNameTheFileAndTheLine)
{
    const std::pair<std::string, int> rows[] = {
        {"\"a\"=sz:\"value before any section\"\n", 1},
        {"[k]\n\"a\"=string:\"x\"\n", 2},                    // unknown type
        {"[k]\n\n\"a\"=sz:\"x\n", 3},                        // unclosed string
        {"[k]\n\"a\"=sz:\"\\q\"\n", 2},                      // unknown escape
        {"[k]\n\"a\"=dword:4294967296\n", 2},                // too big
        {"[k]\n\"a\"=binary:0\n", 2},                        // odd digits
        {"[k]\n\"a\"=sz:\"x\" y\n", 2},                      // text after the value
        {"[k]\n\"Name\"=sz:\"x\"\n\"NAME\"=sz:\"y\"\n", 3}, // the same name twice
        {"[k\n", 1},
        {"[a\\\\b]\n", 1},                                   // empty key name
        {"[k]\n\"a\"=sz:\"\xC3\x28\"\n", 2},                 // invalid UTF-8
        {"[k]\n\"a\"=hex(4):01 00 00 00\n", 2},              // a named type as hex
    };
    for (const auto& [text, line] : rows) {
        try {
            ParseStore(text, "/some/dir/HKEY_USERS.reg");
            ADD_FAILURE() << text << ": parsed";
        } catch (const WinError& e) {
            EXPECT_EQ(e.GetOSErrorCode(), 1009u) << text;
            EXPECT_NE(std::string(e.what()).find("/some/dir/HKEY_USERS.reg: line " + std::to_string(line) + ":"),
                      std::string::npos)
                << e.what();
        }
    }
}
