#include "network/realtime/OrvekRealTime.h"

#include "fen/OrvekURL.h"
#include "fen/osdep/OrvekPort.h"
#include "network/protocol/TextCoding.h"
#include "network/protocol/Topics.h"
#include "network/realtime/Connection.h"
#include "value/dynamic/RefCounted.h"

#include <cctype>
#include <map>
#include <mutex>
#include <new>
#include <optional>
#include <thread>
#include <utility>
#include <vector>

namespace qv::network::realtime {
namespace {

using value::dynamic::RefCounted;
using session::kIID_IUnknown;

/// {3C8E5A21-9D47-4B6F-A1E3-0F52C7B9D864}
constexpr Guid kIID_IOrvekRealTime{0x3C8E5A21, 0x9D47, 0x4B6F, {0xA1, 0xE3, 0x0F, 0x52, 0xC7, 0xB9, 0xD8, 0x64}};
/// {8F0D2B6C-4E71-4A95-B3C8-61D9E0A4F217}
constexpr Guid kIID_ISubscription{0x8F0D2B6C, 0x4E71, 0x4A95, {0xB3, 0xC8, 0x61, 0xD9, 0xE0, 0xA4, 0xF2, 0x17}};

struct Target {
    std::string host;
    std::string process;
    std::string path;
};

/// Host, process and path of `url`, or nothing when it names no variable.
std::optional<Target> TargetOf(const char16_t* text)
{
    try {
        const fen::OrvekURL url(text);
        Target target;
        if (url.GetKind() == fen::OrvekURL::HostForm) {
            if (url.GetSegmentCount() == 0 || url.GetSegment(0).IsParent())
                return std::nullopt;
            const auto& host = url.GetSegment(0).GetName();
            target.host = protocol::Utf8FromUtf16(std::u16string_view(host.c_str(), host.length()));
        } else if (url.GetKind() != fen::OrvekURL::LocalForm) {
            return std::nullopt;
        }
        target.process = protocol::ProcessName(url);
        target.path = protocol::VariablePath(url);
        if (target.process.empty() || target.path.empty())
            return std::nullopt;
        return target;
    } catch (...) {
        return std::nullopt;
    }
}

std::string LowerCase(std::string text)
{
    for (auto& c : text)
        c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return text;
}

class Subscription final : public RefCounted<ISubscription> {
public:
    Subscription(std::shared_ptr<Connection> connection, std::uint64_t id)
        : connection_(std::move(connection)), id_(id)
    {
    }
    ~Subscription() override
    {
        if (connection_)
            connection_->RemoveSubscription(id_);
    }

    std::int32_t QueryInterface(const Guid& iid, void** out) override
    {
        if (out == nullptr)
            return session::kStatusNullPointer;
        if (iid == kIID_IUnknown || iid == kIID_ISubscription) {
            AddRef();
            *out = static_cast<ISubscription*>(this);
            return 0;
        }
        *out = nullptr;
        return value::dynamic::kNoInterface;
    }

    std::int32_t Write(const value::VarData& value) override
    {
        if (!connection_)
            return ErrorCodes::InvalidURL;
        return connection_->Write(id_, value);
    }

private:
    std::shared_ptr<Connection> connection_; // null for an invalid URL
    std::uint64_t id_;
};

class RealTime final : public RefCounted<IOrvekRealTime> {
public:
    RealTime(session::IOrvekSession* session, IOrvekRealTimeReceiver* receiver)
        : session_(session), receiver_(std::make_shared<ReceiverLink>(receiver))
    {
        session::OrvekLibraryStart();
        if (session_ != nullptr)
            session_->AddRef();
    }

    ~RealTime() override
    {
        receiver_->Close();
        // The reporters hold the receiver; they end before it may be released.
        std::vector<std::thread> reporters;
        {
            std::lock_guard lock(mutex_);
            reporters.swap(reporters_);
        }
        for (std::thread& reporter : reporters)
            reporter.join();
        std::map<std::pair<std::string, std::uint16_t>, std::shared_ptr<Connection>> connections;
        {
            std::lock_guard lock(mutex_);
            connections.swap(connections_);
        }
        for (auto& [key, connection] : connections)
            connection->Stop();
        connections.clear();
        if (session_ != nullptr)
            session_->Release();
        session::OrvekLibraryStop();
    }

    std::int32_t QueryInterface(const Guid& iid, void** out) override
    {
        if (out == nullptr)
            return session::kStatusNullPointer;
        if (iid == kIID_IUnknown || iid == kIID_IOrvekRealTime) {
            AddRef();
            *out = static_cast<IOrvekRealTime*>(this);
            return 0;
        }
        *out = nullptr;
        return value::dynamic::kNoInterface;
    }

    std::int32_t Subscribe(const char16_t* url, std::int32_t handle, const SubscribeOptions*,
                           ISubscription** subscription) override
    {
        if (subscription == nullptr)
            return session::kStatusNullPointer;
        *subscription = nullptr;
        if (url == nullptr)
            return session::kStatusNullPointer;
        try {
            const auto target = TargetOf(url);
            if (!target) {
                *subscription = new Subscription(nullptr, 0);
                ReportInvalidURL(handle);
                return 0;
            }
            const std::uint16_t port = fen::osdep::GetOrvekDataPort();
            auto connection = ConnectionFor(target->host, port);
            const std::uint64_t id = connection->AddSubscription(handle, target->process, target->path);
            *subscription = new Subscription(std::move(connection), id);
            return 0;
        } catch (const std::bad_alloc&) {
            return session::kStatusOutOfMemory;
        } catch (...) {
            return ErrorCodes::SubscriptionFailed;
        }
    }

private:
    std::shared_ptr<Connection> ConnectionFor(const std::string& host, std::uint16_t port)
    {
        std::lock_guard lock(mutex_);
        // Host names ignore letter case; the connection keeps the first spelling.
        auto& slot = connections_[{LowerCase(host), port}];
        if (!slot) {
            auto connection = std::make_shared<Connection>(host, port, session_, receiver_);
            connection->Start();
            slot = std::move(connection);
        }
        return slot;
    }

    /// The one change of a subscription whose URL names no variable, from a
    /// thread of the library as every change is.
    void ReportInvalidURL(std::int32_t handle)
    {
        std::lock_guard lock(mutex_);
        reporters_.emplace_back([receiver = receiver_, handle] {
            receiver->Deliver(handle, ChangeMask::All, value::VarData(), QualityBits::InvalidURL,
                              ErrorCodes::InvalidURL, CurrentTime());
        });
    }

    session::IOrvekSession* session_;
    std::shared_ptr<ReceiverLink> receiver_;
    std::mutex mutex_;
    std::map<std::pair<std::string, std::uint16_t>, std::shared_ptr<Connection>> connections_;
    /// Threads that report invalid URLs, joined when the object goes.
    std::vector<std::thread> reporters_;
};

} // namespace

bool NewOrvekRealTime(session::IOrvekSession* session, IOrvekRealTimeReceiver* receiver, IOrvekRealTime** realTime)
{
    if (realTime == nullptr)
        return false;
    *realTime = nullptr;
    if (receiver == nullptr)
        return false;
    *realTime = new (std::nothrow) RealTime(session, receiver);
    return *realTime != nullptr;
}

} // namespace qv::network::realtime
