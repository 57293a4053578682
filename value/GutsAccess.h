#pragma once
/// \file
/// Holds an interface obtained by QueryInterface and releases it after use.

#include "value/dynamic/Interfaces.h"

namespace qv::value {

template <typename I>
class Interface {
public:
    Interface(dynamic::IGuts* guts, const dynamic::Guid& iid)
    {
        void* out = nullptr;
        if (guts != nullptr && guts->QueryInterface(iid, &out) >= 0 && out != nullptr)
            iface_ = static_cast<I*>(static_cast<dynamic::IGuts*>(out));
    }
    ~Interface()
    {
        if (iface_ != nullptr)
            iface_->Release();
    }
    Interface(const Interface&) = delete;
    Interface& operator=(const Interface&) = delete;

    explicit operator bool() const noexcept { return iface_ != nullptr; }
    I* operator->() const noexcept { return iface_; }

private:
    I* iface_ = nullptr;
};

} // namespace qv::value
