#include "fen/osdep/OSException.h"
#include "fen/osdep/SharedLibrary.h"

#include <gtest/gtest.h>

using namespace qv::fen;
using qv::fen::osdep::SharedLibrary;
using qv::fen::osdep::WinError;

TEST(SharedLibrary, NameRule)
{
    const std::pair<const char16_t*, const char16_t*> rows[] = {
        {u"", u""}, {u"mpr", u"mpr.so"}, {u"mpr.dll", u"mpr.dll"}, {u"dir.d\\mpr", u"dir.d\\mpr.so"},
        {u"/opt/app.d/libplugin", u"/opt/app.d/libplugin.so"}, {u"dir\\", u"dir\\"},
    };
    for (const auto& [name, loaded] : rows)
        EXPECT_EQ(SharedLibrary::NormalizeName(WString(name)).View(), loaded);
}

TEST(SharedLibrary, LoadsAndFindsSymbols)
{
    SharedLibrary math(WString(u"libm.so.6"));
    ASSERT_NE(math.GetModule(), nullptr);
    auto cosine = reinterpret_cast<double (*)(double)>(math.GetSymbol("cos"));
    ASSERT_NE(cosine, nullptr);
    EXPECT_DOUBLE_EQ(cosine(0.0), 1.0);
    EXPECT_NE(math.GetSymbol(WString(u"sin")), nullptr);

    EXPECT_EQ(math.GetSymbol("no_such_symbol_here", true), nullptr);
    try {
        math.GetSymbol("no_such_symbol_here");
        ADD_FAILURE() << "a missing symbol must throw";
    } catch (const WinError& e) {
        EXPECT_EQ(e.GetOSErrorCode(), 127u);
    }

    math.Unload();
    EXPECT_EQ(math.GetModule(), nullptr);
    EXPECT_NE(math.Load(), nullptr);
}

TEST(SharedLibrary, SymbolsOfALibraryThatDidNotLoad)
{
    SharedLibrary missing(WString(u"libvaroscope-does-not-exist"));
    EXPECT_EQ(missing.GetModule(), nullptr);
    EXPECT_EQ(missing.GetSymbol("anything", true), nullptr);
    try {
        missing.GetSymbol("anything");
        ADD_FAILURE() << "expected library not loaded";
    } catch (const WinError& e) {
        EXPECT_STREQ(e.what(), "library not loaded");
        EXPECT_EQ(e.GetOSErrorCode(), 9999u);
    }
}
