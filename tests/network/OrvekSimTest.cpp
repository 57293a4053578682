// orvek-sim as a program: the demo plant's processes and types, its set
// points, its clean stop, and the load generator's rate.

#include "MqttObserver.h"
#include "SimulatorProcess.h"
#include "network/protocol/Catalogue.h"
#include "network/protocol/ProcessState.h"
#include "network/protocol/Topics.h"
#include "network/protocol/ValueMessage.h"
#include "network/protocol/WriteRequest.h"
#include "network/protocol/WriteResult.h"
#include "support/TestBroker.h"
#include "value/TypeCodes.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <chrono>
#include <csignal>
#include <set>
#include <string>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace qv::network {
namespace {

namespace proto = protocol;
namespace TypeCode = value::TypeCode;
using namespace std::chrono_literals;

using test::Simulator;

bool HasState(const std::string& payload, proto::RunState state)
{
    return !payload.empty() && proto::DecodeProcessState(payload).state == state;
}

TEST(OrvekSimTest, PlantCoversEveryTypeServesSetPointsAndStopsCleanly)
{
    test::TestBroker broker;
    test::MqttObserver observer(broker.Port(), {"orvek/v1/#"});
    Simulator sim({"--port", std::to_string(broker.Port())});
    const std::vector<std::string> processes = {"boiler", "tanks", "packaging"};
    for (const std::string& process : processes)
        ASSERT_TRUE(observer.WaitFor(proto::ProcessTopic(process, proto::TopicKind::State),
                                     [](const std::string& p) { return HasState(p, proto::RunState::Running); }))
            << process;

    std::set<std::uint16_t> types;
    std::set<std::uint8_t> kinds;
    bool someWritable = false;
    for (const std::string& process : processes) {
        const auto catalogue = observer.Get(proto::ProcessTopic(process, proto::TopicKind::Catalogue));
        ASSERT_TRUE(catalogue) << process;
        for (const proto::CatalogueVariable& variable : proto::DecodeCatalogue(*catalogue).variables) {
            types.insert(variable.type);
            if (variable.type == TypeCode::Numeric)
                kinds.insert(variable.kind);
            someWritable = someWritable || (variable.access & proto::Access::Write) != 0;
        }
    }
    for (std::uint16_t type : {TypeCode::Numeric, TypeCode::Logical, TypeCode::UInt64, TypeCode::AnsiString,
                               TypeCode::UnicodeString, TypeCode::RawBytes, TypeCode::Vector, TypeCode::Dictionary,
                               TypeCode::SSTimeValue})
        EXPECT_TRUE(types.count(type)) << "type " << type;
    EXPECT_EQ(kinds, (std::set<std::uint8_t>{0, 1, 2, 3, 4, 5, 6, 7, 8}));
    EXPECT_TRUE(someWritable);

    // A set point takes a value within its limits and refuses one beyond.
    const std::string result = proto::NamedTopic("boiler", proto::TopicKind::WriteResult, "drum.level.setpoint");
    const std::string write = proto::NamedTopic("boiler", proto::TopicKind::Write, "drum.level.setpoint");
    observer.Publish(write, proto::EncodeWriteRequest({"w1", "op", value::VarData::MakeNumeric(60)}));
    auto answer = observer.WaitFor(result, [](const std::string& p) { return proto::DecodeWriteResult(p).id == "w1"; });
    ASSERT_TRUE(answer);
    EXPECT_EQ(proto::DecodeWriteResult(*answer).status, proto::WriteStatus::Written);
    observer.Publish(write, proto::EncodeWriteRequest({"w2", "op", value::VarData::MakeNumeric(95)}));
    answer = observer.WaitFor(result, [](const std::string& p) { return proto::DecodeWriteResult(p).id == "w2"; });
    ASSERT_TRUE(answer);
    EXPECT_EQ(proto::DecodeWriteResult(*answer).status, proto::WriteStatus::BadValue);
    const auto setPoint =
        observer.Get(proto::NamedTopic("boiler", proto::TopicKind::Value, "drum.level.setpoint"));
    ASSERT_TRUE(setPoint);
    EXPECT_EQ(proto::DecodeValueMessage(*setPoint).value.ToDouble(), 60.0);

    // Values keep coming; a second is plenty for the fast ones.
    const std::size_t before = observer.Count("orvek/v1/boiler/value/drum.level");
    std::this_thread::sleep_for(1s);
    EXPECT_GE(observer.Count("orvek/v1/boiler/value/drum.level") - before, 3u);

    sim.Signal(SIGTERM);
    EXPECT_EQ(sim.Wait(5s), 0);
    for (const std::string& process : processes)
        EXPECT_TRUE(observer.WaitFor(proto::ProcessTopic(process, proto::TopicKind::State),
                                     [](const std::string& p) { return HasState(p, proto::RunState::Stopped); }))
            << process;
}

TEST(OrvekSimTest, LoadGeneratorPublishesAtTheAskedRate)
{
    test::TestBroker broker;
    test::MqttObserver observer(broker.Port(), {"orvek/v1/load/value/+"});
    constexpr int kVariables = 50;
    constexpr int kRate = 500;
    Simulator sim({"--port", std::to_string(broker.Port()), "--load", std::to_string(kVariables), "--rate",
                   std::to_string(kRate), "--seconds", "2"});
    ASSERT_EQ(sim.Wait(8s), 0);
    // One initial value per variable, then the changes at the rate; the
    // pacing catches up when late, so the count follows the run time.
    const std::size_t changes = 2 * kRate;
    EXPECT_TRUE(observer.WaitForCount("orvek/v1/load/value/", kVariables + changes * 9 / 10));
    const std::size_t received = observer.Count("orvek/v1/load/value/");
    EXPECT_LE(received, kVariables + changes + 1);
    EXPECT_NE(sim.Output().find("value messages published"), std::string::npos);
}

TEST(OrvekSimTest, BadCommandLineIsRefused)
{
    for (const std::vector<std::string>& arguments :
         {std::vector<std::string>{"--port", "0"}, {"--load", "10"}, {"--rate", "x", "--load", "1"}, {"--bogus"}}) {
        Simulator sim(arguments);
        EXPECT_EQ(sim.Wait(5s), 2) << arguments[0];
    }
}

} // namespace
} // namespace qv::network
