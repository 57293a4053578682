#include "WatchCommandLine.h"

#include <gtest/gtest.h>

#include <stdexcept>

namespace qv::test {
namespace {

using tools::ParseWatchCommandLine;

TEST(WatchCommandLine, TakesAListUrlsAndOptions)
{
    const auto line = ParseWatchCommandLine({"--digits", "4", "--hex", "Plant.VSD", "\\\\h\\p\\a", "--save", "out.vsd",
                                             "--seconds", "2.5", "--no-services", "\\\\h\\p\\b"});
    EXPECT_EQ(line.documentPath, "Plant.VSD");
    EXPECT_EQ(line.urls, (std::vector<std::string>{"\\\\h\\p\\a", "\\\\h\\p\\b"}));
    EXPECT_EQ(line.digits, 4u);
    EXPECT_TRUE(line.hexForRawData);
    EXPECT_FALSE(line.xxForBadQuality);
    EXPECT_EQ(line.savePath, "out.vsd");
    EXPECT_EQ(line.seconds, 2.5);
    EXPECT_FALSE(line.ensureServices);
}

TEST(WatchCommandLine, RefusesBadValuesWithAMessage)
{
    for (const std::vector<std::string>& bad :
         {std::vector<std::string>{"--digits", "13"}, {"--digits", "0"}, {"--digits", "4x"}, {"--digits"},
          {"--seconds", "-1"}, {"--save"}, {"--colour"}, {"a.vsd", "b.vsd"}}) {
        try {
            ParseWatchCommandLine(bad);
            ADD_FAILURE() << "accepted " << bad[0];
        } catch (const std::invalid_argument& e) {
            EXPECT_NE(std::string(e.what()), "");
        }
    }
}

} // namespace
} // namespace qv::test
