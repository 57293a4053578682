#pragma once
/// \file
/// The object the real-time library calls back, and the table from the
/// client's subscription handles to the library's subscription objects.
///
/// Threads. OnDataChange runs on library threads, possibly several at once;
/// it takes no lock and hands every change, unchanged, to the data callback.
/// The table operations run on any thread under `tableLock`; subscriptions
/// are released only after `tableLock` is left, so a library that delivers
/// a change while a subscription is being released cannot deadlock on the
/// table. The data callback and its context are set once, before the first
/// subscription exists, and read without a lock afterwards.

#include "client/DataCallback.h"
#include "fen/osdep/Mutex.h"
#include "network/realtime/OrvekRealTime.h"

#include <atomic>
#include <cstdint>
#include <map>

namespace qv::fbfen::orvekclient {

class Receiver final : public network::realtime::IOrvekRealTimeReceiver3 {
public:
    using ISubscription = network::realtime::ISubscription;
    using Guid = value::dynamic::Guid;

    /// Starts with one reference, the creator's.
    Receiver() = default;
    Receiver(const Receiver&) = delete;
    Receiver& operator=(const Receiver&) = delete;

    // IUnknown. QueryInterface answers IUnknown and both receiver interfaces
    // with this object and a new reference; anything else is refused.
    std::int32_t QueryInterface(const Guid& iid, void** object) override;
    std::uint32_t AddRef() override;
    /// At zero the receiver destroys itself and returns 0.
    std::uint32_t Release() override;

    // Notifications the library may send; nothing to do for them.
    void Notification3() override {}
    void Notification4() override {}
    void Notification5() override {}
    void Notification6() override {}

    /// Passes one change to the data callback; dropped while none is set.
    void OnDataChange(std::int32_t handle, std::uint32_t changeMask, const value::VarData* value,
                      std::uint64_t quality, std::int32_t errorCode, const fen::AbsTime* timestamp) override;

    void SetDataCallback(DataCallback callback) noexcept { dataCallback.store(callback, std::memory_order_release); }
    void SetCallbackContext(void* context) noexcept { callbackContext.store(context, std::memory_order_release); }

    /// Takes over the caller's reference to `subscription` under `handle`;
    /// a handle already present keeps its first subscription and the new
    /// one stays the caller's.
    /// \return true when the entry was made.
    bool AddSubscription(ISubscription* subscription, std::int32_t handle);
    bool HasSubscription(std::int32_t handle);
    /// The subscription of `handle`, or null. With `remove` the entry leaves
    /// the table and the caller receives the table's reference; without it
    /// the pointer is only valid while the entry stays.
    ISubscription* FindSubscription(std::int32_t handle, bool remove);
    /// The subscription of `handle` with a reference of the caller's own,
    /// or null; safe to use while another thread ends the subscription.
    ISubscription* AcquireSubscription(std::int32_t handle);
    /// Ends the subscription of `handle`; nothing for an unknown handle.
    void RemoveSubscription(std::int32_t handle);
    /// Ends every subscription, in ascending order of handle.
    void ReleaseAll();

private:
    // The library calls Release; nobody deletes a receiver directly.
    virtual ~Receiver();

    /// Handles ordered as unsigned numbers; each entry holds one reference.
    std::map<std::uint32_t, ISubscription*> subscriptions;
    std::atomic<std::uint32_t> refCount{1};
    fen::osdep::Mutex tableLock;
    // Atomic so that a library thread that starts before the owner has
    // finished setting them up reads either nothing or the whole setting.
    std::atomic<DataCallback> dataCallback{nullptr};
    std::atomic<void*> callbackContext{nullptr};
};

} // namespace qv::fbfen::orvekclient
