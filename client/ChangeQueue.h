#pragma once
/// \file
/// The hand-over of data changes from library threads to the thread that
/// shows them.
///
/// Producers (any thread) call Deliver: the packet is appended under
/// `queueLock` and one notification follows, outside the lock. The consumer
/// answers every notification with exactly one ApplyNext, which applies the
/// oldest packet with the lock released and only then takes it off. So every
/// packet is applied once, in arrival order, and a lost notification only
/// delays a packet until the next one. The queue has no size limit.

#include "client/DataChangePacket.h"
#include "fen/Noncopyable.h"
#include "fen/osdep/Mutex.h"

#include <boost/shared_ptr.hpp>

#include <cstddef>
#include <deque>
#include <functional>
#include <mutex>
#include <utility>

namespace qv::fbfen::orvekclient {

class ChangeQueue : private fen::Noncopyable {
public:
    /// Asks the consumer, once per appended packet, to run ApplyNext. It is
    /// called on the producer's thread with no lock held and must not block.
    using Notifier = std::function<void()>;

    explicit ChangeQueue(Notifier notify) : notify_(std::move(notify)) {}

    /// Appends a copy of `packet` (its value's storage is shared, not copied)
    /// and notifies the consumer once.
    void Deliver(const DataChangePacket& packet)
    {
        DataChangePacket copy(packet);
        {
            std::lock_guard guard(queueLock);
            packets_.push_back(std::move(copy));
        }
        if (notify_)
            notify_();
    }

    /// Applies the oldest packet: `apply(const DataChangePacket&)` runs with
    /// `queueLock` released, then the packet is taken off, also when `apply`
    /// throws. False, and `apply` not called, when the queue is empty.
    template <typename Apply>
    bool ApplyNext(Apply&& apply)
    {
        const DataChangePacket* front = nullptr;
        {
            std::lock_guard guard(queueLock);
            if (packets_.empty())
                return false;
            // Appends at the back never move the front element of a deque,
            // and only this consumer removes it.
            front = &packets_.front();
        }
        struct PopFront {
            ChangeQueue& queue;
            ~PopFront()
            {
                std::lock_guard guard(queue.queueLock);
                queue.packets_.pop_front();
            }
        } popAfterApply{*this};
        std::forward<Apply>(apply)(*front);
        return true;
    }

    /// Packets waiting to be applied.
    std::size_t Size() const
    {
        std::lock_guard guard(queueLock);
        return packets_.size();
    }

private:
    mutable fen::osdep::Mutex queueLock;
    std::deque<DataChangePacket> packets_;
    const Notifier notify_;
};

/// Each consumer's queue is shared with the producers that append to it.
using ChangeQueuePtr = boost::shared_ptr<ChangeQueue>;

} // namespace qv::fbfen::orvekclient
