#include "ServiceTestSupport.h"

#include "fen/osdep/OSException.h"
#include "fen/osdep/OrvekPort.h"
#include "fen/osdep/RegKey.h"

#include <cstdlib>
#include <filesystem>

using namespace qv::fen::osdep;
using qv::fen::exception::ServiceFailure;
using qv::test::ProcessGone;
using qv::test::WaitUntil;
using std::chrono::milliseconds;
using Clock = std::chrono::steady_clock;

namespace {

class DaemonTest : public qv::test::ServiceTest {};

milliseconds Since(Clock::time_point start)
{
    return std::chrono::duration_cast<milliseconds>(Clock::now() - start);
}

/// Runs `call`, expecting ServiceFailure stamped with the service layer's source name.
template <typename Call>
void ExpectServiceFailure(Call call)
{
    try {
        call();
        ADD_FAILURE() << "no ServiceFailure";
    } catch (const ServiceFailure& e) {
        EXPECT_STREQ(e.GetFile(), "qv\\fen\\osdep\\Daemon");
        EXPECT_GT(e.GetLine(), 0);
    }
}

} // namespace

TEST_F(DaemonTest, StartedServiceIsMarkedForOtherProcessesAndStops)
{
    Define("Scripted", "--checkpoints 2 --every 100");
    StartDaemon(W("Scripted"), 0, nullptr, false);

    const ServiceStatus status = StatusOf("Scripted");
    EXPECT_EQ(status.state, kServiceRunning);
    ASSERT_GT(status.processId, 0);
    EXPECT_FALSE(ProcessGone(status.processId));
    EXPECT_TRUE(IsDaemonRunning(W("Scripted")));
    const std::string wfsc = std::string(QV_BIN_DIR) + "/wfsc status Scripted >/dev/null";
    EXPECT_EQ(WEXITSTATUS(std::system(wfsc.c_str())), 0) << "another process sees the mark";

    // A second start finds it running and leaves it alone.
    const auto again = Clock::now();
    StartDaemon(W("Scripted"), 0, nullptr, false);
    EXPECT_LT(Since(again), milliseconds(500));
    EXPECT_EQ(StatusOf("Scripted").processId, status.processId);

    StopDaemon(W("Scripted"), false, 5000);
    EXPECT_FALSE(IsDaemonRunning(W("Scripted")));
    EXPECT_TRUE(WaitUntil([&] { return ProcessGone(status.processId) && ProcessGone(status.hostPid); },
                          milliseconds(2000)));
    EXPECT_EQ(Recorded(), (std::vector<std::string>{"start Scripted", "stop Scripted"}));
    EXPECT_NE(WEXITSTATUS(std::system(wfsc.c_str())), 0);
}

TEST_F(DaemonTest, ArgumentsOfTheStartReachTheService)
{
    Define("Plain", "--silent --name Ignored");
    const char16_t* argv[] = {u"--name", u"Given"};
    StartDaemon(W("Plain"), 2, argv, false);
    EXPECT_EQ(StatusOf("Plain").state, kServiceRunning) << "a silent service runs once it has settled";
    EXPECT_EQ(Recorded(), std::vector<std::string>{"start Given"});
}

TEST_F(DaemonTest, StartWaitsWhileCheckpointsGrowAndFailsWhenTheyStallOrTheServiceEnds)
{
    // Eight checkpoints 300 ms apart outlast the 1000 ms wait hint many times over.
    Define("Slow", "--checkpoints 8 --every 300", {}, 1000);
    auto start = Clock::now();
    StartDaemon(W("Slow"), 0, nullptr, false);
    EXPECT_GE(Since(start), milliseconds(2000));
    EXPECT_EQ(StatusOf("Slow").state, kServiceRunning);

    Define("Stalled", "--checkpoints 1 --then stall", {}, 1000);
    start = Clock::now();
    ExpectServiceFailure([&] { StartDaemon(W("Stalled"), 0, nullptr, false); });
    EXPECT_GE(Since(start), milliseconds(1000));
    EXPECT_LT(Since(start), milliseconds(5000));
    EXPECT_EQ(StatusOf("Stalled").state, kServiceStartPending);

    Define("Quitter", "--checkpoints 1 --then exit");
    ExpectServiceFailure([&] { StartDaemon(W("Quitter"), 0, nullptr, false); });
    EXPECT_TRUE(WaitUntil([&] { return !IsDaemonRunning(W("Quitter")); }, milliseconds(2000)));
}

TEST_F(DaemonTest, ServiceIgnoringTheStopIsKilledAtTheDeadlineOnlyWhenAsked)
{
    Define("Stubborn", "--ignore-term");
    StartDaemon(W("Stubborn"), 0, nullptr, false);
    const ServiceStatus status = StatusOf("Stubborn");

    auto start = Clock::now();
    ExpectServiceFailure([&] { StopDaemon(W("Stubborn"), false, 1000); });
    EXPECT_GE(Since(start), milliseconds(1000));
    EXPECT_FALSE(ProcessGone(status.processId)) << "not killed without the kill flag";
    EXPECT_EQ(StatusOf("Stubborn").state, kServiceStopPending);

    start = Clock::now();
    ExpectServiceFailure([&] { StopDaemon(W("Stubborn"), true, 1500); });
    EXPECT_GE(Since(start), milliseconds(1500));
    EXPECT_LT(Since(start), milliseconds(4000));
    EXPECT_TRUE(WaitUntil([&] { return ProcessGone(status.processId) && ProcessGone(status.hostPid); },
                          milliseconds(3000)));
    EXPECT_FALSE(IsDaemonRunning(W("Stubborn")));
}

TEST_F(DaemonTest, QuickStopOnlyAsks)
{
    Define("Lingering", "--stop-delay 1500");
    StartDaemon(W("Lingering"), 0, nullptr, false);
    const auto start = Clock::now();
    StopDaemon(W("Lingering"), false, 0);
    EXPECT_LT(Since(start), milliseconds(300));
    EXPECT_TRUE(IsDaemonRunning(W("Lingering")));
    EXPECT_TRUE(WaitUntil([&] { return StatusOf("Lingering").state == kServiceStopPending; }, milliseconds(1000)));
    EXPECT_TRUE(WaitUntil([&] { return !IsDaemonRunning(W("Lingering")); }, milliseconds(4000)));

    // Starting a stop-pending service waits for the stop first.
    StartDaemon(W("Lingering"), 0, nullptr, false);
    StopDaemon(W("Lingering"), false, 0);
    ASSERT_TRUE(WaitUntil([&] { return StatusOf("Lingering").state == kServiceStopPending; }, milliseconds(1000)));
    StartDaemon(W("Lingering"), 0, nullptr, false);
    EXPECT_EQ(StatusOf("Lingering").state, kServiceRunning);
    EXPECT_EQ(Recorded(), (std::vector<std::string>{"start Lingering", "stop Lingering", "start Lingering",
                                                    "stop Lingering", "start Lingering"}));
}

TEST_F(DaemonTest, MarkHeldByAnotherProcessCountsAsRunningAndNothingIsStarted)
{
    qv::test::ForeignMark mark(RequiredServiceNames());
    // A status file left by a host that no longer exists must not be believed.
    ServiceStatus stale;
    stale.state = kServiceStopped;
    stale.hostPid = static_cast<int>(::getpid());
    stale.hostStart = 1;
    stale.processId = static_cast<int>(::getpid());
    WriteServiceStatus("WfTimeSync", stale);

    for (const std::string& name : RequiredServiceNames())
        EXPECT_TRUE(IsDaemonRunning(W(name))) << name;
    EnsureRequiredDaemons();
    StartDaemon(W("WfClassAds"), 0, nullptr, false);

    const ServiceStatus timeSync = QueryServiceStatus("WfTimeSync", 5000);
    EXPECT_EQ(timeSync.state, kServiceRunning);
    EXPECT_EQ(timeSync.processId, 0) << "the pid of a stale report is never used";
    EXPECT_FALSE(std::filesystem::exists(home_.Runtime() / "varoscope/log")) << "no host was launched";
    EXPECT_FALSE(ReadServiceStatusFile("WfClassAds"));

    // A stop cannot reach a process that is not a host of ours.
    ExpectServiceFailure([&] { StopDaemon(W("WfTimeSync"), true, 1000); });
}

TEST_F(DaemonTest, UnknownAndInvalidNamesFail)
{
    for (const char16_t* name : {u"NoSuchService", u"", u"a/b", u".."}) {
        EXPECT_FALSE(IsDaemonRunning(name));
        ExpectServiceFailure([&] { StartDaemon(name, 0, nullptr, false); });
        ExpectServiceFailure([&] { StopDaemon(name, true, 1000); });
        StopDaemon(name, false, 0);
    }
    Define("Broken", "");
    ServiceDefinition broken = *LoadServiceDefinition("Broken");
    broken.imagePath = "\"unclosed";
    WriteServiceDefinition(broken);
    ExpectServiceFailure([&] { StartDaemon(W("Broken"), 0, nullptr, false); });
}

TEST_F(DaemonTest, RequiredDefinitionsAndTheDataPortAreWrittenOnFirstUse)
{
    const auto definition = LoadServiceDefinition("wfcairnetserver");
    ASSERT_TRUE(definition);
    EXPECT_EQ(definition->name, "WfCairnetServer");
    EXPECT_NE(definition->imagePath.find("wfcairnet"), std::string::npos);
    EXPECT_TRUE(LoadServiceDefinition("WfClassAds"));
    EXPECT_FALSE(LoadServiceDefinition("NotRequired"));
    EXPECT_EQ(ListServiceNames(), (std::vector<std::string>{"WfCairnetServer", "WfClassAds"}));

    EXPECT_EQ(GetOrvekDataPort(), 18883);
    RegKey key(kLocalMachine, u"SOFTWARE\\Quorvane\\Orvek", true, false, u"");
    EXPECT_EQ(key.GetValue(u"DataPort")->number, 18883u);
    RegKey writable(kLocalMachine, u"SOFTWARE\\Quorvane\\Orvek", false, false, u"");
    writable.SetValue(u"DataPort", RegValue{kRegDword, {}, {}, 70000, {}});
    EXPECT_THROW(GetOrvekDataPort(), qv::fen::exception::InvalidArgument);
}

TEST_F(DaemonTest, RuntimeDirectoryThatIsNotPrivateIsRefused)
{
    Define("Scripted", "");
    const auto runtime = home_.Runtime() / "varoscope";
    std::filesystem::create_directory(runtime);
    std::filesystem::permissions(runtime, std::filesystem::perms::owner_all | std::filesystem::perms::group_read |
                                              std::filesystem::perms::group_exec);
    EXPECT_THROW(RuntimeDirectory(), qv::fen::osdep::WinError);
    EXPECT_FALSE(IsDaemonRunning(W("Scripted")));
    ExpectServiceFailure([&] { StartDaemon(W("Scripted"), 0, nullptr, false); });

    // Nor is a link to a folder elsewhere.
    std::filesystem::remove(runtime);
    std::filesystem::create_directory(home_.Runtime() / "elsewhere");
    std::filesystem::permissions(home_.Runtime() / "elsewhere", std::filesystem::perms::owner_all);
    std::filesystem::create_directory_symlink(home_.Runtime() / "elsewhere", runtime);
    EXPECT_THROW(RuntimeDirectory(), qv::fen::osdep::WinError);
}
