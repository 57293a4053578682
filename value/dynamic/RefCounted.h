#pragma once
/// \file
/// The reference count shared by every storage object.

#include "value/dynamic/Interfaces.h"

#include <atomic>
#include <cstdint>

namespace qv::value::dynamic {

/// Implements AddRef and Release of `Interface` with an atomic count that
/// starts at one; the last Release destroys the object.
template <typename Interface>
class RefCounted : public Interface {
public:
    std::uint32_t AddRef() override { return refs_.fetch_add(1, std::memory_order_relaxed) + 1; }

    std::uint32_t Release() override
    {
        const std::uint32_t left = refs_.fetch_sub(1, std::memory_order_acq_rel) - 1;
        if (left == 0)
            delete this;
        return left;
    }

    /// Answers only the interfaces that `Offer` names; subclasses extend it.
    std::int32_t QueryInterface(const Guid&, void** out) override
    {
        *out = nullptr;
        return kNoInterface;
    }

protected:
    RefCounted() = default;
    RefCounted(const RefCounted&) = delete;
    RefCounted& operator=(const RefCounted&) = delete;
    virtual ~RefCounted() = default;

    /// Hands out `iface` of this object with a reference added.
    std::int32_t Offer(IGuts* iface, void** out)
    {
        AddRef();
        *out = iface;
        return kOk;
    }

private:
    std::atomic<std::uint32_t> refs_{1};
};

} // namespace qv::value::dynamic
