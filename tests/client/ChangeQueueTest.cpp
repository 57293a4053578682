#include "client/ChangeQueue.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>

#include <stdexcept>
#include <vector>

namespace qv::test {
namespace {

using fbfen::orvekclient::ChangeQueue;
using fbfen::orvekclient::DataChangePacket;

DataChangePacket Packet(std::int32_t handle, double number)
{
    DataChangePacket packet;
    packet.handle = handle;
    packet.changeMask = 1;
    packet.value = value::VarData::MakeNumeric(number);
    return packet;
}

TEST(ChangeQueue, AppliesEachPacketOnceInArrivalOrder)
{
    int notifications = 0;
    auto queue = boost::make_shared<ChangeQueue>([&] { ++notifications; });
    for (int i = 1; i <= 3; ++i)
        queue->Deliver(Packet(i, i * 1.5));
    EXPECT_EQ(notifications, 3);
    EXPECT_EQ(queue->Size(), 3u);

    std::vector<std::int32_t> applied;
    for (int i = 0; i < notifications; ++i)
        EXPECT_TRUE(queue->ApplyNext([&](const DataChangePacket& p) {
            applied.push_back(p.handle);
            EXPECT_EQ(p.value.ToDouble(), p.handle * 1.5);
        }));
    EXPECT_EQ(applied, (std::vector<std::int32_t>{1, 2, 3}));
    EXPECT_FALSE(queue->ApplyNext([&](const DataChangePacket&) { ADD_FAILURE() << "applied from an empty queue"; }));
}

TEST(ChangeQueue, PacketLeavesEvenWhenApplyingThrowsAndItStaysQueuedUntilApplied)
{
    ChangeQueue queue(nullptr);
    queue.Deliver(Packet(1, 0));
    queue.Deliver(Packet(2, 0));
    EXPECT_THROW(queue.ApplyNext([](const DataChangePacket&) { throw std::runtime_error("bad packet"); }),
                 std::runtime_error);
    std::int32_t next = 0;
    // A packet appended while the front one is being applied waits its turn.
    queue.ApplyNext([&](const DataChangePacket& p) {
        next = p.handle;
        queue.Deliver(Packet(3, 0));
    });
    EXPECT_EQ(next, 2);
    EXPECT_EQ(queue.Size(), 1u);
}

TEST(ChangeQueue, EachQueueHoldsItsOwnCopySharingTheValue)
{
    ChangeQueue first(nullptr), second(nullptr);
    DataChangePacket packet = Packet(5, 0);
    packet.value = value::VarData("shared text");
    first.Deliver(packet);
    second.Deliver(packet);
    packet.value = value::VarData("changed by the producer");

    for (ChangeQueue* queue : {&first, &second})
        queue->ApplyNext([](const DataChangePacket& p) { EXPECT_EQ(p.value.GetString(), fen::String("shared text")); });
}

} // namespace
} // namespace qv::test
