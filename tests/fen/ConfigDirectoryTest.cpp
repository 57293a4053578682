#include "fen/osdep/ConfigDirectory.h"

#include "OsdepTestSupport.h"
#include "support/TemporaryHome.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

using namespace qv::fen::osdep;

TEST(ConfigDirectory, ChosenByTheEnvironmentAndCreatedPrivate)
{
    const qv::test::TemporaryHome temp;
    const std::string base = temp.Home().string();
    qv::test::ScopedEnvironment home("HOME", base + "/home");
    {
        qv::test::ScopedEnvironment own("VAROSCOPE_HOME", base + "/own/dir");
        qv::test::ScopedEnvironment xdg("XDG_CONFIG_HOME", base + "/xdg");
        EXPECT_EQ(ConfigDirectory(), base + "/own/dir");
    }
    {
        // Empty counts as unset, and a trailing slash changes nothing.
        qv::test::ScopedEnvironment own("VAROSCOPE_HOME", "");
        qv::test::ScopedEnvironment xdg("XDG_CONFIG_HOME", base + "/xdg/");
        EXPECT_EQ(ConfigDirectory(), base + "/xdg/varoscope");
    }
    {
        qv::test::ScopedEnvironment own("VAROSCOPE_HOME", "");
        qv::test::ScopedEnvironment xdg("XDG_CONFIG_HOME", "relative/ignored");
        EXPECT_EQ(ConfigDirectory(), base + "/home/.config/varoscope");
    }
    for (const char* created : {"/own", "/own/dir", "/xdg/varoscope", "/home", "/home/.config/varoscope"}) {
        struct stat info {};
        ASSERT_EQ(::stat((base + created).c_str(), &info), 0) << created;
        EXPECT_TRUE(S_ISDIR(info.st_mode)) << created;
        EXPECT_EQ(info.st_mode & 0777, 0700u) << created;
    }

    WriteBytes(base + "/file", "x");
    qv::test::ScopedEnvironment own("VAROSCOPE_HOME", base + "/file");
    EXPECT_ANY_THROW(ConfigDirectory());
}
