// The messages around the value: process state, catalogue, writes, alarms,
// the rules every envelope follows, and the example of docs/protocol.md.

#include "network/protocol/AlarmAck.h"
#include "network/protocol/AlarmMessage.h"
#include "network/protocol/Catalogue.h"
#include "network/protocol/ProcessState.h"
#include "network/protocol/ProtocolError.h"
#include "network/protocol/ValueMessage.h"
#include "network/protocol/WriteRequest.h"
#include "network/protocol/WriteResult.h"

#include <gtest/gtest.h>

using namespace qv::network::protocol;
using qv::fen::AbsTime;
using qv::value::VarData;

TEST(ProtocolMessages, ExampleOfTheProtocolPage)
{
    // The three payloads that docs/protocol.md publishes with mosquitto_pub.
    const ProcessState state = DecodeProcessState(R"({"v":1,"state":"running"})");
    EXPECT_EQ(state.state, RunState::Running);

    const Catalogue catalogue =
        DecodeCatalogue(R"({"v":1,"variables":[{"path":"drum.level","type":3,"kind":0,"access":1}]})");
    ASSERT_EQ(catalogue.variables.size(), 1u);
    EXPECT_EQ(catalogue.variables[0].path, "drum.level");
    EXPECT_EQ(catalogue.variables[0].type, qv::value::TypeCode::Numeric);
    EXPECT_EQ(catalogue.variables[0].access, Access::Read);
    EXPECT_FALSE(catalogue.variables[0].valued); // absent: no value published

    const ValueMessage value = DecodeValueMessage(
        R"({"v":1,"value":{"t":3,"n":42.5},"quality":"0x0000000000000000","error":0,)"
        R"("time":{"s":"3786912000","f":"9223372036854775808"}})");
    EXPECT_EQ(value.value.TypeWord(), 3u);
    EXPECT_EQ(value.value.ToDouble(), 42.5);
    std::int64_t unixSeconds = 0;
    ASSERT_EQ(qv::fen::AbsTimeToUnixSeconds(value.time, qv::fen::Rounding::Truncate, unixSeconds), 0);
    EXPECT_EQ(unixSeconds, 1704067200); // 2024-01-01 00:00:00 UTC
    EXPECT_EQ(value.time.fraction, 1ull << 63);
}

TEST(ProtocolMessages, StateAndLastWill)
{
    EXPECT_EQ(LastWillPayload(), R"({"state":"failed","v":1})");
    const ProcessState running{RunState::Running, 4711, AbsTime{5, -7}};
    EXPECT_EQ(EncodeProcessState(running), R"({"pid":4711,"since":{"f":"5","s":"-7"},"state":"running","v":1})");
    const ProcessState back = DecodeProcessState(EncodeProcessState(running));
    EXPECT_EQ(back.pid, 4711);
    EXPECT_EQ(back.since, (AbsTime{5, -7}));
    EXPECT_EQ(DecodeProcessState(R"({"v":1,"state":"stopped"})").state, RunState::Stopped);
    EXPECT_THROW(DecodeProcessState(R"({"v":1,"state":"Running"})"), ProtocolError);
    EXPECT_THROW(DecodeProcessState(R"({"v":1,"state":"running","pid":0})"), ProtocolError);
}

TEST(ProtocolMessages, CatalogueRoundTripAndRules)
{
    Catalogue catalogue;
    catalogue.variables.push_back({"drum.level", 3, 7, Access::Read | Access::Write});
    catalogue.variables.push_back({"a\\'x.y'", 0x1005, 0, Access::Read, true});
    catalogue.alarms.push_back({"drum high/1", "Drum level high", 700, "drum.level"});
    const std::string text = EncodeCatalogue(catalogue);
    EXPECT_EQ(text, R"({"alarms":[{"id":"drum high/1","path":"drum.level","severity":700,"text":"Drum level high"}],)"
                    R"("v":1,"variables":[{"access":3,"kind":7,"path":"drum.level","type":3,"valued":false},)"
                    R"({"access":1,"kind":0,"path":"a\\'x.y'","type":4101,"valued":true}]})");
    const Catalogue back = DecodeCatalogue(text);
    ASSERT_EQ(back.variables.size(), 2u);
    EXPECT_EQ(back.variables[1].path, "a\\'x.y'");
    EXPECT_EQ(back.variables[0].kind, 7);
    EXPECT_FALSE(back.variables[0].valued);
    EXPECT_TRUE(back.variables[1].valued);
    ASSERT_EQ(back.alarms.size(), 1u);
    EXPECT_EQ(back.alarms[0].id, "drum high/1");
    EXPECT_EQ(back.alarms[0].severity, 700);

    for (const char* bad : {
             R"({"v":1})",
             R"({"v":1,"variables":[{"path":"'drum'.level","type":3}]})",
             R"({"v":1,"variables":[{"path":"a","type":3},{"path":"a","type":2}]})",
             R"({"v":1,"variables":[{"path":"a","type":65536}]})",
             R"({"v":1,"variables":[{"path":"a","type":3,"kind":16}]})",
             R"({"v":1,"variables":[{"path":"a","type":3,"valued":"true"}]})",
             R"({"v":1,"variables":[],"alarms":[{"id":""}]})",
             R"({"v":1,"variables":[],"alarms":[{"id":"x","severity":1001}]})",
         }) {
        SCOPED_TRACE(bad);
        EXPECT_THROW(DecodeCatalogue(bad), ProtocolError);
    }
    catalogue.variables.push_back({"drum.level", 3, 0, Access::Read});
    EXPECT_THROW(EncodeCatalogue(catalogue), qv::fen::exception::InvalidArgument);
}

TEST(ProtocolMessages, WritesAndAlarmsRoundTrip)
{
    const WriteRequest request{"monitor-1", "operator", VarData::MakeBitField(0x81)};
    EXPECT_EQ(EncodeWriteRequest(request), R"({"id":"monitor-1","user":"operator","v":1,"value":{"n":129.0,"t":524291}})");
    const WriteRequest request2 = DecodeWriteRequest(EncodeWriteRequest(request));
    EXPECT_EQ(request2.id, "monitor-1");
    EXPECT_EQ(request2.user, "operator");
    EXPECT_EQ(request2.value.TypeWord(), request.value.TypeWord());
    EXPECT_EQ(request2.value.ToDouble(), 129.0);
    EXPECT_THROW(DecodeWriteRequest(R"({"v":1,"id":"","value":{"t":0}})"), ProtocolError);
    EXPECT_THROW(DecodeWriteRequest(R"({"v":1,"id":"x"})"), ProtocolError);

    const WriteResult result = DecodeWriteResult(EncodeWriteResult({"monitor-1", WriteStatus::AccessDenied, "no"}));
    EXPECT_EQ(result.id, "monitor-1");
    EXPECT_EQ(result.status, WriteStatus::AccessDenied);
    EXPECT_EQ(result.text, "no");
    EXPECT_THROW(DecodeWriteResult(R"({"v":1,"id":"x","status":2147483648})"), ProtocolError);

    const AlarmMessage alarm{false, true, "Drum level high", 700, AbsTime{1, 2}, "operator"};
    const AlarmMessage alarm2 = DecodeAlarmMessage(EncodeAlarmMessage(alarm));
    EXPECT_FALSE(alarm2.raised);
    EXPECT_TRUE(alarm2.acknowledged);
    EXPECT_EQ(alarm2.text, alarm.text);
    EXPECT_EQ(alarm2.severity, 700);
    EXPECT_EQ(alarm2.time, alarm.time);
    EXPECT_EQ(alarm2.user, "operator");
    EXPECT_THROW(DecodeAlarmMessage(R"({"v":1,"state":"acknowledged"})"), ProtocolError);

    const AlarmAck ack = DecodeAlarmAck(EncodeAlarmAck({"operator", "checked"}));
    EXPECT_EQ(ack.user, "operator");
    EXPECT_EQ(ack.comment, "checked");
}

TEST(ProtocolMessages, EnvelopeRules)
{
    // Later revisions of version 1 may add members; readers skip them.
    EXPECT_EQ(DecodeValueMessage(R"({"v":1,"value":{"t":0},"unit":"m"})").time, AbsTime::Earliest());
    const ValueMessage lowerCase = DecodeValueMessage(R"({"v":1,"value":{"t":0},"quality":"0x2000abc"})");
    EXPECT_EQ(lowerCase.quality, 0x2000ABCu);

    for (const char* bad : {
             "",
             "null",
             R"({"value":{"t":0}})",
             R"({"v":2,"value":{"t":0}})",
             R"({"v":"1","value":{"t":0}})",
             R"({"v":1,"v":1,"value":{"t":0}})",
             R"({"v":1,"value":{"t":0,"t":3}})",
             R"({"v":1,"value":{"t":0}} x)",
             R"({"v":1,"value":{"t":0},"quality":"0x10000000000000000"})",
             R"({"v":1,"value":{"t":0},"quality":"2000"})",
             R"({"v":1,"value":{"t":0},"quality":"0x-1"})",
             R"({"v":1,"value":{"t":0},"error":-2147483649})",
             R"({"v":1,"value":{"t":0},"time":{"s":"0","f":"0","z":"0"}})",
             R"({"v":1,"value":{"t":0},"time":{"s":0,"f":0}})",
             "{\"v\":1,\"value\":{\"t\":4101,\"a\":\"\xFF\"}}",
         }) {
        SCOPED_TRACE(bad);
        EXPECT_THROW(DecodeValueMessage(bad), ProtocolError);
    }
}
