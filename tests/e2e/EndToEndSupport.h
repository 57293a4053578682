#pragma once
// Helpers of the end-to-end tests: a monitor (session, real-time object and
// recording receiver, released in the right order), and a fixture with a
// fresh configuration directory whose data port leads to a test broker.

#include "network/RealTimeTestSupport.h"

#include "network/protocol/ProcessState.h"
#include "network/protocol/Topics.h"
#include "network/publisher/Publisher.h"
#include "network/realtime/HostResolver.h"
#include "network/session/OrvekSession.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

namespace qv::test {

namespace Q = rt::QualityBits;
using namespace std::chrono_literals;

/// Anything but the "connecting" that a brand-new connection shows first.
inline bool Settled(const RecordedChange& change)
{
    return change.quality != Q::Connecting;
}

/// One monitor on the network, with its own session and login.
class Monitor {
public:
    Monitor() { network::session::NewOrvekSession(&session_); }
    ~Monitor()
    {
        for (auto* subscription : subscriptions_)
            subscription->Release();
        if (realTime_ != nullptr)
            realTime_->Release();
        session_->Release();
    }
    Monitor(const Monitor&) = delete;
    Monitor& operator=(const Monitor&) = delete;

    std::int32_t Login(const char16_t* user, const char16_t* password)
    {
        return session_->Login(user, password, nullptr);
    }

    /// Subscribes `url` under `handle`; the subscription lives as long as the monitor.
    rt::ISubscription* Subscribe(const char16_t* url, std::int32_t handle)
    {
        if (realTime_ == nullptr) {
            EXPECT_TRUE(rt::NewOrvekRealTime(session_, &receiver_, &realTime_));
        }
        rt::ISubscription* subscription = nullptr;
        EXPECT_EQ(realTime_->Subscribe(url, handle, nullptr, &subscription), 0);
        if (subscription != nullptr)
            subscriptions_.push_back(subscription);
        return subscription;
    }

    RecordingReceiver& Receiver() { return receiver_; }

private:
    // Declared first: the real-time object holds it until its last Release.
    RecordingReceiver receiver_;
    network::session::IOrvekSession* session_ = nullptr;
    rt::IOrvekRealTime* realTime_ = nullptr;
    std::vector<rt::ISubscription*> subscriptions_;
};

class EndToEnd : public ::testing::Test {
protected:
    void SetUp() override { StartBroker({}); }
    void TearDown() override { rt::SetHostResolver(nullptr); }

    void StartBroker(TestBrokerOptions options)
    {
        broker_.reset();
        broker_ = std::make_unique<TestBroker>(std::move(options));
        SetDataPort(broker_->Port());
    }

    /// Options of a publisher on the test broker.
    network::publisher::PublisherOptions PublisherOn(std::string user = {}, std::string password = {}) const
    {
        network::publisher::PublisherOptions options;
        options.host = TestBroker::Host();
        options.port = broker_->Port();
        options.user = std::move(user);
        options.password = std::move(password);
        options.connectTimeout = 3s;
        return options;
    }

    /// Starts `publisher` and waits until the broker holds its "running".
    /// Start() returns once "running" is sent, and that may still wait behind
    /// the process's values; a monitor subscribing meanwhile would rightly
    /// find no process yet.
    void Start(network::publisher::Publisher& publisher, const std::string& user = {},
               const std::string& password = {})
    {
        publisher.Start();
        RawClient watcher(broker_->Port(), user.empty() ? nullptr : user.c_str(),
                          password.empty() ? nullptr : password.c_str());
        watcher.Subscribe(network::protocol::ProcessTopic(publisher.Process(), network::protocol::TopicKind::State));
        while (const auto message = watcher.WaitForMessage()) {
            if (!message->second.empty()
                && network::protocol::DecodeProcessState(message->second).state == network::protocol::RunState::Running)
                return;
        }
        ADD_FAILURE() << "the broker never held \"running\" for " << publisher.Process();
    }

    TemporaryHome home_;
    std::unique_ptr<TestBroker> broker_;
};

} // namespace qv::test
