#include "fen/osdep/AtomicFile.h"
#include "fen/osdep/OSException.h"

#include "OsdepTestSupport.h"
#include "support/TemporaryHome.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

using namespace qv::fen::osdep;

namespace {

unsigned ModeOf(const std::string& path)
{
    struct stat info {};
    EXPECT_EQ(::stat(path.c_str(), &info), 0);
    return info.st_mode & 07777;
}

} // namespace

TEST(AtomicFile, ReplacesContentsKeepsPermissionsAndLeavesNoTemporary)
{
    const qv::test::TemporaryHome temp;
    const std::string dir = temp.Home().string();
    const std::string file = dir + "/options.dat";
    const mode_t mask = ::umask(022);
    WriteFileAtomically(file, std::string("first\0bytes", 11));
    EXPECT_EQ(ReadBytes(file), std::string("first\0bytes", 11));
    EXPECT_EQ(ModeOf(file), 0644u);
    ASSERT_EQ(::chmod(file.c_str(), 0600), 0);
    WriteFileAtomically(file, "second");
    ::umask(mask);
    EXPECT_EQ(ReadBytes(file), "second");
    EXPECT_EQ(ModeOf(file), 0600u);

    // Failures: no directory to write in; a directory in the way of the rename.
    try {
        WriteFileAtomically(dir + "/missing/file", "x");
        ADD_FAILURE() << "wrote into a missing directory";
    } catch (const WinError& e) {
        EXPECT_EQ(e.GetOSErrorCode(), 2u);
        EXPECT_NE(std::string(e.what()).find("missing/file"), std::string::npos) << e.what();
    }
    std::filesystem::create_directory(dir + "/taken");
    EXPECT_THROW(WriteFileAtomically(dir + "/taken", "x"), WinError);
    std::size_t entries = 0;
    for ([[maybe_unused]] const auto& entry : std::filesystem::directory_iterator(dir))
        ++entries;
    EXPECT_EQ(entries, 2u);
}
