#pragma once
// A subscription object that counts what is done to it, for tests of the
// receiver's table.

#include "network/realtime/OrvekRealTime.h"

#include <atomic>

namespace qv::test {

class FakeSubscription final : public network::realtime::ISubscription {
public:
    std::int32_t QueryInterface(const value::dynamic::Guid&, void** out) override
    {
        *out = nullptr;
        return static_cast<std::int32_t>(0x80004002u);
    }
    std::uint32_t AddRef() override { return ++references; }
    std::uint32_t Release() override
    {
        ++releases;
        return --references;
    }
    std::int32_t Write(const value::VarData&) override
    {
        ++writes;
        return 0;
    }

    /// Starts with the one reference its creator hands out; the test owns the object.
    std::atomic<int> references{1};
    std::atomic<int> releases{0};
    std::atomic<int> writes{0};
};

} // namespace qv::test
