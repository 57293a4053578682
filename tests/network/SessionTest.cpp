#include "network/session/OrvekSession.h"

#include "RealTimeTestSupport.h"

#include "network/protocol/ProcessState.h"
#include "network/protocol/Topics.h"
#include "network/protocol/WriteRequest.h"

#include <gtest/gtest.h>

#include <string>

namespace qv::test {
namespace {

namespace session = network::session;
namespace proto = network::protocol;

std::u16string UserName(session::IOrvekSession* s)
{
    session::IOrvekIdentity* identity = nullptr;
    EXPECT_EQ(s->GetIdentity(&identity), session::kStatusOk);
    char16_t* name = nullptr;
    EXPECT_EQ(identity->GetUserName(&name), session::kStatusOk);
    identity->Release();
    std::u16string result = name;
    session::OrvekFreeString(name);
    return result;
}

class SessionTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        session::OrvekLibraryStart();
        ASSERT_TRUE(session::NewOrvekSession(&session_));
        session_->ResetLogin();
    }
    void TearDown() override
    {
        session_->Close();
        session_->Release();
        session::OrvekLibraryStop();
    }

    TemporaryHome home_;
    TestBroker broker_{{{{"alice", "wonder"}, {"bob", "builder"}}, "", true, ""}};
    session::IOrvekSession* session_ = nullptr;
};

TEST_F(SessionTest, LoginIsCheckedByTheDataServer)
{
    SetDataPort(broker_.Port());
    EXPECT_EQ(UserName(session_), u"");
    EXPECT_EQ(session_->Login(u"alice", u"wrong", nullptr), session::kStatusAccessDenied);
    EXPECT_EQ(session_->Login(u"mallory", u"wonder", nullptr), session::kStatusAccessDenied);
    EXPECT_EQ(UserName(session_), u"");

    EXPECT_EQ(session_->Login(u"alice", u"wonder", nullptr), session::kStatusOk);
    EXPECT_EQ(UserName(session_), u"alice");
    // A refused login keeps the one before.
    EXPECT_LT(session_->Login(u"bob", u"wrong", nullptr), 0);
    EXPECT_EQ(UserName(session_), u"alice");

    session_->ResetLogin();
    EXPECT_EQ(UserName(session_), u"");
    // Without a data server a login is unanswered, not refused.
    SetDataPort(FreeLoopbackPort());
    EXPECT_EQ(session_->Login(u"alice", u"wonder", nullptr), session::kStatusNoDataServer);
    session_->Close();
    EXPECT_EQ(session_->Login(u"alice", u"wonder", nullptr), session::kStatusClosed);
}

TEST_F(SessionTest, EveryConnectionCarriesTheLogin)
{
    SetDataPort(broker_.Port());
    ASSERT_EQ(session_->Login(u"bob", u"builder", nullptr), session::kStatusOk);
    RawClient process(broker_.Port(), "alice", "wonder");
    process.Publish("orvek/v1/boiler/state", proto::EncodeProcessState({}));
    process.Publish("orvek/v1/boiler/catalogue", R"({"v":1,"variables":[{"path":"x","type":3,"access":3}]})");
    process.Publish("orvek/v1/boiler/value/x", R"({"v":1,"value":{"t":3,"n":4}})");
    process.Subscribe("orvek/v1/boiler/write/+");

    RecordingReceiver receiver;
    rt::IOrvekRealTime* realTime = nullptr;
    ASSERT_TRUE(rt::NewOrvekRealTime(session_, &receiver, &realTime));
    rt::ISubscription* subscription = nullptr;
    ASSERT_EQ(realTime->Subscribe(u"\\\\localhost\\boiler\\x", 1, nullptr, &subscription), 0);
    auto change = receiver.WaitFor(1, [](const auto& c) { return c.quality != rt::QualityBits::Connecting; });
    ASSERT_TRUE(change);
    EXPECT_EQ(change->quality, 0u);

    ASSERT_EQ(subscription->Write(value::VarData::MakeNumeric(5)), 0);
    auto request = process.WaitForMessage();
    ASSERT_TRUE(request);
    EXPECT_EQ(proto::DecodeWriteRequest(request->second).user, "bob");
    EXPECT_NE(broker_.Log().find("u'bob'"), std::string::npos) << broker_.Log();

    subscription->Release();
    realTime->Release();
}

} // namespace
} // namespace qv::test
