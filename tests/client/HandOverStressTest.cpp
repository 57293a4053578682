// Several library threads deliver changes through the receiver into two
// change queues while one consumer thread drains them, message by message,
// and subscriptions come and go in the receiver's table. Run under
// ThreadSanitizer by the test command.

#include "client/FakeSubscription.h"

#include "client/ChangeQueue.h"
#include "client/Receiver.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>

#include <array>
#include <condition_variable>
#include <deque>
#include <map>
#include <mutex>
#include <thread>
#include <vector>

namespace qv::test {
namespace {

using namespace fbfen::orvekclient;

constexpr int kLibraryThreads = 4;
constexpr int kHandlesPerThread = 5;
constexpr int kChangesPerThread = 20000;
constexpr int kChurnedSubscriptions = 2000;

/// The consumer's message loop: one message per appended packet, naming its queue.
class MessageLoop {
public:
    void Post(int queue)
    {
        {
            std::lock_guard lock(mutex_);
            messages_.push_back(queue);
        }
        posted_.notify_one();
    }
    /// The next message; -1 when none comes within a generous time.
    int Next()
    {
        std::unique_lock lock(mutex_);
        if (!posted_.wait_for(lock, std::chrono::seconds(60), [&] { return !messages_.empty(); }))
            return -1;
        const int queue = messages_.front();
        messages_.pop_front();
        return queue;
    }

private:
    std::mutex mutex_;
    std::condition_variable posted_;
    std::deque<int> messages_;
};

struct Document {
    std::array<ChangeQueuePtr, 2> queues;
};

void DispatchToQueues(void* context, std::int32_t handle, std::uint32_t mask, const value::VarData* value,
                      std::uint64_t quality, std::int32_t error, fen::AbsTime time)
{
    const DataChangePacket packet{handle, mask, time, quality, error, *value};
    for (const auto& queue : static_cast<Document*>(context)->queues)
        queue->Deliver(packet);
}

TEST(HandOverStress, NoPacketIsLostDuplicatedOrReorderedPerHandle)
{
    MessageLoop loop;
    Document document;
    for (int i = 0; i < 2; ++i)
        document.queues[i] = boost::make_shared<ChangeQueue>([&loop, i] { loop.Post(i); });

    auto* receiver = new Receiver;
    receiver->SetCallbackContext(&document);
    receiver->SetDataCallback(DispatchToQueues);

    std::vector<std::thread> library;
    for (int t = 0; t < kLibraryThreads; ++t) {
        library.emplace_back([receiver, t] {
            const fen::AbsTime time{0, 1000};
            for (int i = 0; i < kChangesPerThread; ++i) {
                const std::int32_t handle = t * 100 + i % kHandlesPerThread;
                const auto value = value::VarData::MakeNumeric(i / kHandlesPerThread);
                receiver->OnDataChange(handle, 1, &value, 0, 0, &time);
            }
        });
    }

    // Subscriptions come and go on the same handles from two threads while
    // the changes flow.
    struct Churn {
        std::vector<FakeSubscription> subscriptions = std::vector<FakeSubscription>(kChurnedSubscriptions);
        std::vector<char> entered = std::vector<char>(kChurnedSubscriptions);
    };
    std::array<Churn, 2> churns;
    std::vector<std::thread> churning;
    for (int c = 0; c < 2; ++c) {
        churning.emplace_back([receiver, &churn = churns[c], c] {
            for (int i = 0; i < kChurnedSubscriptions; ++i) {
                churn.entered[i] = receiver->AddSubscription(&churn.subscriptions[i], i % 50);
                if (Receiver::ISubscription* s = receiver->AcquireSubscription((i + 7 * c) % 50)) {
                    s->Write(value::VarData::MakeNumeric(i));
                    s->Release();
                }
                if (i % 3 == c)
                    receiver->RemoveSubscription((i + 25) % 50);
                if (i % 500 == 499)
                    receiver->ReleaseAll();
            }
        });
    }

    // The consumer: exactly one packet per message.
    std::array<std::map<std::int32_t, double>, 2> next;
    int wrongOrder = 0, missingMessages = 0, emptyQueues = 0;
    const int expected = 2 * kLibraryThreads * kChangesPerThread;
    for (int message = 0; message < expected; ++message) {
        const int q = loop.Next();
        if (q < 0) {
            ++missingMessages;
            break;
        }
        const bool applied = document.queues[q]->ApplyNext([&](const DataChangePacket& p) {
            double& wanted = next[q][p.handle];
            if (p.value.ToDouble() != wanted)
                ++wrongOrder;
            wanted = p.value.ToDouble() + 1;
        });
        emptyQueues += !applied;
    }
    for (auto& thread : library)
        thread.join();
    for (auto& thread : churning)
        thread.join();

    EXPECT_EQ(missingMessages, 0);
    EXPECT_EQ(emptyQueues, 0) << "a message found its queue empty";
    EXPECT_EQ(wrongOrder, 0);
    for (int q = 0; q < 2; ++q) {
        EXPECT_EQ(document.queues[q]->Size(), 0u) << "a packet without its message";
        ASSERT_EQ(next[q].size(), std::size_t{kLibraryThreads * kHandlesPerThread});
        for (const auto& [handle, count] : next[q])
            EXPECT_EQ(count, kChangesPerThread / kHandlesPerThread) << "handle " << handle;
    }

    // Every subscription the table took is ended exactly once, with the
    // receiver's last reference at the latest; a refused one stays the caller's.
    receiver->Release();
    int wrongCount = 0;
    for (const Churn& churn : churns)
        for (int i = 0; i < kChurnedSubscriptions; ++i)
            wrongCount += churn.subscriptions[i].references != (churn.entered[i] ? 0 : 1);
    EXPECT_EQ(wrongCount, 0);
}

} // namespace
} // namespace qv::test
