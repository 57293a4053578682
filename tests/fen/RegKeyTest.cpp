#include "fen/osdep/OSException.h"
#include "fen/osdep/RegKey.h"

#include "OsdepTestSupport.h"
#include "support/TemporaryHome.h"

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

using namespace qv::fen;
using namespace qv::fen::osdep;

namespace {

/// The Win32 code of the WinError that `action` throws; 0 when it throws nothing.
template <typename Action>
std::uint32_t CodeOf(Action action)
{
    try {
        action();
    } catch (const WinError& e) {
        return e.GetOSErrorCode();
    }
    return 0;
}

class RegKeyTest : public ::testing::Test {
protected:
    std::string UserStore() const { return (home_.Home() / "HKEY_CURRENT_USER.reg").string(); }

    qv::test::TemporaryHome home_;
};

} // namespace

TEST_F(RegKeyTest, PathIsThePrefixAndTheSubkey)
{
    RegKey created(kCurrentUser, u"Varoscope\\Recent", false, true);
    EXPECT_EQ(created.GetPath(), WString(u"Software\\Quorvane\\Varoscope\\Recent"));
    created.SetStringValue(u"File1", u"a.vsd");
    // An empty prefix takes the path as given; another prefix replaces the default.
    EXPECT_EQ(RegKey(kCurrentUser, u"Software\\Quorvane\\Varoscope\\Recent", true, false, u"").GetStringValue(u"File1"),
              WString(u"a.vsd"));
    EXPECT_EQ(RegKey(kCurrentUser, u"Recent", true, false, u"Software\\Quorvane\\Varoscope\\").GetStringValue(u"File1"),
              WString(u"a.vsd"));
    EXPECT_EQ(RegKey(kCurrentUser, u"").GetPath(), WString(u"Software\\Quorvane"));

    EXPECT_EQ(CodeOf([] { RegKey(kCurrentUser, u"\\Leading", true, true); }), 161u);
    EXPECT_EQ(CodeOf([] { RegKey(kCurrentUser, u"a\\\\b", true, true); }), 161u);
}

TEST_F(RegKeyTest, AccessRightsAndRoots)
{
    RegKey(kLocalMachine32, u"App", false, true).SetStringValue(u"v", u"machine");
    RegKey(kCurrentUser, u"App", false, true).SetStringValue(u"v", u"user");
    const std::tuple<std::uint32_t, bool, bool, std::uint32_t> rows[] = {
        {kLocalMachine, true, false, 0x20009},  {kLocalMachine, false, false, 0x2000F},
        {kLocalMachine, true, true, 0x2000F},   {kLocalMachine32, true, false, 0x20209},
        {kLocalMachine64, false, false, 0x2010F},
    };
    for (const auto& [root, readOnly, create, access] : rows) {
        RegKey key(root, u"App", readOnly, create);
        EXPECT_EQ(key.GetAccess(), access) << root << readOnly << create;
        EXPECT_EQ(key.GetStringValue(u"v"), WString(u"machine")); // the views share one store
    }
    EXPECT_EQ(RegKey(kCurrentUser, u"App").GetStringValue(u"v"), WString(u"user"));
    EXPECT_EQ(CodeOf([] { RegKey(kUsers, u"App"); }), 2u);
    EXPECT_EQ(CodeOf([] { RegKey(6, u"App", false, true); }), 6u);

    RegKey readOnly(kLocalMachine, u"App");
    EXPECT_EQ(CodeOf([&] { readOnly.SetStringValue(u"v", u"x"); }), 5u);
    EXPECT_EQ(CodeOf([&] { readOnly.DeleteValue(u"v"); }), 5u);
    EXPECT_EQ(CodeOf([&] { readOnly.DeleteSubkey(u"x"); }), 5u);
    RegKey(kLocalMachine, u"App", false).SetStringValue(u"v", u"changed");
    EXPECT_EQ(readOnly.GetStringValue(u"v"), WString(u"changed")); // read afresh
}

TEST_F(RegKeyTest, MissingKeysAndValues)
{
    EXPECT_EQ(CodeOf([] { RegKey(kCurrentUser, u"Nowhere"); }), 2u);
    EXPECT_EQ(CodeOf([] { RegKey(kCurrentUser, u"Nowhere", false); }), 2u);
    EXPECT_FALSE(std::filesystem::exists(UserStore()));

    RegKey key(kCurrentUser, u"Here", false, true);
    EXPECT_EQ(CodeOf([&] { key.GetStringValue(u"absent", nullptr, true); }), 2u);
    const WString fallback(u"fallback");
    EXPECT_EQ(key.GetStringValue(u"absent", &fallback, false), fallback);
    EXPECT_EQ(key.GetStringValue(u"absent", nullptr, false), WString());
    EXPECT_FALSE(key.GetValue(u"absent").has_value());
    EXPECT_EQ(CodeOf([&] { key.DeleteValue(u"absent"); }), 2u);
    EXPECT_EQ(CodeOf([&] { key.DeleteSubkey(u"absent"); }), 2u);
}

TEST_F(RegKeyTest, StringValuesByType)
{
    RegKey key(kCurrentUser, u"Strings", false, true);
    key.SetStringValue(u"plain", u"text");
    key.SetStringValue(u"expand", u"%HOME%\\data", true);
    key.SetValue(u"nul", Sz(std::u16string(u"before\0after", 12)));
    key.SetValue(u"count", Number(kRegDword, 7));
    key.SetValue(u"list", MultiSz({}));

    EXPECT_EQ(key.GetStringValue(u"plain"), WString(u"text"));
    EXPECT_EQ(key.GetStringValue(u"expand"), WString(u"%HOME%\\data"));
    EXPECT_EQ(key.GetValue(u"expand")->type, kRegExpandSz);
    EXPECT_EQ(key.GetStringValue(u"nul").length(), 6u);
    EXPECT_EQ(key.GetValue(u"nul")->text.size(), 12u);

    EXPECT_THROW(key.GetStringValue(u"count"), exception::InvalidOperation);
    EXPECT_THROW(key.GetStringValue(u"list", nullptr, true), exception::InvalidOperation);
    const WString fallback(u"none");
    EXPECT_EQ(key.GetStringValue(u"count", &fallback, false), fallback);
}

TEST_F(RegKeyTest, SetValueKeepsWhatItsTypeUses)
{
    RegKey key(kCurrentUser, u"Typed", false, true);
    key.SetValue(u"link", Bytes(6, {0x41, 0}));
    RegValue stray = Sz(u"s");
    stray.number = 5;
    stray.bytes = {1};
    key.SetValue(u"stray", stray);
    EXPECT_EQ(key.GetValue(u"link"), Bytes(6, {0x41, 0}));
    EXPECT_EQ(key.GetValue(u"stray"), Sz(u"s"));

    const std::string before = ReadBytes(UserStore());
    EXPECT_EQ(CodeOf([&] { key.SetValue(u"dword", Number(kRegDword, 0x100000000u)); }), 87u);
    EXPECT_EQ(ReadBytes(UserStore()), before);
}

TEST_F(RegKeyTest, NamesIgnoreCaseButKeepIt)
{
    RegKey key(kCurrentUser, u"MixedCase\\Inner", false, true);
    key.SetStringValue(u"Recent", u"one");
    RegKey(kCurrentUser, u"MIXEDCASE\\inner", false).SetStringValue(u"RECENT", u"two");
    EXPECT_EQ(key.GetStringValue(u"recent"), WString(u"two"));
    // WString compares without case, so the spelling is checked on the raw text.
    const std::vector<WString> names = key.EnumerateValues();
    ASSERT_EQ(names.size(), 1u);
    EXPECT_EQ(std::u16string_view(names[0].c_str()), u"Recent");
    EXPECT_EQ(std::u16string_view(RegKey(kCurrentUser, u"mixedcase").EnumerateSubkeys().at(0).c_str()), u"Inner");
}

TEST_F(RegKeyTest, SubkeysAndValuesEnumerateAndDelete)
{
    RegKey parent(kCurrentUser, u"Tree", false, true);
    RegKey(kCurrentUser, u"Tree\\b\\deep", false, true).SetStringValue(u"v", u"x");
    RegKey(kCurrentUser, u"Tree\\a", false, true);
    parent.SetStringValue(u"z", u"1");
    parent.SetStringValue(u"y", u"2");
    EXPECT_EQ(parent.EnumerateSubkeys(), (std::vector<WString>{u"b", u"a"}));
    EXPECT_EQ(parent.EnumerateValues(), (std::vector<WString>{u"z", u"y"}));

    RegKey deep(kCurrentUser, u"Tree\\b\\deep");
    parent.DeleteSubkey(u"B");
    EXPECT_EQ(parent.EnumerateSubkeys(), std::vector<WString>{u"a"});
    EXPECT_EQ(CodeOf([] { RegKey(kCurrentUser, u"Tree\\b\\deep"); }), 2u);
    EXPECT_EQ(CodeOf([&] { deep.GetStringValue(u"v"); }), 1018u); // deleted under an open key
    EXPECT_EQ(CodeOf([&] { parent.DeleteSubkey(u""); }), 87u);      // never the key itself
    parent.DeleteValue(u"Z");
    EXPECT_EQ(parent.EnumerateValues(), std::vector<WString>{u"y"});
}

TEST_F(RegKeyTest, RemoteMachineFailsBeforeTouchingAnything)
{
    EXPECT_EQ(CodeOf([] { RegKey(kLocalMachine, u"Orvek", true, false, nullptr, u"\\\\plant-a"); }), 53u);
    EXPECT_EQ(CodeOf([] { RegKey(9, u"Orvek", false, true, nullptr, u"plant-a"); }), 53u);
    EXPECT_TRUE(std::filesystem::is_empty(home_.Home()));
    RegKey(kLocalMachine, u"Orvek", false, true, nullptr, u"").SetStringValue(u"MachineName", u"plant-a");
    EXPECT_EQ(RegKey(kLocalMachine, u"Orvek").GetStringValue(u"MachineName"), WString(u"plant-a"));
}

TEST_F(RegKeyTest, HandEditsAreSeenAndCorruptFilesRefused)
{
    RegKey key(kCurrentUser, u"Edited", false, true);
    WriteBytes(UserStore(), "[Software\\Quorvane\\Edited]\n\"v\"=sz:\"by hand\"\n");
    EXPECT_EQ(key.GetStringValue(u"v"), WString(u"by hand"));

    const std::string corrupt = "[Software\\Quorvane\\Edited]\n\"v\"=sz:\"by hand\"\n\"w\"=sz:\"unclosed\n";
    WriteBytes(UserStore(), corrupt);
    const std::function<void()> actions[] = {
        [&] { key.GetStringValue(u"v"); },
        [&] { key.SetStringValue(u"x", u"y"); },
        [&] { key.DeleteValue(u"v"); },
        [] { RegKey(kCurrentUser, u"New", false, true); },
    };
    for (const auto& action : actions) {
        try {
            action();
            ADD_FAILURE() << "no error";
        } catch (const WinError& e) {
            EXPECT_EQ(e.GetOSErrorCode(), 1009u);
            EXPECT_NE(std::string(e.what()).find(UserStore() + ": line 3"), std::string::npos) << e.what();
        }
        EXPECT_EQ(ReadBytes(UserStore()), corrupt);
    }
    const WString fallback(u"fallback");
    EXPECT_EQ(key.GetStringValue(u"v", &fallback, false), fallback);
}

TEST_F(RegKeyTest, TwoProcessesWritingAtOnceLoseNothing)
{
    constexpr int kPerProcess = 200;
    auto nameOf = [](int p, int i) { return std::to_string(p) + "-" + std::to_string(i); };
    RegKey key(kCurrentUser, u"Concurrent", false, true);
    int gate[2];
    ASSERT_EQ(::pipe(gate), 0);
    pid_t children[2];
    for (int p = 0; p < 2; ++p) {
        children[p] = ::fork();
        ASSERT_GE(children[p], 0);
        if (children[p] == 0) {
            ::close(gate[1]);
            char byte;
            [[maybe_unused]] ssize_t n = ::read(gate[0], &byte, 1); // returns once the parent closes the gate
            int status = 0;
            try {
                for (int i = 0; i < kPerProcess; ++i)
                    key.SetStringValue(WString(nameOf(p, i).c_str()), WString(("value " + nameOf(p, i)).c_str()));
            } catch (...) {
                status = 1;
            }
            ::_exit(status);
        }
    }
    ::close(gate[0]);
    ::close(gate[1]);
    for (pid_t child : children) {
        int status = 0;
        ASSERT_EQ(::waitpid(child, &status, 0), child);
        EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
    }

    EXPECT_EQ(key.EnumerateValues().size(), 2u * kPerProcess);
    for (int p = 0; p < 2; ++p)
        for (int i = 0; i < kPerProcess; ++i)
            EXPECT_EQ(key.GetStringValue(WString(nameOf(p, i).c_str())), WString(("value " + nameOf(p, i)).c_str()));
    std::vector<std::string> files;
    for (const auto& entry : std::filesystem::directory_iterator(home_.Home()))
        files.push_back(entry.path().filename().string());
    std::sort(files.begin(), files.end());
    EXPECT_EQ(files, (std::vector<std::string>{"HKEY_CURRENT_USER.reg", "HKEY_CURRENT_USER.reg.lock"}));
}
