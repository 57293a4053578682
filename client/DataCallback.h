#pragma once
/// \file
/// The function through which the client hands data changes to its owner.

#include "fen/AbsTime.h"
#include "value/VarData.h"

#include <cstdint>

namespace qv::fbfen::orvekclient {

/// Called on a library thread for every change: the context given to the
/// client, the subscription handle, the change mask, the new value (valid
/// only during the call), the quality word, the error code and the time of
/// the change. It must copy what it keeps and return quickly.
using DataCallback = void (*)(void* context, std::int32_t handle, std::uint32_t changeMask,
                              const value::VarData* value, std::uint64_t quality, std::int32_t errorCode,
                              fen::AbsTime timestamp);

} // namespace qv::fbfen::orvekclient
