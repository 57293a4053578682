#include "ServiceTestSupport.h"

using namespace qv::fen::osdep;
using qv::fen::exception::ServiceFailure;

namespace {

class DaemonDependentsTest : public qv::test::ServiceTest {
protected:
    // Top depends on Middle, which depends on Base.
    void DefineChain(const std::string& topOptions = "")
    {
        Define("Base", "");
        Define("Middle", "", {"Base"});
        Define("Top", topOptions, {"Middle"});
    }
    using Lines = std::vector<std::string>;
};

} // namespace

TEST_F(DaemonDependentsTest, DependentsStartAfterAndStopBeforeTheirService)
{
    DefineChain();
    StartDaemon(W("Base"), 0, nullptr, true);
    for (const char* name : {"Base", "Middle", "Top"})
        EXPECT_EQ(StatusOf(name).state, kServiceRunning) << name;
    EXPECT_EQ(Recorded(), (Lines{"start Base", "start Middle", "start Top"}));

    StopDaemon(W("Base"), true, 5000);
    for (const char* name : {"Base", "Middle", "Top"})
        EXPECT_FALSE(IsDaemonRunning(W(name))) << name;
    EXPECT_EQ(Recorded(), (Lines{"start Base", "start Middle", "start Top", "stop Top", "stop Middle", "stop Base"}));
}

TEST_F(DaemonDependentsTest, StartingAServiceStartsWhatItDependsOnFirst)
{
    DefineChain();
    Define("Extra", "", {"Top"});
    StartDaemon(W("Top"), 0, nullptr, false);
    EXPECT_EQ(Recorded(), (Lines{"start Base", "start Middle", "start Top"}));
    // Without startDependents the dependents of a started service stay stopped.
    EXPECT_FALSE(IsDaemonRunning(W("Extra")));
}

TEST_F(DaemonDependentsTest, StatusCodesOfTheDependentFunctions)
{
    Define("Lonely", "");
    EXPECT_EQ(StartDependentDaemons(W("Lonely"), true), kDaemonOk);
    EXPECT_EQ(StopDependentDaemons(W("Lonely"), true, 1000), kDaemonOk);

    // A dependent that cannot start: the status says so and a start that
    // asked for its dependents fails, leaving the service itself running.
    Define("Failing", "--then exit", {"Lonely"});
    EXPECT_THROW(StartDaemon(W("Lonely"), 0, nullptr, true), ServiceFailure);
    EXPECT_TRUE(IsDaemonRunning(W("Lonely")));
    ASSERT_TRUE(qv::test::WaitUntil([&] { return !IsDaemonRunning(W("Failing")); }, std::chrono::seconds(2)));
    EXPECT_EQ(StartDependentDaemons(W("Lonely"), false), kDaemonFailed);
}

TEST_F(DaemonDependentsTest, ServiceWhoseDependentWillNotStopStaysAndTheStopFails)
{
    DefineChain("--ignore-term");
    StartDaemon(W("Top"), 0, nullptr, false);
    EXPECT_EQ(StopDependentDaemons(W("Middle"), false, 1000), kDaemonFailed);
    EXPECT_THROW(StopDaemon(W("Base"), false, 1000), ServiceFailure);
    EXPECT_TRUE(IsDaemonRunning(W("Base")));
    EXPECT_TRUE(IsDaemonRunning(W("Middle")));
}

TEST_F(DaemonDependentsTest, CircularDefinitionsFailInsteadOfRecursing)
{
    Define("Chicken", "", {"Egg"});
    Define("Egg", "", {"Chicken"});
    EXPECT_THROW(StartDaemon(W("Chicken"), 0, nullptr, false), ServiceFailure);
    EXPECT_FALSE(IsDaemonRunning(W("Chicken")));
    EXPECT_FALSE(IsDaemonRunning(W("Egg")));
}
