#pragma once
// Helpers of the session and real-time tests: a receiver that records every
// change, a tiny process made of raw libmosquitto and the protocol codec,
// and a fixture that points the Orvek data port at a test broker.

#include "support/TemporaryHome.h"
#include "support/TestBroker.h"

#include "fen/AbsTime.h"
#include "fen/osdep/RegKey.h"
#include "network/protocol/VarDataJson.h"
#include "network/realtime/OrvekRealTime.h"
#include "value/VarData.h"

#include <mosquitto.h>
#include <nlohmann/json.hpp>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace qv::test {

namespace rt = network::realtime;

struct RecordedChange {
    std::int32_t handle;
    std::uint32_t mask;
    std::string value; // the value's JSON
    std::uint64_t quality;
    std::int32_t error;
    fen::AbsTime time;
    value::VarData data; // the value itself, for exact comparisons
};

class RecordingReceiver final : public rt::IOrvekRealTimeReceiver3 {
public:
    std::int32_t QueryInterface(const rt::Guid&, void** out) override
    {
        *out = nullptr;
        return static_cast<std::int32_t>(0x80004002u);
    }
    std::uint32_t AddRef() override { return ++refs_; }
    std::uint32_t Release() override { return --refs_; } // lives on the test's stack
    void Notification3() override {}
    void Notification4() override {}
    void Notification5() override {}
    void Notification6() override {}
    void OnDataChange(std::int32_t handle, std::uint32_t mask, const value::VarData* value, std::uint64_t quality,
                      std::int32_t error, const fen::AbsTime* time) override
    {
        std::lock_guard lock(mutex_);
        changes_.push_back({handle, mask, network::protocol::VarDataToJson(*value).dump(), quality, error, *time, *value});
        changed_.notify_all();
    }

    /// Waits until a change of `handle` satisfies `match`, looking only at
    /// changes of `handle` after those already seen by earlier waits; returns it.
    std::optional<RecordedChange> WaitFor(std::int32_t handle, const std::function<bool(const RecordedChange&)>& match,
                                          std::chrono::milliseconds timeout = std::chrono::seconds(5))
    {
        std::unique_lock lock(mutex_);
        std::optional<RecordedChange> found;
        changed_.wait_for(lock, timeout, [&] {
            auto& seen = seen_[handle];
            for (; seen < changes_.size(); ++seen) {
                if (changes_[seen].handle == handle && match(changes_[seen])) {
                    found = changes_[seen++];
                    return true;
                }
            }
            return false;
        });
        return found;
    }
    std::optional<RecordedChange> WaitForQuality(std::int32_t handle, std::uint64_t bits,
                                                 std::chrono::milliseconds timeout = std::chrono::seconds(5))
    {
        return WaitFor(handle, [bits](const RecordedChange& c) { return (c.quality & bits) == bits; }, timeout);
    }
    std::vector<RecordedChange> Changes(std::int32_t handle)
    {
        std::lock_guard lock(mutex_);
        std::vector<RecordedChange> result;
        for (const auto& change : changes_)
            if (change.handle == handle)
                result.push_back(change);
        return result;
    }
    std::uint32_t References() const { return refs_; }

private:
    std::atomic<std::uint32_t> refs_{1};
    std::mutex mutex_;
    std::condition_variable changed_;
    std::vector<RecordedChange> changes_;
    std::map<std::int32_t, std::size_t> seen_;
};

/// A raw MQTT client on the test broker, standing in for a process.
class RawClient {
public:
    explicit RawClient(std::uint16_t port, const char* user = nullptr, const char* password = nullptr)
    {
        mosquitto_lib_init();
        handle_ = mosquitto_new(nullptr, true, this);
        mosquitto_username_pw_set(handle_, user, password);
        mosquitto_message_callback_set(handle_, [](mosquitto*, void* self, const mosquitto_message* message) {
            auto* client = static_cast<RawClient*>(self);
            std::lock_guard lock(client->mutex_);
            client->received_.emplace_back(message->topic,
                                           std::string(static_cast<const char*>(message->payload),
                                                       static_cast<std::size_t>(message->payloadlen)));
            client->arrived_.notify_all();
        });
        mosquitto_publish_callback_set(handle_, [](mosquitto*, void* self, int mid) {
            auto* client = static_cast<RawClient*>(self);
            std::lock_guard lock(client->mutex_);
            client->acknowledged_.push_back(mid);
            client->arrived_.notify_all();
        });
        if (mosquitto_connect(handle_, "127.0.0.1", port, 10) != MOSQ_ERR_SUCCESS
            || mosquitto_loop_start(handle_) != MOSQ_ERR_SUCCESS)
            throw std::runtime_error("raw client cannot connect");
    }
    ~RawClient()
    {
        mosquitto_disconnect(handle_);
        mosquitto_loop_stop(handle_, false);
        mosquitto_destroy(handle_);
    }
    RawClient(const RawClient&) = delete;
    RawClient& operator=(const RawClient&) = delete;

    /// Publishes with QoS 1 and waits until the broker has it.
    void Publish(const std::string& topic, const std::string& payload, bool retain = true)
    {
        std::unique_lock lock(mutex_);
        int mid = 0;
        if (mosquitto_publish(handle_, &mid, topic.c_str(), static_cast<int>(payload.size()), payload.data(), 1,
                              retain)
            != MOSQ_ERR_SUCCESS)
            throw std::runtime_error("publish failed");
        arrived_.wait_for(lock, std::chrono::seconds(5), [&] {
            return std::find(acknowledged_.begin(), acknowledged_.end(), mid) != acknowledged_.end();
        });
    }
    void Subscribe(const std::string& filter) { mosquitto_subscribe(handle_, nullptr, filter.c_str(), 1); }

    std::optional<std::pair<std::string, std::string>> WaitForMessage(std::chrono::milliseconds timeout
                                                                      = std::chrono::seconds(5))
    {
        std::unique_lock lock(mutex_);
        if (!arrived_.wait_for(lock, timeout, [&] { return !received_.empty(); }))
            return std::nullopt;
        auto message = received_.front();
        received_.erase(received_.begin());
        return message;
    }

private:
    mosquitto* handle_;
    std::mutex mutex_;
    std::condition_variable arrived_;
    std::vector<std::pair<std::string, std::string>> received_;
    std::vector<int> acknowledged_;
};

/// Points the Orvek data port of a fresh configuration directory at `port`.
inline void SetDataPort(std::uint16_t port)
{
    fen::osdep::RegKey key(fen::osdep::kLocalMachine, fen::WString(u"SOFTWARE\\Quorvane\\Orvek"), false, true, u"");
    fen::osdep::RegValue value;
    value.type = fen::osdep::kRegDword;
    value.number = port;
    key.SetValue(u"DataPort", value);
}

} // namespace qv::test
