#pragma once
// A raw MQTT client for tests that watch what a publisher puts on the broker:
// it subscribes to some filters, records every message (the latest one of
// each topic and a count per topic) and can publish requests of its own.

#include <mosquitto.h>

#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace qv::test {

class MqttObserver {
public:
    using Latest = std::map<std::string, std::string>;

    MqttObserver(std::uint16_t port, std::vector<std::string> filters) : filters_(std::move(filters))
    {
        mosquitto_lib_init();
        client_ = mosquitto_new(nullptr, true, this);
        if (client_ == nullptr)
            throw std::runtime_error("mosquitto_new failed");
        mosquitto_connect_callback_set(client_, [](mosquitto* client, void* self, int code) {
            if (code != 0)
                return;
            auto* observer = static_cast<MqttObserver*>(self);
            for (const std::string& filter : observer->filters_)
                mosquitto_subscribe(client, nullptr, filter.c_str(), 1);
        });
        mosquitto_subscribe_callback_set(client_, [](mosquitto*, void* self, int, int, const int*) {
            auto* observer = static_cast<MqttObserver*>(self);
            std::lock_guard lock(observer->mutex_);
            ++observer->subscribed_;
            observer->changed_.notify_all();
        });
        mosquitto_message_callback_set(client_, [](mosquitto*, void* self, const mosquitto_message* message) {
            auto* observer = static_cast<MqttObserver*>(self);
            std::lock_guard lock(observer->mutex_);
            std::string payload(static_cast<const char*>(message->payload),
                                message->payload == nullptr ? 0 : static_cast<std::size_t>(message->payloadlen));
            observer->latest_[message->topic] = payload;
            ++observer->counts_[message->topic];
            observer->changed_.notify_all();
        });
        if (mosquitto_connect(client_, "127.0.0.1", port, 10) != MOSQ_ERR_SUCCESS
            || mosquitto_loop_start(client_) != MOSQ_ERR_SUCCESS) {
            mosquitto_destroy(client_);
            throw std::runtime_error("observer cannot connect");
        }
        if (!WaitUntil([&](const Latest&) { return subscribed_ >= filters_.size(); }))
            throw std::runtime_error("observer cannot subscribe");
    }

    ~MqttObserver()
    {
        mosquitto_disconnect(client_);
        mosquitto_loop_stop(client_, false);
        mosquitto_destroy(client_);
    }

    MqttObserver(const MqttObserver&) = delete;
    MqttObserver& operator=(const MqttObserver&) = delete;

    /// Waits until `condition` holds for the latest message of each topic;
    /// `condition` runs under the observer's lock and must not call it.
    bool WaitUntil(const std::function<bool(const Latest&)>& condition,
                   std::chrono::milliseconds timeout = std::chrono::seconds(5))
    {
        std::unique_lock lock(mutex_);
        return changed_.wait_for(lock, timeout, [&] { return condition(latest_); });
    }

    /// Waits until `topic` holds a message for which `condition` holds; that message.
    std::optional<std::string> WaitFor(const std::string& topic,
                                       const std::function<bool(const std::string&)>& condition,
                                       std::chrono::milliseconds timeout = std::chrono::seconds(5))
    {
        std::optional<std::string> found;
        WaitUntil(
            [&](const Latest& latest) {
                const auto message = latest.find(topic);
                if (message == latest.end() || !condition(message->second))
                    return false;
                found = message->second;
                return true;
            },
            timeout);
        return found;
    }

    std::optional<std::string> Get(const std::string& topic)
    {
        std::lock_guard lock(mutex_);
        const auto message = latest_.find(topic);
        return message == latest_.end() ? std::nullopt : std::optional(message->second);
    }

    /// Messages received on topics that start with `prefix`.
    std::size_t Count(const std::string& prefix)
    {
        std::lock_guard lock(mutex_);
        return CountLocked(prefix);
    }

    /// Waits until at least `count` messages came on topics that start with `prefix`.
    bool WaitForCount(const std::string& prefix, std::size_t count,
                      std::chrono::milliseconds timeout = std::chrono::seconds(5))
    {
        std::unique_lock lock(mutex_);
        return changed_.wait_for(lock, timeout, [&] { return CountLocked(prefix) >= count; });
    }

    /// Forgets the latest message of `topic`, so that the next one can be awaited.
    void Forget(const std::string& topic)
    {
        std::lock_guard lock(mutex_);
        latest_.erase(topic);
    }

    void Publish(const std::string& topic, const std::string& payload, bool retain = false)
    {
        if (mosquitto_publish(client_, nullptr, topic.c_str(), static_cast<int>(payload.size()), payload.data(), 1,
                              retain)
            != MOSQ_ERR_SUCCESS)
            throw std::runtime_error("observer cannot publish");
    }

private:
    std::size_t CountLocked(const std::string& prefix) const
    {
        std::size_t count = 0;
        for (const auto& [topic, n] : counts_)
            if (topic.compare(0, prefix.size(), prefix) == 0)
                count += n;
        return count;
    }

    std::vector<std::string> filters_;
    mosquitto* client_ = nullptr;
    std::mutex mutex_;
    std::condition_variable changed_;
    std::size_t subscribed_ = 0;
    Latest latest_;
    std::map<std::string, std::size_t> counts_;
};

} // namespace qv::test
