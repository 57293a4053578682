#pragma once
/// \file
/// One data change of one subscription, as it travels from the real-time
/// library's thread to the user-interface thread.

#include "fen/AbsTime.h"
#include "value/VarData.h"

#include <cstdint>

namespace qv::fbfen::orvekclient {

/// Bits of `DataChangePacket::changeMask`.
namespace ChangeBits {
inline constexpr std::uint32_t Value = 0x1;
inline constexpr std::uint32_t Timestamp = 0x4;
/// Either bit says that the quality word or the error code changed.
inline constexpr std::uint32_t QualityOrError = 0x2 | 0x8;
} // namespace ChangeBits

/// One change. The packet owns its value; copying it shares the value's
/// storage by reference, so a copy per consumer is cheap.
struct DataChangePacket {
    /// Subscription handle of the item.
    std::int32_t handle = 0;
    /// ChangeBits of what changed.
    std::uint32_t changeMask = 0;
    /// Time of the change.
    fen::AbsTime timestamp{};
    /// Quality word; 0 is good.
    std::uint64_t quality = 0;
    /// Error code of the item; negative means an error.
    std::int32_t errorCode = 0;
    /// The new value.
    value::VarData value;
};

} // namespace qv::fbfen::orvekclient
