#include "network/realtime/OrvekRealTime.h"
#include "network/realtime/HostResolver.h"

#include "RealTimeTestSupport.h"

#include "network/protocol/Catalogue.h"
#include "network/protocol/ProcessState.h"
#include "network/protocol/Topics.h"
#include "network/protocol/ValueMessage.h"
#include "network/protocol/WriteRequest.h"

#include <gtest/gtest.h>

#include <map>
#include <thread>

namespace qv::test {
namespace {

namespace proto = network::protocol;
namespace Q = rt::QualityBits;
using namespace std::chrono_literals;

/// A change other than the "connecting" that a brand-new connection shows first.
bool Settled(const RecordedChange& change)
{
    return change.quality != Q::Connecting;
}

bool Any(const RecordedChange&)
{
    return true;
}

std::string ValueJson(double number)
{
    return proto::VarDataToJson(value::VarData::MakeNumeric(number)).dump();
}

fen::AbsTime At(std::int64_t seconds)
{
    return {0, seconds};
}

/// One process "boiler" on the broker, published with raw MQTT.
class FakeProcess {
public:
    explicit FakeProcess(std::uint16_t port, std::string name = "boiler", const char* user = nullptr,
                         const char* password = nullptr)
        : client_(port, user, password), name_(std::move(name))
    {
    }
    void State(proto::RunState state)
    {
        client_.Publish(proto::ProcessTopic(name_, proto::TopicKind::State), proto::EncodeProcessState({state, {}, {}}));
    }
    void Catalogue(const proto::Catalogue& catalogue)
    {
        client_.Publish(proto::ProcessTopic(name_, proto::TopicKind::Catalogue), proto::EncodeCatalogue(catalogue));
    }
    void Value(const std::string& path, double number, std::uint64_t quality = 0, fen::AbsTime time = At(3786912000))
    {
        proto::ValueMessage message;
        message.value = value::VarData::MakeNumeric(number);
        message.quality = quality;
        message.time = time;
        client_.Publish(proto::NamedTopic(name_, proto::TopicKind::Value, path), proto::EncodeValueMessage(message));
    }
    /// Running, with readable "drum.level" = `number`.
    void Standard(double number)
    {
        Catalogue({{{"drum.level", 3, 0, proto::Access::Read | proto::Access::Write}, {"drum.empty", 3}}, {}});
        Value("drum.level", number);
        State(proto::RunState::Running);
    }
    RawClient& Client() { return client_; }

private:
    RawClient client_;
    std::string name_;
};

class RealTimeTest : public ::testing::Test {
protected:
    void SetUp() override { StartBroker({}); }
    void TearDown() override
    {
        for (auto* subscription : subscriptions_)
            subscription->Release();
        subscriptions_.clear();
        if (realTime_ != nullptr)
            realTime_->Release();
        if (session_ != nullptr)
            session_->Release();
        rt::SetHostResolver(nullptr);
    }

    void StartBroker(TestBrokerOptions options)
    {
        broker_.reset();
        broker_ = std::make_unique<TestBroker>(std::move(options));
        SetDataPort(broker_->Port());
    }

    rt::IOrvekRealTime* RealTime()
    {
        if (realTime_ == nullptr) {
            network::session::NewOrvekSession(&session_);
            EXPECT_TRUE(rt::NewOrvekRealTime(session_, &receiver_, &realTime_));
        }
        return realTime_;
    }

    rt::ISubscription* Subscribe(const char16_t* url, std::int32_t handle)
    {
        rt::ISubscription* subscription = nullptr;
        EXPECT_EQ(RealTime()->Subscribe(url, handle, nullptr, &subscription), 0);
        EXPECT_NE(subscription, nullptr);
        if (subscription != nullptr)
            subscriptions_.push_back(subscription);
        return subscription;
    }

    /// The next change of `handle` that `match` accepts; throws when none comes.
    RecordedChange Next(std::int32_t handle, const std::function<bool(const RecordedChange&)>& match = Any)
    {
        const auto change = receiver_.WaitFor(handle, match);
        if (!change)
            throw std::runtime_error("no awaited change of handle " + std::to_string(handle));
        return *change;
    }
    RecordedChange NextWithQuality(std::int32_t handle, std::uint64_t bits)
    {
        return Next(handle, [bits](const RecordedChange& c) { return (c.quality & bits) == bits; });
    }

    TemporaryHome home_;
    std::unique_ptr<TestBroker> broker_;
    RecordingReceiver receiver_;
    network::session::IOrvekSession* session_ = nullptr;
    rt::IOrvekRealTime* realTime_ = nullptr;
    std::vector<rt::ISubscription*> subscriptions_;
};

TEST_F(RealTimeTest, DeliversLatestValueAtOnceThenEachChangeWithItsMask)
{
    FakeProcess process(broker_->Port());
    process.Standard(42.5);
    Subscribe(u"\\\\localhost\\boiler\\drum.level", 7);

    const RecordedChange first = Next(7, Settled);
    EXPECT_EQ(first.mask, rt::ChangeMask::All); // everything differs from "connecting"
    EXPECT_EQ(first.value, ValueJson(42.5));
    EXPECT_EQ(first.quality, 0u);
    EXPECT_EQ(first.error, 0);
    EXPECT_EQ(first.time, At(3786912000));

    process.Value("drum.level", 43.0);
    const RecordedChange value = Next(7);
    EXPECT_EQ(value.mask, rt::ChangeMask::Value);
    EXPECT_EQ(value.value, ValueJson(43.0));

    process.Value("drum.level", 43.0, 0, At(3786912001));
    EXPECT_EQ(Next(7).mask, rt::ChangeMask::Timestamp);

    // The process's own quality bits pass through.
    process.Value("drum.level", 43.0, 0x1, At(3786912001));
    const RecordedChange quality = Next(7);
    EXPECT_EQ(quality.mask, rt::ChangeMask::QualityOrError | rt::ChangeMask::QualityOrError2);
    EXPECT_EQ(quality.quality, 0x1u);

    // Republishing the same message changes nothing.
    process.Value("drum.level", 43.0, 0x1, At(3786912001));
    process.Value("drum.level", 44.0, 0x1, At(3786912001));
    EXPECT_EQ(Next(7).value, ValueJson(44.0));
    EXPECT_EQ(receiver_.Changes(7).size(), receiver_.Changes(7).front().quality == Q::Connecting ? 6u : 5u);
}

TEST_F(RealTimeTest, ReportsMissingProcessVariableAndValue)
{
    FakeProcess process(broker_->Port());
    process.Standard(1.0);
    // Another spelling of the host: the local machine's "localhost" in capitals.
    Subscribe(u"\\\\LOCALHOST\\boiler\\no.such", 1);
    Subscribe(u"\\\\localhost\\boiler\\drum.empty", 2);
    Subscribe(u"\\\\localhost\\nobody\\drum.level", 3);

    const RecordedChange missing = Next(1, Settled);
    EXPECT_EQ(missing.quality, Q::Nonexistant);
    EXPECT_LT(missing.error, 0);
    EXPECT_EQ(Next(2, Settled).quality, Q::NoKnownValue);
    EXPECT_EQ(Next(3, Settled).quality, Q::Nonexistant);

    // The variable appears later and is delivered as a change.
    process.Value("drum.empty", 5.0);
    const RecordedChange appeared = Next(2);
    EXPECT_EQ(appeared.quality, 0u);
    EXPECT_EQ(appeared.value, ValueJson(5.0));
    EXPECT_EQ(appeared.mask & rt::ChangeMask::Value, rt::ChangeMask::Value);
}

TEST_F(RealTimeTest, InvalidURLIsDeliveredAsAChange)
{
    for (const char16_t* url : {u"\\\\host\\", u"\\\\localhost\\boiler", u"relative.path", u"\\\\h\\p\\'unclosed"}) {
        SCOPED_TRACE(std::u16string(url).size());
        auto* subscription = Subscribe(url, 9);
        const RecordedChange change = Next(9);
        EXPECT_EQ(change.quality, Q::InvalidURL);
        EXPECT_EQ(change.mask, rt::ChangeMask::All);
        EXPECT_LT(subscription->Write(value::VarData::MakeNumeric(1)), 0);
    }
}

TEST_F(RealTimeTest, ProcessFailureKeepsTheLastValueUntilTheProcessRunsAgain)
{
    FakeProcess process(broker_->Port());
    process.Standard(3.0);
    Subscribe(u"\\\\localhost\\boiler\\drum.level", 4);
    EXPECT_EQ(Next(4, Settled).quality, 0u);

    // What the broker publishes from the last will of a process that vanished.
    process.Client().Publish(proto::ProcessTopic("boiler", proto::TopicKind::State), proto::LastWillPayload());
    const RecordedChange failed = Next(4);
    EXPECT_EQ(failed.quality, Q::ProcessFailure);
    EXPECT_EQ(failed.value, ValueJson(3.0));
    EXPECT_EQ(failed.mask, rt::ChangeMask::QualityOrError | rt::ChangeMask::QualityOrError2);

    process.State(proto::RunState::Running);
    EXPECT_EQ(Next(4).quality, 0u);
}

TEST_F(RealTimeTest, DisconnectedThenRefusedThenResumesAfterRestart)
{
    {
        FakeProcess process(broker_->Port());
        process.Standard(10.0);
        Subscribe(u"\\\\localhost\\boiler\\drum.level", 5);
        Next(5, [](const auto& c) { return c.quality == 0; });
        broker_->Stop();
        EXPECT_EQ(NextWithQuality(5, Q::Disconnected).value, ValueJson(10.0));
        EXPECT_TRUE(receiver_.WaitForQuality(5, Q::Connecting));
        // Nothing listens on the data port while the broker is down.
        EXPECT_EQ(NextWithQuality(5, Q::ServiceLookupFailure).error, rt::ErrorCodes::ConnectionRefused);
    }
    broker_->Start();
    FakeProcess restarted(broker_->Port());
    restarted.Standard(11.0);
    EXPECT_TRUE(receiver_.WaitFor(5, [](const auto& c) { return c.quality == 0 && c.value == ValueJson(11.0); }));
}

class MapResolver : public rt::HostResolver {
public:
    explicit MapResolver(std::map<std::string, std::string> names) : names_(std::move(names)) {}
    std::optional<std::string> Resolve(const std::string& host) const override
    {
        ++calls;
        const auto found = names_.find(host);
        return found == names_.end() ? std::nullopt : std::optional<std::string>(found->second);
    }
    mutable std::atomic<int> calls{0};

private:
    std::map<std::string, std::string> names_;
};

TEST_F(RealTimeTest, HostNamesGoThroughTheResolver)
{
    auto resolver = std::make_shared<MapResolver>(std::map<std::string, std::string>{{"plant-a", "127.0.0.1"}});
    rt::SetHostResolver(resolver);
    FakeProcess process(broker_->Port());
    process.Standard(8.0);
    Subscribe(u"\\\\plant-a\\boiler\\drum.level", 1);
    Subscribe(u"\\\\nowhere\\boiler\\drum.level", 2);

    EXPECT_EQ(Next(1, Settled).value, ValueJson(8.0));
    EXPECT_EQ(NextWithQuality(2, Q::DnsFailure).error, rt::ErrorCodes::HostNotFound);

    // The local names never reach the resolver.
    const int before = resolver->calls;
    Subscribe(u"\\\\localhost\\boiler\\drum.level", 3);
    Subscribe(u"\\\\.\\boiler\\drum.level", 4);
    EXPECT_TRUE(receiver_.WaitFor(3, [](const auto& c) { return c.quality == 0; }));
    EXPECT_TRUE(receiver_.WaitFor(4, [](const auto& c) { return c.quality == 0; }));
    EXPECT_LE(resolver->calls - before, 1); // at most a retry for "nowhere"
}

TEST_F(RealTimeTest, AccessDeniedForAnUnreadableVariableAndARefusedLogin)
{
    FakeProcess process(broker_->Port());
    process.Catalogue({{{"secret", 3, 0, proto::Access::Write}}, {}});
    process.Value("secret", 1.0);
    process.State(proto::RunState::Running);
    Subscribe(u"\\\\localhost\\boiler\\secret", 1);
    EXPECT_TRUE(receiver_.WaitForQuality(1, Q::AccessDenied));

    StartBroker({{{"alice", "wonder"}}, "", true, ""});
    Subscribe(u"\\\\localhost\\boiler\\drum.level", 2); // the session has no login
    EXPECT_EQ(NextWithQuality(2, Q::AccessDenied).error, rt::ErrorCodes::AccessDenied);
}

TEST_F(RealTimeTest, AValuedVariableIsAccessDeniedUntilItsValueArrives)
{
    // "viewer" may read everything of "boiler" but the values of "secret" and "unset".
    StartBroker({{{"plant", "p"}, {"viewer", "v"}},
                 "user plant\ntopic readwrite orvek/v1/#\n"
                 "user viewer\ntopic read orvek/v1/boiler/state\ntopic read orvek/v1/boiler/catalogue\n"
                 "topic read orvek/v1/boiler/value/open\ntopic read orvek/v1/boiler/value/late\n",
                 true, ""});
    FakeProcess process(broker_->Port(), "boiler", "plant", "p");
    proto::Catalogue catalogue{{{"secret", 3, 0, proto::Access::Read, true},
                                {"unset", 3, 0, proto::Access::Read, false},
                                {"open", 3, 0, proto::Access::Read, true},
                                {"late", 3, 0, proto::Access::Read, true}},
                               {}};
    process.Value("secret", 1.0);
    process.Value("open", 2.0);
    process.Catalogue(catalogue);
    process.State(proto::RunState::Running);

    RealTime(); // makes the session that the subscriptions' connection uses
    ASSERT_EQ(session_->Login(u"viewer", u"v", nullptr), network::session::kStatusOk);
    Subscribe(u"\\\\localhost\\boiler\\secret", 1);
    Subscribe(u"\\\\localhost\\boiler\\unset", 2);
    Subscribe(u"\\\\localhost\\boiler\\open", 3);
    Subscribe(u"\\\\localhost\\boiler\\late", 4);

    const RecordedChange withheld = Next(1, Settled);
    EXPECT_EQ(withheld.quality, Q::AccessDenied);
    EXPECT_EQ(withheld.error, rt::ErrorCodes::AccessDenied);
    EXPECT_EQ(withheld.data.Code(), value::TypeCode::Empty);
    // Never published: nothing is withheld.
    EXPECT_EQ(Next(2, Settled).quality, Q::NoKnownValue);
    const RecordedChange open = Next(3, Settled);
    EXPECT_EQ(open.quality, 0u);
    EXPECT_EQ(open.data.ToDouble(), 2.0);

    // Readable but not yet delivered looks the same until the value comes.
    NextWithQuality(4, Q::AccessDenied);
    process.Value("late", 4.0);
    const RecordedChange shown = Next(4, [](const auto& c) { return c.quality == 0; });
    EXPECT_EQ(shown.error, 0);
    EXPECT_EQ(shown.data.ToDouble(), 4.0);

    // A catalogue that later calls the variable valued, with its value
    // still not delivered, turns "no known value" into "access denied".
    catalogue.variables[1].valued = true;
    process.Value("unset", 3.0);
    process.Catalogue(catalogue);
    EXPECT_TRUE(receiver_.WaitForQuality(2, Q::AccessDenied));
}

TEST_F(RealTimeTest, WriteSendsARequestAndReleaseStopsDeliveries)
{
    FakeProcess process(broker_->Port());
    process.Standard(1.0);
    process.Client().Subscribe("orvek/v1/boiler/write/+");
    auto* subscription = Subscribe(u"\\\\localhost\\boiler\\drum.level", 3);
    Next(3, Settled);

    ASSERT_EQ(subscription->Write(value::VarData::MakeNumeric(55)), 0);
    auto request = process.Client().WaitForMessage();
    ASSERT_TRUE(request);
    EXPECT_EQ(request->first, "orvek/v1/boiler/write/drum.level");
    const auto decoded = proto::DecodeWriteRequest(request->second);
    EXPECT_EQ(proto::VarDataToJson(decoded.value).dump(), ValueJson(55));
    EXPECT_FALSE(decoded.id.empty());

    std::erase(subscriptions_, subscription);
    subscription->Release();
    process.Value("drum.level", 2.0);
    std::this_thread::sleep_for(300ms);
    EXPECT_EQ(receiver_.Changes(3).back().value, ValueJson(1.0));
}

TEST_F(RealTimeTest, ReleasingTheRealTimeObjectReleasesTheReceiver)
{
    Subscribe(u"\\\\localhost\\boiler\\drum.level", 1);
    ASSERT_TRUE(receiver_.WaitFor(1, Any));
    EXPECT_GT(receiver_.References(), 1u);
    realTime_->Release();
    realTime_ = nullptr;
    EXPECT_EQ(receiver_.References(), 1u);
}

} // namespace
} // namespace qv::test
