// What a monitor shows when something on the way fails: the publishing
// process dies, the data server stops and comes back, the variable or the
// process does not exist, the host name does not resolve, the host runs no
// data server.

#include "EndToEndSupport.h"
#include "network/SimulatorProcess.h"

#include "network/protocol/Catalogue.h"

#include <map>

namespace qv::test {
namespace {

namespace proto = network::protocol;
using network::publisher::Publisher;
using value::VarData;
namespace TypeCode = value::TypeCode;

using E2EFault = EndToEnd;

bool HasNumber(const RecordedChange& change)
{
    return change.data.Code() == TypeCode::Numeric
           && (change.quality & (Q::Connecting | Q::Nonexistant | Q::NoKnownValue | Q::ProcessFailure)) == 0;
}

TEST_F(E2EFault, KilledPublisherIsAProcessFailure)
{
    Simulator sim({"--port", std::to_string(broker_->Port()), "--seconds", "8"});
    Monitor monitor;
    monitor.Subscribe(u"\\\\localhost\\boiler\\drum.level", 1);
    ASSERT_TRUE(monitor.Receiver().WaitFor(1, HasNumber));

    sim.Signal(SIGKILL);
    EXPECT_EQ(sim.Wait(2s), -1);
    const auto failed = monitor.Receiver().WaitForQuality(1, Q::ProcessFailure);
    ASSERT_TRUE(failed);
    EXPECT_EQ(failed->error, rt::ErrorCodes::ProcessFailed);
}

TEST_F(E2EFault, StoppedDataServerDisconnectsAndValuesResumeOnRestart)
{
    Publisher publisher("boiler", PublisherOn());
    publisher.DeclareVariable("drum.level", TypeCode::Numeric, 0, proto::Access::Read);
    publisher.Publish("drum.level", VarData::MakeNumeric(10));
    Start(publisher);
    Monitor monitor;
    monitor.Subscribe(u"\\\\localhost\\boiler\\drum.level", 1);
    ASSERT_TRUE(monitor.Receiver().WaitFor(1, [](const auto& c) { return c.quality == 0; }));

    broker_->Stop();
    const auto lost = monitor.Receiver().WaitForQuality(1, Q::Disconnected);
    ASSERT_TRUE(lost);
    EXPECT_EQ(lost->error, rt::ErrorCodes::ConnectionLost);
    ASSERT_TRUE(monitor.Receiver().WaitForQuality(1, Q::Connecting));

    // The broker comes back empty; the publisher publishes everything again
    // and the subscription picks it up without being asked.
    broker_->Start();
    const auto resumed = monitor.Receiver().WaitFor(
        1, [](const auto& c) { return c.quality == 0 && c.data.ToDouble() == 10.0; }, 8s);
    ASSERT_TRUE(resumed);
    publisher.Publish("drum.level", VarData::MakeNumeric(11));
    const auto next = monitor.Receiver().WaitFor(1, [](const auto&) { return true; });
    ASSERT_TRUE(next);
    EXPECT_EQ(next->data.ToDouble(), 11.0);
    EXPECT_EQ(next->mask, rt::ChangeMask::Value | rt::ChangeMask::Timestamp);
}

TEST_F(E2EFault, UnknownVariablesAndProcessesAreNonexistant)
{
    Publisher publisher("boiler", PublisherOn());
    publisher.DeclareVariable("drum.level", TypeCode::Numeric, 0, proto::Access::Read);
    publisher.DeclareVariable("drum.spare", TypeCode::Numeric, 0, proto::Access::Read);
    publisher.Publish("drum.spare", VarData::MakeNumeric(1));
    Start(publisher);
    Monitor monitor;
    monitor.Subscribe(u"\\\\localhost\\boiler\\no.such", 1);
    monitor.Subscribe(u"\\\\localhost\\nobody\\drum.level", 2);
    monitor.Subscribe(u"\\\\localhost\\boiler\\drum.level", 3);
    monitor.Subscribe(u"\\\\localhost\\boiler\\drum.spare", 4);

    for (std::int32_t handle : {1, 2}) {
        const auto missing = monitor.Receiver().WaitFor(handle, Settled);
        ASSERT_TRUE(missing) << handle;
        EXPECT_EQ(missing->quality, Q::Nonexistant) << handle;
        EXPECT_EQ(missing->error, rt::ErrorCodes::NoSuchVariable) << handle;
    }
    // Declared but never published is a different matter.
    const auto unpublished = monitor.Receiver().WaitFor(3, Settled);
    ASSERT_TRUE(unpublished);
    EXPECT_EQ(unpublished->quality, Q::NoKnownValue);

    // A variable that the process removes stops existing.
    ASSERT_TRUE(monitor.Receiver().WaitFor(4, [](const auto& c) { return c.quality == 0; }));
    ASSERT_TRUE(publisher.RemoveVariable("drum.spare"));
    const auto removed = monitor.Receiver().WaitForQuality(4, Q::Nonexistant);
    ASSERT_TRUE(removed);
    EXPECT_EQ(removed->quality, Q::Nonexistant);
}

/// Names from a table, so that no query leaves the machine.
class TableResolver : public rt::HostResolver {
public:
    explicit TableResolver(std::map<std::string, std::string> names) : names_(std::move(names)) {}
    std::optional<std::string> Resolve(const std::string& host) const override
    {
        const auto found = names_.find(host);
        return found == names_.end() ? std::nullopt : std::optional<std::string>(found->second);
    }

private:
    std::map<std::string, std::string> names_;
};

TEST_F(E2EFault, HostsThatDoNotResolveOrRunNoDataServer)
{
    // The test broker listens on 127.0.0.1 only, so nothing answers on
    // 127.0.0.2: a host without a data server, still on the loopback.
    rt::SetHostResolver(std::make_shared<TableResolver>(
        std::map<std::string, std::string>{{"plant-a", "127.0.0.1"}, {"plant-b", "127.0.0.2"}}));
    Publisher publisher("boiler", PublisherOn());
    publisher.DeclareVariable("drum.level", TypeCode::Numeric, 0, proto::Access::Read);
    publisher.Publish("drum.level", VarData::MakeNumeric(8));
    Start(publisher);
    Monitor monitor;
    monitor.Subscribe(u"\\\\plant-a\\boiler\\drum.level", 1);
    monitor.Subscribe(u"\\\\plant-b\\boiler\\drum.level", 2);
    monitor.Subscribe(u"\\\\plant-c\\boiler\\drum.level", 3);

    const auto found = monitor.Receiver().WaitFor(1, Settled);
    ASSERT_TRUE(found);
    EXPECT_EQ(found->quality, 0u);
    EXPECT_EQ(found->data.ToDouble(), 8.0);
    const auto noServer = monitor.Receiver().WaitFor(2, Settled);
    ASSERT_TRUE(noServer);
    EXPECT_EQ(noServer->quality, Q::ServiceLookupFailure);
    EXPECT_EQ(noServer->error, rt::ErrorCodes::ConnectionRefused);
    const auto unknown = monitor.Receiver().WaitFor(3, Settled);
    ASSERT_TRUE(unknown);
    EXPECT_EQ(unknown->quality, Q::DnsFailure);
    EXPECT_EQ(unknown->error, rt::ErrorCodes::HostNotFound);
}

} // namespace
} // namespace qv::test
