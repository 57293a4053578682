// varoscope-watch on the shipped demo list against orvek-sim on a broker of
// the test's own: every item of the list shows live values.

#include "network/RealTimeTestSupport.h"
#include "network/SimulatorProcess.h"

#include "document/DocumentFile.h"

#include <gtest/gtest.h>

#include <csignal>
#include <set>

namespace qv::test {
namespace {

using namespace std::chrono_literals;

TEST(WatchTool, ShowsTheDemoPlantLiveAndSavesTheList)
{
    TemporaryHome home;
    TestBroker broker;
    SetDataPort(broker.Port());
    Simulator sim({"--port", std::to_string(broker.Port()), "--seconds", "60"});

    const auto demo = document::LoadDocument(DEMO_WATCH_LIST);
    ASSERT_EQ(demo.items.size(), 16u);
    std::set<std::string> shortNames;
    for (const auto& item : demo.items)
        shortNames.insert(item.url.substr(item.url.rfind('\\') + 1));

    // Each line: the short name padded, two blanks, value, time and quality.
    std::map<std::string, std::set<std::string>> goodValues;
    std::size_t parsed = 0;
    auto allLive = [&](const std::string& output) {
        for (std::size_t end; (end = output.find('\n', parsed)) != std::string::npos; parsed = end + 1) {
            const std::string line = output.substr(parsed, end - parsed);
            const auto nameEnd = line.find("  ");
            if (line.ends_with("  good") && nameEnd != std::string::npos)
                goodValues[line.substr(0, nameEnd)].insert(line.substr(nameEnd));
        }
        for (const std::string& name : shortNames)
            if (!goodValues.contains(name))
                return false;
        return goodValues["drum.level"].size() >= 3; // the level keeps changing
    };

    const std::string saved = (home.Home() / "saved.vsd").string();
    ChildProcess watch(VAROSCOPE_WATCH_PROGRAM, {"--no-services", "--digits", "6", DEMO_WATCH_LIST, "--save", saved});
    watch.ReadUntil(allLive, 30s);
    watch.Signal(SIGTERM);
    ASSERT_EQ(watch.Wait(20s), 0);
    for (const std::string& name : shortNames)
        EXPECT_TRUE(goodValues.contains(name)) << name << " never showed a good value";
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
