#include "client/Receiver.h"

#include "client/OCException.h"
#include "network/session/OrvekSession.h"

#include <mutex>
#include <utility>

namespace qv::fbfen::orvekclient {

using network::realtime::kIID_IOrvekRealTimeReceiver;
using network::realtime::kIID_IOrvekRealTimeReceiver3;
using network::session::kIID_IUnknown;

Receiver::~Receiver()
{
    ReleaseAll();
}

std::int32_t Receiver::QueryInterface(const Guid& iid, void** object)
{
    if (object == nullptr)
        return kStatusInvalidArgument;
    *object = nullptr;
    if (iid == kIID_IUnknown || iid == kIID_IOrvekRealTimeReceiver3 || iid == kIID_IOrvekRealTimeReceiver) {
        *object = static_cast<network::realtime::IOrvekRealTimeReceiver*>(this);
        AddRef();
        return 0;
    }
    return kStatusNoInterface;
}

std::uint32_t Receiver::AddRef()
{
    return refCount.fetch_add(1, std::memory_order_relaxed) + 1;
}

std::uint32_t Receiver::Release()
{
    const std::uint32_t left = refCount.fetch_sub(1, std::memory_order_acq_rel) - 1;
    if (left == 0)
        delete this;
    return left;
}

void Receiver::OnDataChange(std::int32_t handle, std::uint32_t changeMask, const value::VarData* value,
                            std::uint64_t quality, std::int32_t errorCode, const fen::AbsTime* timestamp)
{
    const DataCallback callback = dataCallback.load(std::memory_order_acquire);
    if (callback == nullptr || value == nullptr || timestamp == nullptr)
        return;
    callback(callbackContext.load(std::memory_order_acquire), handle, changeMask, value, quality, errorCode,
             *timestamp);
}

bool Receiver::AddSubscription(ISubscription* subscription, std::int32_t handle)
{
    std::lock_guard guard(tableLock);
    return subscriptions.emplace(static_cast<std::uint32_t>(handle), subscription).second;
}

bool Receiver::HasSubscription(std::int32_t handle)
{
    std::lock_guard guard(tableLock);
    return subscriptions.contains(static_cast<std::uint32_t>(handle));
}

Receiver::ISubscription* Receiver::FindSubscription(std::int32_t handle, bool remove)
{
    std::lock_guard guard(tableLock);
    const auto entry = subscriptions.find(static_cast<std::uint32_t>(handle));
    if (entry == subscriptions.end())
        return nullptr;
    ISubscription* subscription = entry->second;
    if (remove)
        subscriptions.erase(entry);
    return subscription;
}

Receiver::ISubscription* Receiver::AcquireSubscription(std::int32_t handle)
{
    std::lock_guard guard(tableLock);
    const auto entry = subscriptions.find(static_cast<std::uint32_t>(handle));
    if (entry == subscriptions.end())
        return nullptr;
    entry->second->AddRef();
    return entry->second;
}

void Receiver::RemoveSubscription(std::int32_t handle)
{
    if (ISubscription* subscription = FindSubscription(handle, true))
        subscription->Release();
}

void Receiver::ReleaseAll()
{
    std::map<std::uint32_t, ISubscription*> old;
    {
        std::lock_guard guard(tableLock);
        old.swap(subscriptions);
    }
    for (auto& [handle, subscription] : old)
        subscription->Release();
}

} // namespace qv::fbfen::orvekclient
