// Who may read and write, decided by the data server's password file and
// access-control list, as a monitor sees it.

#include "EndToEndSupport.h"

#include "network/protocol/Catalogue.h"

#include <mutex>
#include <thread>

namespace qv::test {
namespace {

namespace proto = network::protocol;
using network::publisher::Publisher;
using network::publisher::WriteDecision;
using network::publisher::WriteRequestInfo;
using network::session::kStatusAccessDenied;
using network::session::kStatusOk;
using value::VarData;
namespace TypeCode = value::TypeCode;

using E2EAccess = EndToEnd;

const std::map<std::string, std::string> kUsers{{"plant", "p-secret"}, {"operator", "o-secret"}, {"viewer", "v-secret"}};

TEST_F(E2EAccess, RefusedPasswordFailsLoginAndLeavesTheSessionAnonymous)
{
    StartBroker({kUsers, "", true, ""});
    Publisher publisher("boiler", PublisherOn("plant", "p-secret"));
    publisher.DeclareVariable("drum.level", TypeCode::Numeric, 0, proto::Access::Read);
    publisher.Publish("drum.level", VarData::MakeNumeric(4));
    Start(publisher, "plant", "p-secret");

    Monitor monitor;
    EXPECT_EQ(monitor.Login(u"operator", u"wrong"), kStatusAccessDenied);
    monitor.Subscribe(u"\\\\localhost\\boiler\\drum.level", 1);
    // The broker refuses the anonymous connection that is left.
    const auto refused = monitor.Receiver().WaitFor(1, Settled);
    ASSERT_TRUE(refused);
    EXPECT_EQ(refused->quality, Q::AccessDenied);
    EXPECT_EQ(refused->error, rt::ErrorCodes::AccessDenied);

    // A good login afterwards goes with the next attempt of the same subscription.
    EXPECT_EQ(monitor.Login(u"operator", u"o-secret"), kStatusOk);
    const auto shown = monitor.Receiver().WaitFor(1, [](const auto& c) { return c.quality == 0; });
    ASSERT_TRUE(shown);
    EXPECT_EQ(shown->data.ToDouble(), 4.0);
}

TEST_F(E2EAccess, UnreadableVariablesShowAccessDeniedAndNoValue)
{
    // "viewer" may read the process's state and catalogue and one value topic.
    StartBroker({kUsers,
                 "user plant\ntopic readwrite orvek/v1/#\n"
                 "user viewer\n"
                 "topic read orvek/v1/boiler/state\n"
                 "topic read orvek/v1/boiler/catalogue\n"
                 "topic read orvek/v1/boiler/value/drum.level\n",
                 true, ""});
    Publisher publisher("boiler", PublisherOn("plant", "p-secret"));
    publisher.DeclareVariable("drum.level", TypeCode::Numeric, 0, proto::Access::Read);
    publisher.DeclareVariable("drum.secret", TypeCode::Numeric, 0, proto::Access::Read);
    publisher.DeclareVariable("drum.command", TypeCode::Numeric, 0, proto::Access::Write);
    publisher.Publish("drum.level", VarData::MakeNumeric(1));
    publisher.Publish("drum.secret", VarData::MakeNumeric(2));
    publisher.Publish("drum.command", VarData::MakeNumeric(3));
    Start(publisher, "plant", "p-secret");

    Monitor monitor;
    ASSERT_EQ(monitor.Login(u"viewer", u"v-secret"), kStatusOk);
    monitor.Subscribe(u"\\\\localhost\\boiler\\drum.level", 1);
    monitor.Subscribe(u"\\\\localhost\\boiler\\drum.command", 2);
    monitor.Subscribe(u"\\\\localhost\\boiler\\drum.secret", 3);

    const auto readable = monitor.Receiver().WaitFor(1, Settled);
    ASSERT_TRUE(readable);
    EXPECT_EQ(readable->quality, 0u);
    EXPECT_EQ(readable->data.ToDouble(), 1.0);

    // The process's catalogue marks the variable write-only.
    const auto writeOnly = monitor.Receiver().WaitFor(2, Settled);
    ASSERT_TRUE(writeOnly);
    EXPECT_EQ(writeOnly->quality, Q::AccessDenied);
    EXPECT_EQ(writeOnly->error, rt::ErrorCodes::AccessDenied);
    EXPECT_EQ(writeOnly->data.Code(), TypeCode::Empty);

    // The access-control list forbids the value topic. The broker grants the
    // subscription and silently withholds the retained value; the catalogue
    // says the process published one, so the monitor shows "access denied".
    const auto forbidden = monitor.Receiver().WaitFor(3, Settled);
    ASSERT_TRUE(forbidden);
    EXPECT_EQ(forbidden->quality, Q::AccessDenied) << std::hex << forbidden->quality;
    EXPECT_EQ(forbidden->error, rt::ErrorCodes::AccessDenied);
    publisher.Publish("drum.secret", VarData::MakeNumeric(5));
    publisher.Publish("drum.level", VarData::MakeNumeric(6));
    ASSERT_TRUE(monitor.Receiver().WaitFor(1, [](const auto& c) { return c.data.ToDouble() == 6.0; }));
    for (const auto& change : monitor.Receiver().Changes(3))
        EXPECT_EQ(change.data.Code(), TypeCode::Empty) << change.value;
}

TEST_F(E2EAccess, WriteDeniedByTheAccessListLeavesTheValueUnchanged)
{
    StartBroker({kUsers,
                 "user plant\ntopic readwrite orvek/v1/#\n"
                 "user operator\ntopic readwrite orvek/v1/#\n"
                 "user viewer\ntopic read orvek/v1/#\n",
                 true, ""});
    std::mutex mutex; // outlives the publisher, whose thread runs the handler
    std::vector<WriteRequestInfo> requests;
    Publisher publisher("boiler", PublisherOn("plant", "p-secret"));
    publisher.DeclareVariable("setpoint", TypeCode::Numeric, 0, proto::Access::Read | proto::Access::Write);
    publisher.Publish("setpoint", VarData::MakeNumeric(50));
    publisher.SetWriteHandler([&](const WriteRequestInfo& request, VarData&) {
        std::lock_guard lock(mutex);
        requests.push_back(request);
        return WriteDecision{};
    });
    Start(publisher, "plant", "p-secret");

    Monitor viewer;
    ASSERT_EQ(viewer.Login(u"viewer", u"v-secret"), kStatusOk);
    auto* viewed = viewer.Subscribe(u"\\\\localhost\\boiler\\setpoint", 1);
    ASSERT_TRUE(viewer.Receiver().WaitFor(1, [](const auto& c) { return c.quality == 0; }));
    // Handed to the connection; the broker drops it without telling the writer.
    EXPECT_EQ(viewed->Write(VarData::MakeNumeric(77)), 0);
    std::this_thread::sleep_for(300ms);

    // The same write from a user the list allows goes through.
    Monitor operatorMonitor;
    ASSERT_EQ(operatorMonitor.Login(u"operator", u"o-secret"), kStatusOk);
    auto* operated = operatorMonitor.Subscribe(u"\\\\localhost\\boiler\\setpoint", 1);
    ASSERT_TRUE(operatorMonitor.Receiver().WaitFor(1, [](const auto& c) { return c.quality == 0; }));
    EXPECT_EQ(operated->Write(VarData::MakeNumeric(66)), 0);
    const auto written = viewer.Receiver().WaitFor(1, [](const auto&) { return true; });
    ASSERT_TRUE(written);
    EXPECT_EQ(written->data.ToDouble(), 66.0);

    std::lock_guard lock(mutex);
    ASSERT_EQ(requests.size(), 1u);
    EXPECT_EQ(requests[0].user, "operator");
    for (const auto& change : viewer.Receiver().Changes(1))
        EXPECT_NE(change.data.ToDouble(), 77.0);
}

} // namespace
} // namespace qv::test
