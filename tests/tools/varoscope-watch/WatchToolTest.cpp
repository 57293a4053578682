// varoscope-watch on the shipped demo list against orvek-sim on a broker of
// the test's own: every item of the list shows live values.

#include "network/RealTimeTestSupport.h"
#include "network/SimulatorProcess.h"

#include "document/DocumentFile.h"

#include <gtest/gtest.h>

#include <set>
#include <sstream>

namespace qv::test {
namespace {

using namespace std::chrono_literals;

TEST(WatchTool, ShowsTheDemoPlantLiveAndSavesTheList)
{
    TemporaryHome home;
    TestBroker broker;
    SetDataPort(broker.Port());
    Simulator sim({"--port", std::to_string(broker.Port()), "--seconds", "20"});

    const std::string saved = (home.Home() / "saved.vsd").string();
    ChildProcess watch(VAROSCOPE_WATCH_PROGRAM,
                       {"--no-services", "--seconds", "4", "--digits", "6", DEMO_WATCH_LIST, "--save", saved});
    ASSERT_EQ(watch.Wait(20s), 0);

    // Each line: the short name padded, two blanks, value, time and quality.
    std::map<std::string, std::set<std::string>> goodValues;
    std::istringstream lines(watch.Output());
    for (std::string line; std::getline(lines, line);) {
        if (!line.ends_with("  good"))
            continue;
        const auto nameEnd = line.find("  ");
        goodValues[line.substr(0, nameEnd)].insert(line.substr(nameEnd));
    }
    const auto demo = document::LoadDocument(DEMO_WATCH_LIST);
    ASSERT_EQ(demo.items.size(), 16u);
    for (const auto& item : demo.items) {
        const std::string shortName = item.url.substr(item.url.rfind('\\') + 1);
        EXPECT_TRUE(goodValues.contains(shortName)) << shortName << " never showed a good value";
    }
    EXPECT_GE(goodValues["drum.level"].size(), 3u) << "the level should keep changing";

    // The saved list holds the same items, top row first: the reverse of
    // the file, which the list showed bottom row first.
    const auto reread = document::LoadDocument(saved);
    ASSERT_EQ(reread.items.size(), 16u);
    EXPECT_TRUE(reread.items.front().url.ends_with("\\boiler\\drum.level"));
    EXPECT_TRUE(demo.items.back().url.ends_with("\\boiler\\drum.level"));
    EXPECT_EQ(reread.placement, demo.placement);
}

} // namespace
} // namespace qv::test
