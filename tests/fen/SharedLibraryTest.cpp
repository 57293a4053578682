#include "fen/osdep/OSException.h"
#include "fen/osdep/SharedLibrary.h"

#include <cmath>
#include <gtest/gtest.h>

using namespace qv::fen;
using qv::fen::osdep::SharedLibrary;
using qv::fen::osdep::WinError;

TEST(SharedLibrary, NameRule)
{
    struct Row {
        const char16_t* name;
        const char16_t* loaded;
    };
    const Row rows[] = {
        {u"", u""},
        {u"mpr", u"mpr.so"},
        {u"mpr.dll", u"mpr.dll"},
        {u"libm.so.6", u"libm.so.6"},
        {u"dir.d\\mpr", u"dir.d\\mpr.so"},
        {u"/opt/app.d/libplugin", u"/opt/app.d/libplugin.so"},
        {u"dir\\", u"dir\\"},
    };
    for (const Row& row : rows)
        EXPECT_EQ(SharedLibrary::NormalizeName(WString(row.name)).View(), row.loaded);
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
