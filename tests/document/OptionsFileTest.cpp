#include "document/OptionsFile.h"

#include "support/TemporaryHome.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

using namespace std::string_literals;
using namespace qv::document;

TEST(DocumentOptionsFile, DecodesValidFilesAndResetsInvalidOnes)
{
    DisplayOptions expected;
    expected.autoloadLastView = true;
    const std::string bytes = "\x01\x00\x01\x00\x0C\x3F"s;
    EXPECT_EQ(DecodeOptions(bytes), expected);
    EXPECT_EQ(EncodeOptions(expected), bytes);

    const DisplayOptions custom{false, true, false, true, 3, 0x05};
    EXPECT_EQ(DecodeOptions(EncodeOptions(custom)), custom);

    // Digits outside 1..12 or no column: every option returns to its default,
    // autoload included.
    for (const std::string& invalid : {"\x01\x01\x00\x01\x0D\x3F"s, "\x01\x01\x00\x01\x00\x3F"s,
                                      "\x01\x01\x00\x01\x05\x00"s})
        EXPECT_EQ(DecodeOptions(invalid), DisplayOptions{}) << testing::PrintToString(invalid);
}

TEST(DocumentOptionsFile, ShortFilesTakeDefaultsForTheMissingBytes)
{
    DisplayOptions expected;
    EXPECT_EQ(DecodeOptions(""), expected);
    expected.autoloadLastView = true;
    EXPECT_EQ(DecodeOptions("\x01"), expected);
    expected.decimalDigits = 5;
    EXPECT_EQ(DecodeOptions("\x01\x00\x01\x00\x05"s), expected);
    EXPECT_EQ(DecodeOptions("\x01\x00\x01\x00\x05\x3F" "extra"s), expected);
}

TEST(DocumentOptionsFile, LivesInTheConfigurationDirectoryAndIsReplacedWhole)
{
    const qv::test::TemporaryHome home;
    const std::string path = OptionsFilePath();
    EXPECT_EQ(path, (home.Home() / "qv_vsmb.dat").string());
    EXPECT_EQ(AutoLoadFilePath(), (home.Home() / "AutoLoad.vsd").string());

    EXPECT_EQ(ReadOptionsFile(path), DisplayOptions{});
    std::ofstream(path, std::ios::binary) << "\x01\x01\x01\x01\x02\x03" "old tail";
    DisplayOptions options;
    options.decimalDigits = 7;
    WriteOptionsFile(path, options);
    EXPECT_EQ(std::filesystem::file_size(path), 6u);
    EXPECT_EQ(ReadOptionsFile(path), options);
    EXPECT_EQ(std::distance(std::filesystem::directory_iterator(home.Home()), {}), 1) << "a temporary file is left";
}
