// The publisher against a real broker, watched by a raw MQTT client.

#include "network/publisher/Publisher.h"

#include "MqttObserver.h"
#include "network/protocol/AlarmAck.h"
#include "network/protocol/AlarmMessage.h"
#include "network/protocol/Catalogue.h"
#include "network/protocol/ProcessState.h"
#include "network/protocol/Topics.h"
#include "network/protocol/ValueMessage.h"
#include "network/protocol/WriteRequest.h"
#include "network/protocol/WriteResult.h"
#include "network/publisher/WriteConversion.h"
#include "support/TestBroker.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cmath>
#include <csignal>
#include <mutex>
#include <sys/wait.h>
#include <unistd.h>

namespace qv::network::publisher {
namespace {

namespace proto = protocol;
using value::NumericKind;
using value::VarData;
namespace TypeCode = value::TypeCode;
using namespace std::chrono_literals;

PublisherOptions On(const test::TestBroker& broker)
{
    PublisherOptions options;
    options.host = test::TestBroker::Host();
    options.port = broker.Port();
    options.connectTimeout = 3s;
    return options;
}

std::string Topic(const std::string& process, proto::TopicKind kind, const std::string& name = {})
{
    return name.empty() && !proto::TopicKindHasName(kind) ? proto::ProcessTopic(process, kind)
                                                          : proto::NamedTopic(process, kind, name);
}

bool HasState(const std::string& payload, proto::RunState state)
{
    return !payload.empty() && proto::DecodeProcessState(payload).state == state;
}

class PublisherTest : public ::testing::Test {
protected:
    test::TestBroker broker;
};

/// Whether the catalogue in `payload` calls `path` valued; false when it does not list it.
bool ListsValued(const std::string& payload, const std::string& path)
{
    for (const proto::CatalogueVariable& variable : proto::DecodeCatalogue(payload).variables) {
        if (variable.path == path)
            return variable.valued;
    }
    return false;
}

TEST_F(PublisherTest, PublishesCatalogueValuesAndStateRetained)
{
    const std::string process = "my boiler/1";
    const std::string quoted = "a\\'x.y'";
    Publisher publisher(process, On(broker));
    publisher.DeclareVariable("drum.level", TypeCode::Numeric, static_cast<std::uint8_t>(NumericKind::Int16),
                              proto::Access::Read | proto::Access::Write);
    publisher.DeclareVariable(quoted, TypeCode::AnsiString, 0, proto::Access::Read);
    const fen::AbsTime taken{1ull << 63, 3786912000};
    // A value recorded before the connection goes out once connected.
    publisher.Publish("drum.level", VarData::MakeNumeric(-5.0), 0x2, -3, taken);
    publisher.Start();
    EXPECT_TRUE(publisher.IsConnected());

    // Subscribed afterwards: everything has to come from retained messages.
    test::MqttObserver observer(broker.Port(), {"orvek/v1/#"});
    const auto state = observer.WaitFor(Topic(process, proto::TopicKind::State),
                                        [](const std::string& p) { return HasState(p, proto::RunState::Running); });
    ASSERT_TRUE(state);
    EXPECT_EQ(proto::DecodeProcessState(*state).pid, static_cast<std::int32_t>(getpid()));

    const std::string catalogueTopic = Topic(process, proto::TopicKind::Catalogue);
    const auto catalogue = observer.Get(catalogueTopic);
    ASSERT_TRUE(catalogue);
    const proto::Catalogue decoded = proto::DecodeCatalogue(*catalogue);
    ASSERT_EQ(decoded.variables.size(), 2u);
    EXPECT_EQ(decoded.variables[1].path, "drum.level");
    EXPECT_EQ(decoded.variables[1].type, TypeCode::Numeric);
    EXPECT_EQ(decoded.variables[1].kind, 2);
    EXPECT_EQ(decoded.variables[1].access, 3u);
    EXPECT_TRUE(decoded.variables[1].valued);
    EXPECT_EQ(decoded.variables[0].path, quoted);
    EXPECT_FALSE(decoded.variables[0].valued);

    const std::string valueTopic = Topic(process, proto::TopicKind::Value, "drum.level");
    const auto first = observer.Get(valueTopic);
    ASSERT_TRUE(first);
    proto::ValueMessage message = proto::DecodeValueMessage(*first);
    EXPECT_EQ(message.value.TypeWord(), 0x20003u); // the variable's kind, Int16
    EXPECT_EQ(message.value.ToDouble(), -5.0);
    EXPECT_EQ(message.quality, 0x2u);
    EXPECT_EQ(message.error, -3);
    EXPECT_EQ(message.time, taken);

    // A later value, stamped now by default.
    const fen::AbsTime before = CurrentTime();
    publisher.Publish("drum.level", VarData::MakeNumeric(7.0));
    const auto next = observer.WaitFor(valueTopic, [](const std::string& p) {
        return proto::DecodeValueMessage(p).value.ToDouble() == 7.0;
    });
    ASSERT_TRUE(next);
    message = proto::DecodeValueMessage(*next);
    EXPECT_EQ(message.quality, 0u);
    EXPECT_GE(message.time, before);
    EXPECT_LE(message.time, CurrentTime());

    // The first value goes out ahead of the catalogue that calls the variable
    // valued, so whoever sees that catalogue already has the value.
    const std::string quotedTopic = Topic(process, proto::TopicKind::Value, quoted);
    publisher.Publish(quoted, VarData("full"));
    ASSERT_TRUE(observer.WaitFor(catalogueTopic, [&](const std::string& p) { return ListsValued(p, quoted); }));
    const auto full = observer.Get(quotedTopic);
    ASSERT_TRUE(full);
    EXPECT_EQ(proto::DecodeValueMessage(*full).value.GetString(), fen::String("full"));
    // A later value leaves the catalogue alone.
    const std::size_t catalogues = observer.Count(catalogueTopic);
    publisher.Publish(quoted, VarData("fuller"));

    // Another type drops the value: the catalogue stops calling the variable
    // valued before its topic is emptied.
    publisher.DeclareVariable(quoted, TypeCode::Numeric, 0, proto::Access::Read);
    ASSERT_TRUE(observer.WaitFor(quotedTopic, [](const std::string& p) { return p.empty(); }));
    EXPECT_EQ(observer.Count(catalogueTopic), catalogues + 1);
    const auto after = observer.Get(catalogueTopic);
    ASSERT_TRUE(after);
    EXPECT_FALSE(ListsValued(*after, quoted));
    EXPECT_TRUE(ListsValued(*after, "drum.level"));

    // A removed variable leaves the catalogue.
    EXPECT_TRUE(publisher.RemoveVariable(quoted));
    EXPECT_TRUE(observer.WaitFor(catalogueTopic, [](const std::string& p) {
        return proto::DecodeCatalogue(p).variables.size() == 1;
    }));
}

TEST_F(PublisherTest, RefusesMisuseAndUnreachableServer)
{
    Publisher publisher("p", On(broker));
    EXPECT_THROW(publisher.DeclareVariable("'drum'.level", TypeCode::Numeric, 0, 1), fen::exception::InvalidArgument);
    EXPECT_THROW(publisher.DeclareVariable("x", TypeCode::Numeric, 16, 1), fen::exception::InvalidArgument);
    EXPECT_THROW(publisher.Publish("undeclared", VarData::MakeNumeric(1)), fen::exception::InvalidArgument);
    publisher.DeclareVariable("x", TypeCode::Numeric, 0, 1);
    EXPECT_THROW(publisher.Publish("x", VarData("text")), fen::exception::InvalidArgument);
    EXPECT_THROW(publisher.RaiseAlarm("", "no id", 1), fen::exception::InvalidArgument);
    EXPECT_THROW(publisher.RaiseAlarm("a", "too severe", 1001), fen::exception::InvalidArgument);

    PublisherOptions nowhere = On(broker);
    nowhere.port = test::FreeLoopbackPort();
    nowhere.connectTimeout = 1500ms;
    Publisher lost("p", nowhere);
    EXPECT_THROW(lost.Start(), PublisherError);
    EXPECT_FALSE(lost.IsConnected());
}

class PublisherWriteTest : public PublisherTest {
protected:
    void SetUp() override
    {
        publisher.DeclareVariable("sp", TypeCode::Numeric, static_cast<std::uint8_t>(NumericKind::UInt8),
                                  proto::Access::Read | proto::Access::Write);
        publisher.DeclareVariable("ro", TypeCode::Numeric, 0, proto::Access::Read);
        publisher.DeclareVariable("name", TypeCode::AnsiString, 0, proto::Access::Read | proto::Access::Write);
        publisher.Publish("sp", VarData::MakeNumeric(10));
        publisher.Publish("ro", VarData::MakeNumeric(1.5));
        publisher.SetWriteHandler([this](const WriteRequestInfo& request, VarData& value) -> WriteDecision {
            ++handled;
            if (request.user == "guest")
                return {proto::WriteStatus::AccessDenied, "guests may not write"};
            if (request.path == "name")
                value = VarData("renamed by the process");
            return {};
        });
        publisher.Start();
    }

    /// Sends `payload` to the write topic of `path`; the answer to it.
    proto::WriteResult WriteRaw(const std::string& path, const std::string& payload)
    {
        const std::string resultTopic = Topic("plant", proto::TopicKind::WriteResult, path);
        observer.Forget(resultTopic);
        observer.Publish(Topic("plant", proto::TopicKind::Write, path), payload);
        const auto answer = observer.WaitFor(resultTopic, [](const std::string&) { return true; });
        if (!answer)
            throw std::runtime_error("no answer to the write of " + path);
        return proto::DecodeWriteResult(*answer);
    }
    proto::WriteResult Write(const std::string& path, const VarData& value, const std::string& user = "operator")
    {
        return WriteRaw(path, proto::EncodeWriteRequest({"req-" + std::to_string(++requests), user, value}));
    }
    VarData Published(const std::string& path)
    {
        return proto::DecodeValueMessage(*observer.Get(Topic("plant", proto::TopicKind::Value, path))).value;
    }

    Publisher publisher{"plant", On(broker)};
    test::MqttObserver observer{broker.Port(), {"orvek/v1/plant/#"}};
    std::atomic<int> handled{0};
    int requests = 0;
};

TEST_F(PublisherWriteTest, AcceptedWritesAreConvertedStoredAndPublished)
{
    proto::WriteResult result = Write("sp", VarData::MakeNumeric(42.0));
    EXPECT_EQ(result.status, proto::WriteStatus::Written) << result.text;
    EXPECT_EQ(result.id, "req-1");
    EXPECT_TRUE(observer.WaitFor(Topic("plant", proto::TopicKind::Value, "sp"), [](const std::string& p) {
        return proto::DecodeValueMessage(p).value.ToDouble() == 42.0;
    }));
    EXPECT_EQ(Published("sp").TypeWord(), 0x40003u) << "a written number takes the variable's kind";
    EXPECT_EQ(publisher.Value("sp").ToDouble(), 42.0);

    // Text that reads as a number converts.
    EXPECT_EQ(Write("sp", VarData(" 17 ")).status, proto::WriteStatus::Written);
    EXPECT_EQ(publisher.Value("sp").ToDouble(), 17.0);

    // The handler may replace the value it accepts.
    EXPECT_EQ(Write("name", VarData::MakeNumeric(3)).status, proto::WriteStatus::Written);
    EXPECT_EQ(publisher.Value("name").GetString(), fen::String("renamed by the process"));
}

TEST_F(PublisherWriteTest, RefusedAndMalformedWritesAreAnsweredAndLeaveTheValueAlone)
{
    struct Case {
        const char* name;
        std::string path;
        VarData value;
        std::int32_t status;
    };
    const Case cases[] = {
        {"read only", "ro", VarData::MakeNumeric(2), proto::WriteStatus::NotWritable},
        {"unknown variable", "missing", VarData::MakeNumeric(2), proto::WriteStatus::NoSuchVariable},
        {"out of the kind's range", "sp", VarData::MakeNumeric(300), proto::WriteStatus::BadValue},
    };
    for (const Case& c : cases) {
        const proto::WriteResult result = Write(c.path, c.value);
        EXPECT_EQ(result.status, c.status) << c.name << ": " << result.text;
        EXPECT_FALSE(result.text.empty()) << c.name;
    }
    EXPECT_EQ(Write("sp", VarData::MakeNumeric(5), "guest").status, proto::WriteStatus::AccessDenied);

    // Malformed requests are answered too, with their id when it can be read.
    proto::WriteResult result = WriteRaw("sp", "this is not json");
    EXPECT_EQ(result.status, proto::WriteStatus::BadRequest);
    EXPECT_EQ(result.id, "");
    result = WriteRaw("sp", R"({"v":1,"id":"x9","value":{"t":3}})");
    EXPECT_EQ(result.status, proto::WriteStatus::BadRequest);
    EXPECT_EQ(result.id, "x9");
    EXPECT_EQ(WriteRaw("sp", R"({"v":2,"id":"x10","value":{"t":3,"n":1}})").status, proto::WriteStatus::BadRequest);
    EXPECT_EQ(WriteRaw("sp", std::string("\xFF\x00\x01", 3)).status, proto::WriteStatus::BadRequest);

    EXPECT_EQ(handled.load(), 1) << "only the request that passed the checks reaches the handler";
    EXPECT_EQ(publisher.Value("sp").ToDouble(), 10.0);
    EXPECT_EQ(Published("sp").ToDouble(), 10.0);
    EXPECT_EQ(Published("ro").ToDouble(), 1.5);
    // Still serving.
    EXPECT_EQ(Write("sp", VarData::MakeNumeric(11)).status, proto::WriteStatus::Written);
}

TEST_F(PublisherTest, AlarmsAreRaisedClearedAndAcknowledged)
{
    Publisher publisher("plant", On(broker));
    std::mutex acksMutex;
    std::vector<std::string> acks;
    publisher.SetAckHandler([&](const std::string& id, const std::string& user, const std::string& comment) {
        std::lock_guard lock(acksMutex);
        acks.push_back(id + "/" + user + "/" + comment);
    });
    publisher.DeclareVariable("drum.level", TypeCode::Numeric, 0, 1);
    publisher.Start();
    test::MqttObserver observer(broker.Port(), {"orvek/v1/plant/#"});
    const std::string topic = Topic("plant", proto::TopicKind::Alarm, "drum-high");
    auto alarmWhere = [&](const std::function<bool(const proto::AlarmMessage&)>& condition) {
        const auto payload = observer.WaitFor(
            topic, [&](const std::string& p) { return !p.empty() && condition(proto::DecodeAlarmMessage(p)); });
        return payload.has_value();
    };

    publisher.RaiseAlarm("drum-high", "Drum level high", 700, "drum.level");
    EXPECT_TRUE(alarmWhere([](const proto::AlarmMessage& a) {
        return a.raised && !a.acknowledged && a.text == "Drum level high" && a.severity == 700 && !a.time.IsEarliest();
    }));
    const proto::Catalogue catalogue = proto::DecodeCatalogue(*observer.Get(Topic("plant", proto::TopicKind::Catalogue)));
    ASSERT_EQ(catalogue.alarms.size(), 1u);
    EXPECT_EQ(catalogue.alarms[0].path, "drum.level");

    // Requests that change nothing: malformed, for an unknown alarm.
    observer.Publish(Topic("plant", proto::TopicKind::AlarmAck, "drum-high"), "{broken");
    observer.Publish(Topic("plant", proto::TopicKind::AlarmAck, "nope"), proto::EncodeAlarmAck({"op", ""}));
    // An acknowledgement from the network.
    observer.Publish(Topic("plant", proto::TopicKind::AlarmAck, "drum-high"),
                     proto::EncodeAlarmAck({"operator", "valve checked"}));
    EXPECT_TRUE(alarmWhere([](const proto::AlarmMessage& a) { return a.raised && a.acknowledged && a.user == "operator"; }));
    {
        std::lock_guard lock(acksMutex);
        EXPECT_EQ(acks, std::vector<std::string>{"drum-high/operator/valve checked"});
    }

    EXPECT_TRUE(publisher.ClearAlarm("drum-high"));
    EXPECT_TRUE(alarmWhere([](const proto::AlarmMessage& a) { return !a.raised && a.acknowledged; }));
    publisher.RaiseAlarm("drum-high", "Drum level high", 700, "drum.level");
    EXPECT_TRUE(alarmWhere([](const proto::AlarmMessage& a) { return a.raised && !a.acknowledged; }))
        << "raising again resets the acknowledgement";
    EXPECT_TRUE(publisher.AcknowledgeAlarm("drum-high", "self"));
    EXPECT_TRUE(alarmWhere([](const proto::AlarmMessage& a) { return a.acknowledged && a.user == "self"; }));
    EXPECT_FALSE(publisher.ClearAlarm("never-raised"));

    EXPECT_TRUE(publisher.RemoveAlarm("drum-high"));
    EXPECT_TRUE(observer.WaitFor(topic, [](const std::string& p) { return p.empty(); }));
}

TEST_F(PublisherTest, OrderlyStopLeavesStoppedAndKeepsTheRest)
{
    {
        Publisher publisher("plant", On(broker));
        publisher.DeclareVariable("x", TypeCode::Numeric, 0, 1);
        publisher.Publish("x", VarData::MakeNumeric(3));
        publisher.Start();
        publisher.Stop();
        EXPECT_FALSE(publisher.IsConnected());
    }
    test::MqttObserver observer(broker.Port(), {"orvek/v1/plant/#"});
    EXPECT_TRUE(observer.WaitFor(Topic("plant", proto::TopicKind::State),
                                 [](const std::string& p) { return HasState(p, proto::RunState::Stopped); }));
    EXPECT_TRUE(observer.WaitFor(Topic("plant", proto::TopicKind::Value, "x"), [](const std::string& p) {
        return proto::DecodeValueMessage(p).value.ToDouble() == 3.0;
    }));
    EXPECT_TRUE(observer.Get(Topic("plant", proto::TopicKind::Catalogue)).has_value());
}

TEST_F(PublisherTest, KilledProcessIsMarkedFailed)
{
    // The child publishes and waits to be killed; forked before this test
    // starts any thread of its own.
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        try {
            Publisher publisher("doomed", On(broker));
            publisher.DeclareVariable("x", TypeCode::Numeric, 0, 1);
            publisher.Publish("x", VarData::MakeNumeric(1));
            publisher.Start();
            for (;;)
                pause();
        } catch (...) {
        }
        _exit(1);
    }
    test::MqttObserver observer(broker.Port(), {"orvek/v1/doomed/#"});
    const bool running = observer
                             .WaitFor(Topic("doomed", proto::TopicKind::State),
                                      [](const std::string& p) { return HasState(p, proto::RunState::Running); })
                             .has_value();
    kill(child, SIGKILL);
    int status = 0;
    waitpid(child, &status, 0);
    ASSERT_TRUE(running);
    EXPECT_TRUE(observer.WaitFor(Topic("doomed", proto::TopicKind::State),
                                 [](const std::string& p) { return HasState(p, proto::RunState::Failed); }));
    EXPECT_TRUE(observer.Get(Topic("doomed", proto::TopicKind::Value, "x")).has_value());
}

TEST_F(PublisherTest, RepublishesEverythingAfterTheBrokerRestarts)
{
    Publisher publisher("plant", On(broker));
    publisher.DeclareVariable("x", TypeCode::Numeric, 0, 1);
    publisher.Publish("x", VarData::MakeNumeric(4));
    publisher.RaiseAlarm("a", "alarm", 10);
    publisher.Start();
    broker.Restart(); // no persistence: every retained message is gone

    test::MqttObserver observer(broker.Port(), {"orvek/v1/plant/#"});
    EXPECT_TRUE(observer.WaitFor(
        Topic("plant", proto::TopicKind::State), [](const std::string& p) { return HasState(p, proto::RunState::Running); },
        8s));
    EXPECT_TRUE(observer.Get(Topic("plant", proto::TopicKind::Catalogue)).has_value());
    EXPECT_TRUE(observer.Get(Topic("plant", proto::TopicKind::Value, "x")).has_value());
    EXPECT_TRUE(observer.Get(Topic("plant", proto::TopicKind::Alarm, "a")).has_value());
    EXPECT_TRUE(publisher.IsConnected());
}

TEST_F(PublisherTest, RequestsLeftRetainedAreNotCarriedOutAgain)
{
    test::MqttObserver observer(broker.Port(), {"orvek/v1/plant/#"});
    const std::string write = Topic("plant", proto::TopicKind::Write, "x");
    observer.Publish(write, proto::EncodeWriteRequest({"stale", "", VarData::MakeNumeric(99)}), true);
    observer.Publish(Topic("plant", proto::TopicKind::AlarmAck, "a"), proto::EncodeAlarmAck({"stale", ""}), true);
    // Both are kept by the broker once they come back to the observer.
    ASSERT_TRUE(observer.WaitFor(write, [](const std::string&) { return true; }));
    ASSERT_TRUE(observer.WaitFor(Topic("plant", proto::TopicKind::AlarmAck, "a"), [](const std::string&) { return true; }));

    Publisher publisher("plant", On(broker));
    publisher.DeclareVariable("x", TypeCode::Numeric, 0, proto::Access::Read | proto::Access::Write);
    publisher.Publish("x", VarData::MakeNumeric(1));
    publisher.RaiseAlarm("a", "alarm", 10);
    publisher.Start();
    // A live request after the retained ones; once it is answered, the
    // retained ones would have been served too.
    observer.Publish(write, proto::EncodeWriteRequest({"live", "", VarData::MakeNumeric(2)}));
    EXPECT_TRUE(observer.WaitFor(Topic("plant", proto::TopicKind::WriteResult, "x"),
                                 [](const std::string& p) { return proto::DecodeWriteResult(p).id == "live"; }));
    EXPECT_EQ(observer.Count(Topic("plant", proto::TopicKind::WriteResult, "x")), 1u) << "the stale one was answered";
    EXPECT_EQ(publisher.Value("x").ToDouble(), 2.0);
    const auto alarm = observer.Get(Topic("plant", proto::TopicKind::Alarm, "a"));
    ASSERT_TRUE(alarm);
    EXPECT_FALSE(proto::DecodeAlarmMessage(*alarm).acknowledged);
}

TEST(PublisherWriteConversion, ConvertsWhereSensibleAndRefusesTheRest)
{
    struct Case {
        const char* name;
        VarData written;
        std::uint16_t type;
        NumericKind kind;
        bool ok;
        std::uint32_t typeWord;
        double number; // for numeric and logical results
    };
    const Case cases[] = {
        {"number keeps the variable's kind", VarData::MakeNumeric(-7), TypeCode::Numeric, NumericKind::Int8, true,
         0x10003, -7},
        {"float32 rounds", VarData::MakeNumeric(0.1), TypeCode::Numeric, NumericKind::Float32, true, 0x70003,
         static_cast<double>(0.1f)},
        {"float32 overflow", VarData::MakeNumeric(1e39), TypeCode::Numeric, NumericKind::Float32, false, 0, 0},
        {"bit field", VarData::MakeNumeric(4294967295.0), TypeCode::Numeric, NumericKind::BitField, true, 0x80003,
         4294967295.0},
        {"negative bit field", VarData::MakeNumeric(-1), TypeCode::Numeric, NumericKind::BitField, false, 0, 0},
        {"fraction to an integer kind", VarData::MakeNumeric(2.5), TypeCode::Numeric, NumericKind::UInt8, false, 0, 0},
        {"NaN to an integer kind", VarData::MakeNumeric(std::nan("")), TypeCode::Numeric, NumericKind::Int32, false,
         0, 0},
        {"logical to number", VarData::MakeLogical(true), TypeCode::Numeric, NumericKind::Float64, true, 3, 1},
        {"exact count to number", VarData::MakeUInt64(1ull << 60), TypeCode::Numeric, NumericKind::Float64, true, 3,
         std::ldexp(1.0, 60)},
        {"inexact count to number", VarData::MakeUInt64((1ull << 53) + 1), TypeCode::Numeric, NumericKind::Float64,
         false, 0, 0},
        {"unicode number text", VarData(u"2.5e1"), TypeCode::Numeric, NumericKind::Float64, true, 3, 25},
        {"empty text to number", VarData(""), TypeCode::Numeric, NumericKind::Float64, false, 0, 0},
        {"bytes to number", VarData(reinterpret_cast<const std::uint8_t*>("\x01"), 1), TypeCode::Numeric,
         NumericKind::Float64, false, 0, 0},
        {"word to logical", VarData("Off"), TypeCode::Logical, NumericKind::Float64, true, 2, 0},
        {"number text to logical", VarData("2"), TypeCode::Logical, NumericKind::Float64, true, 2, 1},
        {"other text to logical", VarData("maybe"), TypeCode::Logical, NumericKind::Float64, false, 0, 0},
        {"text to count", VarData("18446744073709551615"), TypeCode::UInt64, NumericKind::Float64, true, 0x11, 0},
        {"negative to count", VarData::MakeNumeric(-1), TypeCode::UInt64, NumericKind::Float64, false, 0, 0},
        {"number to text", VarData::MakeNumeric(1.5), TypeCode::AnsiString, NumericKind::Float64, true, 0x1005, 0},
        {"dictionary to text", VarData::NewDictionary(), TypeCode::AnsiString, NumericKind::Float64, false, 0, 0},
        {"time to raw bytes", VarData(fen::AbsTime{0, 5}), TypeCode::RawBytes, NumericKind::Float64, false, 0, 0},
        {"same storage type", VarData(fen::AbsTime{0, 5}), TypeCode::SSTimeValue, NumericKind::Float64, true, 0x100F,
         0},
    };
    for (const Case& c : cases) {
        VarData result;
        std::string why;
        const bool ok = ConvertForWrite(c.written, c.type, static_cast<std::uint8_t>(c.kind), result, why);
        EXPECT_EQ(ok, c.ok) << c.name;
        if (!ok) {
            EXPECT_FALSE(why.empty()) << c.name;
            continue;
        }
        EXPECT_EQ(result.TypeWord(), c.typeWord) << c.name;
        if (c.type == TypeCode::Numeric || c.type == TypeCode::Logical) {
            EXPECT_EQ(result.ToDouble(), c.number) << c.name;
        }
    }
    VarData result;
    std::string why;
    ASSERT_TRUE(ConvertForWrite(VarData("18446744073709551615"), TypeCode::UInt64, 0, result, why));
    EXPECT_EQ(result.GetUInt64(), 18446744073709551615ull);
    ASSERT_TRUE(ConvertForWrite(VarData::MakeNumeric(1.5), TypeCode::AnsiString, 0, result, why));
    EXPECT_EQ(result.GetString(), fen::String("1.5"));
}

} // namespace
} // namespace qv::network::publisher
