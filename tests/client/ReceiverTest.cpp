#include "client/FakeSubscription.h"

#include "client/OCException.h"
#include "client/Receiver.h"
#include "network/session/OrvekSession.h"

#include <gtest/gtest.h>

#include <vector>

namespace qv::test {
namespace {

using fbfen::orvekclient::Receiver;
namespace rt = network::realtime;

struct Delivered {
    void* context;
    std::int32_t handle;
    std::uint32_t mask;
    double value;
    std::uint64_t quality;
    std::int32_t error;
    fen::AbsTime time;
};
std::vector<Delivered> delivered;

void Record(void* context, std::int32_t handle, std::uint32_t mask, const value::VarData* value,
            std::uint64_t quality, std::int32_t error, fen::AbsTime time)
{
    delivered.push_back({context, handle, mask, value->ToDouble(), quality, error, time});
}

TEST(Receiver, AnswersOnlyItsInterfacesAndCountsReferences)
{
    auto* receiver = new Receiver;
    for (const auto& iid : {network::session::kIID_IUnknown, rt::kIID_IOrvekRealTimeReceiver3,
                            rt::kIID_IOrvekRealTimeReceiver}) {
        void* object = nullptr;
        EXPECT_EQ(receiver->QueryInterface(iid, &object), 0);
        EXPECT_EQ(object, static_cast<rt::IOrvekRealTimeReceiver*>(receiver));
    }
    void* object = receiver;
    EXPECT_EQ(receiver->QueryInterface(network::session::kIID_IOrvekSession, &object),
              fbfen::orvekclient::kStatusNoInterface);
    EXPECT_EQ(object, nullptr);
    // One reference from creation plus one per answered query.
    EXPECT_EQ(receiver->AddRef(), 5u);
    for (std::uint32_t left = 4; left > 0; --left)
        EXPECT_EQ(receiver->Release(), left);
    EXPECT_EQ(receiver->Release(), 0u);
}

TEST(Receiver, TableKeepsFirstEntryAndHandsOverReferences)
{
    auto* receiver = new Receiver;
    FakeSubscription first, second, other;
    EXPECT_TRUE(receiver->AddSubscription(&first, 7));
    EXPECT_FALSE(receiver->AddSubscription(&second, 7));
    EXPECT_TRUE(receiver->AddSubscription(&other, -1)); // ordered as 0xFFFFFFFF

    EXPECT_EQ(receiver->FindSubscription(7, false), &first);
    EXPECT_TRUE(receiver->HasSubscription(7));
    EXPECT_EQ(receiver->FindSubscription(7, true), &first);
    EXPECT_EQ(receiver->FindSubscription(7, true), nullptr);
    EXPECT_FALSE(receiver->HasSubscription(7));
    EXPECT_EQ(first.releases, 0) << "the caller received the table's reference";

    receiver->RemoveSubscription(7); // already gone: nothing happens
    receiver->RemoveSubscription(12345);
    EXPECT_EQ(receiver->Release(), 0u);
    EXPECT_EQ(other.releases, 1) << "the last release ends what is left";
    EXPECT_EQ(second.releases, 0) << "a refused entry stays the caller's";
}

TEST(Receiver, ReleaseAllEndsEachSubscriptionOnce)
{
    auto* receiver = new Receiver;
    std::vector<FakeSubscription> subscriptions(4);
    const std::int32_t handles[] = {100000, 3, -2, 42};
    for (std::size_t i = 0; i < 4; ++i)
        receiver->AddSubscription(&subscriptions[i], handles[i]);
    receiver->ReleaseAll();
    for (const auto& subscription : subscriptions)
        EXPECT_EQ(subscription.releases, 1);
    EXPECT_FALSE(receiver->HasSubscription(3));
    receiver->Release();
    for (const auto& subscription : subscriptions)
        EXPECT_EQ(subscription.releases, 1) << "released once, not again by the destructor";
}

TEST(Receiver, PassesChangesUnchangedOnceTheCallbackIsSet)
{
    auto* receiver = new Receiver;
    delivered.clear();
    const auto value = value::VarData::MakeNumeric(2.5);
    const fen::AbsTime time{0x8000000000000000u, 3'000'000'000};
    receiver->OnDataChange(1, 0xF, &value, 0, 0, &time);
    EXPECT_TRUE(delivered.empty()) << "a change before the callback is set is dropped";

    int context = 0;
    receiver->SetCallbackContext(&context);
    receiver->SetDataCallback(Record);
    // The library's own bits and a negative error pass through as they are.
    receiver->OnDataChange(-9, 0x5, &value, rt::QualityBits::Disconnected | 1, -5, &time);
    ASSERT_EQ(delivered.size(), 1u);
    const Delivered& d = delivered[0];
    EXPECT_EQ(d.context, &context);
    EXPECT_EQ(d.handle, -9);
    EXPECT_EQ(d.mask, 0x5u);
    EXPECT_EQ(d.value, 2.5);
    EXPECT_EQ(d.quality, rt::QualityBits::Disconnected | 1);
    EXPECT_EQ(d.error, -5);
    EXPECT_EQ(d.time, time);
    receiver->Release();
}

} // namespace
} // namespace qv::test
